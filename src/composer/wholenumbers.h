// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <QtGlobal>

#include <cmath>
#include <limits>

/// The integer part, cut toward zero. A document can hold any number: what no integer can take ends
/// at the limits, and no number at all is 0.
template <typename Integer = qint64>
[[nodiscard]] inline Integer wholePart(double value)
{
    constexpr auto Highest = static_cast<double>(std::numeric_limits<Integer>::max());
    constexpr auto Lowest = static_cast<double>(std::numeric_limits<Integer>::min());
    if (std::isnan(value)) {
        return 0;
    }
    if (value >= Highest) {
        return std::numeric_limits<Integer>::max();
    }
    return value <= Lowest ? std::numeric_limits<Integer>::min() : static_cast<Integer>(value);
}

/// Positions that a hostile document moves out of the range of integers end at its limits.
[[nodiscard]] inline qint64 boundedSum(qint64 a, qint64 b)
{
    qint64 sum = 0;
    if (__builtin_add_overflow(a, b, &sum)) {
        return a < 0 ? std::numeric_limits<qint64>::min() : std::numeric_limits<qint64>::max();
    }
    return sum;
}

[[nodiscard]] inline qint64 boundedDifference(qint64 a, qint64 b)
{
    qint64 difference = 0;
    if (__builtin_sub_overflow(a, b, &difference)) {
        return a < 0 ? std::numeric_limits<qint64>::min() : std::numeric_limits<qint64>::max();
    }
    return difference;
}
