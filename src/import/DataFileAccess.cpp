// SPDX-License-Identifier: Apache-2.0
#include "DataFileAccess.h"

#include "TextLines.h"
#include "datavalues.h"

#include "base/EngineeringNumber.h"
#include "base/SideWorker.h"
#include "base/freespace.h"
#include "base/limits.h"
#include "log/Tracer.h"
#include "streams/samplestream.h"

#include <QFile>
#include <QFileInfo>
#include <QRegularExpression>

#include <array>
#include <cmath>

namespace {

void say(const QString &text)
{
    Tracer::Trace(Tracer::Information, text);
}

QString textOf(std::string_view text)
{
    return QString::fromUtf8(text.data(), static_cast<qsizetype>(text.size()));
}

bool isTagLine(std::string_view line)
{
    return line[0] == '#' || line[0] == '%' || line[0] == '/' || line[0] == '!';
}

/// The most samples that a waveform, or this import, takes.
qint64 mostSamples(qint64 limit)
{
    return limit > 0 ? std::min(limit, MaxSamples) : MaxSamples;
}

bool tooManySamples()
{
    return Tracer::fail(QString("The data holds more than %1 samples.").arg(MaxSamples));
}

/// Whether all parts of a line, blanks, tabs and semicolons apart, are numbers like "0,5". Their
/// halves would be taken for numbers of their own.
bool hasDecimalCommas(std::string_view line)
{
    static const QRegularExpression gaps("[;\t ]+");
    const QStringList parts = textOf(line).split(gaps, Qt::SkipEmptyParts);
    static const QRegularExpression number("^[+-]?\\d+,\\d+([eE][+-]?\\d+)?$");
    return parts.size() > 1 && std::all_of(parts.begin(), parts.end(), [](const QString &part) {
               return number.match(part).hasMatch();
           });
}

/// A level offset in dB that stays finite for silence, as everywhere in files.
double offsetOf(double level)
{
    constexpr double Silence = 1e-12;
    return levelOffset(level > 0 ? level : Silence);
}

bool open(QFile &file, const char *missingText, const char *unreadableText)
{
    // A pipe or a device may never end.
    if (!QFileInfo(file.fileName()).isFile()) {
        return Tracer::fail(missingText);
    }
    return file.open(QIODevice::ReadOnly) || Tracer::fail(unreadableText);
}

/// Checks the magnitude of raw numbers: wrong settings make numbers of any size.
bool checkMagnitudes(std::span<const float> iq, qint64 firstSample)
{
    constexpr float Largest = 1000;
    for (size_t i = 0; i + 1 < iq.size(); i += 2) {
        // A number that is none fails, too.
        if (!(std::fabs(iq[i]) <= Largest && std::fabs(iq[i + 1]) <= Largest)) {
            Tracer::Trace(Tracer::Error,
                          "Numbers appear to be too large. Check conversion settings!");
            return Tracer::fail(QString::asprintf(
                "    (Sample #%lld: I=%1.3f, Q=%1.3f)", firstSample + static_cast<qint64>(i / 2),
                static_cast<double>(iq[i]), static_cast<double>(iq[i + 1])));
        }
    }
    return true;
}

} // namespace

DataFileAccess::DataFileAccess(QObject *parent)
    : ReadControl(parent)
{
}

bool DataFileAccess::importData(const WvImportJob &job, WvWriteJob *result, BufferedIO *data,
                                qint64 limit)
{
    QFile first(job.file1);
    if (!open(first, "Input file does not exist.", "Error opening input file.")) {
        return false;
    }
    if (!job.useFile2) {
        return importDevices(job, first, nullptr, result, data, limit);
    }
    say((job.binary ? "Importing from 2nd BINARY file '" : "Importing from 2nd ASCII file '") +
        job.file2 + '\'');
    QFile second(job.file2);
    return open(second, "2nd input file does not exist.", "Error opening 2nd input file.") &&
           importDevices(job, first, &second, result, data, limit);
}

