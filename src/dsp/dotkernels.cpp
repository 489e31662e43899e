// SPDX-License-Identifier: Apache-2.0
#include "dotkernels.h"

#include "vectorclones.h"

#include <algorithm>
#include <array>
#include <cstddef>
#include <cstring>

namespace {

template <typename Real>
struct Kernel
{
    static constexpr int Lanes = KernelLanes<Real>;
    typedef Real Vector __attribute__((vector_size(KernelVectorBytes)));
    typedef float Samples __attribute__((vector_size(Lanes * sizeof(float))));
};

// The bodies hand vectors over by reference: by value, the way would depend on the instruction set.

template <typename Vector, typename Real>
CORVANE_INLINE void load(Vector &vector, const Real *from)
{
    std::memcpy(&vector, from, sizeof(vector));
}

template <typename Real>
CORVANE_INLINE void loadSamples(typename Kernel<Real>::Vector &vector, const float *from)
{
    typename Kernel<Real>::Samples samples;
    std::memcpy(&samples, from, sizeof(samples));
    vector = __builtin_convertvector(samples, typename Kernel<Real>::Vector);
}

/// The sums of the lanes of four vectors. Halves are added first, which every instruction set can
/// do at the cost of taking them out of a register.
CORVANE_INLINE void sumLanes(const Kernel<float>::Vector &i0, const Kernel<float>::Vector &q0,
                             const Kernel<float>::Vector &i1, const Kernel<float>::Vector &q1,
                             float *sums)
{
    typedef float Quarter __attribute__((vector_size(KernelVectorBytes / 4)));
    const auto quarterOf = [](const Kernel<float>::Vector &vector, Quarter &quarter) {
        const auto half = __builtin_shufflevector(vector, vector, 0, 1, 2, 3, 4, 5, 6, 7) +
                          __builtin_shufflevector(vector, vector, 8, 9, 10, 11, 12, 13, 14, 15);
        quarter = __builtin_shufflevector(half, half, 0, 1, 2, 3) +
                  __builtin_shufflevector(half, half, 4, 5, 6, 7);
    };
    Quarter a;
    Quarter b;
    Quarter c;
    Quarter d;
    quarterOf(i0, a);
    quarterOf(q0, b);
    quarterOf(i1, c);
    quarterOf(q1, d);
    const Quarter ab =
        __builtin_shufflevector(a, b, 0, 4, 1, 5) + __builtin_shufflevector(a, b, 2, 6, 3, 7);
    const Quarter cd =
        __builtin_shufflevector(c, d, 0, 4, 1, 5) + __builtin_shufflevector(c, d, 2, 6, 3, 7);
    const Quarter all =
        __builtin_shufflevector(ab, cd, 0, 1, 4, 5) + __builtin_shufflevector(ab, cd, 2, 3, 6, 7);
    std::memcpy(sums, &all, sizeof(all));
}

CORVANE_INLINE void sumLanes(const Kernel<double>::Vector &i0, const Kernel<double>::Vector &q0,
                             const Kernel<double>::Vector &i1, const Kernel<double>::Vector &q1,
                             float *sums)
{
    const auto sumOf = [](const Kernel<double>::Vector &vector) {
        const auto half = __builtin_shufflevector(vector, vector, 0, 1, 2, 3) +
                          __builtin_shufflevector(vector, vector, 4, 5, 6, 7);
        const auto quarter =
            __builtin_shufflevector(half, half, 0, 1) + __builtin_shufflevector(half, half, 2, 3);
        return static_cast<float>(quarter[0] + quarter[1]);
    };
    sums[0] = sumOf(i0);
    sums[1] = sumOf(q0);
    sums[2] = sumOf(i1);
    sums[3] = sumOf(q1);
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

template <typename Real>
CORVANE_INLINE void
accumulate(const typename Kernel<Real>::Vector &coefficients, const Output<Real> &output, int place,
           typename Kernel<Real>::Vector &sumI, typename Kernel<Real>::Vector &sumQ)
{
    typename Kernel<Real>::Vector xi;
    typename Kernel<Real>::Vector xq;
    loadSamples<Real>(xi, output.inPhase + place);
    loadSamples<Real>(xq, output.quadrature + place);
    sumI += coefficients * xi;
    sumQ += coefficients * xq;
}

/// Two outputs at a time share the work of adding up lanes. An odd last one is computed twice.
template <typename Real, typename Coefficients>
CORVANE_INLINE void dotPairs(const RowBlock<Real> &block, const Coefficients &coefficientsOf)
{
    using Vector = typename Kernel<Real>::Vector;
    constexpr int Lanes = Kernel<Real>::Lanes;
    const std::size_t count = block.offsets.size();
    for (std::size_t n = 0; n < count; n += 2) {
        const std::size_t second = std::min(n + 1, count - 1);
        Output<Real> output0;
        Output<Real> output1;
        locate(block, n, output0);
        locate(block, second, output1);
        Vector i0{};
        Vector q0{};
        Vector i1{};
        Vector q1{};
        for (int place = 0; place < block.vectors * Lanes; place += Lanes) {
            Vector c0;
            Vector c1;
            coefficientsOf(n, output0.row + place, place, c0);
            coefficientsOf(second, output1.row + place, place, c1);
            accumulate<Real>(c0, output0, place, i0, q0);
            accumulate<Real>(c1, output1, place, i1, q1);
        }
        std::array<float, 4> sums;
        sumLanes(i0, q0, i1, q1, sums.data());
        std::copy_n(sums.data(), 2 * (second - n + 1), block.result.data() + 2 * n);
    }
}

template <typename Real>
CORVANE_INLINE void dotRowsBody(const RowBlock<Real> &block)
{
    using Vector = typename Kernel<Real>::Vector;
    dotPairs(
        block, [](std::size_t, const Real *row, int, Vector &c)
                   __attribute__((always_inline)) { load(c, row); });
}

template <typename Real>
CORVANE_INLINE void dotSlopedRowsBody(const SlopedBlock<Real> &sloped)
{
    using Vector = typename Kernel<Real>::Vector;
    const std::ptrdiff_t width =
        static_cast<std::ptrdiff_t>(sloped.base.vectors) * Kernel<Real>::Lanes;
    dotPairs(
        sloped.base, [&](std::size_t n, const Real *row, int place, Vector &c)
                         __attribute__((always_inline)) {
                             Vector value;
                             Vector up;
                             Vector down;
                             Vector shift;
                             load(value, row);
                             load(up, row + width);
                             load(down, row - width);
                             load(shift, sloped.shifts + place);
                             const Vector d = sloped.fractions[n] - shift;
                             c = value + d * (d >= 0 ? up : down);
                         });
}

/// Sums of this many kernel vectors of outputs are kept in registers.
constexpr int TileVectors = 4;

template <typename Real>
CORVANE_INLINE void
filterTile(std::span<const Real> taps, const float *x,
           std::array<float, static_cast<std::size_t>(TileVectors *KernelLanes<Real>)> &result)
{
    using Vector = typename Kernel<Real>::Vector;
    constexpr int Lanes = Kernel<Real>::Lanes;
    Vector sum0{};
    Vector sum1{};
    Vector sum2{};
    Vector sum3{};
    for (const Real tap : taps) {
        Vector x0;
        Vector x1;
        Vector x2;
        Vector x3;
        loadSamples<Real>(x0, x);
        loadSamples<Real>(x1, x + Lanes);
        loadSamples<Real>(x2, x + Lanes + Lanes);
        loadSamples<Real>(x3, x + Lanes + Lanes + Lanes);
        sum0 += tap * x0;
        sum1 += tap * x1;
        sum2 += tap * x2;
        sum3 += tap * x3;
        ++x;
    }
    const std::array<Vector, TileVectors> sums{sum0, sum1, sum2, sum3};
    std::array<Real, static_cast<std::size_t>(TileVectors * Lanes)> lanes;
    std::memcpy(lanes.data(), sums.data(), sizeof(lanes));
    for (std::size_t i = 0; i < lanes.size(); ++i) {
        result[i] = static_cast<float>(lanes[i]);
    }
}

template <typename Real>
CORVANE_INLINE void filterSamplesBody(const FilterBlock<Real> &block)
{
    constexpr auto Tile = static_cast<std::size_t>(TileVectors * KernelLanes<Real>);
    std::array<float, Tile> inPhase;
    std::array<float, Tile> quadrature;
    const std::size_t count = block.result.size() / 2;
    for (std::size_t n = 0; n < count; n += Tile) {
        filterTile<Real>(block.taps, block.input.inPhase + n, inPhase);
        filterTile<Real>(block.taps, block.input.quadrature + n, quadrature);
        const std::size_t used = std::min(Tile, count - n);
        for (std::size_t i = 0; i < used; ++i) {
            block.result[2 * (n + i)] = inPhase[i];
            block.result[2 * (n + i) + 1] = quadrature[i];
        }
    }
}

} // namespace

CORVANE_VECTOR_CLONES void dotRows(const RowBlock<float> &block)
{
    dotRowsBody(block);
}

CORVANE_VECTOR_CLONES void dotRows(const RowBlock<double> &block)
{
    dotRowsBody(block);
}

CORVANE_VECTOR_CLONES void dotSlopedRows(const SlopedBlock<float> &block)
{
    dotSlopedRowsBody(block);
}

CORVANE_VECTOR_CLONES void dotSlopedRows(const SlopedBlock<double> &block)
{
    dotSlopedRowsBody(block);
}

CORVANE_VECTOR_CLONES void filterSamples(const FilterBlock<float> &block)
{
    filterSamplesBody(block);
}

CORVANE_VECTOR_CLONES void filterSamples(const FilterBlock<double> &block)
{
    filterSamplesBody(block);
}

CORVANE_VECTOR_CLONES SquareLevel measureSquares(std::span<const float> iq)
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
    SquareLevel level;
    for (std::size_t i = 0; i < Lanes; ++i) {
        level.highest = std::max(level.highest, highest[i]);
        level.sum += sum[i];
    }
    return level;
}

CORVANE_VECTOR_CLONES void deinterleave(std::span<const float> iq, float *inPhase,
                                        float *quadrature)
{
    const std::size_t count = iq.size() / 2;
    for (std::size_t n = 0; n < count; ++n) {
        inPhase[n] = iq[2 * n];
        quadrature[n] = iq[2 * n + 1];
    }
}
