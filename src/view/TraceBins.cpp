// SPDX-License-Identifier: Apache-2.0
#include "TraceBins.h"

#include "base/simd.h"

#include <algorithm>
#include <cmath>
#include <cstddef>
#include <cstring>

namespace {

// The display's own constants: close to pi and 2 pi, but not equal to them.
constexpr double StepLimit = 3.1415;
constexpr double StepTurn = 6.283;
constexpr double AxisPhase = 6.283185308;
constexpr double NegativeRealPhase = 3.141592654;
constexpr double LeastMagnitude = 1e-6;

constexpr double Pi = 3.141592653589793;
constexpr double TanPiOver8 = 0.41421356237309503;

constexpr quint8 MarkerMask = 15;

/// Columns of a block of samples; sized to stay in the first-level cache.
struct Block
{
    static constexpr int Size = 512;
    alignas(64) std::array<double, Size> i;
    alignas(64) std::array<double, Size> q;
    alignas(64) std::array<double, Size> magnitude;
    alignas(64) std::array<double, Size> phase;
    alignas(64) std::array<double, Size> phaseSize;  ///< |phase|
    alignas(64) std::array<double, Size + 1> folded; ///< from index 1 on; 0 is the sample before
    alignas(64) std::array<double, Size> step;
};

/// atan(x) for x from 0 to 1. Arguments above tan(pi/8) are brought down by the addition theorem,
/// the rest is a polynomial through Chebyshev nodes; the error is below 3e-16. It has no branch, so
/// that the loop over samples vectorises, which a call of atan2 would prevent.
CORVANE_INLINE double arcTangent(double smaller, double larger)
{
    const bool upper = smaller > TanPiOver8 * larger;
    const double numerator = upper ? smaller - larger : smaller;
    const double denominator = upper ? smaller + larger : larger;
    const double x = numerator / denominator;
    const double z = x * x;
    // Summed in pairs, so that few of the products wait for each other.
    const double z2 = z * z;
    const double z4 = z2 * z2;
    const double low =
        (1.0 - 0.3333333333333312 * z) + z2 * (0.19999999999940837 - 0.14285714279244968 * z);
    const double middle = (0.11111110744657099 - 0.09090896801472813 * z) +
                          z2 * (0.07692045194561481 - 0.06662950246036792 * z);
    const double high = (0.05846866752275139 - 0.05035049795312439 * z) +
                        z2 * (0.03796390316111083 - 0.017803896394812564 * z);
    const double p = low + z4 * (middle + z4 * high);
    return (upper ? Pi / 4 : 0.0) + x * p;
}

/// Magnitude, phase and phase step of `count` samples.
CORVANE_INLINE void analyse(const IqSample *samples, int count, Block &block)
{
    for (int k = 0; k < count; ++k) {
        const double i = samples[k].i;
        const double q = samples[k].q;
        const double magnitude = std::sqrt(i * i + q * q);
        const double absI = std::fabs(i);
        const double absQ = std::fabs(q);
        const bool steep = absQ > absI;
        const double larger = steep ? absQ : absI;
        const double angle = arcTangent(steep ? absI : absQ, larger > 0 ? larger : 1.0);
        const double fromAxis = steep ? Pi / 2 - angle : angle;
        const double upperHalf = i < 0 ? Pi - fromAxis : fromAxis;
        double phase = q < 0 ? -upperHalf : upperHalf;
        const double realPhase = i <= 0 ? NegativeRealPhase : 0.0;
        const double imaginaryPhase = q > 0 ? AxisPhase : -AxisPhase;
        phase = q == 0 ? realPhase : phase;
        phase = i == 0 ? imaginaryPhase : phase;
        phase = magnitude > LeastMagnitude ? phase : 0.0;
        const auto at = static_cast<std::size_t>(k);
        block.i[at] = i;
        block.q[at] = q;
        block.magnitude[at] = magnitude;
        block.phase[at] = phase;
        block.phaseSize[at] = std::fabs(phase);
        block.folded[at + 1] = phase < 0 ? phase + StepTurn : phase;
    }
    for (int k = 0; k < count; ++k) {
        const auto at = static_cast<std::size_t>(k);
        const double difference = block.folded[at + 1] - block.folded[at];
        const double lowered = difference > StepLimit ? difference - StepTurn : difference;
        block.step[at] = difference < -StepLimit ? difference + StepTurn : lowered;
    }
}

struct Range
{
    double low;
    double high;
};

/// Values side by side in one register, and registers side by side: comparing and adding in
/// independent lanes keeps one result from waiting for the one before.
constexpr int LaneCount = 2;
constexpr int RowCount = 4;
constexpr int ChunkSize = LaneCount * RowCount;
using Lanes = double __attribute__((vector_size(LaneCount * sizeof(double))));
using Rows = std::array<Lanes, RowCount>;

CORVANE_INLINE void load(const double *values, Rows &rows)
{
    std::memcpy(rows.data(), values, sizeof(rows));
}

/// Least and greatest of `count` values and of the range so far.
CORVANE_INLINE Range widen(Range range, const double *values, int count)
{
    int k = 0;
    if (count >= ChunkSize) {
        Rows low;
        load(values, low);
        Rows high = low;
        for (k = ChunkSize; k + ChunkSize <= count; k += ChunkSize) {
            Rows chunk;
            load(values + k, chunk);
            for (std::size_t row = 0; row < RowCount; ++row) {
                low[row] = chunk[row] < low[row] ? chunk[row] : low[row];
                high[row] = chunk[row] > high[row] ? chunk[row] : high[row];
            }
        }
        for (std::size_t row = 0; row < RowCount; ++row) {
            for (int lane = 0; lane < LaneCount; ++lane) {
                range.low = std::min(range.low, low[row][lane]);
                range.high = std::max(range.high, high[row][lane]);
            }
        }
    }
    for (; k < count; ++k) {
        range.low = std::min(range.low, values[k]);
        range.high = std::max(range.high, values[k]);
    }
    return range;
}

CORVANE_INLINE double sumOf(const double *values, int count)
{
    Rows sums{};
    int k = 0;
    for (; k + ChunkSize <= count; k += ChunkSize) {
        Rows chunk;
        load(values + k, chunk);
        for (std::size_t row = 0; row < RowCount; ++row) {
            sums[row] += chunk[row];
        }
    }
    const Lanes lanes = (sums[0] + sums[1]) + (sums[2] + sums[3]);
    double sum = lanes[0] + lanes[1];
    for (; k < count; ++k) {
        sum += values[k];
    }
    return sum;
}

CORVANE_INLINE void foldMarkers(TraceBin &bin, std::span<const quint8> markers)
{
    unsigned high = 0;
    unsigned low = 0;
    for (const quint8 marker : markers) {
        high |= marker;
        low |= ~static_cast<unsigned>(marker);
    }
    bin.mkrHigh |= static_cast<quint8>(high & MarkerMask);
    bin.mkrLow |= static_cast<quint8>(low & MarkerMask);
}

/// Folds `count` analysed samples into their bin. `sum` is the bin's sum of magnitudes.
CORVANE_INLINE void fold(TraceBin &bin, const Block &block, int count, double &sum)
{
    const bool first = bin.count == 0;
    const auto range = [count, first](const std::array<double, Block::Size> &values, double low,
                                      double high) {
        return widen(first ? Range{values[0], values[0]} : Range{low, high}, values.data(), count);
    };
    const Range i = range(block.i, bin.iMin, bin.iMax);
    const Range q = range(block.q, bin.qMin, bin.qMax);
    const Range magnitude = range(block.magnitude, bin.magMin, bin.magMax);
    const Range step = range(block.step, bin.freqMin, bin.freqMax);
    const Range size = range(block.phaseSize, std::fabs(bin.phaseLow), std::fabs(bin.phaseHigh));
    const auto sizeEnd = block.phaseSize.begin() + count;
    // The phase keeps its sign, and the first of equal sizes counts.
    if (first || size.low < std::fabs(bin.phaseLow)) {
        const auto at = std::find(block.phaseSize.begin(), sizeEnd, size.low);
        bin.phaseLow = block.phase[static_cast<std::size_t>(at - block.phaseSize.begin())];
    }
    if (first || size.high > std::fabs(bin.phaseHigh)) {
        const auto at = std::find(block.phaseSize.begin(), sizeEnd, size.high);
        bin.phaseHigh = block.phase[static_cast<std::size_t>(at - block.phaseSize.begin())];
    }
    sum += sumOf(block.magnitude.data(), count);
    bin.iMin = i.low;
    bin.iMax = i.high;
    bin.qMin = q.low;
    bin.qMax = q.high;
    bin.magMin = magnitude.low;
    bin.magMax = magnitude.high;
    bin.freqMin = step.low;
    bin.freqMax = step.high;
    bin.count += count;
    bin.magAvg = sum / bin.count;
}

/// Nothing lies before the very first sample, so that it takes the step to the next one: 0 would be
/// seen as a stroke from the carrier at the edge of the picture.
double firstStep(std::span<const IqSample> samples)
{
    if (samples.size() < 2) {
        return 0;
    }
    Block block;
    block.folded[0] = 0;
    analyse(samples.data(), 2, block);
    return block.step[1];
}

} // namespace

