// SPDX-License-Identifier: Apache-2.0
#include "WavFileAccess.h"

#include "pcmwords.h"

#include "log/Tracer.h"
#include "streams/BufferedIO.h"

#include <QDataStream>
#include <QtEndian>

#include <algorithm>
#include <cstring>
#include <vector>

namespace {

constexpr qint64 ChunkIdSize = 4;
constexpr qint64 ChunkHeadSize = 8;
constexpr int BlockSamples = 64 * 1024;

/// A length of 32 bits in a file whose true lengths stand in its chunk "ds64".
constexpr quint32 LengthStandsElsewhere = 0xFFFFFFFF;

constexpr quint16 Pcm = 1;
constexpr quint16 IeeeFloat = 3;
constexpr quint16 Extensible = 0xFFFE;

/// Values of full scale 1; of whole numbers the most negative becomes -1.
void toFloats(const WavHeader &header, std::span<char> bytes, std::span<float> values)
{
    const int width = header.bitsPerSample / 8;
    if (width == 2) {
        std::vector<qint16> words(values.size());
        if (!words.empty()) {
            std::memcpy(words.data(), bytes.data(), bytes.size());
        }
        convertWords(words, true, values.data());
        return;
    }
    const char *source = bytes.data();
    for (float &value : values) {
        if (width == 1) {
            // The only width without a sign.
            value = static_cast<float>(static_cast<quint8>(*source) - 128) / 128.0F;
        } else if (header.isFloat) {
            value = qFromLittleEndian<float>(source);
        } else {
            // Left-aligned, so that the sign stands in the sign's place.
            quint32 word = 0;
            for (int byte = 0; byte < width; ++byte) {
                word = word >> 8 | quint32(static_cast<quint8>(source[byte])) << 24;
            }
            constexpr double FullScale = 2147483648.0;
            value = static_cast<float>(static_cast<qint32>(word) / FullScale);
        }
        source += width;
    }
}

} // namespace

double WavHeader::playTime() const
{
    return sampleRate > 0 ? static_cast<double>(samples()) / sampleRate : 0.0;
}

WavFileAccess::WavFileAccess(QObject *parent)
    : FileAccess(parent)
{
}

void WavFileAccess::forget()
{
    m_header = WavHeader();
}

bool WavFileAccess::readHeader()
{
    Tracer::Trace(Tracer::Information, "Reading header data from file " + fileName());
    m_header = WavHeader();
    return isOpen() ? checkHeader() : Tracer::fail("File is not open.");
}

bool WavFileAccess::checkHeader()
{
    Tracer::Trace(Tracer::Debug, "Checking .wav file header.");
    m_longDataLength = -1;
    const QByteArray form = device()->seek(0) ? device()->read(ChunkIdSize) : QByteArray();
    if (form != "RIFF" && form != "RF64") {
        return Tracer::fail("This is not a valid RIFF waveform file.");
    }
    QDataStream stream(device());
    stream.setByteOrder(QDataStream::LittleEndian);
    quint32 fileSize = 0;
    stream >> fileSize;
    if (stream.status() != QDataStream::Ok || fileSize < 8) {
        return Tracer::fail("The file size seems to be invalid.");
    }
    if (device()->read(ChunkIdSize) != "WAVE") {
        return Tracer::fail("This is not a valid WAVE waveform file.");
    }
    Tracer::Trace(Tracer::Debug, "Evaluating chunks...");
    bool formatFound = false;
    bool dataFound = false;
    for (;;) {
        const QByteArray id = device()->read(ChunkIdSize);
        if (id.size() < ChunkIdSize) {
            Tracer::Trace(Tracer::Debug, "No more header signatures available in .wav file.");
            break;
        }
        quint32 length = 0;
        stream >> length;
        // Files of floats state their number of samples in so short a chunk.
        const bool isTooShort = length <= 8 && id != "fact";
        if (stream.status() != QDataStream::Ok || isTooShort) {
            return Tracer::fail("No chunk length available in .wav file.");
        }
        const qint64 position = device()->pos();
        qint64 span = length;
        if (id == "ds64" && form == "RF64") {
            m_longDataLength = longDataLength();
        } else if (id == "fmt ") {
            Tracer::Trace(
                Tracer::Debug,
                QString("  Found 'fmt' chunk at position %1.").arg(position - ChunkHeadSize));
            if (!checkFormatChunk(length)) {
                return false;
            }
            formatFound = true;
        } else if (id == "data") {
            Tracer::Trace(
                Tracer::Debug,
                QString("  Found 'data' chunk at position %1.").arg(position - ChunkHeadSize));
            if (length == LengthStandsElsewhere && m_longDataLength >= 0) {
                span = m_longDataLength;
            }
            m_header.dataLength = span;
            m_header.dataPosition = position;
            dataFound = true;
        } else {
            logUnknownChunk(id, length);
        }
        // A length that leads beyond the end leaves nothing to walk on to.
        if (span > device()->size() - position || !device()->seek(position + span)) {
            break;
        }
        // Most programs fill a chunk of odd length up by a zero that the length doesn't count; no
        // chunk's name begins with one.
        if (span % 2 == 1 && device()->peek(1) == QByteArray(1, '\0')) {
            static_cast<void>(device()->skip(1));
        }
    }
    m_header.valid = formatFound && dataFound;
    return true;
}

/// The length of the samples by the chunk "ds64", behind that of the file.
qint64 WavFileAccess::longDataLength()
{
    QDataStream stream(device());
    stream.setByteOrder(QDataStream::LittleEndian);
    quint64 fileSize = 0;
    qint64 dataSize = -1;
    stream >> fileSize >> dataSize;
    return stream.status() == QDataStream::Ok ? dataSize : -1;
}

