// SPDX-License-Identifier: Apache-2.0
#pragma once

#include "wvbytes.h"

/// RIFF WAVE files built chunk by chunk.

/// A chunk; `stated` is the length that it claims, below 0 that of the content.
[[nodiscard]] inline QByteArray chunk(const QByteArray &id, const QByteArray &content,
                                      qint64 stated = -1)
{
    return id + littleEndian(static_cast<quint32>(stated < 0 ? content.size() : stated)) + content;
}

[[nodiscard]] inline QByteArray formatChunk(int tag = 1, int channels = 2, int rate = 48000,
                                            int alignment = 4, int bits = 16)
{
    return chunk("fmt ", words({tag, channels}) + littleEndian(rate) +
                             littleEndian(static_cast<quint32>(qint64(rate) * alignment)) +
                             words({alignment, bits}));
}

[[nodiscard]] inline QByteArray wavFile(const QByteArray &chunks)
{
    return chunk("RIFF", "WAVE" + chunks);
}
