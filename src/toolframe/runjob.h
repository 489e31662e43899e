// SPDX-License-Identifier: Apache-2.0
#pragma once

#include "jobs/ToolJob.h"

class QTextEdit;
class QWidget;
struct ReportLine;

/// Runs a job behind a modal progress dialog over `parent`, whose cancel button ends the job, and
/// puts the lines of its report into `report` (may be null). Returns when the job has ended.
[[nodiscard]] JobOutcome runJob(ToolJob &job, QWidget *parent, QTextEdit *report);

/// Appends one line to the read-only text of a tool's last page and scrolls to it. Texts are shown
/// as they are: a "<" in a file name is no markup.
void appendReport(QTextEdit &report, const ReportLine &line);
