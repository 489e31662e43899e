// SPDX-License-Identifier: Apache-2.0
#include "WvWriter.h"

#include "SampleCoding.h"
#include "streams/BufferedIO.h"
#include "streams/levels.h"

#include "base/OutputFile.h"
#include "base/ProgressClock.h"
#include "log/Tracer.h"

#include <QDateTime>

#include <algorithm>
#include <array>
#include <charconv>
#include <cmath>
#include <cstring>
#include <utility>
#include <vector>

namespace {

constexpr int BlockSamples = 64 * 1024;

const char *typeName(int type)
{
    switch (type) {
    case WvTypeTbx:
        return "TBX-WV";
    case WvTypeTvx:
        return "TVX-WV";
    default:
        return "TGX-WV";
    }
}

/// Index of the first byte whose masked state differs from `state`, or the size.
size_t findChange(std::span<const quint8> bytes, size_t from, quint8 mask, quint8 state)
{
    const quint64 wideMask = 0x0101010101010101ULL * mask;
    const quint64 wideState = 0x0101010101010101ULL * state;
    size_t i = from;
    for (; i + sizeof(quint64) <= bytes.size(); i += sizeof(quint64)) {
        quint64 wide = 0;
        std::memcpy(&wide, bytes.data() + i, sizeof wide);
        if ((wide & wideMask) != wideState) {
            break;
        }
    }
    while (i < bytes.size() && (bytes[i] & mask) == state) {
        ++i;
    }
    return i;
}

/// Appends "0:1", or ";12:0" for any position but the first.
void appendTransition(QByteArray &text, int position, bool high)
{
    if (position > 0) {
        text.append(';');
    }
    std::array<char, 16> digits;
    const auto [end, error] = std::to_chars(digits.begin(), digits.end(), position);
    text.append(digits.data(), end - digits.data());
    text.append(high ? ":1" : ":0", 2);
}

} // namespace

WvWriter::WvWriter(WvWriteJob &job, const WvStreams &streams, ProgressClock &progress,
                   std::function<void(int)> report)
    : m_job(job)
    , m_streams(streams)
    , m_progress(progress)
    , m_report(std::move(report))
    , m_markersFromMemory(!job.markers.isEmpty() && streams.markers == nullptr)
    , m_markersFromStream(job.markers.isEmpty() && job.markerLists && streams.markers != nullptr)
{
}

void WvWriter::prepareLevels()
{
    double rms = 0;
    double peak = 0;
    if (!m_job.levelsValid && !m_job.iSamples.isEmpty() && !m_job.qSamples.isEmpty()) {
        Tracer::Trace(Tracer::Information, "Calculating Peak and RMS data from waveform...");
        double sum = 0;
        for (qsizetype i = 0; i < m_job.samples; ++i) {
            const float inPhase = m_job.iSamples.at(i);
            const float quadrature = m_job.qSamples.at(i);
            const float power = inPhase * inPhase + quadrature * quadrature;
            sum += static_cast<double>(power);
            peak = std::max(peak, static_cast<double>(std::sqrt(power)));
        }
        // Silence is given the level of -100 dB, which is told apart from any real signal.
        constexpr double Silence = 1e-5;
        rms = std::sqrt(sum / m_job.samples);
        rms = rms == 0 ? Silence : rms;
        peak = peak == 0 ? Silence : peak;
        m_job.rmsOffset = levelOffset(rms);
        m_job.peakOffset = levelOffset(peak);
    }
    const auto info = [](const QString &line) { Tracer::Trace(Tracer::Information, line); };
    info("========== Signal Statistics ==========");
    info(QString::asprintf("ARB clock :%4.3f Hz", m_job.clock));
    info(QString::asprintf("MKR clock :%4.3f Hz", m_job.markerClock));
    info(QString::asprintf("Samples   :%ld", static_cast<long>(m_job.samples)));
    info(QString::asprintf("RMS       :%5.2f (RMS-Offset: %5.2f dBfs)", rms, m_job.rmsOffset));
    info(QString::asprintf("PEAK      :%5.2f (PK-Offset: %5.2f dBfs)", peak, m_job.peakOffset));
    info(QString::asprintf("Pk/Av     :%5.2f dB", m_job.rmsOffset - m_job.peakOffset));
    info("=======================================");
}

bool WvWriter::put(OutputFile &file, std::span<const char> bytes)
{
    return file.write(bytes) || Tracer::fail("Error writing output file: " + file.errorString());
}

bool WvWriter::write(OutputFile &file)
{
    m_report(10);
    if (!writeTags(file) || !copyTagsStream(file) || !writeMarkers(file)) {
        return false;
    }
    m_report(50);
    const auto blockBytes = 4 * static_cast<qint64>(m_job.samples) + 1;
    return put(file, "{WAVEFORM-" + QByteArray::number(blockBytes) + ": #") && writeSamples(file) &&
           put(file, QByteArray("}"));
}

bool WvWriter::writeTags(OutputFile &file)
{
    QString text = QString("{TYPE: %1,0}").arg(typeName(m_job.type));
    if (!m_job.comment.isEmpty()) {
        text += "{COMMENT:" + m_job.comment + "}";
    }
    if (!m_job.copyright.isEmpty()) {
        text += "{COPYRIGHT:" + m_job.copyright + "}";
    }
    text += QDateTime::currentDateTime().toString("'{DATE:'yyyy-MM-dd;HH:mm:ss'}'");
    text += QString::asprintf("{CLOCK:%f}", m_job.clock);
    text += QString::asprintf("{CLOCK MARKER:%f}", m_job.markerClock);
    text += QString::asprintf("{LEVEL OFFS:%f,%f}", m_job.rmsOffset, m_job.peakOffset);
    text += QString("{SAMPLES:%1}").arg(m_job.samples);
    return put(file, text.toLatin1());
}

