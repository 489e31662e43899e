// SPDX-License-Identifier: Apache-2.0
#include "ToolJob.h"

#include "log/Tracer.h"

ToolJob::ToolJob(QObject *parent)
    : QObject(parent)
{
}

JobOutcome ToolJob::run()
{
    if (work()) {
        if (!m_ending.success.isEmpty()) {
            emit report(ReportLine::success(m_ending.success));
        }
        return JobOutcome::Finished;
    }
    if (!m_ending.failure.isEmpty()) {
        const bool isPlain = m_cancelled && m_ending.cancelled.isEmpty();
        emit report(isPlain
                        ? ReportLine::plain("Cancelled")
                        : ReportLine::failure(m_cancelled ? m_ending.cancelled : m_ending.failure));
    }
    return m_cancelled ? JobOutcome::Cancelled : JobOutcome::Failed;
}

bool ToolJob::mayProceed() const
{
    return !m_cancelled || Tracer::fail("Action aborted by user.");
}

void ToolJob::cancel()
{
    m_cancelled = true;
    emit cancelRequested();
}

void ToolJob::setEnding(JobEnding ending)
{
    m_ending = std::move(ending);
}

void ToolJob::setFailureText(const QString &text)
{
    m_ending.failure = text;
}

bool ToolJob::refuse(const QString &reason)
{
    m_ending.failure.clear();
    return Tracer::fail(reason);
}

void ToolJob::reportAll(const ReportLines &lines)
{
    for (const ReportLine &line : lines) {
        emit report(line);
    }
}
