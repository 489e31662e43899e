// SPDX-License-Identifier: Apache-2.0
#include "dotkernels.h"

#include "base/simd.h"

#include <algorithm>
#include <array>
#include <cstddef>

namespace {

/// The sums of the lanes of four vectors.
template <std::size_t Bytes>
CORVANE_INLINE void sumLanes(const WideVector<float, Bytes> &i0, const WideVector<float, Bytes> &q0,
                             const WideVector<float, Bytes> &i1, const WideVector<float, Bytes> &q1,
                             float *sums)
{
    using Sum = QuarterSum<float, Bytes>;
    using Quarter = typename Sum::Vector;
    Quarter a;
    Quarter b;
    Quarter c;
    Quarter d;
    Sum::of(i0, a);
    Sum::of(q0, b);
    Sum::of(i1, c);
    Sum::of(q1, d);
    const Quarter ab =
        __builtin_shufflevector(a, b, 0, 4, 1, 5) + __builtin_shufflevector(a, b, 2, 6, 3, 7);
    const Quarter cd =
        __builtin_shufflevector(c, d, 0, 4, 1, 5) + __builtin_shufflevector(c, d, 2, 6, 3, 7);
    const Quarter all =
        __builtin_shufflevector(ab, cd, 0, 1, 4, 5) + __builtin_shufflevector(ab, cd, 2, 3, 6, 7);
    std::memcpy(sums, &all, sizeof(all));
}

template <std::size_t Bytes>
CORVANE_INLINE void
sumLanes(const WideVector<double, Bytes> &i0, const WideVector<double, Bytes> &q0,
         const WideVector<double, Bytes> &i1, const WideVector<double, Bytes> &q1, float *sums)
{
    using Sum = QuarterSum<double, Bytes>;
    typename Sum::Vector quarters[4];
    Sum::of(i0, quarters[0]);
    Sum::of(q0, quarters[1]);
    Sum::of(i1, quarters[2]);
    Sum::of(q1, quarters[3]);
    for (int i = 0; i < 4; ++i) {
        sums[i] = static_cast<float>(quarters[i][0] + quarters[i][1]);
    }
}

/// Where one output of a block takes its coefficients and samples from.
template <typename Real>
struct Output
{
    const float *inPhase;
    const float *quadrature;
    const Real *row;
};

template <typename Real>
CORVANE_INLINE void locate(const RowBlock<Real> &block, std::size_t n, Output<Real> &output)
{
    output = {block.input.inPhase + block.offsets[n], block.input.quadrature + block.offsets[n],
              block.rows + block.rowStarts[n]};
}

template <typename Real, std::size_t Bytes>
CORVANE_INLINE void accumulate(const WideVector<Real, Bytes> &coefficients,
                               const Output<Real> &output, int place, WideVector<Real, Bytes> &sumI,
                               WideVector<Real, Bytes> &sumQ)
{
    using Wide = WideVector<Real, Bytes>;
    for (std::size_t part = 0; part < Wide::Parts; ++part) {
        typename Wide::Part xi;
        typename Wide::Part xq;
        loadPart<Real, Bytes>(xi, output.inPhase + place + part * Wide::PartLanes);
        loadPart<Real, Bytes>(xq, output.quadrature + place + part * Wide::PartLanes);
        sumI.parts[part] += coefficients.parts[part] * xi;
        sumQ.parts[part] += coefficients.parts[part] * xq;
    }
}

/// Two outputs at a time share the work of adding up lanes. An odd last one is computed twice.
template <std::size_t Bytes, typename Real, typename Coefficients>
CORVANE_INLINE void dotPairs(const RowBlock<Real> &block, const Coefficients &coefficientsOf)
{
    using Wide = WideVector<Real, Bytes>;
    const std::size_t count = block.offsets.size();
    for (std::size_t n = 0; n < count; n += 2) {
        const std::size_t second = std::min(n + 1, count - 1);
        Output<Real> output0;
        Output<Real> output1;
        locate(block, n, output0);
        locate(block, second, output1);
        Wide i0{};
        Wide q0{};
        Wide i1{};
        Wide q1{};
        for (int place = 0; place < block.vectors * Wide::Lanes; place += Wide::Lanes) {
            Wide c0;
            Wide c1;
            coefficientsOf(n, output0.row + place, place, c0);
            coefficientsOf(second, output1.row + place, place, c1);
            accumulate(c0, output0, place, i0, q0);
            accumulate(c1, output1, place, i1, q1);
        }
        std::array<float, 4> sums;
        sumLanes(i0, q0, i1, q1, sums.data());
        std::copy_n(sums.data(), 2 * (second - n + 1), block.result.data() + 2 * n);
    }
}

template <std::size_t Bytes, typename Real>
CORVANE_INLINE void dotRowsBody(const RowBlock<Real> &block)
{
    dotPairs<Bytes>(
        block, [](std::size_t, const Real *row, int, WideVector<Real, Bytes> &c)
                   __attribute__((always_inline)) { load(c, row); });
}

template <std::size_t Bytes, typename Real>
CORVANE_INLINE void dotSlopedRowsBody(const SlopedBlock<Real> &sloped)
{
    using Wide = WideVector<Real, Bytes>;
    const std::ptrdiff_t width = static_cast<std::ptrdiff_t>(sloped.base.vectors) * Wide::Lanes;
    dotPairs<Bytes>(
        sloped.base, [&](std::size_t n, const Real *row, int place, Wide &c)
                         __attribute__((always_inline)) {
                             Wide value;
                             Wide up;
                             Wide down;
                             Wide shift;
                             load(value, row);
                             load(up, row + width);
                             load(down, row - width);
                             load(shift, sloped.shifts + place);
                             for (std::size_t part = 0; part < Wide::Parts; ++part) {
                                 const auto d = sloped.fractions[n] - shift.parts[part];
                                 const auto slope = d >= 0 ? up.parts[part] : down.parts[part];
                                 c.parts[part] = value.parts[part] + d * slope;
                             }
                         });
}

/// Registers of outputs whose sums are kept while the taps go by.
constexpr std::size_t TileParts = 8;

template <std::size_t Bytes, typename Real>
CORVANE_INLINE void filterTile(std::span<const Real> taps, const float *x, Real *result)
{
    using Wide = WideVector<Real, Bytes>;
    typename Wide::Part sums[TileParts] = {};
    for (const Real tap : taps) {
        for (std::size_t part = 0; part < TileParts; ++part) {
            typename Wide::Part samples;
            loadPart<Real, Bytes>(samples, x + part * Wide::PartLanes);
            sums[part] += tap * samples;
        }
        ++x;
    }
    std::memcpy(result, sums, sizeof(sums));
}

template <std::size_t Bytes, typename Real>
CORVANE_INLINE void filterSamplesBody(const FilterBlock<Real> &block)
{
    constexpr std::size_t Tile = TileParts * WideVector<Real, Bytes>::PartLanes;
    std::array<Real, Tile> inPhase;
    std::array<Real, Tile> quadrature;
    const std::size_t count = block.result.size() / 2;
    for (std::size_t n = 0; n < count; n += Tile) {
        filterTile<Bytes>(block.taps, block.input.inPhase + n, inPhase.data());
        filterTile<Bytes>(block.taps, block.input.quadrature + n, quadrature.data());
        const std::size_t used = std::min(Tile, count - n);
        for (std::size_t i = 0; i < used; ++i) {
            block.result[2 * (n + i)] = static_cast<float>(inPhase[i]);
            block.result[2 * (n + i) + 1] = static_cast<float>(quadrature[i]);
        }
    }
}

} // namespace

