// SPDX-License-Identifier: Apache-2.0
#include "MemoryDevice.h"

#include "log/Tracer.h"
#include "wvfile/WvScanner.h"
#include "wvfile/WvTypes.h"

#include <cstdint>
#include <cstdlib>

extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t *data, std::size_t size)
{
    MemoryDevice device;
    device.bytes =
        QByteArray::fromRawData(reinterpret_cast<const char *>(data), static_cast<qsizetype>(size));
    if (!device.open(QIODevice::ReadOnly)) {
        std::abort();
    }
    WvFileSummary summary;
    const bool ok = WvScanner(summary).scan(device);
    // A refusal has a reason; a list of segments is no longer than the text that it came from.
    bool hasReason = false;
    for (const Tracer::Entry &entry : Tracer::takeEntries()) {
        hasReason = hasReason || entry.second == Tracer::Error;
    }
    if (ok == hasReason || summary.segments.size() > 1025 || summary.segmentCount < 0) {
        std::abort();
    }
    return 0;
}
