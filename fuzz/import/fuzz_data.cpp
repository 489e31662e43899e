// SPDX-License-Identifier: Apache-2.0
#include "import/DataFileAccess.h"
#include "import/dataguess.h"
#include "support/MemoryStream.h"
#include "support/fuzzcheck.h"

#include <cmath>
#include <cstdint>

/// The first bytes choose the settings, the others are one file, or two halves.
extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t *data, std::size_t size)
{
    constexpr std::size_t settingsSize = 4;
    if (size < settingsSize) {
        return 0;
    }
    WvImportJob job;
    job.binary = data[0] % 4 == 0;
    job.useFile2 = data[0] / 4 % 2 == 1;
    job.format.dataFormat = static_cast<DataFormat>(data[1] % 3);
    job.format.precision = static_cast<DataPrecision>(data[2] % 5);
    job.format.isSigned = data[2] / 8 % 2 == 1;
    job.format.bigEndian = data[2] / 16 % 2 == 1;
    job.scaling = static_cast<ImportScaling>(data[3] % 3);
    const qint64 limit = data[3] / 4;
    const QByteArray bytes(reinterpret_cast<const char *>(data + settingsSize),
                           static_cast<qsizetype>(size - settingsSize));
    static_cast<void>(previewText(bytes.left(DataGuess::HeadSize), looksBinary(bytes)));

    static MemoryStream samples;
    samples.clear();
    MemoryDevice first;
    MemoryDevice second;
    const qsizetype half = job.useFile2 ? bytes.size() / 2 : bytes.size();
    first.bytes = bytes.left(half);
    second.bytes = bytes.mid(half);
    require(first.open(QIODevice::ReadOnly) && second.open(QIODevice::ReadOnly));
    DataFileAccess reader;
    WvWriteJob result;
    const bool ok = reader.importDevices(job, first, job.useFile2 ? &second : nullptr, &result,
                                         &samples.stream, limit);
    // Hexadecimal text goes on after words that are no number.
    require(takeErrors() != ok || job.format.dataFormat == DataFormat::Hexadecimal);
    if (ok) {
        require(result.samples > 0 && (limit == 0 || result.samples <= limit));
        require(std::isfinite(result.peakOffset) && std::isfinite(result.rmsOffset));
        require(samples.contentSize() == BufferedIO::HeaderSize + 8 * qint64(result.samples));
    }
    return 0;
}
