// SPDX-License-Identifier: Apache-2.0
#include "RangeMeter.h"

#include "base/ProgressClock.h"
#include "log/Tracer.h"
#include "streams/BufferedIO.h"

#include <algorithm>
#include <vector>

void RangeMeter::cancel()
{
    m_cancelled = true;
}

std::optional<LevelSums> RangeMeter::measure(BufferedIO &data, qint64 begin, qint64 count)
{
    m_cancelled = false;
    if (!data.restartAtPosition(BufferedIO::HeaderSize + begin * BufferedIO::RecordSize)) {
        Tracer::Trace(Tracer::Error, "Cannot set I/Q data stream start position.");
        return std::nullopt;
    }
    constexpr qint64 BlockSamples = 64 * 1024;
    ProgressClock progress([this](int percent) { emit ProgressUpdate(percent); }, m_cancelled);
    std::vector<float> values(2 * static_cast<size_t>(std::min(count, BlockSamples)));
    LevelSums sums;
    for (qint64 done = 0; done < count;) {
        if (progress.shouldStop(done, count)) {
            Tracer::Trace(Tracer::Error, "Action aborted by user.");
            return std::nullopt;
        }
        const auto wanted = static_cast<int>(std::min(count - done, BlockSamples));
        const int bytes = wanted * BufferedIO::RecordSize;
        if (data.readBlock(bytes, values.data()) != bytes) {
            Tracer::Trace(Tracer::Error, "Cannot read I/Q data.");
            return std::nullopt;
        }
        addLevels(std::span(values).first(2 * static_cast<size_t>(wanted)), sums);
        done += wanted;
    }
    return sums;
}
