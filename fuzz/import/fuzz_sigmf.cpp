// SPDX-License-Identifier: Apache-2.0
#include "import/sigmfmetadata.h"
#include "import/tarentries.h"
#include "support/fuzzcheck.h"

#include <QBuffer>

#include <cstdint>

extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t *data, std::size_t size)
{
    QByteArray bytes(reinterpret_cast<const char *>(data), static_cast<qsizetype>(size));
    if (const auto metadata = parseSigmfMetadata(bytes)) {
        require(metadata->channels > 0 && metadata->trailingBytes >= 0);
    }
    QBuffer archive(&bytes);
    require(archive.open(QIODevice::ReadOnly));
    if (const auto entries = tarEntries(archive)) {
        for (const TarEntry &entry : *entries) {
            require(entry.size >= 0 && entry.size <= bytes.size() - entry.position);
        }
    }
    return 0;
}
