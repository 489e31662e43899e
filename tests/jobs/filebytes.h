// SPDX-License-Identifier: Apache-2.0
#pragma once

#include "log/Tracer.h"

#include <QByteArray>
#include <QFile>
#include <QList>
#include <QStringList>
#include <QtEndian>

#include <initializer_list>

/// Files built byte by byte, and the log as plain lines, for the tests of imports, jobs and the
/// command line.
namespace filebytes {

template <typename T>
QByteArray littleEndian(T value)
{
    QByteArray bytes(sizeof(T), '\0');
    qToLittleEndian(value, bytes.data());
    return bytes;
}

/// 16-bit words, least significant byte first.
inline QByteArray words(std::initializer_list<int> values)
{
    QByteArray bytes;
    for (const int value : values) {
        bytes += littleEndian(static_cast<quint16>(value));
    }
    return bytes;
}

/// A chunk; `stated` is the length that it claims, below 0 that of the content.
inline QByteArray chunk(const QByteArray &id, const QByteArray &content, qint64 stated = -1)
{
    return id + littleEndian(static_cast<quint32>(stated < 0 ? content.size() : stated)) + content;
}

inline QByteArray formatChunk(int tag = 1, int channels = 2, int rate = 48000, int alignment = 4,
                              int bits = 16)
{
    return chunk("fmt ", words({tag, channels}) + littleEndian(rate) +
                             littleEndian(rate * alignment) + words({alignment, bits}));
}

inline QByteArray wavFile(const QByteArray &chunks)
{
    return chunk("RIFF", "WAVE" + chunks);
}

/// A waveform file: the tags as they stand, then the sample block.
inline QByteArray wvFile(const QByteArray &tags, const QByteArray &sampleWords)
{
    return tags + "{WAVEFORM-" + QByteArray::number(sampleWords.size() + 1) + ": #" + sampleWords +
           '}';
}

inline bool store(const QString &fileName, const QByteArray &bytes)
{
    QFile file(fileName);
    return file.open(QIODevice::WriteOnly) && file.write(bytes) == bytes.size() && file.flush();
}

inline QByteArray load(const QString &fileName)
{
    QFile file(fileName);
    return file.open(QIODevice::ReadOnly) ? file.readAll() : QByteArray();
}

/// The waiting lines of the log at the given levels, without their time of day.
inline QStringList takeLog(int levels)
{
    QStringList lines;
    const QList<Tracer::Entry> entries = Tracer::takeEntries();
    for (const auto &[text, level] : entries) {
        if ((level & levels) != 0) {
            lines << text.mid(text.indexOf("  ") + 2);
        }
    }
    return lines;
}

/// The content of a tag of a file; null if it has none.
inline QByteArray tag(const QByteArray &file, const QByteArray &name)
{
    const qsizetype begin = file.indexOf('{' + name + ':');
    if (begin < 0) {
        return {};
    }
    const qsizetype content = begin + name.size() + 2;
    return file.mid(content, file.indexOf('}', content) - content);
}

/// The words of the sample block of a written file.
inline QByteArray sampleWords(const QByteArray &file)
{
    return file.mid(file.indexOf('#') + 1).chopped(1);
}

} // namespace filebytes
