// SPDX-License-Identifier: Apache-2.0
#pragma once

#include "streams/TempStream.h"

#include <map>
#include <memory>

/// The samples of one segment's source on their way through the passes: a data and a marker stream.
/// Between the passes both are released and hold no memory.
///
/// There may be many at a time, so the buffers are small; blocks go past them anyway.
struct SegmentBuffers
{
    static constexpr int DataBufferSize = 1024 * 1024;  ///< bytes
    static constexpr int MarkerBufferSize = 256 * 1024; ///< bytes

    std::unique_ptr<TempStream> data;
    std::unique_ptr<TempStream> markers;

    void makeStreams()
    {
        data = std::make_unique<TempStream>(DataBufferSize);
        markers = std::make_unique<TempStream>(MarkerBufferSize);
    }

    /// Writes what is left and frees the memory. False if a disk is full.
    [[nodiscard]] bool release()
    {
        bool done = true;
        for (TempStream *stream : {data.get(), markers.get()}) {
            if (stream != nullptr && stream->stream()->isInitialised()) {
                done = stream->stream()->releaseBuf() && done;
            }
        }
        return done;
    }
};

/// The buffers of all segments by their sampleKey.
using SegmentBufferMap = std::map<quint32, SegmentBuffers>;

[[nodiscard]] constexpr quint32 sampleKey(int track, int segment)
{
    return (static_cast<quint32>(track) << 16U) ^ (static_cast<quint32>(segment) & 0xFFFFU);
}
