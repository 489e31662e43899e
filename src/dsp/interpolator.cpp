// SPDX-License-Identifier: Apache-2.0
#include "interpolator.h"

#include "tapplan.h"

#include <algorithm>
#include <array>
#include <cmath>
#include <cstddef>
#include <cstdint>
#include <numeric>
#include <vector>

namespace {

/// Outputs that are planned and computed at a time.
constexpr int PlanSize = 1024;

/// Bound of the input samples in a repeated period.
constexpr int MaxOffset = 1024 * 1024;

/// Larger banks of phases would come from main memory.
constexpr std::size_t MaxBankBytes = 4ULL * 1024 * 1024;

/// Up to this sum of the magnitudes of the coefficients, single precision holds the bound.
constexpr double MaxSinglePrecisionSum = 12.0;

template <typename Real>
struct alignas(KernelVectorBytes) KernelVector
{
    std::array<Real, KernelLanes<Real>> lanes{};
};

/// Rows of coefficients, all zero at first, padded to whole kernel vectors.
template <typename Real>
class RowStore
{
public:
    RowStore(int taps, std::size_t rowCount)
        : m_vectors((taps + KernelLanes<Real> - 1) / KernelLanes<Real>)
        , m_rows(rowCount * static_cast<std::size_t>(m_vectors))
    {
    }

    [[nodiscard]] int vectors() const { return m_vectors; }
    [[nodiscard]] Real *row(std::size_t index)
    {
        return m_rows[index * static_cast<std::size_t>(m_vectors)].lanes.data();
    }
    [[nodiscard]] const Real *row(std::size_t index) const
    {
        return m_rows[index * static_cast<std::size_t>(m_vectors)].lanes.data();
    }

private:
    int m_vectors;
    std::vector<KernelVector<Real>> m_rows;
};

/// The coefficients of one output, interpolated between the table points as defined.
template <typename Real>
void fillRow(const FilterTable &table, double position, int count, double scale, Real *row)
{
    for (int j = 0; j < count; ++j) {
        const auto index = static_cast<qint64>(position);
        if (index >= 0 && index < FilterTablePoints) {
            const auto point = static_cast<std::size_t>(index);
            row[j] = static_cast<Real>(
                table.value[point] + table.slope[point] * (position - static_cast<double>(index)));
        }
        position -= scale;
    }
}

/// An output that falls on an input sample has a tap more than one between two. Its position is
/// rounded, so that it may lie a hair before or behind the sample, which changes the number of taps
/// and the place of the first one.
enum OnSample : std::size_t {
    Exact = 0,       ///< or so close that the ends of the taps are rounded to it
    RoundedUp = 1,   ///< all taps, with the coefficients of a position behind the sample
    JustBefore = 2,  ///< the last tap is missing
    JustBehind = 3,  ///< the first tap is missing
    OnSampleRows = 4 ///< number of such rows
};

OnSample onSampleKind(const TapRange &taps, const TapGeometry &geometry)
{
    const bool before = taps.position > (geometry.length() - 1.5) * geometry.scale();
    if (taps.count == geometry.maxTaps()) {
        return before ? Exact : RoundedUp;
    }
    return before ? JustBefore : JustBehind;
}

template <typename Real>
void fillOnSampleRow(const FilterTable &table, const TapGeometry &geometry, OnSample kind,
                     Real *row)
{
    const bool before = kind == Exact || kind == JustBefore;
    const int back = geometry.length() - (before ? 1 : 2);
    const int taps = geometry.maxTaps() - (kind < JustBefore ? 0 : 1);
    fillRow(table, back * geometry.scale(), taps, geometry.scale(), row);
}

/// Equal counts: every output has the same taps, one input sample on.
template <typename Real>
class SingleRow final : public Interpolator
{
public:
    SingleRow(const FilterTable &table, const TapGeometry &geometry)
        : m_half(geometry.half())
        , m_taps(static_cast<std::size_t>(geometry.maxTaps()))
    {
        const TapRange taps = geometry.taps(0);
        fillRow(table, taps.position, taps.count, geometry.scale(), m_taps.data());
    }

