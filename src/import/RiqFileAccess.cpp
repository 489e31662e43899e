// SPDX-License-Identifier: Apache-2.0
#include "RiqFileAccess.h"

#include "pcmwords.h"

#include "log/Tracer.h"
#include "streams/BufferedIO.h"
#include "streams/samplestream.h"

#include <QtEndian>

#include <algorithm>
#include <array>
#include <vector>

namespace {

constexpr qint32 MagicNumber = 0x000C4D70;
constexpr qint16 IfDataTag = 901;
constexpr quint32 HasOptionalHeader = 0x80000000U;
constexpr quint32 IsLittleEndian = 0x20000000U;
constexpr int FixedHeaderSize = 28; ///< common and attribute header
constexpr int OptionalHeaderSize = 56;
constexpr int TraceLengthOffset = 20;
constexpr int SampleSize = 4;

using Header = std::array<char, FixedHeaderSize + OptionalHeaderSize>;

template <typename T>
T big(const Header &header, size_t offset)
{
    return qFromBigEndian<T>(header.data() + offset);
}

template <typename T>
T ordered(const Header &header, size_t offset, bool littleEndian)
{
    return littleEndian ? qFromLittleEndian<T>(header.data() + offset) : big<T>(header, offset);
}

/// The size in bytes of a block with all of its headers.
qint64 blockSize(const RiqEntry &block)
{
    return FixedHeaderSize + block.optionalHeaderLength +
           static_cast<qint64>(SampleSize) * block.traceLength;
}

bool refuse(const QString &text, qint64 position)
{
    return Tracer::fail(text + QString(" block starting at positon %1.").arg(position));
}

/// Takes and checks the headers whose place and byte order are fixed.
bool takeFixedHeaders(const Header &header, RiqEntry &block)
{
    block.magic = big<qint32>(header, 0);
    block.versionFirst = big<qint16>(header, 4);
    block.versionSecond = big<qint16>(header, 6);
    block.attributeTag = big<qint16>(header, 16);
    block.traceLength = big<qint16>(header, TraceLengthOffset);
    block.optionalHeaderLength = static_cast<qint8>(header[23]);
    block.selectorFlags = big<qint32>(header, 24);
    const auto flags = static_cast<quint32>(block.selectorFlags);
    block.littleEndian = (flags & IsLittleEndian) != 0;
    if (block.magic != MagicNumber) {
        Tracer::Trace(Tracer::Error, "Invalid magic number in common header.");
        return Tracer::fail(QString::asprintf("Found pattern 0x%08X at position %lld.",
                                              static_cast<quint32>(block.magic), block.position));
    }
    if (block.attributeTag != IfDataTag) {
        Tracer::Trace(Tracer::Error, "Invalid attribute tag in common header.");
        return Tracer::fail(
            QString::asprintf("Found: %d     Expected: %d (IF)", block.attributeTag, IfDataTag));
    }
    if (block.versionFirst == 0 && block.versionSecond == 0) {
        return refuse("Invalid version numbers in data", block.position);
    }
    if ((flags & HasOptionalHeader) == 0) {
        return refuse("No optional header in data", block.position);
    }
    if (block.traceLength <= 0) {
        return refuse("Invalid trace length set in data", block.position);
    }
    return block.optionalHeaderLength >= OptionalHeaderSize ||
           refuse("Invalid opt. data block length found in data", block.position);
}

/// Takes and checks the optional header.
bool takeOptionalHeader(const Header &header, RiqEntry &block)
{
    const bool little = block.littleEndian;
    block.bytesPerSample = ordered<qint16>(header, 30, little);
    block.sampleRate = ordered<qint32>(header, 32, little);
    block.ifBandwidth = ordered<qint32>(header, 40, little);
    block.count = ordered<qint64>(header, 60, little);
    constexpr double HighWordWeight = 65536; // the recorder's own, though the low word has 32 bits
    block.ifFrequency = ordered<quint32>(header, 68, little) * HighWordWeight +
                        ordered<quint32>(header, 36, little);
    constexpr qint64 NsPerMs = 1'000'000;
    block.timeStamp = QDateTime::fromMSecsSinceEpoch(ordered<qint64>(header, 76, little) / NsPerMs);
    if (block.bytesPerSample != SampleSize) {
        return refuse("Invalid number of bytes/sample set in data", block.position);
    }
    if (block.sampleRate <= 0) {
        return refuse("Invalid sample rate set in data", block.position);
    }
    return block.ifBandwidth != 0 || refuse("Invalid IF bandwidth set in data", block.position);
}

bool sameParameters(const RiqEntry &a, const RiqEntry &b)
{
    return a.ifFrequency == b.ifFrequency && a.sampleRate == b.sampleRate &&
           a.selectorFlags == b.selectorFlags && a.ifBandwidth == b.ifBandwidth &&
           a.optionalHeaderLength == b.optionalHeaderLength;
}

void logEntry(const RiqEntry &entry)
{
    Tracer::Trace(Tracer::Information,
                  QString::asprintf("Packet at position %lld (0x%08llX)", entry.position,
                                    static_cast<unsigned long long>(entry.position)));
    if (!Tracer::isEnabled(Tracer::Debug)) {
        return;
    }
    QStringList lines;
    if (entry.littleEndian) {
        lines += "  Optional header is Little-Endian.";
    }
    lines += QString("  Opt. Header Len : %1 Bytes").arg(entry.optionalHeaderLength);
    lines += QString("  Time Stamp : %1").arg(entry.timeStamp.toString("dd.MM.yyyy hh:mm:ss"));
    lines += QString("  IF Frequency : %1 MHz").arg(entry.ifFrequency / 1e6);
    lines += QString("  Samples : %1").arg(entry.traceLength);
    lines += QString("  Sample Rate : %1 Hz").arg(entry.sampleRate);
    for (const QString &line : lines) {
        Tracer::Trace(Tracer::Debug, line);
    }
}

} // namespace

