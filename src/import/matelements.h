// SPDX-License-Identifier: Apache-2.0
#pragma once

#include "MatFileAccess.h"

/// The numbers of the MATLAB level 5 format that its reader needs.
namespace mat {

inline constexpr quint32 ArrayFlagsType = 6; ///< as data types, these are also plain numbers
inline constexpr quint32 NameType = 1;
inline constexpr quint32 DimensionsType = 5;
inline constexpr quint32 MatrixType = 14;
inline constexpr quint32 CompressedType = 15;
inline constexpr quint32 SmallNameTag = 0x00030001; ///< a name of three letters in its own tag
inline constexpr quint32 DoubleClass = 6;

/// Bytes of a number of this data type; 0 for what is no number.
[[nodiscard]] quint32 typeSize(quint32 type);

[[nodiscard]] inline qint64 paddedSize(qint64 size)
{
    return (size + 7) / 8 * 8;
}

/// Converts numbers of this data type, least significant byte first, to floats by way of doubles.
void toFloats(quint32 type, const char *bytes, qint64 count, float *values);

/// Reads the sub-elements of an array, up to the position where it ends, into the entry.
[[nodiscard]] bool readArray(MatSource &source, qint64 end, MatEntry &entry);

} // namespace mat