void TraceBins::compute(std::span<const IqSample> samples, std::span<const quint8> markers)
{
    begin(static_cast<qint64>(samples.size()));
    append(samples, markers);
}

void TraceBins::begin(qint64 total)
{
    m_total = total;
    m_done = 0;
    m_bin = 0;
    m_sum = 0;
    if (total >= MinSamples) {
        m_bins.fill(TraceBin{});
        m_sparse = total < SparseLimit;
    }
}

CORVANE_CLONES void TraceBins::append(std::span<const IqSample> samples,
                                      std::span<const quint8> markers)
{
    if (m_total < MinSamples) {
        return;
    }
    Block block;
    block.folded[0] = m_lastPhase;
    std::size_t taken = 0;
    while (taken < samples.size() && m_bin < BinCount) {
        // The first sample of the next bin: the least i with i * 512 / n at or above its number.
        const qint64 end = ((m_bin + 1) * m_total + BinCount - 1) / BinCount;
        if (m_done == end) {
            ++m_bin;
            m_sum = 0;
            continue;
        }
        const auto inBin = static_cast<std::size_t>(end - m_done);
        const std::size_t count =
            std::min({inBin, samples.size() - taken, std::size_t{Block::Size}});
        const int blockCount = static_cast<int>(count);
        analyse(samples.data() + taken, blockCount, block);
        if (m_done == 0) {
            block.step[0] = firstStep(samples);
        }
        TraceBin &bin = m_bins[static_cast<std::size_t>(m_bin)];
        fold(bin, block, blockCount, m_sum);
        if (taken < markers.size()) {
            foldMarkers(bin, markers.subspan(taken, std::min(markers.size() - taken, count)));
        }
        block.folded[0] = block.folded[count];
        taken += count;
        m_done += static_cast<qint64>(count);
    }
    m_lastPhase = block.folded[0];
}

void TraceBins::clear()
{
    m_bins.fill(TraceBin{});
    m_sparse = false;
}
