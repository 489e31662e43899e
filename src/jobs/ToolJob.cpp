// SPDX-License-Identifier: Apache-2.0
#include "ToolJob.h"

#include "log/Tracer.h"

ToolJob::ToolJob(QObject *parent)
    : QObject(parent)
{
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
