// SPDX-License-Identifier: Apache-2.0
#include "LoadJob.h"

#include <utility>

LoadJob::LoadJob(QString fileName, SourceWaveform &target, QObject *parent)
    : ToolJob(parent)
    , m_fileName(std::move(fileName))
    , m_target(target)
{
}

bool LoadJob::work()
{
    return m_target.read(*this, m_fileName) && !isCancelled();
}