    void compute(qint64 firstOutput, PlanarInput input, qint64 inputStart,
                 std::span<float> result) const override
    {
        const qint64 offset = firstOutput - m_half - inputStart;
        filterSamples(
            FilterBlock<Real>{{input.inPhase + offset, input.quadrature + offset}, m_taps, result});
    }

private:
    int m_half;
    std::vector<Real> m_taps;
};

/// Counts with a common divisor: the fractions of the positions repeat, so a row for each is made
/// once.
template <typename Real>
class PhaseBank final : public Interpolator
{
public:
    PhaseBank(const FilterTable &table, const TapGeometry &geometry, int inputPeriod,
              int outputPeriod)
        : m_geometry(geometry)
        , m_phases(outputPeriod)
        , m_exactRatio(std::fma(geometry.ratio(), inputPeriod, -outputPeriod) == 0)
        , m_rows(geometry.maxTaps(), static_cast<std::size_t>(outputPeriod) + OnSampleRows)
    {
        // Short periods are repeated, so that the kernel has long stretches to work on.
        const int repeats = std::max(std::min(PlanSize / outputPeriod, MaxOffset / inputPeriod), 1);
        m_inputPeriod = static_cast<qint64>(inputPeriod) * repeats;
        m_outputPeriod = static_cast<qint64>(outputPeriod) * repeats;
        const std::int32_t stride = m_rows.vectors() * KernelLanes<Real>;
        for (int repeat = 0; repeat < repeats; ++repeat) {
            const auto start = static_cast<std::int32_t>(repeat * inputPeriod);
            m_offsets.push_back(start - geometry.half());
            m_rowStarts.push_back((outputPeriod + static_cast<std::int32_t>(Exact)) * stride);
            for (int phase = 1; phase < outputPeriod; ++phase) {
                const TapRange taps = geometry.taps(phase);
                m_offsets.push_back(start + static_cast<std::int32_t>(taps.first));
                m_rowStarts.push_back(phase * stride);
            }
        }
        for (int phase = 1; phase < outputPeriod; ++phase) {
            const TapRange taps = geometry.taps(phase);
            fillRow(table, taps.position, taps.count, geometry.scale(),
                    m_rows.row(static_cast<std::size_t>(phase)));
        }
        for (std::size_t kind = 0; kind < OnSampleRows; ++kind) {
            fillOnSampleRow(table, geometry, static_cast<OnSample>(kind),
                            m_rows.row(static_cast<std::size_t>(outputPeriod) + kind));
        }
    }

    void compute(qint64 firstOutput, PlanarInput input, qint64 inputStart,
                 std::span<float> result) const override
    {
        const qint64 count = static_cast<qint64>(result.size() / 2);
        for (qint64 done = 0; done < count;) {
            const qint64 output = firstOutput + done;
            const qint64 place = output % m_outputPeriod;
            const qint64 length = std::min(count - done, m_outputPeriod - place);
            const qint64 shift = output / m_outputPeriod * m_inputPeriod - inputStart;
            RowBlock<Real> block;
            block.input = {input.inPhase + shift, input.quadrature + shift};
            block.rows = m_rows.row(0);
            block.offsets = std::span(m_offsets).subspan(static_cast<std::size_t>(place),
                                                         static_cast<std::size_t>(length));
            block.rowStarts =
                std::span(m_rowStarts)
                    .subspan(static_cast<std::size_t>(place), static_cast<std::size_t>(length));
            block.vectors = m_rows.vectors();
            block.result = result.subspan(2 * static_cast<std::size_t>(done),
                                          2 * static_cast<std::size_t>(length));
            dotRows(block);
            done += length;
        }
        if (!m_exactRatio) {
            correctOnSample(firstOutput, input, inputStart, result);
        }
    }

private:
    /// Computes again the outputs on a sample whose position was rounded away from it.
    void correctOnSample(qint64 firstOutput, PlanarInput input, qint64 inputStart,
                         std::span<float> result) const
    {
        const qint64 end = firstOutput + static_cast<qint64>(result.size() / 2);
        const qint64 start = (firstOutput + m_phases - 1) / m_phases * m_phases;
        for (qint64 output = start; output < end; output += m_phases) {
            const TapRange taps = m_geometry.taps(output);
            const OnSample kind = onSampleKind(taps, m_geometry);
            if (kind == Exact) {
                continue;
            }
            const auto offset = static_cast<std::int32_t>(taps.first - inputStart);
            const auto rowStart = static_cast<std::int32_t>(
                m_rows.row(static_cast<std::size_t>(m_phases) + kind) - m_rows.row(0));
            RowBlock<Real> block;
            block.input = input;
            block.rows = m_rows.row(0);
            block.offsets = {&offset, 1};
            block.rowStarts = {&rowStart, 1};
            block.vectors = m_rows.vectors();
            block.result = result.subspan(2 * static_cast<std::size_t>(output - firstOutput), 2);
            dotRows(block);
        }
    }

