// SPDX-License-Identifier: Apache-2.0
#include "RangeJob.h"

#include "RangeMeter.h"

#include "log/Tracer.h"

RangeJob::RangeJob(SourceWaveform &source, qint64 first, qint64 last, QObject *parent)
    : ToolJob(parent)
    , m_source(source)
    , m_first(first)
    , m_last(last)
{
}

bool RangeJob::work()
{
    Tracer::Trace(Tracer::Information,
                  QString("Rescaling from pos. %1 to pos %2.").arg(m_first + 1).arg(m_last + 1));
    RangeMeter meter;
    const JobStep step(*this, "Calculating...", meter);
    const std::optional<LevelSums> levels =
        meter.measure(*m_source.data(), m_first, m_last - m_first + 1);
    if (levels) {
        m_levels = *levels;
    }
    return levels.has_value();
}
