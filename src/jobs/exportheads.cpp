// SPDX-License-Identifier: Apache-2.0
#include "exportheads.h"

#include <QtEndian>

#include <zlib.h>

#include <algorithm>
#include <limits>

namespace {

template <typename T>
QByteArray number(T value)
{
    QByteArray bytes(sizeof(T), '\0');
    qToLittleEndian(value, bytes.data());
    return bytes;
}

QByteArray wavChunk(const char *id, const QByteArray &content)
{
    return QByteArray(id, 4) + number(static_cast<quint32>(content.size())) + content;
}

constexpr quint32 NoLength = std::numeric_limits<quint32>::max();

constexpr quint32 MatInt8 = 1;
constexpr quint32 MatInt32 = 5;
constexpr quint32 MatUint32 = 6;
constexpr quint32 MatDouble = 9;
constexpr quint32 MatMatrix = 14;
constexpr quint32 MatCompressed = 15;
constexpr qint64 TagBytes = 8;
constexpr quint32 MatDoubleClass = 6;
constexpr quint32 MatComplexFlag = 0x0800;

constexpr qint64 LargestStored = 65535;

template <typename T>
QByteArray bigNumber(T value)
{
    QByteArray bytes(sizeof(T), '\0');
    qToBigEndian(value, bytes.data());
    return bytes;
}

QByteArray matTag(quint32 type, qint64 bytes)
{
    return number(type) + number(static_cast<quint32>(bytes));
}

/// Flags, dimensions and name of a column of doubles.
QByteArray matArrayHead(const QByteArray &name, qint64 rows, quint32 flags)
{
    const QByteArray padded = name.leftJustified((name.size() + 7) / 8 * 8, '\0');
    return matTag(MatUint32, 8) + number(MatDoubleClass | flags) + number(quint32(0)) +
           matTag(MatInt32, 8) + number(static_cast<qint32>(rows)) + number(qint32(1)) +
           matTag(MatInt8, name.size()) + padded;
}

} // namespace

QByteArray wavHead(WavSample sample, quint32 sampleRate, qint64 samples)
{
    constexpr quint16 Channels = 2;
    const bool isFloat = sample == WavSample::Float32;
    const int valueBytes = wavSampleBytes(sample);
    const auto blockBytes = static_cast<quint16>(Channels * valueBytes);
    const qint64 dataBytes = samples * blockBytes;
    const quint64 byteRate = quint64(sampleRate) * blockBytes;
    QByteArray format = number(quint16(isFloat ? 3 : 1)) + number(Channels) + number(sampleRate) +
                        number(static_cast<quint32>(std::min<quint64>(byteRate, NoLength))) +
                        number(blockBytes) + number(static_cast<quint16>(8 * valueBytes));
    QByteArray chunks;
    if (isFloat) {
        // All but plain PCM tell the size of an extension and the length in samples.
        format += number(quint16(0));
        chunks =
            wavChunk("fact", number(static_cast<quint32>(std::min<qint64>(samples, NoLength))));
    }
    chunks.prepend(wavChunk("fmt ", format));
    constexpr qint64 HeadBytes = 12;
    constexpr qint64 LongLengthsBytes = 36;
    const qint64 plain = HeadBytes - 8 + chunks.size() + 8 + dataBytes + dataBytes % 2;
    if (plain <= NoLength) {
        return "RIFF" + number(static_cast<quint32>(plain)) + "WAVE" + chunks + "data" +
               number(static_cast<quint32>(dataBytes));
    }
    const QByteArray lengths =
        number(plain + LongLengthsBytes) + number(dataBytes) + number(samples) + number(quint32(0));
    return "RF64" + number(NoLength) + "WAVE" + wavChunk("ds64", lengths) + chunks + "data" +
           number(NoLength);
}

QByteArray matFileHead()
{
    constexpr int TextBytes = 116;
    constexpr int PlaceBytes = 8; // of a subsystem's data, which there is none of
    return QByteArray("MATLAB 5.0 MAT-file, written by Corvane").leftJustified(TextBytes) +
           QByteArray(PlaceBytes, '\0') + number(quint16(0x0100)) + "IM";
}

QByteArray matCompressedTag(qint64 bytes)
{
    return matTag(MatCompressed, bytes);
}

QByteArray matVectorHead(qint64 samples)
{
    const qint64 partBytes = samples * static_cast<qint64>(sizeof(double));
    const QByteArray array = matArrayHead("iq", samples, MatComplexFlag);
    return matTag(MatMatrix, array.size() + 2 * (TagBytes + partBytes)) + array +
           matTag(MatDouble, partBytes);
}

qint64 matVectorBytes(qint64 samples)
{
    return matVectorHead(samples).size() + TagBytes +
           2 * samples * static_cast<qint64>(sizeof(double));
}

QByteArray matImaginaryTag(qint64 samples)
{
    return matTag(MatDouble, samples * static_cast<qint64>(sizeof(double)));
}

QByteArray matClock(double clockHz)
{
    const QByteArray array =
        matArrayHead("clock", 1, 0) + matTag(MatDouble, sizeof(double)) + number(clockHz);
    return matTag(MatMatrix, array.size()) + array;
}

StoredZlib::StoredZlib(qint64 bytes)
    : m_total(bytes)
{
}

qint64 StoredZlib::size() const
{
    constexpr qint64 FrameBytes = 6; // the head of the stream and its checksum
    constexpr qint64 BlockHeadBytes = 5;
    const qint64 blocks = (m_total + LargestStored - 1) / LargestStored;
    return FrameBytes + BlockHeadBytes * blocks + m_total;
}

QByteArray StoredZlib::add(const QByteArray &bytes)
{
    QByteArray out;
    if (m_done == 0 && m_waiting.isEmpty()) {
        out = QByteArray::fromHex("7801");
    }
    m_checksum =
        static_cast<quint32>(adler32(m_checksum, reinterpret_cast<const Bytef *>(bytes.constData()),
                                     static_cast<uInt>(bytes.size())));
    m_waiting += bytes;
    while (m_waiting.size() >= LargestStored || m_done + m_waiting.size() == m_total) {
        const auto count = std::min<qint64>(m_waiting.size(), LargestStored);
        m_done += count;
        const bool isLast = m_done == m_total;
        const auto length = static_cast<quint16>(count);
        out += QByteArray(1, isLast ? '\1' : '\0') + number(length) +
               number(static_cast<quint16>(~length)) + m_waiting.left(count);
        m_waiting.remove(0, count);
        if (isLast) {
            return out + bigNumber(m_checksum);
        }
    }
    return out;
}