    TapGeometry m_geometry;
    qint64 m_phases;
    bool m_exactRatio; ///< positions on a sample aren't rounded
    qint64 m_inputPeriod;
    qint64 m_outputPeriod;
    RowStore<Real> m_rows; ///< row 0 isn't used; the rows on a sample follow those of the phases
    std::vector<std::int32_t> m_offsets;
    std::vector<std::int32_t> m_rowStarts;
};

/// Any counts. Tap j of an output at table point p lies at p - j scale. With the whole parts taken
/// out, all taps share one fraction of p, and a row holds the table values for one whole part of p:
/// the gather from the table becomes a walk along rows.
template <typename Real>
class SlopedTable final : public Interpolator
{
public:
    SlopedTable(const FilterTable &table, const TapGeometry &geometry)
        : m_geometry(geometry)
        , m_lowest(static_cast<int>((geometry.length() - 2) * geometry.scale()) - 1)
        , m_rowCount(
              static_cast<std::size_t>((geometry.length() - 1) * geometry.scale() - m_lowest) + 2)
        , m_rows(geometry.maxTaps(), 2 * m_rowCount + 8)
        , m_shifts(geometry.maxTaps(), 1)
    {
        // An output between two input samples has one tap less than one on a sample.
        for (int j = 0; j < geometry.maxTaps() - 1; ++j) {
            const double place = j * geometry.scale();
            const double whole = std::floor(place);
            m_shifts.row(0)[j] = static_cast<Real>(place - whole);
            for (std::size_t r = 0; r < m_rowCount; ++r) {
                const double point = m_lowest + static_cast<double>(r) - whole;
                if (point >= 0 && point < FilterTablePoints) {
                    const auto index = static_cast<std::size_t>(point);
                    m_rows.row(2 * r)[j] = static_cast<Real>(table.value[index]);
                    m_rows.row(2 * r + 1)[j] = static_cast<Real>(table.slope[index]);
                }
            }
        }
        // Rows without slopes before and behind serve any fraction.
        const std::size_t exact = 2 * m_rowCount + 2;
        const std::size_t roundedUp = exact + 3;
        fillOnSampleRow(table, geometry, Exact, m_rows.row(exact));
        fillOnSampleRow(table, geometry, RoundedUp, m_rows.row(roundedUp));
        m_layout.lowest = m_lowest;
        m_layout.rowStride = 2 * m_rows.vectors() * KernelLanes<Real>;
        m_layout.onSample = static_cast<std::int32_t>(m_rows.row(exact) - m_rows.row(0));
        m_layout.onSampleNext = static_cast<std::int32_t>(m_rows.row(roundedUp) - m_rows.row(0));
    }

    void compute(qint64 firstOutput, PlanarInput input, qint64 inputStart,
                 std::span<float> result) const override
    {
        std::array<std::int32_t, PlanSize> offsets;
        std::array<std::int32_t, PlanSize> rowStarts;
        std::array<Real, PlanSize> fractions;
        const std::size_t count = result.size() / 2;
        for (std::size_t done = 0; done < count;) {
            const std::size_t length = std::min<std::size_t>(PlanSize, count - done);
            const TapPlan<Real> plan{std::span(offsets).first(length),
                                     std::span(rowStarts).first(length),
                                     std::span(fractions).first(length)};
            planTaps(m_geometry, m_layout, firstOutput + static_cast<qint64>(done), inputStart,
                     plan);
            SlopedBlock<Real> block;
            block.base.input = input;
            block.base.rows = m_rows.row(0);
            block.base.offsets = plan.offsets;
            block.base.rowStarts = plan.rowStarts;
            block.base.vectors = m_rows.vectors();
            block.base.result = result.subspan(2 * done, 2 * length);
            block.fractions = plan.fractions;
            block.shifts = m_shifts.row(0);
            dotSlopedRows(block);
            done += length;
        }
    }

private:
    TapGeometry m_geometry;
    int m_lowest; ///< table point of the first row
    std::size_t m_rowCount;
    RowStore<Real> m_rows; ///< values and slopes take turns
    RowStore<Real> m_shifts;
    SlopedLayout m_layout;
};

template <typename Real>
std::unique_ptr<Interpolator> makeFor(const FilterTable &table, const TapGeometry &geometry,
                                      int inputCount, int outputCount)
{
    if (inputCount == outputCount) {
        return std::make_unique<SingleRow<Real>>(table, geometry);
    }
    const int divisor = std::gcd(inputCount, outputCount);
    const int phases = outputCount / divisor;
    const std::size_t rowBytes = static_cast<std::size_t>(geometry.maxTaps()) * sizeof(Real);
    const std::size_t paddedBytes = rowBytes + KernelVectorBytes;
    if (static_cast<std::size_t>(phases) * paddedBytes <= MaxBankBytes) {
        return std::make_unique<PhaseBank<Real>>(table, geometry, inputCount / divisor, phases);
    }
    return std::make_unique<SlopedTable<Real>>(table, geometry);
}

} // namespace

std::unique_ptr<Interpolator> makeInterpolator(const FilterTable &table,
                                               const TapGeometry &geometry, int inputCount,
                                               int outputCount)
{
    double sum = 0;
    for (const double value : table.value) {
        sum += std::abs(value);
    }
    if (sum / geometry.scale() > MaxSinglePrecisionSum) {
        return makeFor<double>(table, geometry, inputCount, outputCount);
    }
    return makeFor<float>(table, geometry, inputCount, outputCount);
}
