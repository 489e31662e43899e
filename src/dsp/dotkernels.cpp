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

template <typename Real>
CORVANE_INLINE float sumOf(const typename Kernel<Real>::Vector &vector)
{
    std::array<Real, Kernel<Real>::Lanes> lanes;
    std::memcpy(lanes.data(), &vector, sizeof(vector));
    for (std::size_t width = lanes.size() / 2; width > 0; width /= 2) {
        for (std::size_t i = 0; i < width; ++i) {
            lanes[i] += lanes[i + width];
        }
    }
    return static_cast<float>(lanes[0]);
}

template <typename Real>
CORVANE_INLINE void dotRowsBody(const RowBlock<Real> &block)
{
    using Vector = typename Kernel<Real>::Vector;
    constexpr int Lanes = Kernel<Real>::Lanes;
    for (std::size_t n = 0; n < block.offsets.size(); ++n) {
        const float *inPhase = block.input.inPhase + block.offsets[n];
        const float *quadrature = block.input.quadrature + block.offsets[n];
        const Real *row = block.rows[n];
        Vector sumI{};
        Vector sumQ{};
        for (int v = 0; v < block.vectors; ++v) {
            Vector c;
            Vector xi;
            Vector xq;
            load(c, row + v * Lanes);
            loadSamples<Real>(xi, inPhase + v * Lanes);
            loadSamples<Real>(xq, quadrature + v * Lanes);
            sumI += c * xi;
            sumQ += c * xq;
        }
        block.result[2 * n] = sumOf<Real>(sumI);
        block.result[2 * n + 1] = sumOf<Real>(sumQ);
    }
}

template <typename Real>
CORVANE_INLINE void dotSlopedRowsBody(const SlopedBlock<Real> &sloped)
{
    using Vector = typename Kernel<Real>::Vector;
    constexpr int Lanes = Kernel<Real>::Lanes;
    const RowBlock<Real> &block = sloped.base;
    const std::ptrdiff_t width = static_cast<std::ptrdiff_t>(block.vectors) * Lanes;
    for (std::size_t n = 0; n < block.offsets.size(); ++n) {
        const float *inPhase = block.input.inPhase + block.offsets[n];
        const float *quadrature = block.input.quadrature + block.offsets[n];
        const Real *row = block.rows[n];
        const Real fraction = sloped.fractions[n];
        Vector sumI{};
        Vector sumQ{};
        for (int v = 0; v < block.vectors; ++v) {
            Vector value;
            Vector up;
            Vector down;
            Vector shift;
            Vector xi;
            Vector xq;
            load(value, row + v * Lanes);
            load(up, row + width + v * Lanes);
            load(down, row - width + v * Lanes);
            load(shift, sloped.shifts + v * Lanes);
            const Vector d = fraction - shift;
            const Vector c = value + d * (d >= 0 ? up : down);
            loadSamples<Real>(xi, inPhase + v * Lanes);
            loadSamples<Real>(xq, quadrature + v * Lanes);
            sumI += c * xi;
            sumQ += c * xq;
        }
        block.result[2 * n] = sumOf<Real>(sumI);
        block.result[2 * n + 1] = sumOf<Real>(sumQ);
    }
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
        loadSamples<Real>(x2, x + 2 * Lanes);
        loadSamples<Real>(x3, x + 3 * Lanes);
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