bool DataFileAccess::importDevices(const WvImportJob &job, QIODevice &first, QIODevice *second,
                                   WvWriteJob *result, BufferedIO *data, qint64 limit)
{
    if (!result || !data) {
        return Tracer::fail("Invalid input arguments.");
    }
    m_samples = 0;
    m_comment.clear();
    m_copyright.clear();
    m_clockHz.reset();
    m_clipped = ClipCount();
    m_sums = LevelSums();
    if (!data->restartAtBegining()) {
        return Tracer::fail("Temporary file for wave data cannot be opened.");
    }
    if (!data->writeHeader(BufferedIO::DataHeader)) {
        return Tracer::fail("Cannot write to temporary waveform storage.");
    }
    const bool read = job.binary ? readBinary(job, first, second, *data, limit)
                                 : readText(job, first, second, *data, limit);
    if (!read) {
        return false;
    }
    if (m_samples == 0) {
        return Tracer::fail("No samples found in the input file.");
    }
    return finish(job, *result, *data);
}

bool DataFileAccess::readText(const WvImportJob &job, QIODevice &first, QIODevice *second,
                              BufferedIO &data, qint64 limit)
{
    std::vector<float> iq(floatsOf(StreamBlockSamples));
    const auto take = [&](std::span<float> values) {
        if (!second) {
            addLevels(values, m_sums);
            return writeSamples(data, values);
        }
        for (size_t i = 0; i < values.size(); ++i) {
            iq[2 * i] = values[i];
            iq[2 * i + 1] = 0;
        }
        return writeSamples(data, std::span(iq).first(2 * values.size()));
    };
    return readLines(job.format, first, second ? 1 : 2, limit, m_samples, take) &&
           (!second || addSecondText(job.format, *second, data, limit));
}

/// Reads the Q of each sample over the zeros that stand for them.
bool DataFileAccess::addSecondText(const ValueFormat &format, QIODevice &second, BufferedIO &data,
                                   qint64 limit)
{
    if (!data.checkHeader(BufferedIO::DataHeader) ||
        !data.writeBytes(BufferedIO::HeaderSize, BufferedIO::DataHeader)) {
        return Tracer::fail("Error writing to temporary waveform file.");
    }
    std::vector<float> iq(floatsOf(StreamBlockSamples));
    qint64 merged = 0;
    const auto take = [&](std::span<float> values) {
        // What lies beyond the first file is counted only.
        const auto count = static_cast<int>(
            std::min<qint64>(static_cast<qint64>(values.size()), m_samples - merged));
        const auto block = std::span(iq).first(floatsOf(count));
        if (count == 0) {
            return true;
        }
        if (readSamples(data, block) < count) {
            return Tracer::fail("2nd file contains more data than first file.");
        }
        for (size_t i = 0; i < static_cast<size_t>(count); ++i) {
            block[2 * i + 1] = values[i];
        }
        merged += count;
        addLevels(block, m_sums);
        return writeSamples(data, block);
    };
    qint64 count = 0;
    if (!readLines(format, second, 1, limit, count, take)) {
        return false;
    }
    if (count == m_samples) {
        return true;
    }
    Tracer::Trace(Tracer::Error, QString("The files don't match: %1 I values in the first, "
                                         "%2 Q values in the second.")
                                     .arg(m_samples)
                                     .arg(count));
    if (count > m_samples) {
        Tracer::Trace(Tracer::Error, "2nd file contains more data than first file.");
    }
    return false;
}

/// Reads lines of `columns` values each and hands them on in blocks.
bool DataFileAccess::readLines(const ValueFormat &format, QIODevice &device, size_t columns,
                               qint64 limit, qint64 &count,
                               const std::function<bool(std::span<float>)> &take)
{
    ProgressClock progress = startProgress();
    TextLines lines(device, progress);
    std::vector<float> block(columns * StreamBlockSamples);
    std::array<double, 2> values{};
    const auto row = std::span(values).first(columns);
    size_t filled = 0;
    std::string_view line;
    const auto refuse = [&] {
        Tracer::Trace(Tracer::Error, QString("Line %1:").arg(lines.lineNumber()));
        Tracer::Trace(Tracer::Error, textOf(line));
        return Tracer::fail("Error importing IQ ASCII floating point data.");
    };
    while ((limit <= 0 || count < limit) && lines.next(line)) {
        if (isTagLine(line)) {
            if (!takeTagLine(line, lines.lineNumber())) {
                return false;
            }
            continue;
        }
        if (count == 0 && hasDecimalCommas(line)) {
            Tracer::Trace(Tracer::Error,
                          QString("Line %1 has decimal commas. Write its numbers with points: "
                                  "commas separate numbers here.")
                              .arg(lines.lineNumber()));
            return refuse();
        }
        if (!getValuesFromLine(line, row, format, lines.lineNumber())) {
            return refuse();
        }
        if (count == MaxSamples) {
            return tooManySamples();
        }
        for (const double value : row) {
            block[filled++] = static_cast<float>(value);
        }
        ++count;
        if (filled == block.size()) {
            if (!take(block)) {
                return Tracer::fail("Error writing to temporary waveform file.");
            }
            filled = 0;
        }
    }
    if (lines.hasFailed()) {
        return false;
    }
    if (filled > 0 && !take(std::span(block).first(filled))) {
        return Tracer::fail("Error writing to temporary waveform file.");
    }
    say(QString("Processed lines      : %1").arg(lines.lineNumber()));
    say(QString("Imported data points : %1").arg(count));
    return true;
}

