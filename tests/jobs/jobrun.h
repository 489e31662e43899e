// SPDX-License-Identifier: Apache-2.0
#pragma once

#include "jobs/ReportText.h"
#include "jobs/ToolJob.h"
#include "support/files.h"

#include <QDir>
#include <QFile>
#include <QStringList>

/// A job that has run, with what it told.
struct JobRun
{
    explicit JobRun(ToolJob &job)
    {
        QObject::connect(&job, &ToolJob::stepStarted, &job,
                         [this](const QString &label) { steps << label; });
        QObject::connect(&job, &ToolJob::report, &job,
                         [this](const ReportLine &line) { report << plainLine(line); });
        outcome = job.run();
    }

    [[nodiscard]] bool done() const { return outcome == JobOutcome::Finished; }

    QStringList steps;
    QStringList report; ///< as on a terminal
    JobOutcome outcome = JobOutcome::Failed;
};

/// A folder in which the jobs of this program keep their streams.
class StreamFolder
{
public:
    StreamFolder() { qputenv("TMPDIR", QFile::encodeName(m_folder.path())); }

    /// Whether no file lies there; open ones have no name.
    [[nodiscard]] bool isEmpty() const { return QDir(m_folder.path()).isEmpty(QDir::Files); }

private:
    TestFolder m_folder;
};