RiqFileAccess::RiqFileAccess(QObject *parent)
    : FileAccess(parent)
{
}

void RiqFileAccess::forget()
{
    m_directoryValid = false;
    m_entries.clear();
}

RiqEntry RiqFileAccess::entry(qsizetype index) const
{
    return m_directoryValid ? m_entries.value(index) : RiqEntry();
}

bool RiqFileAccess::readDirectory()
{
    forget();
    if (!isOpen()) {
        return Tracer::fail("File is not open.");
    }
    if (!walk()) {
        m_entries.clear();
        return false;
    }
    m_directoryValid = true;
    emit ProgressUpdate(100);
    return true;
}

bool RiqFileAccess::walk()
{
    ProgressClock progress = startProgress();
    const qint64 fileSize = device()->size();
    Header header{};
    qint64 position = 0;
    while (position < fileSize && device()->seek(position)) {
        if (progress.shouldStop(position, fileSize)) {
            return Tracer::fail("*** Action aborted by user.");
        }
        const qint64 got = device()->read(header.data(), header.size());
        if (got < FixedHeaderSize) {
            break;
        }
        RiqEntry block;
        block.position = position;
        if (!takeFixedHeaders(header, block)) {
            return false;
        }
        if (got < static_cast<qint64>(header.size())) {
            // What the end of the file cuts is no error; a device that fails before it is one.
            if (device()->size() < position + static_cast<qint64>(header.size())) {
                break;
            }
            return refuse("Invalid optional header in data", position);
        }
        if (!takeOptionalHeader(header, block)) {
            return false;
        }
        position += blockSize(block);
        if (position > fileSize) {
            break;
        }
        addBlock(block);
    }
    return true;
}

void RiqFileAccess::addBlock(const RiqEntry &block)
{
    if (m_entries.isEmpty() || !sameParameters(m_entries.last(), block)) {
        m_entries.append(block);
        logEntry(block);
    }
    RiqEntry &entry = m_entries.last();
    entry.valid = true;
    entry.traceLength = block.traceLength;
    entry.samples += block.traceLength;
    ++entry.blocks;
}