bool DataFileAccess::takeTagLine(std::string_view line, qint64 lineNumber)
{
    const QString text = textOf(line);
    say("Evaluating tag " + text);
    const qsizetype equals = text.indexOf('=');
    if (equals < 0) {
        return true;
    }
    // The name may stand anywhere in the line, but the value isn't searched for names.
    const QString name = text.left(equals).toUpper();
    const QString value = text.mid(equals + 1).trimmed();
    if (name.contains("COMMENT")) {
        m_comment = value;
    }
    if (name.contains("COPYRIGHT")) {
        m_copyright = value;
    }
    if (name.contains("CLOCKRATE")) {
        constexpr double Lowest = 400;
        bool plain = false;
        double clock = value.toDouble(&plain);
        if (!plain) {
            const std::optional<ParsedNumber> number = parseNumber(value, "Hz", true);
            clock = number ? number->value : 0;
        }
        if (!(clock >= Lowest && clock <= MaxClockHz)) {
            return Tracer::fail(QString("Line %1: Number for CLOCKRATE is out of range. Aborting.")
                                    .arg(lineNumber));
        }
        m_clockHz = clock;
    }
    return true;
}

bool DataFileAccess::readBinary(const WvImportJob &job, QIODevice &first, QIODevice *second,
                                BufferedIO &data, qint64 limit)
{
    const int size = binaryValueSize(job.format.precision);
    if (size == 0) {
        return Tracer::fail("Binary precision not supported.");
    }
    if (!isBinaryFormatKnown(job.format)) {
        return Tracer::fail("Unsupported file format.");
    }
    ProgressClock progress = startProgress();
    const size_t valuesOfFirst = floatsOf(StreamBlockSamples) / (second ? 2 : 1);
    const auto valueBytes = static_cast<size_t>(size);
    std::vector<std::byte> bytes(valuesOfFirst * valueBytes);
    // While the levels of one block are summed, the next one is fetched.
    std::array<std::vector<float>, 2> blocks;
    blocks.fill(std::vector<float>(floatsOf(StreamBlockSamples)));
    std::vector<float> part(valuesOfFirst);
    SideWorker sums;
    /// Fetches up to `count` values; how many came.
    const auto fetch = [&](QIODevice &device, size_t count, float *target) {
        const qint64 got = device.read(reinterpret_cast<char *>(bytes.data()),
                                       static_cast<qint64>(count * valueBytes));
        const size_t whole = static_cast<size_t>(std::max<qint64>(got, 0)) / valueBytes;
        convertBinary(std::span(bytes).first(whole * valueBytes), job.format, {target, whole});
        return whole;
    };
    const qint64 most = mostSamples(limit);
    // What a pipe brings isn't known before.
    const qint64 expected = first.isSequential() ? 0 : first.size() / size / (second ? 1 : 2);
    if (!hasTemporaryRoomFor(std::min(expected, most) * BufferedIO::RecordSize)) {
        return false;
    }
    while (m_samples < most) {
        if (progress.shouldStop(first.pos(), first.size())) {
            return Tracer::fail("Action aborted by user.");
        }
        const auto wanted =
            static_cast<size_t>(std::min<qint64>(most - m_samples, StreamBlockSamples));
        std::vector<float> &iq = blocks.front();
        size_t samples = 0;
        if (!second) {
            samples = fetch(first, 2 * wanted, iq.data()) / 2;
        } else {
            samples = fetch(first, wanted, part.data());
            for (size_t i = 0; i < samples; ++i) {
                iq[2 * i] = part[i];
            }
            if (fetch(*second, samples, part.data()) < samples) {
                return Tracer::fail("Number of I and Q values disagree.");
            }
            for (size_t i = 0; i < samples; ++i) {
                iq[2 * i + 1] = part[i];
            }
        }
        const auto block = std::span(iq).first(2 * samples);
        // Integers can't leave the range by more than a step.
        if (job.format.dataFormat == DataFormat::Rational && !checkMagnitudes(block, m_samples)) {
            return false;
        }
        sums.start([this, block] { addLevels(block, m_sums); });
        blocks.front().swap(blocks.back());
        if (samples > 0 && !data.writeBlock(static_cast<int>(block.size_bytes()), block.data())) {
            return Tracer::fail("Cannot write to temporary waveform storage.");
        }
        m_samples += static_cast<qint64>(samples);
        if (samples < wanted) {
            break;
        }
    }
    sums.wait();
    if (limit <= 0 && m_samples == MaxSamples && !first.atEnd()) {
        return tooManySamples();
    }
    say(QString("%1 values imported.").arg(m_samples));
    return true;
}

