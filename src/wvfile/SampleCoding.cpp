// SPDX-License-Identifier: Apache-2.0
#include "SampleCoding.h"

#include "base/simd.h"

#include <algorithm>
#include <array>
#include <bit>
#include <cmath>
#include <cstring>

#if Q_BYTE_ORDER != Q_LITTLE_ENDIAN
#error "The sample loops take words as they stand in the file, least significant byte first."
#endif

namespace {

constexpr float FullScale = 32767.0F;

CORVANE_CLONES void decodeA(const qint16 *words, float *values, size_t count, float gain)
{
    for (size_t i = 0; i < count; ++i) {
        values[i] = (static_cast<float>(words[i]) - 0.5F) / FullScale * gain;
    }
}

CORVANE_CLONES void decodeB(const qint16 *words, float *values, size_t count, float gain)
{
    for (size_t i = 0; i < count; ++i) {
        values[i] = static_cast<float>(words[i]) / FullScale * gain;
    }
}

CORVANE_CLONES void decodeC(const qint16 *words, float *values, size_t count, float gain)
{
    for (size_t i = 0; i < count; ++i) {
        const auto word = static_cast<qint16>(words[i] ^ qint16(-0x8000));
        values[i] = static_cast<float>(word) / FullScale * gain;
    }
}

CORVANE_CLONES void decodeD(const qint16 *words, float *values, size_t count, float gain)
{
    for (size_t i = 0; i < count; ++i) {
        const int word = static_cast<quint16>(words[i]) & 0xFFFC;
        values[i] = (static_cast<float>(word) - 32768.5F) / 32000.0F * gain;
    }
}

inline float scaledToWord(float value)
{
    float scaled = value * FullScale + 0.5F;
    scaled = value < -1.0F ? -FullScale : scaled;
    // Written so that a NaN, which compares false, takes the upper limit.
    return value <= 1.0F ? scaled : FullScale;
}

CORVANE_CLONES void encodeA(const float *values, qint16 *words, size_t count)
{
    for (size_t i = 0; i < count; ++i) {
        words[i] = static_cast<qint16>(static_cast<int>(scaledToWord(values[i])));
    }
}

/// Largest magnitude, NaN left out. Magnitudes order as their bits do, and whole numbers let the
/// loop go by vectors where floating point may not change the order of its comparisons.
CORVANE_CLONES float largestMagnitude(const float *values, size_t count)
{
    constexpr qint32 InfinityBits = 0x7F800000;
    qint32 largest = 0;
    for (size_t i = 0; i < count; ++i) {
        const qint32 bits = std::bit_cast<qint32>(values[i]) & 0x7FFFFFFF;
        const qint32 number = bits > InfinityBits ? 0 : bits;
        largest = number > largest ? number : largest;
    }
    return std::bit_cast<float>(largest);
}

CORVANE_CLONES quint32 clippedAmong(const float *values, size_t count)
{
    quint32 fitting = 0;
    for (size_t i = 0; i < count; ++i) {
        const float scaled = values[i] * FullScale + 0.5F;
        // Written so that a NaN, which compares false, counts as clipped; without a branch.
        const quint32 isBelow = scaled < FullScale + 1 ? 1U : 0U;
        const quint32 isAbove = scaled > -(FullScale + 1) ? 1U : 0U;
        fitting += isBelow & isAbove;
    }
    return static_cast<quint32>(count) - fitting;
}

CORVANE_CLONES void limit(float *values, size_t count)
{
    for (size_t i = 0; i < count; ++i) {
        const float value = values[i] < -1.0F ? -1.0F : values[i];
        values[i] = value > 1.0F ? 1.0F : value;
    }
}

} // namespace

void decodeWords(SampleCoding coding, std::span<const std::byte> words, float gain,
                 std::span<float> values)
{
    // Blocks come from buffers of bytes; a copy through an aligned block keeps the access defined.
    constexpr size_t BlockWords = 4096;
    std::array<qint16, BlockWords> block;
    for (size_t done = 0; done < values.size(); done += BlockWords) {
        const size_t count = std::min(BlockWords, values.size() - done);
        std::memcpy(block.data(), words.data() + 2 * done, 2 * count);
        float *target = values.data() + done;
        switch (coding) {
        case SampleCoding::A:
            decodeA(block.data(), target, count, gain);
            break;
        case SampleCoding::B:
            decodeB(block.data(), target, count, gain);
            break;
        case SampleCoding::C:
            decodeC(block.data(), target, count, gain);
            break;
        case SampleCoding::D:
            decodeD(block.data(), target, count, gain);
            break;
        }
    }
}

void encodeWords(std::span<const float> values, std::span<std::byte> words)
{
    constexpr size_t BlockWords = 4096;
    std::array<qint16, BlockWords> block;
    for (size_t done = 0; done < values.size(); done += BlockWords) {
        const size_t count = std::min(BlockWords, values.size() - done);
        encodeA(values.data() + done, block.data(), count);
        std::memcpy(words.data() + 2 * done, block.data(), 2 * count);
    }
}

void countClipped(std::span<const float> values, ClipCount &count)
{
    const quint32 clipped = clippedAmong(values.data(), values.size());
    if (clipped > 0) {
        count.values += clipped;
        count.largest = std::max(
            count.largest, static_cast<double>(largestMagnitude(values.data(), values.size())));
    }
}

void limitToFullScale(std::span<float> values)
{
    limit(values.data(), values.size());
}

qint16 encodeWord(float value)
{
    return static_cast<qint16>(static_cast<int>(scaledToWord(value)));
}
