// SPDX-License-Identifier: Apache-2.0
#include "interpolator.h"

#include <algorithm>
#include <array>
#include <cmath>
#include <cstddef>
#include <numeric>
#include <vector>

namespace {

/// Outputs that are planned and computed at a time.
constexpr std::size_t PlanSize = 512;

/// A bank of phases up to this size stays in the second cache of one core.
constexpr std::size_t MaxBankBytes = 1024 * 1024;

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

/// The rows of outputs that fall on an input sample. The position of such an output is rounded, so
/// that it may lie a hair before or behind the sample, which changes the number of taps and the
/// place of the first one.
template <typename Real>
class OnSampleRows
{
public:
    static constexpr std::size_t Count = 4;

    /// Writes the rows into the store, `stride` rows apart.
    static void fill(RowStore<Real> &store, std::size_t first, std::size_t stride,
                     const FilterTable &table, const TapGeometry &geometry)
    {
        for (std::size_t variant = 0; variant < Count; ++variant) {
            const int back = geometry.length() - (variant % 2 == 0 ? 1 : 2);
            const int taps = geometry.maxTaps() - (variant < 2 ? 0 : 1);
            fillRow(table, back * geometry.scale(), taps, geometry.scale(),
                    store.row(first + variant * stride));
        }
    }

    [[nodiscard]] static std::size_t variantOf(const TapRange &taps, const TapGeometry &geometry)
    {
        const bool atSample = taps.position > (geometry.length() - 1.5) * geometry.scale();
        return (atSample ? 0U : 1U) + (taps.count == geometry.maxTaps() ? 0U : 2U);
    }
};

/// What the kernels need to know of the next outputs.
template <typename Real>
struct Plan
{
    std::array<std::int32_t, PlanSize> offsets;
    std::array<const Real *, PlanSize> rows;
    std::array<Real, PlanSize> fractions;
};

template <typename Real>
RowBlock<Real> rowBlock(const Plan<Real> &plan, PlanarInput input, int vectors,
                        std::span<float> result)
{
    RowBlock<Real> block;
    block.input = input;
    block.offsets = std::span(plan.offsets).first(result.size() / 2);
    block.rows = std::span(plan.rows).first(result.size() / 2);
    block.vectors = vectors;
    block.result = result;
    return block;
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
        , m_inputPeriod(inputPeriod)
        , m_outputPeriod(outputPeriod)
        , m_rows(geometry.maxTaps(),
                 static_cast<std::size_t>(outputPeriod) + OnSampleRows<Real>::Count)
        , m_first(static_cast<std::size_t>(outputPeriod))
    {
        for (int phase = 1; phase < outputPeriod; ++phase) {
            const TapRange taps = geometry.taps(phase);
            m_first[static_cast<std::size_t>(phase)] = taps.first;
            fillRow(table, taps.position, taps.count, geometry.scale(),
                    m_rows.row(static_cast<std::size_t>(phase)));
        }
        OnSampleRows<Real>::fill(m_rows, onSample(), 1, table, geometry);
    }

    void compute(qint64 firstOutput, PlanarInput input, qint64 inputStart,
                 std::span<float> result) const override
    {
        Plan<Real> plan;
        qint64 phase = firstOutput % m_outputPeriod;
        qint64 periodStart = firstOutput / m_outputPeriod * m_inputPeriod;
        for (std::size_t done = 0; done < result.size() / 2;) {
            const std::size_t count = std::min(PlanSize, result.size() / 2 - done);
            for (std::size_t i = 0; i < count; ++i) {
                if (phase == 0) {
                    planOnSample(plan, i, firstOutput + static_cast<qint64>(done + i), inputStart);
                } else {
                    const auto row = static_cast<std::size_t>(phase);
                    plan.rows[i] = m_rows.row(row);
                    plan.offsets[i] =
                        static_cast<std::int32_t>(m_first[row] + periodStart - inputStart);
                }
                if (++phase == m_outputPeriod) {
                    phase = 0;
                    periodStart += m_inputPeriod;
                }
            }
            dotRows(rowBlock(plan, input, m_rows.vectors(), result.subspan(2 * done, 2 * count)));
            done += count;
        }
    }

private:
    [[nodiscard]] std::size_t onSample() const { return static_cast<std::size_t>(m_outputPeriod); }

    void planOnSample(Plan<Real> &plan, std::size_t i, qint64 output, qint64 inputStart) const
    {
        const TapRange taps = m_geometry.taps(output);
        plan.rows[i] = m_rows.row(onSample() + OnSampleRows<Real>::variantOf(taps, m_geometry));
        plan.offsets[i] = static_cast<std::int32_t>(taps.first - inputStart);
    }

    TapGeometry m_geometry;
    qint64 m_inputPeriod;
    qint64 m_outputPeriod;
    RowStore<Real> m_rows;       // row 0 is not used
    std::vector<qint64> m_first; // first tap of each phase in the first period
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
        , m_rows(geometry.maxTaps(), 2 * (m_rowCount + 2 * OnSampleRows<Real>::Count))
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
        // A row without slopes before and behind serves any fraction.
        OnSampleRows<Real>::fill(m_rows, 2 * (m_rowCount + 1), 4, table, geometry);
    }

    void compute(qint64 firstOutput, PlanarInput input, qint64 inputStart,
                 std::span<float> result) const override
    {
        Plan<Real> plan;
        for (std::size_t done = 0; done < result.size() / 2;) {
            const std::size_t count = std::min(PlanSize, result.size() / 2 - done);
            for (std::size_t i = 0; i < count; ++i) {
                const qint64 output = firstOutput + static_cast<qint64>(done + i);
                planOutput(plan, i, m_geometry.taps(output), inputStart);
            }
            const RowBlock<Real> block =
                rowBlock(plan, input, m_rows.vectors(), result.subspan(2 * done, 2 * count));
            dotSlopedRows(
                SlopedBlock<Real>{block, std::span(plan.fractions).first(count), m_shifts.row(0)});
            done += count;
        }
    }

private:
    void planOutput(Plan<Real> &plan, std::size_t i, const TapRange &taps, qint64 inputStart) const
    {
        const auto whole = static_cast<int>(taps.position);
        plan.offsets[i] = static_cast<std::int32_t>(taps.first - inputStart);
        plan.fractions[i] = static_cast<Real>(taps.position - whole);
        if (taps.count < m_geometry.maxTaps()) {
            plan.rows[i] = m_rows.row(2 * static_cast<std::size_t>(whole - m_lowest));
        } else {
            const std::size_t variant = OnSampleRows<Real>::variantOf(taps, m_geometry);
            plan.rows[i] = m_rows.row(2 * (m_rowCount + 1) + 4 * variant);
        }
    }

    TapGeometry m_geometry;
    int m_lowest; ///< table point of the first row
    std::size_t m_rowCount;
    RowStore<Real> m_rows; ///< values and slopes take turns
    RowStore<Real> m_shifts;
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
    if (static_cast<std::size_t>(phases) * rowBytes <= MaxBankBytes) {
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
