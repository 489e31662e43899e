// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <QtEndian>

#include <span>

/// Converts words of a file to floats of full scale 1, so that -32768 becomes -1. The words change
/// to the byte order of the machine.
inline void convertWords(std::span<qint16> words, bool littleEndian, float *values)
{
    const auto count = static_cast<qsizetype>(words.size());
    if (littleEndian) {
        qFromLittleEndian<qint16>(words.data(), count, words.data());
    } else {
        qFromBigEndian<qint16>(words.data(), count, words.data());
    }
    constexpr float Scale = 1.0F / 32768.0F;
    for (const qint16 word : words) {
        *values++ = static_cast<float>(word) * Scale;
    }
}
