// SPDX-License-Identifier: Apache-2.0
#pragma once

#include "TapGeometry.h"

#include <QtGlobal>

#include <cstdint>
#include <span>

/// How the rows of a table with slopes lie in memory.
struct SlopedLayout
{
    int lowest = 0;                ///< table point of the first row
    std::int32_t rowStride = 0;    ///< numbers from a row to the next
    std::int32_t onSample = 0;     ///< start of the row for outputs on an input sample
    std::int32_t onSampleNext = 0; ///< the same for a position that was rounded up
};

/// What the kernels need to know of some outputs.
template <typename Real>
struct TapPlan
{
    static constexpr int MaxCount = 1024;

    std::span<std::int32_t> offsets;   ///< first tap, counted from `inputStart`
    std::span<std::int32_t> rowStarts; ///< index of the row's first number
    std::span<Real> fractions;         ///< table points above the row's
};

/// Plans the outputs from `firstOutput` on: TapGeometry::taps for many outputs at once.
void planTaps(const TapGeometry &geometry, const SlopedLayout &layout, qint64 firstOutput,
              qint64 inputStart, const TapPlan<float> &plan);
void planTaps(const TapGeometry &geometry, const SlopedLayout &layout, qint64 firstOutput,
              qint64 inputStart, const TapPlan<double> &plan);
