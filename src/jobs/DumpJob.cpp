// SPDX-License-Identifier: Apache-2.0
#include "DumpJob.h"

#include "samplepass.h"

#include "base/parallel.h"
#include "wvfile/SampleCoding.h"

#include <QtEndian>

#include <algorithm>
#include <array>
#include <charconv>
#include <utility>
#include <vector>

namespace {

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

QByteArray encodeSamples(DumpFormat format, qint64 begin, std::span<const float> values,
                         std::span<const char> markers)
{
    QByteArray bytes;
    switch (format) {
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
    if (m_format == DumpFormat::Csv && !m_sink(CsvHeading)) {
        return false;
    }
    emit stepStarted("Writing Samples...");
    return passSamples(
               *this, source, begin, count,
               [this](std::span<const float> values, std::span<const char> markers, qint64 first) {
                   return m_sink(encodeSamples(m_format, first, values, markers));
               }) &&
           (!m_finish || m_finish());
}
