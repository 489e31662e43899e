// SPDX-License-Identifier: Apache-2.0
#pragma once

#include "streams/levels.h"
#include "widevector.h"

#include <cstdint>
#include <span>

/// Coefficients in one kernel vector. Rows of coefficients are padded with zeros to a multiple.
template <typename Real>
inline constexpr int KernelLanes = static_cast<int>(KernelVectorBytes / sizeof(Real));

/// A stretch of input samples with the parts in arrays of their own. Behind the last tap of the
/// last output both are readable for one more kernel vector.
struct PlanarInput
{
    const float *inPhase = nullptr;
    const float *quadrature = nullptr;
};

/// Outputs of which each has a row of coefficients and a place in the input: the sum over j of
/// rows[rowStart + j] x[offset + j]. The result is interleaved, I first.
template <typename Real>
struct RowBlock
{
    PlanarInput input;
    const Real *rows = nullptr;
    std::span<const std::int32_t> offsets;
    std::span<const std::int32_t> rowStarts;
    int vectors = 0; ///< kernel vectors in a row
    std::span<float> result;
};

/// As RowBlock, but the coefficients lie between table points: with d = fraction - shift[j] they
/// are row[j] + d slope, slope being that of this row for d at or above 0, else that of the row
/// before. A row is followed by its slopes, and rows lie one behind the other.
template <typename Real>
struct SlopedBlock
{
    RowBlock<Real> base;
    std::span<const Real> fractions; ///< of each output, table points
    const Real *shifts = nullptr;    ///< of each tap, table points below 1
};

/// Outputs that share their coefficients and whose places follow each other: a FIR filter. The
/// place of the first output is index 0 of the input; the input is readable for eight kernel
/// vectors of outputs behind the last one.
template <typename Real>
struct FilterBlock
{
    PlanarInput input;
    std::span<const Real> taps;
    std::span<float> result;
};

void dotRows(const RowBlock<float> &block);
void dotRows(const RowBlock<double> &block);
void dotSlopedRows(const SlopedBlock<float> &block);
void dotSlopedRows(const SlopedBlock<double> &block);
void filterSamples(const FilterBlock<float> &block);
void filterSamples(const FilterBlock<double> &block);

/// Measures interleaved samples like addLevels, but each lane of a vector sums by itself: faster,
/// for sums whose order is fixed by the caller's blocks anyway.
[[nodiscard]] LevelSums measureByLanes(std::span<const float> iq);

/// Parts interleaved samples into two arrays.
void deinterleave(std::span<const float> iq, float *inPhase, float *quadrature);
