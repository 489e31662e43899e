// SPDX-License-Identifier: Apache-2.0
#pragma once

#include "BufferedIO.h"

#include <QtGlobal>

#include <algorithm>
#include <cstddef>
#include <span>
#include <vector>

/// Samples that the stream passes handle at a time: large enough that the calls don't count, small
/// enough to stay in the cache of one core.
inline constexpr int StreamBlockSamples = 32 * 1024;

/// Numbers in a block of samples.
[[nodiscard]] inline std::size_t floatsOf(int samples)
{
    return 2 * static_cast<std::size_t>(samples);
}

/// Reads samples into the span of interleaved I and Q. Returns the number of whole samples that
/// came.
[[nodiscard]] inline int readSamples(BufferedIO &stream, std::span<float> iq)
{
    const int bytes = stream.readBlock(static_cast<int>(iq.size_bytes()), iq.data());
    return bytes > 0 ? bytes / BufferedIO::RecordSize : 0;
}

/// Writes samples given as interleaved I and Q.
[[nodiscard]] inline bool writeSamples(BufferedIO &stream, std::span<const float> iq)
{
    return stream.writeBytes(static_cast<int>(iq.size_bytes()), iq.data());
}

/// How a loop over the samples of a stream ended.
struct BlockLoop
{
    enum End {
        Done,
        Stopped,    ///< it was told to
        ReadFailed, ///< a sample is missing
        WorkFailed,
    };
    End end = Done;
    qint64 position = 0; ///< sample of the failure, counted from the first one of the loop
};

/// Goes through `samples` samples in blocks, from the next one to be read. Before each block `stop`
/// is asked with the number done, and ends the loop by true. `work` takes a block of interleaved I
/// and Q, which it may change, and the index of its first sample; false ends the loop, and gets a
/// cut block, too.
template <typename Stop, typename Work>
[[nodiscard]] BlockLoop forEachBlock(BufferedIO &stream, qint64 samples, Stop stop, Work work)
{
    std::vector<float> block(
        floatsOf(static_cast<int>(std::min<qint64>(samples, StreamBlockSamples))));
    for (qint64 done = 0; done < samples;) {
        if (stop(done)) {
            return {BlockLoop::Stopped, done};
        }
        const auto count = static_cast<int>(std::min<qint64>(samples - done, StreamBlockSamples));
        const int got = readSamples(stream, std::span(block).first(floatsOf(count)));
        if (got > 0 && !work(std::span(block).first(floatsOf(got)), done)) {
            return {BlockLoop::WorkFailed, done};
        }
        if (got < count) {
            return {BlockLoop::ReadFailed, done + got};
        }
        done += count;
    }
    return {BlockLoop::Done, samples};
}

/// The progress of a loop in percent.
[[nodiscard]] inline int percentOf(qint64 done, qint64 total)
{
    return static_cast<int>(static_cast<double>(done) * 100.0 / static_cast<double>(total));
}
