// SPDX-License-Identifier: Apache-2.0
#pragma once

#include "MemoryDevice.h"

#include "streams/BufferedIO.h"

#include <cstdlib>

/// A sample, marker or tag stream in memory. Kept from run to run, since its buffers cost more than
/// a run.
struct MemoryStream
{
    MemoryDevice device;
    BufferedIO stream;

    MemoryStream()
    {
        if (!stream.initBuf(&device, BufferedIO::ReadWrite)) {
            std::abort();
        }
    }

    /// Forgets all content.
    void clear()
    {
        const bool flushed = stream.restartAtBegining();
        device.bytes.clear();
        if (!flushed || !stream.restartAtBegining()) {
            std::abort();
        }
    }

    /// Bytes, or -1 if what is buffered can't be written.
    [[nodiscard]] qint64 contentSize()
    {
        return stream.restartAtBegining() ? device.bytes.size() : -1;
    }
};