CORVANE_WIDE_KERNEL(dotRows, const RowBlock<float> &, dotRowsBody)
CORVANE_WIDE_KERNEL(dotRows, const RowBlock<double> &, dotRowsBody)
CORVANE_WIDE_KERNEL(dotSlopedRows, const SlopedBlock<float> &, dotSlopedRowsBody)
CORVANE_WIDE_KERNEL(dotSlopedRows, const SlopedBlock<double> &, dotSlopedRowsBody)
CORVANE_WIDE_KERNEL(filterSamples, const FilterBlock<float> &, filterSamplesBody)
CORVANE_WIDE_KERNEL(filterSamples, const FilterBlock<double> &, filterSamplesBody)

CORVANE_CLONES LevelSums measureByLanes(std::span<const float> iq)
{
    constexpr std::size_t Lanes = 8;
    std::array<double, Lanes> highest{};
    std::array<double, Lanes> sum{};
    const std::size_t count = iq.size() / 2;
    for (std::size_t n = 0; n < count; n += Lanes) {
        const std::size_t used = std::min(Lanes, count - n);
        for (std::size_t i = 0; i < used; ++i) {
            const double inPhase = iq[2 * (n + i)];
            const double quadrature = iq[2 * (n + i) + 1];
            const double square = inPhase * inPhase + quadrature * quadrature;
            highest[i] = std::max(highest[i], square);
            sum[i] += square;
        }
    }
    LevelSums level;
    for (std::size_t i = 0; i < Lanes; ++i) {
        level.peak = std::max(level.peak, highest[i]);
        level.sum += sum[i];
    }
    return level;
}

CORVANE_CLONES void deinterleave(std::span<const float> iq, float *inPhase, float *quadrature)
{
    const std::size_t count = iq.size() / 2;
    for (std::size_t n = 0; n < count; ++n) {
        inPhase[n] = iq[2 * n];
        quadrature[n] = iq[2 * n + 1];
    }
}
