// SPDX-License-Identifier: Apache-2.0
#include "DumpJob.h"

#include "base/ProgressClock.h"
#include "base/parallel.h"
#include "log/Tracer.h"
#include "wvfile/SampleCoding.h"

#include <QtEndian>

#include <algorithm>
#include <array>
#include <charconv>
#include <utility>
#include <vector>

namespace {

constexpr qint64 BlockSamples = 16 * 1024;

/// The shortest form of up to nine significant digits: enough to tell any two floats apart.
void appendNumber(QByteArray &line, float value)
{
    constexpr int SignificantDigits = 9;
    std::array<char, 32> text;
    const auto end = std::to_chars(text.data(), text.data() + text.size(), value,
                                   std::chars_format::general, SignificantDigits);
    line.append(text.data(), end.ptr - text.data());
}

QByteArray toCsvLines(qint64 begin, std::span<const float> values, std::span<const char> markers)
{
    QByteArray lines;
    lines.reserve(static_cast<qsizetype>(markers.size()) * 40);
    for (size_t i = 0; i < markers.size(); ++i) {
        lines.append(QByteArray::number(begin + static_cast<qint64>(i))).append(',');
        appendNumber(lines, values[2 * i]);
        lines.append(',');
        appendNumber(lines, values[2 * i + 1]);
        lines.append(',');
        lines.append(QByteArray::number(static_cast<unsigned char>(markers[i]))).append('\n');
    }
    return lines;
}

/// Writing the digits takes far longer than reading the samples, so the processors share it.
QByteArray toCsv(qint64 begin, std::span<const float> values, std::span<const char> markers)
{
    constexpr size_t PartSamples = 2048;
    std::vector<QByteArray> parts((markers.size() + PartSamples - 1) / PartSamples);
    parallelFor(parts.size(), [&](size_t part) {
        const size_t first = part * PartSamples;
        const size_t count = std::min(PartSamples, markers.size() - first);
        parts[part] =
            toCsvLines(begin + static_cast<qint64>(first), values.subspan(2 * first, 2 * count),
                       markers.subspan(first, count));
    });
    QByteArray lines;
    for (const QByteArray &part : parts) {
        lines += part;
    }
    return lines;
}

} // namespace

DumpJob::DumpJob(SampleRange range, DumpFormat format, Sink sink, QObject *parent)
    : SampleReadJob(std::move(range), parent)
    , m_format(format)
    , m_sink(std::move(sink))
{
}

QByteArray DumpJob::encode(qint64 begin, std::span<const float> values,
                           std::span<const char> markers) const
{
    QByteArray bytes;
    switch (m_format) {
    case DumpFormat::Csv:
        return toCsv(begin, values, markers);
    case DumpFormat::Cf32:
        bytes.resize(static_cast<qsizetype>(values.size_bytes()));
        qToLittleEndian<float>(values.data(), static_cast<qsizetype>(values.size()), bytes.data());
        return bytes;
    case DumpFormat::Ci16:
        bytes.resize(static_cast<qsizetype>(2 * values.size()));
        encodeWords(values, std::as_writable_bytes(std::span(bytes.data(), 2 * values.size())));
        return bytes;
    }
    return bytes;
}

bool DumpJob::process(SourceWaveform &source, qint64 begin, qint64 count)
{
    if (!source.data()->restartAtPosition(BufferedIO::HeaderSize +
                                          begin * BufferedIO::RecordSize) ||
        !source.markers()->restartAtPosition(begin)) {
        return Tracer::fail("Cannot set I/Q data stream start position.");
    }
    if (m_format == DumpFormat::Csv && !m_sink("sample,i,q,markers\n")) {
        return false;
    }
    emit stepStarted("Writing Samples...");
    ProgressClock progress([this](int percent) { emit ProgressUpdate(percent); }, cancelFlag());
    std::vector<float> values(2 * static_cast<size_t>(std::min(count, BlockSamples)));
    std::vector<char> markers(values.size() / 2);
    for (qint64 done = 0; done < count;) {
        if (progress.shouldStop(done, count)) {
            return Tracer::fail("Action aborted by user.");
        }
        const auto wanted = static_cast<int>(std::min(count - done, BlockSamples));
        const int bytes = wanted * BufferedIO::RecordSize;
        if (source.data()->readBlock(bytes, values.data()) != bytes ||
            source.markers()->readBlock(wanted, markers.data()) != wanted) {
            return Tracer::fail("Cannot read I/Q data.");
        }
        const auto samples = static_cast<size_t>(wanted);
        if (!m_sink(encode(begin + done, std::span(values).first(2 * samples),
                           std::span(markers).first(samples)))) {
            return false;
        }
        done += wanted;
    }
    // A cancel that came with the last samples counts, too.
    ProgressClock::runEvents();
    return mayProceed() && (!m_finish || m_finish());
}
