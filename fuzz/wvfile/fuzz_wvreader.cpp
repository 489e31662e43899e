// SPDX-License-Identifier: Apache-2.0
#include "base/ProgressClock.h"
#include "support/MemoryStream.h"
#include "support/fuzzcheck.h"
#include "wvfile/WvReader.h"
#include "wvfile/WvTypes.h"

#include <atomic>
#include <cmath>
#include <cstdint>

extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t *data, std::size_t size)
{
    static MemoryStream samples;
    static MemoryStream markers;
    static MemoryStream tags;
    samples.clear();
    markers.clear();
    tags.clear();
    MemoryDevice device(data, size);
    WvFileInfo info;
    info.dataStream = &samples.stream;
    info.markerStream = &markers.stream;
    info.tagsStream = size % 2 == 0 ? &tags.stream : nullptr;
    info.gainDb = size % 3 == 0 ? 6 : 0;
    const std::atomic<bool> cancelled{false};
    ProgressClock progress([](int) {}, cancelled);
    const bool ok = WvReader(info, device, progress).read();
    require(ok != takeErrors());
    if (ok) {
        // What was read is there, and no more than the file could hold.
        require(info.samples > 0);
        require(4 * static_cast<qint64>(info.samples) <= static_cast<qint64>(size));
        require(samples.contentSize() == BufferedIO::HeaderSize + 8LL * info.samples);
        require(markers.contentSize() >= info.controlLength);
        require(std::isfinite(info.rmsOffset));
    }
    return 0;
}
