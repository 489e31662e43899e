// SPDX-License-Identifier: Apache-2.0
#include "JobSource.h"

#include "log/Tracer.h"

#include <algorithm>

JobSource::JobSource(ToolJob &job, SourceWaveform &source, qint64 first, qint64 count, int passes)
    : StreamSource(*source.data(), *source.markers(), first, count)
    , m_job(job)
    , m_progress([&job](int percent) { emit job.ProgressUpdate(percent); }, m_never)
    , m_passes(passes)
{
}

bool JobSource::restart()
{
    m_done = 0;
    m_pass = std::min(m_pass + 1, m_passes - 1);
    return StreamSource::restart();
}

bool JobSource::next(std::span<IqSample> samples, std::span<quint8> markers)
{
    // The tick lets the interrupt through, which the job then knows of.
    if (m_progress.shouldStop(m_done, count(), 100 * m_pass / m_passes,
                              100 * (m_pass + 1) / m_passes) ||
        m_job.isCancelled()) {
        return Tracer::fail("Action aborted by user.");
    }
    m_done += static_cast<qint64>(samples.size());
    return StreamSource::next(samples, markers);
}
