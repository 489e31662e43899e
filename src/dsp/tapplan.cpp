// SPDX-License-Identifier: Apache-2.0
#include "tapplan.h"

#include "base/simd.h"

#include <array>
#include <bit>
#include <cstddef>
#include <cstdint>
#include <numeric>

namespace {

constexpr std::size_t MaxCount = TapPlan<double>::MaxCount;

using PlanArray = std::array<double, MaxCount>;

/// 0, 1, 2 ...: compilers don't vectorise loops that count and compute in doubles.
const PlanArray &counts()
{
    static const PlanArray values = [] {
        PlanArray made{};
        std::iota(made.begin(), made.end(), 0.0);
        return made;
    }();
    return values;
}

/// Floor and ceiling of numbers below 2^51. The library's may raise exceptions, for whose sake
/// compilers leave them scalar.
constexpr double RoundingOffset = 0x1.8p52;

/// 1 for negative numbers, else 0, without a branch.
CORVANE_INLINE double isNegative(double value)
{
    const std::uint64_t sign = std::bit_cast<std::uint64_t>(value) >> 63;
    return std::bit_cast<double>((0 - sign) & std::bit_cast<std::uint64_t>(1.0));
}

CORVANE_INLINE double floorOf(double value)
{
    const double nearest = (value + RoundingOffset) - RoundingOffset;
    return nearest - isNegative(value - nearest);
}

CORVANE_INLINE double ceilingOf(double value)
{
    const double nearest = (value + RoundingOffset) - RoundingOffset;
    return nearest + isNegative(nearest - value);
}

template <typename Target>
CORVANE_INLINE void convert(const PlanArray &values, std::span<Target> target)
{
    Target *to = target.data();
    const std::size_t count = target.size();
    for (std::size_t i = 0; i < count; ++i) {
        to[i] = static_cast<Target>(values[i]);
    }
}

template <typename Real>
CORVANE_INLINE void planTapsBody(const TapGeometry &geometry, const SlopedLayout &layout,
                                 qint64 firstOutput, qint64 inputStart, const TapPlan<Real> &plan)
{
    const double half = geometry.half();
    const double back = geometry.length() - 1;
    const double maxTaps = geometry.maxTaps();
    const double ratio = geometry.ratio();
    const double scale = geometry.scale();
    const double onSampleLimit = (geometry.length() - 1.5) * scale;
    const double lowest = layout.lowest;
    const double stride = layout.rowStride;
    const double roundedRow = layout.onSampleNext;
    const double exactRow = layout.onSample - roundedRow;
    const auto start = static_cast<double>(firstOutput);
    const auto origin = static_cast<double>(inputStart);
    const PlanArray &index = counts();
    PlanArray offsets;
    PlanArray rowStarts;
    PlanArray fractions;
    const std::size_t count = plan.offsets.size();
    for (std::size_t i = 0; i < count; ++i) {
        const double t = (start + index[i]) / ratio;
        const double first = ceilingOf(t - half);
        const double taps = floorOf(half + t) - first;
        const double position = (t - ceilingOf(t) + back) * scale;
        const double whole = floorOf(position);
        // Choices are written as sums of whole numbers, which are exact and no branches.
        const double isExact = floorOf((position - onSampleLimit) / scale) + 1;
        const double isBetween = maxTaps - taps;
        const double onSample = roundedRow + isExact * exactRow;
        offsets[i] = first - origin;
        rowStarts[i] = onSample + isBetween * ((whole - lowest) * stride - onSample);
        fractions[i] = position - whole;
    }
    convert(offsets, plan.offsets);
    convert(rowStarts, plan.rowStarts);
    convert(fractions, plan.fractions);
}

} // namespace

CORVANE_CLONES void planTaps(const TapGeometry &geometry, const SlopedLayout &layout,
                             qint64 firstOutput, qint64 inputStart, const TapPlan<float> &plan)
{
    planTapsBody(geometry, layout, firstOutput, inputStart, plan);
}

CORVANE_CLONES void planTaps(const TapGeometry &geometry, const SlopedLayout &layout,
                             qint64 firstOutput, qint64 inputStart, const TapPlan<double> &plan)
{
    planTapsBody(geometry, layout, firstOutput, inputStart, plan);
}
