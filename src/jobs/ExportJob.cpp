// SPDX-License-Identifier: Apache-2.0
#include "ExportJob.h"

#include "ReportText.h"
#include "SigmfMarks.h"
#include "exportheads.h"
#include "samplepass.h"
#include "sigmfmeta.h"

#include "base/EngineeringNumber.h"
#include "base/freespace.h"
#include "log/Tracer.h"

#include <QCryptographicHash>
#include <QFileInfo>
#include <QtEndian>

#include <algorithm>
#include <array>
#include <cmath>
#include <limits>
#include <utility>
#include <vector>

namespace {

struct FormatName
{
    const char *suffix;
    ExportFormat format;
    const char *name;
};

constexpr std::array<FormatName, 6> FormatNames{{
    {".wav", ExportFormat::Wav, "WAV"},
    {".cf32", ExportFormat::Cf32, "interleaved 32-bit floats"},
    {".cs16", ExportFormat::Cs16, "interleaved 16-bit words"},
    {".csv", ExportFormat::Csv, "CSV"},
    {".mat", ExportFormat::Mat, "MATLAB 5"},
    {".sigmf-meta", ExportFormat::Sigmf, "SigMF"},
}};

const FormatName *formatNameOf(const QString &fileName)
{
    const auto *found =
        std::find_if(FormatNames.begin(), FormatNames.end(), [&](const FormatName &name) {
            return fileName.endsWith(QLatin1String(name.suffix), Qt::CaseInsensitive);
        });
    return found == FormatNames.end() ? nullptr : found;
}

QList<ExportType> typesOf(ExportFormat format)
{
    switch (format) {
    case ExportFormat::Wav:
        return {ExportType::Float32, ExportType::Int16, ExportType::Int24};
    case ExportFormat::Sigmf:
        return {ExportType::Float32, ExportType::Int16};
    case ExportFormat::Cf32:
        return {ExportType::Float32};
    case ExportFormat::Cs16:
        return {ExportType::Int16};
    case ExportFormat::Csv:
    case ExportFormat::Mat:
        break;
    }
    return {};
}

/// 24 bits hold the words of the file as they stand, with a byte of fraction.
constexpr double FullWord24 = 32767 * 256;
constexpr double LargestWord24 = 8388607;

/// The file that the samples go to: that of SigMF lies beside the metadata.
QString sampleFile(const QString &fileName)
{
    return exportFormat(fileName) == ExportFormat::Sigmf ? fileName.chopped(4) + "data" : fileName;
}

WavSample wavSample(ExportType type)
{
    switch (type) {
    case ExportType::Float32:
        return WavSample::Float32;
    case ExportType::Int24:
        return WavSample::Int24;
    case ExportType::Int16:
        break;
    }
    return WavSample::Int16;
}

QByteArray toInt24(std::span<const float> values, ClipCount &clipped)
{
    QByteArray bytes(static_cast<qsizetype>(3 * values.size()), Qt::Uninitialized);
    char *target = bytes.data();
    for (const float value : values) {
        const double scaled = std::round(static_cast<double>(value) * FullWord24);
        const double held = std::clamp(scaled, -LargestWord24 - 1, LargestWord24);
        if (held != scaled) {
            ++clipped.values;
            clipped.largest = std::max(clipped.largest, std::fabs(static_cast<double>(value)));
        }
        const auto word = static_cast<quint32>(static_cast<qint32>(held));
        for (unsigned byte = 0; byte < 3; ++byte) {
            *target++ = static_cast<char>(word >> (8 * byte));
        }
    }
    return bytes;
}

} // namespace

QStringList exportTypeNames()
{
    return {"f32", "s16", "s24"};
}

std::optional<ExportFormat> exportFormat(const QString &fileName)
{
    const FormatName *name = formatNameOf(fileName);
    return name == nullptr ? std::nullopt : std::optional(name->format);
}

QStringList exportSuffixes()
{
    QStringList suffixes;
    for (const FormatName &known : FormatNames) {
        suffixes << known.suffix;
    }
    return suffixes;
}

QList<ExportType> exportTypes(const QString &fileName)
{
    const FormatName *name = formatNameOf(fileName);
    return name == nullptr ? QList<ExportType>() : typesOf(name->format);
}

