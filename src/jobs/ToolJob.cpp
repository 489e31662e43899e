// SPDX-License-Identifier: Apache-2.0
#include "ToolJob.h"

ToolJob::ToolJob(QObject *parent)
    : QObject(parent)
{
}

void ToolJob::cancel()
{
    m_cancelled = true;
    emit cancelRequested();
}
