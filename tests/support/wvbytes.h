// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <QByteArray>
#include <QList>
#include <QtEndian>

/// Files built byte by byte, least significant byte first, and what a test looks for in one.

template <typename T>
[[nodiscard]] QByteArray littleEndian(T value)
{
    QByteArray bytes(sizeof(T), '\0');
    qToLittleEndian(value, bytes.data());
    return bytes;
}

/// 16-bit words; of a sample block: I and Q in turn.
[[nodiscard]] QByteArray words(const QList<int> &values);

/// The sample block of a waveform file, in the form in which it is written.
[[nodiscard]] QByteArray sampleBlock(const QByteArray &sampleWords);

/// `count` samples 0 of it.
[[nodiscard]] QByteArray silentBlock(qint64 count);

/// A waveform file: the tags as they stand, then the sample block.
[[nodiscard]] QByteArray wvFile(const QByteArray &tags, const QByteArray &sampleWords);

/// A waveform file with a complex tone at half of full scale, 1000 samples a turn at a clock of
/// 1 MHz, that is 1 kHz. Marker 1 is high in its first half.
[[nodiscard]] QByteArray toneFile(int samples);

/// The content of a tag of a file; null if it has none.
[[nodiscard]] QByteArray tag(const QByteArray &file, const QByteArray &name);

/// The words of the sample block, which ends a written file.
[[nodiscard]] QByteArray sampleWords(const QByteArray &file);

/// The marker byte of each sample by the transitions in the file's lists.
[[nodiscard]] QByteArray markerBytes(const QByteArray &file, qsizetype samples);
