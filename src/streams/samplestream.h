// SPDX-License-Identifier: Apache-2.0
#pragma once

#include "BufferedIO.h"

#include <QtGlobal>

#include <cstddef>
#include <span>

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

/// The progress of a loop in percent.
[[nodiscard]] inline int percentOf(qint64 done, qint64 total)
{
    return static_cast<int>(static_cast<double>(done) * 100.0 / static_cast<double>(total));
}
