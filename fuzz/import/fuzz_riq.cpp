// SPDX-License-Identifier: Apache-2.0
#include "import/RiqFileAccess.h"
#include "support/MemoryStream.h"
#include "support/fuzzcheck.h"

#include <cstdint>

extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t *data, std::size_t size)
{
    static MemoryStream samples;
    MemoryDevice file(data, size);
    RiqFileAccess access;
    access.open(file);
    const bool ok = access.readDirectory();
    require(ok != takeErrors());
    qint64 total = 0;
    for (qsizetype i = 0; i < access.entries().size(); ++i) {
        const RiqEntry entry = access.entry(i);
        require(entry.valid && entry.samples > 0 && entry.playTime() > 0);
        samples.clear();
        // A directory that came through stands for blocks that can be read.
        require(access.readSamples(i, &samples.stream, 0) && !takeErrors());
        require(samples.contentSize() == BufferedIO::HeaderSize + 8 * entry.samples);
        total += entry.samples;
    }
    require(4 * total <= static_cast<qint64>(size));
    return 0;
}
