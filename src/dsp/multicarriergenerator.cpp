// SPDX-License-Identifier: Apache-2.0
#include "signalgenerators.h"

#include "base/parallel.h"
#include "base/simd.h"
#include "vectormath.h"

#include <algorithm>
#include <array>
#include <cmath>
#include <cstddef>
#include <cstdlib>

namespace {

using SignalConstants::Circle;

/// Carriers this far apart share their phase.
constexpr int PhaseCount = 64;

/// Samples of one part of the work; all of its arrays lie on the stack.
constexpr std::size_t PartSize = 256;

using PartArray = std::array<double, PartSize>;

struct CarrierSum
{
    int carriers = 0; ///< on one side of zero
    double turn = 0;  ///< radians per sample, times the clock
    double clock = 0;
    double offset = 0;
    std::array<double, PhaseCount> phases{};
    std::array<double, PhaseCount> phaseSines{};
    std::array<double, PhaseCount> phaseCosines{};

    [[nodiscard]] double angleOf(int index) const { return turn * index / clock; }

    /// One sample as defined, carrier by carrier.
    [[nodiscard]] double directSample(double x) const
    {
        PartArray angles;
        PartArray values;
        double sum = 0;
        for (int first = 1; first <= carriers; first += static_cast<int>(PartSize)) {
            const auto count = static_cast<std::size_t>(
                std::min(carriers - first + 1, static_cast<int>(PartSize)));
            for (std::size_t i = 0; i < count; ++i) {
                const int k = first + static_cast<int>(i);
                angles[i] = k * x + phases[static_cast<std::size_t>(k % PhaseCount)];
            }
            sines(std::span(angles).first(count), values);
            for (std::size_t i = 0; i < count; ++i) {
                sum += values[i] + offset;
            }
        }
        return sum / carriers;
    }
};

/// 32 x less whole half circles. The parts of the half circle have 26 bits each, so that their
/// products with a count below 2^26 are exact.
CORVANE_CLONES void reduceAngles(const PartArray &angles, PartArray &reduced)
{
    constexpr double HalfCircle1 = 0x1.921fb5p+1;
    constexpr double HalfCircle2 = 0x1.110b46p-25;
    constexpr double HalfCircle3 = 0x1.1a62633145c07p-53;
    constexpr double RoundingOffset = 0x1.8p52;
    for (std::size_t i = 0; i < PartSize; ++i) {
        const double y = 32 * angles[i];
        const double count = (y * 0.3183098861837907 + RoundingOffset) - RoundingOffset;
        reduced[i] = ((y - count * HalfCircle1) - count * HalfCircle2) - count * HalfCircle3;
    }
}

struct ComplexPart
{
    PartArray re;
    PartArray im;
};

/// The sum over r = 1 to `count` of exp(j (phase[r] + r x)) by Horner's rule, z being exp(j x).
CORVANE_CLONES void sumPhases(const CarrierSum &sum, int count, const ComplexPart &z,
                              ComplexPart &result)
{
    result.re.fill(0.0);
    result.im.fill(0.0);
    for (int r = count; r >= 1; --r) {
        const double re = sum.phaseCosines[static_cast<std::size_t>(r % PhaseCount)];
        const double im = sum.phaseSines[static_cast<std::size_t>(r % PhaseCount)];
        for (std::size_t i = 0; i < PartSize; ++i) {
            const double x = result.re[i] + re;
            const double y = result.im[i] + im;
            result.re[i] = x * z.re[i] - y * z.im[i];
            result.im[i] = x * z.im[i] + y * z.re[i];
        }
    }
}

/// The carriers are taken in rows of 64 with the same phases: with P the sum of one row, Q that of
/// the rest and B the number of whole rows, the sum is the imaginary part of G P + exp(j 64 B x) Q,
/// where G is the geometric sum over exp(j 64 m x), m = 0 to B - 1. With r being 32 x less whole
/// half circles, G is exp(j (B - 1) r) sin(B r) / sin(r), which is exact to the last digits also
/// where both sines vanish.
CORVANE_CLONES void combineRows(double rows, const ComplexPart &one, const ComplexPart &all,
                                const ComplexPart &row, const ComplexPart &rest, PartArray &result)
{
    for (std::size_t i = 0; i < PartSize; ++i) {
        const double ratio = one.im[i] == 0 ? rows : all.im[i] / one.im[i];
        // exp(j (B - 1) r) = exp(j B r) exp(-j r)
        const double turnRe = all.re[i] * one.re[i] + all.im[i] * one.im[i];
        const double turnIm = all.im[i] * one.re[i] - all.re[i] * one.im[i];
        const double geometric = (turnRe * row.im[i] + turnIm * row.re[i]) * ratio;
        const double endRe = all.re[i] * all.re[i] - all.im[i] * all.im[i];
        const double endIm = 2 * all.re[i] * all.im[i];
        result[i] = geometric + (endRe * rest.im[i] + endIm * rest.re[i]);
    }
}

class MultiCarrierGenerator final : public SignalGenerator
{
public:
    MultiCarrierGenerator(const MultiCarrierSettings &settings, const SignalFit &fit)
    {
        m_sum.carriers = settings.carriers / 2;
        m_sum.turn = settings.spacing * Circle;
        m_sum.clock = fit.clock;
        m_sum.offset = settings.offsetI;
        if (settings.randomPhase) {
            for (int k = 1; k <= m_sum.carriers; ++k) {
                // rand() is what the noise of this system is drawn from, with its seed.
                m_sum.phases[static_cast<std::size_t>(k % PhaseCount)] =
                    ((std::rand() % 365) / 365.0) * Circle; // NOLINT(*-msc50-cpp)
            }
        }
        sinCos(m_sum.phases, m_sum.phaseSines, m_sum.phaseCosines);
    }