bool WvWriter::copyTagsStream(OutputFile &file)
{
    if (m_streams.tags == nullptr) {
        return true;
    }
    // Not fatal: the samples are worth more than tags that nobody here knows.
    const auto warn = [] {
        Tracer::Trace(Tracer::Warning, "Cannot read the unknown tags. They are not in the file.");
        return true;
    };
    if (!m_streams.tags->restartAtBegining()) {
        return warn();
    }
    QByteArray block(BlockSamples, Qt::Uninitialized);
    for (;;) {
        const int got = m_streams.tags->readBlock(static_cast<int>(block.size()), block.data());
        if (got <= 0) {
            return got == 0 || warn();
        }
        if (!put(file, std::span(block).first(static_cast<size_t>(got)))) {
            return false;
        }
    }
}

bool WvWriter::writeMarkers(OutputFile &file)
{
    if (!m_markersFromMemory && !m_markersFromStream) {
        return true;
    }
    Tracer::Trace(Tracer::Information,
                  m_markersFromMemory ? "Creating marker trace from memory buffer..."
                                      : "Creating marker trace from temporary marker file ...");
    const QString format = m_markersFromMemory ? "{CONTROL LENGTH:%1}" : "{CONTROL LENGTH: %1}";
    if (!put(file, format.arg(m_job.samples).toLatin1())) {
        return false;
    }
    for (int marker = 1; marker <= MarkerCount; ++marker) {
        if (!writeMarkerList(file, marker)) {
            return false;
        }
    }
    return true;
}

bool WvWriter::writeMarkerList(OutputFile &file, int marker)
{
    if (m_markersFromStream && marker > 1 && !m_streams.markers->restartAtBegining()) {
        return Tracer::fail("Error resetting buffer for temporary marker data.");
    }
    const auto mask = static_cast<quint8>(1U << (marker - 1));
    QByteArray text = "{MARKER LIST " + QByteArray::number(marker) + ": ";
    std::vector<quint8> block(static_cast<size_t>(std::min(m_job.samples, BlockSamples)));
    quint8 state = 0;
    for (int begin = 0; begin < m_job.samples;) {
        const int count = std::min(m_job.samples - begin, BlockSamples);
        const auto bytes = std::span(block).first(static_cast<size_t>(count));
        if (!fetchMarkers(begin, bytes)) {
            return false;
        }
        // The first transition always stands at position 0, whatever its state.
        size_t i = begin == 0 ? 0 : findChange(bytes, 0, mask, state);
        while (i < bytes.size()) {
            state = bytes[i] & mask;
            const int position = begin + static_cast<int>(i);
            appendTransition(text, position, state != 0);
            i = findChange(bytes, i, mask, state);
        }
        begin += count;
        if (text.size() > BlockSamples) {
            if (!put(file, text)) {
                return false;
            }
            text.resize(0); // keeps the memory
        }
        if (m_progress.shouldStop(10 + 10 * (marker - 1))) {
            return Tracer::fail("Action aborted by user.");
        }
    }
    return put(file, text + '}');
}

bool WvWriter::fetchMarkers(int begin, std::span<quint8> bytes)
{
    if (m_markersFromStream) {
        const int wanted = static_cast<int>(bytes.size());
        return m_streams.markers->readBlock(wanted, bytes.data()) == wanted ||
               Tracer::fail("Error reading marker data from temporary file.");
    }
    for (size_t i = 0; i < bytes.size(); ++i) {
        bytes[i] = static_cast<quint8>(m_job.markers.at(begin + static_cast<qsizetype>(i)) & 0xF);
    }
    return true;
}

int WvWriter::fetchSamples(int begin, std::span<float> values)
{
    if (m_streams.data != nullptr) {
        const int wanted = static_cast<int>(values.size_bytes());
        return std::max(m_streams.data->readBlock(wanted, values.data()), 0) /
               BufferedIO::RecordSize;
    }
    for (size_t i = 0; i < values.size() / 2; ++i) {
        values[2 * i] = m_job.iSamples.at(begin + static_cast<qsizetype>(i));
        values[2 * i + 1] = m_job.qSamples.at(begin + static_cast<qsizetype>(i));
    }
    return static_cast<int>(values.size() / 2);
}

bool WvWriter::writeSamples(OutputFile &file)
{
    std::vector<float> values(2 * static_cast<size_t>(std::min(m_job.samples, BlockSamples)));
    std::vector<std::byte> words(2 * values.size());
    ClipCount clipped;
    LoopMeter loop;
    for (int done = 0; done < m_job.samples;) {
        if (m_progress.shouldStop(done, m_job.samples, 50, 100)) {
            return Tracer::fail("Action aborted by user.");
        }
        const int wanted = std::min(m_job.samples - done, BlockSamples);
        const int got =
            fetchSamples(done, std::span(values).first(2 * static_cast<size_t>(wanted)));
        const auto bytes = std::span(words).first(4 * static_cast<size_t>(got));
        const auto samples = std::span(values).first(2 * static_cast<size_t>(got));
        encodeWords(samples, bytes);
        const qint64 clippedBefore = clipped.values;
        countClipped(samples, clipped);
        if (clipped.values != clippedBefore) {
            limitToFullScale(samples);
        }
        loop.add(samples);
        if (!put(file, {reinterpret_cast<const char *>(bytes.data()), bytes.size()})) {
            return false;
        }
        if (got < wanted) {
            return Tracer::fail("Error reading waveform data from temporary file.");
        }
        done += got;
    }
    m_job.clippedValues = clipped.values;
    m_job.largestValue = clipped.largest;
    m_job.loop = loop.result();
    return true;
}
