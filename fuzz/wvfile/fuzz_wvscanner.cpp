// SPDX-License-Identifier: Apache-2.0
#include "support/MemoryDevice.h"
#include "support/fuzzcheck.h"
#include "wvfile/WvScanner.h"
#include "wvfile/WvTypes.h"

#include <cstdint>

extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t *data, std::size_t size)
{
    MemoryDevice device(data, size);
    WvFileSummary summary;
    const bool ok = WvScanner(summary).scan(device);
    // A refusal has a reason; a list of segments is no longer than the text that it came from.
    require(ok != takeErrors());
    require(summary.segments.size() <= 1025 && summary.segmentCount >= 0);
    return 0;
}