/// The tag of the format that an extensible header holds; the device stands behind the bits of a
/// sample.
bool WavFileAccess::readSubFormat()
{
    constexpr qint64 SizeMaskBytes = 8; // of the extension, valid bits, places of the channels
    const QByteArray fixedPart = QByteArray::fromHex("000000001000800000aa00389b71");
    const QByteArray rest = device()->read(SizeMaskBytes + 2 + fixedPart.size());
    m_header.formatTag = rest.mid(SizeMaskBytes + 2) == fixedPart
                             ? qFromLittleEndian<quint16>(rest.constData() + SizeMaskBytes)
                             : quint16(0);
    return m_header.formatTag == Pcm || m_header.formatTag == IeeeFloat;
}

bool WavFileAccess::checkFormatChunk(quint32 length)
{
    constexpr quint32 PcmChunkSize = 16;
    constexpr quint32 WithExtensionSize = 18;
    constexpr quint32 ExtensibleSize = 40;
    if (length != PcmChunkSize && length != WithExtensionSize && length < ExtensibleSize) {
        return Tracer::fail("Format chunk has invalid length.");
    }
    QDataStream stream(device());
    stream.setByteOrder(QDataStream::LittleEndian);
    stream >> m_header.formatTag >> m_header.channels >> m_header.sampleRate >> m_header.byteRate >>
        m_header.blockAlignment >> m_header.bitsPerSample;
    const bool isExtensible = m_header.formatTag == Extensible && length >= ExtensibleSize;
    if (isExtensible ? !readSubFormat()
                     : m_header.formatTag != Pcm && m_header.formatTag != IeeeFloat) {
        return Tracer::fail("Data Format must be PCM.");
    }
    if (m_header.channels != 1 && m_header.channels != 2) {
        return Tracer::fail("File must contain 2 channels.");
    }
    if (stream.status() != QDataStream::Ok) {
        return Tracer::fail("Cannot read header information from file.");
    }
    const int blockBytes = m_header.channels * ((m_header.bitsPerSample + 7) / 8);
    if (m_header.blockAlignment != blockBytes && m_header.blockAlignment != 4) {
        return Tracer::fail("Block alignment must be 4 bytes.");
    }
    m_header.isFloat = m_header.formatTag == IeeeFloat;
    const int bits = m_header.bitsPerSample;
    const bool isKnown = m_header.isFloat ? bits == 32 : bits >= 8 && bits <= 32 && bits % 8 == 0;
    return (isKnown && m_header.blockAlignment == blockBytes) ||
           Tracer::fail("Data must be 16 bits/sample.");
}

void WavFileAccess::logUnknownChunk(const QByteArray &id, quint32 length) const
{
    Tracer::Trace(
        Tracer::Debug,
        QString("  Found unknown chunk at position %1.").arg(device()->pos() - ChunkHeadSize));
    Tracer::Trace(Tracer::Debug, "  - ID is '" + QString::fromLatin1(id) + "'.");
    Tracer::Trace(Tracer::Debug, QString("  - Chunk Length is %1 bytes.").arg(length));
}

bool WavFileAccess::readSamples(BufferedIO *stream, qint64 limit)
{
    Tracer::Trace(Tracer::Information, "Reading data from WAV file.");
    if (!isOpen()) {
        return Tracer::fail("File is not open.");
    }
    if (!stream->writeHeader(BufferedIO::DataHeader)) {
        return Tracer::fail("Cannot write to temporary file.");
    }
    const qint64 total = limit > 0 ? std::min(limit, m_header.samples()) : m_header.samples();
    Tracer::Trace(Tracer::Information, QString("  Start position : %1").arg(m_header.dataPosition));
    Tracer::Trace(Tracer::Information, QString("  Samples to read : %1").arg(total));
    if (!device()->seek(m_header.dataPosition)) {
        return Tracer::fail("Cannot set start position data section.");
    }
    ProgressClock progress = startProgress();
    const auto channels = static_cast<size_t>(m_header.channels);
    const qint64 frame = m_header.blockAlignment;
    const auto blockSamples = static_cast<size_t>(std::min<qint64>(total, BlockSamples));
    std::vector<char> bytes(blockSamples * static_cast<size_t>(frame));
    std::vector<float> parts(channels * blockSamples);
    std::vector<float> values(2 * blockSamples);
    for (qint64 done = 0; done < total;) {
        if (progress.shouldStop(done, total)) {
            return Tracer::fail("*** Action aborted by user.");
        }
        const qint64 wanted = std::min<qint64>(total - done, BlockSamples);
        const qint64 got = device()->read(bytes.data(), frame * wanted);
        const auto count = static_cast<size_t>(std::max<qint64>(got, 0) / frame);
        const auto block = std::span(channels == 2 ? values : parts).first(channels * count);
        toFloats(m_header, std::span(bytes).first(count * static_cast<size_t>(frame)), block);
        if (channels == 1) {
            for (size_t i = 0; i < count; ++i) {
                values[2 * i] = parts[i];
                values[2 * i + 1] = 0;
            }
        }
        if (count > 0 &&
            !stream->writeBlock(static_cast<int>(count) * BufferedIO::RecordSize, values.data())) {
            return Tracer::fail("Cannot write to temporary file.");
        }
        if (static_cast<qint64>(count) < wanted) {
            return Tracer::fail("Cannot read data from .wav file.");
        }
        done += wanted;
    }
    return true;
}