bool RiqFileAccess::readSamples(qsizetype index, BufferedIO *stream, qint64 limit)
{
    Tracer::Trace(Tracer::Information, "Reading data from RIQ file.");
    if (!m_directoryValid) {
        return Tracer::fail("Directory structure is invalid.");
    }
    if (!isOpen()) {
        return Tracer::fail("File is not open.");
    }
    if (index < 0 || index >= m_entries.size()) {
        return Tracer::fail("Invalid data block.");
    }
    const RiqEntry &entry = m_entries.at(index);
    if (!entry.valid) {
        return Tracer::fail("Directory entry is invalid.");
    }
    if (!stream->writeHeader(BufferedIO::DataHeader)) {
        return Tracer::fail("Cannot write to temporary file.");
    }
    Tracer::Trace(Tracer::Information, QString("  Start position : %1").arg(entry.position));
    Tracer::Trace(Tracer::Information, QString("  UDP Blocks to process : %1").arg(entry.blocks));
    Tracer::Trace(Tracer::Information, QString("  Samples to read : %1").arg(entry.samples));

    ProgressClock progress = startProgress();
    const int headSize = FixedHeaderSize + entry.optionalHeaderLength;
    constexpr size_t MaxSamples = 32767;
    std::vector<char> head(static_cast<size_t>(headSize));
    std::vector<qint16> words(2 * MaxSamples);
    // Several UDP blocks make one transfer to the stream.
    std::vector<float> values(2 * MaxSamples + floatsOf(StreamBlockSamples));
    size_t held = 0;
    const auto store = [&] {
        const auto bytes = static_cast<int>(held * sizeof(float));
        held = 0;
        return stream->writeBlock(bytes, values.data()) ||
               Tracer::fail("Cannot write to temporary file.");
    };
    qint64 position = entry.position;
    qint64 samples = 0;
    quint32 block = 0;
    for (; block < entry.blocks && (limit <= 0 || samples < limit); ++block) {
        if (progress.shouldStop(samples, entry.samples)) {
            return Tracer::fail("*** Action aborted by user.");
        }
        if (position > device()->size() || !device()->seek(position)) {
            return Tracer::fail("Cannot set start position of UDP block.");
        }
        const qint64 headRead = device()->read(head.data(), headSize);
        const qint16 length = headRead >= TraceLengthOffset + qint64(sizeof(qint16))
                                  ? qFromBigEndian<qint16>(head.data() + TraceLengthOffset)
                                  : qint16(-1);
        if (length < 0) {
            return Tracer::fail(QString("Invalid trace length in UDP block %1.").arg(block));
        }
        if (length == 0) {
            Tracer::Trace(Tracer::Information,
                          QString("UDP block %1 does not contain data. Aborting.").arg(block));
            break;
        }
        if (headRead < headSize) {
            return Tracer::fail("Cannot set start position of UDP data block.");
        }
        position += headSize + static_cast<qint64>(SampleSize) * length;
        const qint64 wanted = limit > 0 ? std::min<qint64>(length, limit - samples) : length;
        if (device()->read(reinterpret_cast<char *>(words.data()), wanted * SampleSize) <
            wanted * SampleSize) {
            return Tracer::fail("Cannot read data from .riq file.");
        }
        convertWords(std::span(words).first(2 * static_cast<size_t>(wanted)), entry.littleEndian,
                     values.data() + held);
        held += floatsOf(static_cast<int>(wanted));
        if (held >= floatsOf(StreamBlockSamples) && !store()) {
            return false;
        }
        samples += wanted;
    }
    if (held > 0 && !store()) {
        return false;
    }
    Tracer::Trace(Tracer::Information,
                  QString("%1 UDP blocks (%2 samples) processed.").arg(block).arg(samples));
    return true;
}
