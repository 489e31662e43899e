// SPDX-License-Identifier: Apache-2.0
#include "import/MatFileAccess.h"
#include "support/MemoryStream.h"
#include "support/fuzzcheck.h"

#include <cstdint>

extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t *data, std::size_t size)
{
    static MemoryStream samples;
    samples.clear();
    MemoryDevice file(data, size);
    MatFileAccess access;
    access.open(file);
    const bool ok = access.readDirectory();
    require(ok != takeErrors());
    // What a compressed element declares takes time, and no memory, so that few are read.
    constexpr int mostRead = 4;
    int read = 0;
    for (const MatEntry &entry : access.directory()) {
        static_cast<void>(entry.obstacle());
        if (!ok || !entry.isUsable() || ++read > mostRead) {
            continue;
        }
        constexpr qint64 mostSamples = 100'000;
        qint64 limit = mostSamples;
        samples.clear();
        const bool whole = access.readVariable(entry.name, &samples.stream, &limit);
        require(whole != takeErrors());
        require(!whole || samples.contentSize() == BufferedIO::HeaderSize + 8 * limit);
    }
    return 0;
}
