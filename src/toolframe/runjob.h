// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <QString>

class QTextEdit;
class QWidget;
class ToolJob;

/// How a job ended: done; not done, with the reason in the log; ended by the user.
enum class JobOutcome { Finished, Failed, Cancelled };

/// Runs a job behind a modal progress dialog over `parent`, whose cancel button ends the job, and
/// puts the lines of its report into `report` (may be null). Returns when the job has ended.
[[nodiscard]] JobOutcome runJob(ToolJob &job, QWidget *parent, QTextEdit *report);

/// Appends one report line, HTML, to the read-only text of a tool's last page and scrolls to it.
/// Tabs, blanks and a leading line feed stay what they are, unlike in HTML.
void appendReport(QTextEdit &report, const QString &html);
