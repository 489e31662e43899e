// SPDX-License-Identifier: Apache-2.0
#include "MeasureJob.h"

#include "RangeMeter.h"

#include "streams/levels.h"

#include <cmath>

bool MeasureJob::process(SourceWaveform &source, qint64 begin, qint64 count)
{
    RangeMeter meter;
    const JobStep step(*this, "Calculating...", meter);
    const std::optional<LevelSums> sums = meter.measure(*source.data(), begin, count);
    if (!sums) {
        return false;
    }
    m_result.samples = count;
    m_result.rmsOffset = measuredOffset(std::sqrt(sums->sum / static_cast<double>(count)));
    m_result.peakOffset = measuredOffset(std::sqrt(sums->peak));
    return true;
}
