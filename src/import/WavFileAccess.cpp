// SPDX-License-Identifier: Apache-2.0
#include "WavFileAccess.h"

#include "pcmwords.h"

#include "log/Tracer.h"
#include "streams/BufferedIO.h"

#include <QDataStream>

#include <algorithm>
#include <vector>

namespace {

constexpr qint64 ChunkIdSize = 4;
constexpr qint64 ChunkHeadSize = 8;
constexpr int BlockSamples = 64 * 1024;

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
    if (!device()->seek(0) || device()->read(ChunkIdSize) != "RIFF") {
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
        if (stream.status() != QDataStream::Ok || length <= 8) {
            return Tracer::fail("No chunk length available in .wav file.");
        }
        const qint64 position = device()->pos();
        if (id == "fmt ") {
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
            m_header.dataLength = length;
            m_header.dataPosition = position;
            dataFound = true;
        } else {
            logUnknownChunk(id, length);
        }
        // A length that leads beyond the end leaves nothing to walk on to.
        if (!device()->seek(position + length)) {
            break;
        }
        // Most programs fill a chunk of odd length up by a zero that the length doesn't count; no
        // chunk's name begins with one.
        if (length % 2 == 1 && device()->peek(1) == QByteArray(1, '\0')) {
            static_cast<void>(device()->skip(1));
        }
    }
    m_header.valid = formatFound && dataFound;
    return true;
}

bool WavFileAccess::checkFormatChunk(quint32 length)
{
    constexpr quint32 PcmChunkSize = 16;
    constexpr qint16 Pcm = 1;
    if (length != PcmChunkSize) {
        return Tracer::fail("Format chunk has invalid length.");
    }
    QDataStream stream(device());
    stream.setByteOrder(QDataStream::LittleEndian);
    stream >> m_header.formatTag;
    if (m_header.formatTag != Pcm) {
        return Tracer::fail("Data Format must be PCM.");
    }
    stream >> m_header.channels;
    if (m_header.channels != 2) {
        return Tracer::fail("File must contain 2 channels.");
    }
    stream >> m_header.sampleRate >> m_header.byteRate >> m_header.blockAlignment >>
        m_header.bitsPerSample;
    if (stream.status() != QDataStream::Ok) {
        return Tracer::fail("Cannot read header information from file.");
    }
    if (m_header.blockAlignment != 4) {
        return Tracer::fail("Block alignment must be 4 bytes.");
    }
    if (m_header.bitsPerSample != 16) {
        return Tracer::fail("Data must be 16 bits/sample.");
    }
    return true;
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
    std::vector<qint16> words(2 * static_cast<size_t>(std::min<qint64>(total, BlockSamples)));
    std::vector<float> values(words.size());
    for (qint64 done = 0; done < total;) {
        if (progress.shouldStop(done, total)) {
            return Tracer::fail("*** Action aborted by user.");
        }
        const qint64 wanted = std::min<qint64>(total - done, BlockSamples);
        const qint64 got = device()->read(reinterpret_cast<char *>(words.data()), 4 * wanted);
        const auto count = static_cast<size_t>(std::max<qint64>(got, 0) / 4);
        convertWords(std::span(words).first(2 * count), true, values.data());
        if (count > 0 &&
            !stream->writeBytes(static_cast<int>(count) * BufferedIO::RecordSize, values.data())) {
            return Tracer::fail("Cannot write to temporary file.");
        }
        if (static_cast<qint64>(count) < wanted) {
            return Tracer::fail("Cannot read data from .wav file.");
        }
        done += wanted;
    }
    return true;
}
