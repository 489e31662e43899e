// SPDX-License-Identifier: Apache-2.0
#include "MemoryDevice.h"

#include "base/ProgressClock.h"
#include "log/Tracer.h"
#include "streams/BufferedIO.h"
#include "wvfile/WvReader.h"
#include "wvfile/WvTypes.h"

#include <atomic>
#include <cmath>
#include <cstdint>
#include <cstdlib>

namespace {

/// A stream that is kept from run to run, since its buffers cost more than a run.
struct Stream
{
    MemoryDevice device;
    BufferedIO stream;

    Stream()
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

    [[nodiscard]] qint64 contentSize()
    {
        return stream.restartAtBegining() ? device.bytes.size() : -1;
    }
};

} // namespace

extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t *data, std::size_t size)
{
    static Stream samples;
    static Stream markers;
    static Stream tags;
    samples.clear();
    markers.clear();
    tags.clear();
    MemoryDevice device;
    device.bytes =
        QByteArray::fromRawData(reinterpret_cast<const char *>(data), static_cast<qsizetype>(size));
    if (!device.open(QIODevice::ReadOnly)) {
        std::abort();
    }
    WvFileInfo info;
    info.dataStream = &samples.stream;
    info.markerStream = &markers.stream;
    info.tagsStream = size % 2 == 0 ? &tags.stream : nullptr;
    info.gainDb = size % 3 == 0 ? 6 : 0;
    const std::atomic<bool> cancelled{false};
    ProgressClock progress([](int) {}, cancelled);
    const bool ok = WvReader(info, device, progress).read();
    bool hasReason = false;
    for (const Tracer::Entry &entry : Tracer::takeEntries()) {
        hasReason = hasReason || entry.second == Tracer::Error;
    }
    if (ok == hasReason) {
        std::abort();
    }
    if (ok) {
        // What was read is there, and no more than the file could hold.
        const bool complete =
            info.samples > 0 &&
            4 * static_cast<qint64>(info.samples) <= static_cast<qint64>(size) &&
            samples.contentSize() == BufferedIO::HeaderSize + 8LL * info.samples &&
            markers.contentSize() >= info.controlLength && std::isfinite(info.rmsOffset);
        if (!complete) {
            std::abort();
        }
    }
    return 0;
}
