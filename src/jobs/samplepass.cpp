// SPDX-License-Identifier: Apache-2.0
#include "samplepass.h"

#include "SourceWaveform.h"
#include "ToolJob.h"

#include "base/ProgressClock.h"
#include "log/Tracer.h"

#include <algorithm>
#include <atomic>
#include <vector>

bool passSamples(ToolJob &job, SourceWaveform &source, qint64 begin, qint64 count,
                 const SampleTaker &take, int fromPercent, int toPercent)
{
    constexpr qint64 BlockSamples = 16 * 1024;
    if (!source.data()->restartAtPosition(BufferedIO::HeaderSize +
                                          begin * BufferedIO::RecordSize) ||
        !source.markers()->restartAtPosition(begin)) {
        return Tracer::fail("Cannot set I/Q data stream start position.");
    }
    const std::atomic<bool> never{false};
    ProgressClock progress([&job](int percent) { emit job.ProgressUpdate(percent); }, never);
    std::vector<float> values(2 * static_cast<size_t>(std::min(count, BlockSamples)));
    std::vector<char> markers(values.size() / 2);
    for (qint64 done = 0; done < count;) {
        // The tick lets the interrupt through, which the job then knows of.
        if (progress.shouldStop(done, count, fromPercent, toPercent) || !job.mayProceed()) {
            return false;
        }
        const auto wanted = static_cast<int>(std::min(count - done, BlockSamples));
        const int bytes = wanted * BufferedIO::RecordSize;
        if (source.data()->readBlock(bytes, values.data()) != bytes ||
            source.markers()->readBlock(wanted, markers.data()) != wanted) {
            return Tracer::fail("Cannot read I/Q data.");
        }
        const auto samples = static_cast<size_t>(wanted);
        if (!take(std::span(values).first(2 * samples), std::span(markers).first(samples),
                  begin + done)) {
            return false;
        }
        done += wanted;
    }
    // A cancel that came with the last samples counts, too.
    ProgressClock::runEvents();
    return job.mayProceed();
}