QString exportProblem(const ExportRequest &request)
{
    const FormatName *name = formatNameOf(request.outputFile);
    if (name == nullptr) {
        return QString("The name '%1' doesn't tell the format; permitted suffixes: %2")
            .arg(request.outputFile, exportSuffixes().join(", "));
    }
    const QList<ExportType> types = typesOf(name->format);
    if (!request.type || types.contains(*request.type)) {
        return {};
    }
    QStringList permitted;
    for (const ExportType type : types) {
        permitted << exportTypeNames().at(static_cast<int>(type));
    }
    return QString("The type %1 isn't one of %2 files; permitted: %3")
        .arg(exportTypeNames().at(static_cast<int>(*request.type)), name->suffix,
             permitted.isEmpty() ? "none" : permitted.join(", "));
}

QStringList exportedFiles(const QString &fileName)
{
    QStringList files{fileName, sampleFile(fileName)};
    files.removeDuplicates();
    return files;
}

ExportJob::ExportJob(ExportRequest request, QObject *parent)
    : SampleReadJob(request.range, parent)
    , m_request(std::move(request))
    , m_file(sampleFile(m_request.outputFile),
             m_request.overwrite ? OutputFile::Existing::Replaced : OutputFile::Existing::Kept)
    , m_fileName(sampleFile(m_request.outputFile))
{
    setEnding({"Export completed", "Export failed"});
}

bool ExportJob::process(SourceWaveform &source, qint64 begin, qint64 count)
{
    if (const QString problem = exportProblem(m_request); !problem.isEmpty()) {
        return refuse(problem);
    }
    if (!hasRoomFor(m_fileName, count * bytesPerSample())) {
        return false;
    }
    if (!m_file.open()) {
        return Tracer::fail(QString("Cannot open '%1': %2").arg(m_fileName, m_file.errorString()));
    }
    emit stepStarted("Writing Samples...");
    if (!writeBody(source, begin, count)) {
        return false;
    }
    emit report(fileRow(m_request.outputFile));
    emit report(ReportLine::row("Format", formatNameOf(m_request.outputFile)->name));
    emit report(ReportLine::row("Samples", QString::number(count)));
    if (m_clipped.values > 0) {
        emit report(
            ReportLine::warning(clippingText(m_clipped.values, 2 * count, m_clipped.largest)));
    }
    return true;
}

/// Bytes that a sample takes in the file; those of a table are guessed low.
qint64 ExportJob::bytesPerSample() const
{
    switch (*exportFormat(m_request.outputFile)) {
    case ExportFormat::Mat:
        return 2 * sizeof(double);
    case ExportFormat::Cf32:
        return 2 * sizeof(float);
    case ExportFormat::Cs16:
        return 2 * sizeof(qint16);
    case ExportFormat::Wav:
    case ExportFormat::Sigmf:
        return 2LL * wavSampleBytes(wavSample(type()));
    case ExportFormat::Csv:
        break;
    }
    constexpr qint64 ShortestLine = 8;
    return ShortestLine;
}

bool ExportJob::writeBody(SourceWaveform &source, qint64 begin, qint64 count)
{
    switch (*exportFormat(m_request.outputFile)) {
    case ExportFormat::Wav:
        return writeWav(source, begin, count);
    case ExportFormat::Mat:
        return writeMat(source, begin, count);
    case ExportFormat::Sigmf:
        return writeSigmf(source, begin, count);
    case ExportFormat::Cf32:
        return writePlain(source, begin, count, DumpFormat::Cf32);
    case ExportFormat::Cs16:
        return writePlain(source, begin, count, DumpFormat::Ci16);
    case ExportFormat::Csv:
        return put(CsvHeading) && writePlain(source, begin, count, DumpFormat::Csv);
    }
    return false;
}

bool ExportJob::put(const QByteArray &bytes)
{
    return m_file.write(std::span(bytes.constData(), static_cast<size_t>(bytes.size()))) ||
           Tracer::fail(QString("Cannot write '%1': %2").arg(m_fileName, m_file.errorString()));
}

bool ExportJob::commit()
{
    return m_file.commit() ||
           Tracer::fail(QString("Cannot write '%1': %2").arg(m_fileName, m_file.errorString()));
}

QByteArray ExportJob::encoded(std::span<const float> values, ExportType type)
{
    switch (type) {
    case ExportType::Float32:
        return encodeSamples(DumpFormat::Cf32, 0, values, {});
    case ExportType::Int24:
        return toInt24(values, m_clipped);
    case ExportType::Int16:
        break;
    }
    countClipped(values, m_clipped);
    return encodeSamples(DumpFormat::Ci16, 0, values, {});
}

