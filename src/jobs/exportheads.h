// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <QByteArray>
#include <QtGlobal>

/// The bytes around the samples of exported files. All numbers stand least significant byte first.

/// How a channel of a WAVE file stores its values.
enum class WavSample { Int16, Int24, Float32 };

[[nodiscard]] constexpr int wavSampleBytes(WavSample sample)
{
    return sample == WavSample::Int16 ? 2 : sample == WavSample::Int24 ? 3 : 4;
}

/// All that comes before the samples of a WAVE file of two channels. A file above 4 GB gets the
/// form RF64 (EBU Tech 3306), whose lengths have 64 bits. `sampleRate` is in samples per second.
[[nodiscard]] QByteArray wavHead(WavSample sample, quint32 sampleRate, qint64 samples);

/// The most samples of a variable of a MATLAB level 5 file, whose lengths have 32 bits.
inline constexpr qint64 MaxMatSamples = (0xFFFFFFFFLL - 0xFFFFFF) / 16;

/// A MATLAB level 5 file is: the head, a compressed element with the variable "iq", the variable
/// "clock".
[[nodiscard]] QByteArray matFileHead();

/// The tag in front of a compressed element of so many bytes.
[[nodiscard]] QByteArray matCompressedTag(qint64 bytes);

/// The variable "iq", a complex column of doubles, up to the real parts; the imaginary parts follow
/// these behind matImaginaryTag().
[[nodiscard]] QByteArray matVectorHead(qint64 samples);
[[nodiscard]] QByteArray matImaginaryTag(qint64 samples);

/// All bytes of the variable.
[[nodiscard]] qint64 matVectorBytes(qint64 samples);

/// The scalar variable "clock", in Hz.
[[nodiscard]] QByteArray matClock(double clockHz);

/// A zlib stream of stored blocks: its length is known before its content, so that a file of any
/// size can be written in one go.
class StoredZlib
{
public:
    /// `bytes` is all that will be added.
    explicit StoredZlib(qint64 bytes);

    /// Bytes of the stream.
    [[nodiscard]] qint64 size() const;

    /// Takes the next bytes and returns what is to be written of the stream.
    [[nodiscard]] QByteArray add(const QByteArray &bytes);

private:
    qint64 m_total;
    qint64 m_done = 0;
    quint32 m_checksum = 1;
    QByteArray m_waiting;
};
