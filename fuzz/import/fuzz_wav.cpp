// SPDX-License-Identifier: Apache-2.0
#include "import/WavFileAccess.h"
#include "support/MemoryStream.h"
#include "support/fuzzcheck.h"

#include <cstdint>

#include <sys/mman.h>
#include <unistd.h>

namespace {

/// A file without a disk behind it; the reader opens nothing but files.
class MemoryFile
{
public:
    MemoryFile()
        : m_descriptor(memfd_create("wav", MFD_CLOEXEC))
    {
        require(m_descriptor >= 0);
    }

    void write(const std::uint8_t *data, std::size_t size) const
    {
        require(ftruncate(m_descriptor, 0) == 0);
        require(pwrite(m_descriptor, data, size, 0) == static_cast<ssize_t>(size));
    }

    [[nodiscard]] QString path() const
    {
        return QStringLiteral("/proc/self/fd/%1").arg(m_descriptor);
    }

private:
    int m_descriptor;
};

} // namespace

extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t *data, std::size_t size)
{
    static const MemoryFile file;
    static MemoryStream samples;
    file.write(data, size);
    samples.clear();
    WavFileAccess access;
    require(access.open(file.path()));
    const bool ok = access.readHeader();
    require(ok != takeErrors());
    if (!ok || !access.header().valid) {
        return 0;
    }
    const WavHeader &header = access.header();
    require(header.blockAlignment > 0 && header.playTime() >= 0);
    const qint64 limit = size % 2 == 0 ? 0 : 3;
    const bool read = access.readSamples(&samples.stream, limit);
    require(read != takeErrors());
    const qint64 content = samples.contentSize() - BufferedIO::HeaderSize;
    require(content >= 0 && content / 8 * header.blockAlignment <= static_cast<qint64>(size));
    if (read) {
        const qint64 expected = limit > 0 ? std::min(limit, header.samples()) : header.samples();
        require(content == 8 * expected);
    }
    return 0;
}
