// SPDX-License-Identifier: Apache-2.0
#include "wvbytes.h"

#include <cmath>
#include <numbers>

QByteArray words(const QList<int> &values)
{
    QByteArray bytes;
    for (const int value : values) {
        bytes += littleEndian(static_cast<quint16>(value));
    }
    return bytes;
}

QByteArray sampleBlock(const QByteArray &sampleWords)
{
    return "{WAVEFORM-" + QByteArray::number(sampleWords.size() + 1) + ": #" + sampleWords + '}';
}

QByteArray silentBlock(qint64 count)
{
    return sampleBlock(QByteArray(4 * count, '\0'));
}

QByteArray wvFile(const QByteArray &tags, const QByteArray &sampleWords)
{
    return tags + sampleBlock(sampleWords);
}

QByteArray toneFile(int samples)
{
    QByteArray block;
    for (int i = 0; i < samples; ++i) {
        const double phase = 2 * std::numbers::pi * i / 1000;
        block += words({static_cast<int>(std::lround(16383.5 * std::cos(phase))),
                        static_cast<int>(std::lround(16383.5 * std::sin(phase)))});
    }
    const QByteArray half = samples > 1 ? ';' + QByteArray::number(samples / 2) + ":0" : "";
    return wvFile("{TYPE: TGX-WV,0}{CLOCK:1000000}{CONTROL LENGTH:" + QByteArray::number(samples) +
                      "}{MARKER LIST 1: 0:1" + half + '}',
                  block);
}

QByteArray tag(const QByteArray &file, const QByteArray &name)
{
    const qsizetype begin = file.indexOf('{' + name + ':');
    if (begin < 0) {
        return {};
    }
    const qsizetype content = begin + name.size() + 2;
    return file.mid(content, file.indexOf('}', content) - content);
}

QByteArray sampleWords(const QByteArray &file)
{
    return file.mid(file.indexOf('#') + 1).chopped(1);
}

QByteArray markerBytes(const QByteArray &file, qsizetype samples)
{
    QByteArray bytes(samples, '\0');
    for (int marker = 0; marker < 4; ++marker) {
        const QByteArray list = tag(file, "MARKER LIST " + QByteArray::number(marker + 1));
        qsizetype from = 0;
        bool high = false;
        const auto fill = [&](qsizetype to) {
            for (; from < to; ++from) {
                bytes[from] = static_cast<char>(bytes[from] | (high ? 1 << marker : 0));
            }
        };
        for (const QByteArray &entry : list.split(';')) {
            const QList<QByteArray> parts = entry.split(':');
            fill(parts.first().toLongLong());
            high = parts.last() == "1";
        }
        fill(samples);
    }
    return bytes;
}