    /// Enough work for all processors.
    [[nodiscard]] int blockSize() const override { return 32768; }

    void fill(int first, std::span<double> inPhase, std::span<double> quadrature) override
    {
        std::fill(quadrature.begin(), quadrature.end(), 0.0);
        parallelFor((inPhase.size() + PartSize - 1) / PartSize, [&](std::size_t part) {
            const std::size_t from = part * PartSize;
            fillPart(first + static_cast<int>(from),
                     inPhase.subspan(from, std::min(PartSize, inPhase.size() - from)));
        });
    }

private:
    void fillPart(int first, std::span<double> values) const
    {
        PartArray angles;
        for (std::size_t i = 0; i < PartSize; ++i) {
            angles[i] = m_sum.angleOf(first + static_cast<int>(i));
        }
        const int rows = m_sum.carriers / PhaseCount;
        const int restCount = m_sum.carriers % PhaseCount;
        ComplexPart z;
        ComplexPart rest;
        sinCos(angles, z.im, z.re);
        sumPhases(m_sum, restCount, z, rest);
        PartArray result = rest.im;
        if (rows > 0) {
            PartArray reduced;
            ComplexPart one;
            ComplexPart all;
            ComplexPart row;
            reduceAngles(angles, reduced);
            sinCos(reduced, one.im, one.re);
            for (double &angle : reduced) {
                angle *= rows;
            }
            sinCos(reduced, all.im, all.re);
            sumPhases(m_sum, PhaseCount, z, row);
            combineRows(rows, one, all, row, rest, result);
        }
        for (std::size_t i = 0; i < values.size(); ++i) {
            values[i] = settled(result[i], angles[i]);
        }
    }

    /// The carrier-by-carrier sum has roundings of its own, most of all those of its angles. Where
    /// they could change the stored float, the sample is computed that way; with very many carriers
    /// that would take hours.
    [[nodiscard]] double settled(double sum, double angle) const
    {
        constexpr int MaxDirectCarriers = 16384;
        const double value = (sum + m_sum.carriers * m_sum.offset) / m_sum.carriers;
        if (m_sum.carriers > MaxDirectCarriers) {
            return value;
        }
        // The roundings of n angles up to n x are independent of each other: their mean has a
        // standard deviation of a third of sqrt(n) x units of rounding. Six of them are taken.
        constexpr double Unit = 0x1p-53;
        const double spread = 2 * std::sqrt(m_sum.carriers) * angle * Unit;
        const double margin = spread + 32 * Unit * (1 + std::abs(m_sum.offset));
        if (static_cast<float>(value - margin) == static_cast<float>(value + margin)) {
            return value;
        }
        return m_sum.directSample(angle);
    }

    CarrierSum m_sum;
};

} // namespace

std::unique_ptr<SignalGenerator> makeMultiCarrier(const MultiCarrierSettings &settings,
                                                  const SignalFit &fit)
{
    return std::make_unique<MultiCarrierGenerator>(settings, fit);
}
