// SPDX-License-Identifier: Apache-2.0
#pragma once

#include "TapGeometry.h"
#include "dotkernels.h"
#include "filtertable.h"

#include <QtGlobal>

#include <memory>
#include <span>

/// Computes output samples of one conversion from a stretch of the input. Doesn't change after it
/// was made, so that several threads may use it at a time, and each output depends on its index
/// alone, so that the result doesn't depend on how the work was cut.
class Interpolator
{
public:
    /// Samples behind the last tap of the last output that must be readable; their values are
    /// multiplied by zero.
    static constexpr int ReadAhead = 192;

    Interpolator() = default;
    virtual ~Interpolator() = default;
    Interpolator(const Interpolator &) = delete;
    Interpolator &operator=(const Interpolator &) = delete;

    /// Computes the outputs from `firstOutput` on that fill the interleaved result. Index 0 of the
    /// input is the input sample `inputStart`, at or before the first tap.
    virtual void compute(qint64 firstOutput, PlanarInput input, qint64 inputStart,
                         std::span<float> result) const = 0;
};

/// Makes the quickest form for the counts: one row of coefficients for equal counts, a bank of
/// phases for counts with a common divisor, else the table with slopes. Coefficients and sums are
/// in single precision where that keeps the result within 3e-6 of the sum in double precision for
/// an input of unit scale, else in double.
[[nodiscard]] std::unique_ptr<Interpolator> makeInterpolator(const FilterTable &table,
                                                             const TapGeometry &geometry,
                                                             int inputCount, int outputCount);
