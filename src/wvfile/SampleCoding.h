// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <QtGlobal>

#include <cstddef>
#include <span>

/// How a 16-bit word of a sample block stands for a value of full scale 1.0.
enum class SampleCoding {
    A, ///< (s - 0.5) / 32767, of the TGX, TBX and TVX kinds; the only one that is written
    B, ///< s / 32767, of the TQX-130 kind
    C, ///< offset binary, 16 bit, of the WV kinds
    D, ///< offset binary, 14 bit in the upper bits of the word, of the WV kinds
};

/// Decodes words, I and Q in turn, least significant byte first, and multiplies each by `gain`.
/// `words` holds two bytes for each float of `values`.
void decodeWords(SampleCoding coding, std::span<const std::byte> words, float gain,
                 std::span<float> values);

/// Encodes values by coding A into words, least significant byte first. Computed in single
/// precision throughout: only so does a decoded word come back as itself. Values beyond full scale
/// give -32767 or +32767, as does a NaN the latter.
void encodeWords(std::span<const float> values, std::span<std::byte> words);

/// Values that no word can hold, and the largest magnitude among them.
struct ClipCount
{
    qint64 values = 0;
    double largest = 0; ///< of full scale 1
};

/// Counts the values, I and Q each, that encodeWords() has to clip. Such are those whose word would
/// lie beyond +-32767: what a file's own words decode to, or rounding leaves above 1, isn't
/// clipped. A NaN counts and doesn't change the largest magnitude.
void countClipped(std::span<const float> values, ClipCount &count);

/// Puts values beyond full scale at -1 or 1, as encodeWords() will.
void limitToFullScale(std::span<float> values);

/// Encodes one value by coding A.
[[nodiscard]] qint16 encodeWord(float value);