bool DataFileAccess::finish(const WvImportJob &job, WvWriteJob &result, BufferedIO &data)
{
    const double peak = m_sums.peakLevel();
    if (!std::isfinite(peak) || !std::isfinite(m_sums.sum)) {
        return Tracer::fail("Numbers appear to be too large. Check conversion settings!");
    }
    const bool full = job.scaling == ImportScaling::Auto;
    // Silence stays silence.
    if (peak > 0 && (full ? peak != 1 : peak > 1) && !scale(job.scaling, peak, data)) {
        return false;
    }
    if (!data.restartAtBegining()) {
        return Tracer::fail("Resetting the temporary waveform storage failed.");
    }
    result.samples = static_cast<int>(m_samples);
    result.comment = m_comment;
    result.copyright = m_copyright;
    result.rmsOffset = offsetOf(m_sums.rmsLevel(m_samples));
    result.peakOffset = offsetOf(m_sums.peakLevel());
    result.levelsValid = true;
    return true;
}

bool DataFileAccess::scale(ImportScaling scaling, double peak, BufferedIO &data)
{
    say("Peak vector is " + QString::number(peak, 'g') + " Scaling to 1.0...");
    if (!data.checkHeader(BufferedIO::DataHeader)) {
        return Tracer::fail("Error reading header from temporary waveform storage.");
    }
    if (!data.writeBytes(BufferedIO::HeaderSize, BufferedIO::DataHeader)) {
        return Tracer::fail("Error writing header to temporary waveform storage.");
    }
    m_sums = LevelSums();
    qint64 clippedSamples = 0;
    qint64 tooLong = 0;
    const auto clip = [&](std::span<float> iq) {
        countClipped(iq, m_clipped);
        for (size_t i = 0; i + 1 < iq.size(); i += 2) {
            const float inPhase = std::clamp(iq[i], -1.0F, 1.0F);
            const float quadrature = std::clamp(iq[i + 1], -1.0F, 1.0F);
            const bool changed = inPhase != iq[i] || quadrature != iq[i + 1];
            clippedSamples += changed ? 1 : 0;
            tooLong += changed && std::hypot(inPhase, quadrature) > 1 ? 1 : 0;
            iq[i] = inPhase;
            iq[i + 1] = quadrature;
        }
    };
    ProgressClock progress = startProgress();
    const BlockLoop loop = forEachBlock(
        data, m_samples, [&](qint64 done) { return progress.shouldStop(done, m_samples); },
        [&](std::span<float> iq, qint64) {
            if (scaling == ImportScaling::None) {
                clip(iq);
            } else {
                for (float &value : iq) {
                    value = static_cast<float>(value / peak);
                }
            }
            addLevels(iq, m_sums);
            return writeSamples(data, iq);
        });
    switch (loop.end) {
    case BlockLoop::Stopped:
        return Tracer::fail("Action aborted by user.");
    case BlockLoop::ReadFailed:
        return Tracer::fail("Error reading samples from temporary file");
    case BlockLoop::WorkFailed:
        return Tracer::fail("Error writing samples to temporary file");
    case BlockLoop::Done:
        break;
    }
    if (clippedSamples > 0) {
        say(QString("%1 samples clipped.").arg(clippedSamples));
    }
    if (tooLong > 0) {
        say(QString("%1 samples exceed max. vector length of 1.0.").arg(tooLong));
    }
    if (scaling != ImportScaling::None) {
        // Rounding may leave the largest vector a little beside full scale.
        m_sums.peak = 1;
    }
    say("New Peak value is " + QString::number(m_sums.peakLevel(), 'g'));
    say("New RMS value is " + QString::number(m_sums.rmsLevel(m_samples), 'g'));
    return true;
}