bool ExportJob::writePlain(SourceWaveform &source, qint64 begin, qint64 count, DumpFormat format)
{
    return passSamples(
               *this, source, begin, count,
               [&](std::span<const float> values, std::span<const char> markers, qint64 first) {
                   if (format == DumpFormat::Ci16) {
                       countClipped(values, m_clipped);
                   }
                   return put(encodeSamples(format, first, values, markers));
               }) &&
           commit();
}

bool ExportJob::writeWav(SourceWaveform &source, qint64 begin, qint64 count)
{
    const double clock = source.info().clock;
    if (!(clock > 0)) {
        return Tracer::fail("The waveform states no clock rate, which a WAV file has to have. Give "
                            "it one first, as by \"level --clock\".");
    }
    const double rate =
        std::clamp<double>(std::round(clock), 1, std::numeric_limits<quint32>::max());
    if (rate != clock) {
        emit report(ReportLine::warning(
            QString("The clock of %1 Hz was rounded to %2 Hz: a WAV file has whole sample rates.")
                .arg(clock, 0, 'g', 12)
                .arg(rate, 0, 'f', 0)));
    }
    const WavSample sample = wavSample(type());
    if (!put(wavHead(sample, static_cast<quint32>(rate), count)) ||
        !passSamples(*this, source, begin, count,
                     [this](std::span<const float> values, std::span<const char>, qint64) {
                         return put(encoded(values, type()));
                     })) {
        return false;
    }
    return commit();
}

bool ExportJob::writeMat(SourceWaveform &source, qint64 begin, qint64 count)
{
    if (count > MaxMatSamples) {
        return Tracer::fail(
            QString("%1 samples are more than a variable of a MATLAB 5 file can have: %2. "
                    "Export a piece by --from and --count.")
                .arg(count)
                .arg(MaxMatSamples));
    }
    // Compressed, as other programs save variables; but without the work that it takes.
    StoredZlib packed(matVectorBytes(count));
    const auto pass = [&](int part, int fromPercent) {
        return passSamples(
            *this, source, begin, count,
            [this, part, &packed](std::span<const float> values, std::span<const char>, qint64) {
                QByteArray bytes(static_cast<qsizetype>(values.size() / 2 * sizeof(double)),
                                 Qt::Uninitialized);
                char *target = bytes.data();
                for (size_t i = static_cast<size_t>(part); i < values.size(); i += 2) {
                    qToLittleEndian(static_cast<double>(values[i]), target);
                    target += sizeof(double);
                }
                return put(packed.add(bytes));
            },
            fromPercent, fromPercent + 50);
    };
    const double clock = source.info().clock;
    return put(matFileHead() + matCompressedTag(packed.size())) &&
           put(packed.add(matVectorHead(count))) && pass(0, 0) &&
           put(packed.add(matImaginaryTag(count))) && pass(1, 50) &&
           put(matClock(clock > 0 ? clock : std::numeric_limits<double>::quiet_NaN())) && commit();
}

bool ExportJob::writeSigmf(SourceWaveform &source, qint64 begin, qint64 count)
{
    QCryptographicHash hash(QCryptographicHash::Sha512);
    SigmfMarks marks;
    if (!passSamples(
            *this, source, begin, count,
            [&](std::span<const float> values, std::span<const char> markers, qint64 first) {
                const QByteArray bytes = encoded(values, type());
                hash.addData(bytes);
                marks.add(markers, first - begin);
                return put(bytes);
            })) {
        return false;
    }
    marks.finish(count);
    const SigmfData data{type() == ExportType::Float32 ? "cf32_le" : "ci16_le",
                         hash.result().toHex()};
    OutputFile meta(m_request.outputFile, m_request.overwrite ? OutputFile::Existing::Replaced
                                                              : OutputFile::Existing::Kept);
    const auto cannotWrite = [&] {
        return Tracer::fail(
            QString("Cannot write '%1': %2").arg(m_request.outputFile, meta.errorString()));
    };
    const bool isWhole = count == source.info().samples;
    if (!meta.open()) {
        return cannotWrite();
    }
    const auto write = [&](const QByteArray &bytes) {
        return meta.write(std::span(bytes.constData(), static_cast<size_t>(bytes.size()))) ||
               cannotWrite();
    };
    return writeSigmfMeta(source, data, isWhole, marks, write) && commit() &&
           (meta.commit() || cannotWrite());
}
