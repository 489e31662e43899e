// SPDX-License-Identifier: Apache-2.0
#include "SignalFigures.h"

#include "AveragedSpectrum.h"

#include <algorithm>
#include <cmath>

namespace {

constexpr int SpectrumLength = 16384;
constexpr int HannWindow = 2;
constexpr std::size_t BlockSamples = 1 << 16;

/// Calls `take` with block after block of the samples, without the markers.
template <typename Take>
bool forEachBlock(SampleSource &source, const Take &take)
{
    if (!source.restart()) {
        return false;
    }
    std::vector<IqSample> block;
    for (qint64 done = 0; done < source.count();) {
        block.resize(std::min(BlockSamples, static_cast<std::size_t>(source.count() - done)));
        if (!source.next(block, {})) {
            return false;
        }
        take(std::span<const IqSample>(block));
        done += std::ssize(block);
    }
    return true;
}

/// The sums of a spectrum's power from its lower edge on, as a line between the edges of its
/// points. The point of the lowest frequency lies half at either end.
class PowerLine
{
public:
    explicit PowerLine(std::span<const double> power)
        : m_sums(power.size() + 2, 0.0)
    {
        for (std::size_t k = 0; k < power.size(); ++k) {
            m_sums[k + 1] = m_sums[k] + (k == 0 ? power[k] / 2 : power[k]);
        }
        m_sums.back() = m_sums[power.size()] + power[0] / 2;
    }

    [[nodiscard]] double total() const { return m_sums.back(); }

    /// The sum below a place from 0 (lower edge) to 1 (upper edge).
    [[nodiscard]] double below(double place) const
    {
        const auto points = static_cast<double>(m_sums.size() - 2);
        // Edge k + 1 lies at (k + 1/2) / points, the first and the last one at the ends.
        const double edge = std::clamp(place * points + 0.5, 0.5, points + 0.5);
        const auto index = std::min(static_cast<std::size_t>(edge), m_sums.size() - 2);
        const double from = std::max(static_cast<double>(index), 0.5);
        const double to = std::min(static_cast<double>(index) + 1, points + 0.5);
        return std::lerp(m_sums[index], m_sums[index + 1], (edge - from) / (to - from));
    }

    /// The place below which so much lies.
    [[nodiscard]] double placeOf(double sum) const
    {
        const auto points = static_cast<double>(m_sums.size() - 2);
        const auto above = std::lower_bound(m_sums.begin() + 1, m_sums.end() - 1, sum);
        const auto index = static_cast<double>(above - m_sums.begin()) - 1;
        const double from = std::max(index, 0.5);
        const double to = std::min(index + 1, points + 0.5);
        const double low = *(above - 1);
        const double share = *above > low ? (sum - low) / (*above - low) : 0.5;
        return (std::lerp(from, to, share) - 0.5) / points;
    }

private:
    std::vector<double> m_sums; ///< at the edges of the points
};

/// Counts the samples that exceed each step over the mean.
class CcdfCounter
{
public:
    CcdfCounter(double meanPower, double peakPower)
    {
        constexpr int FineSteps = 200; // tenths of a dB
        for (int k = 0;; ++k) {
            const double db = k <= FineSteps ? k / 10.0 : k - FineSteps + FineSteps / 10.0;
            m_points.push_back({db, 0});
            m_limits.push_back(meanPower * std::pow(10.0, db / 10));
            if (m_limits.back() >= peakPower) {
                break;
            }
        }
        m_counts.assign(m_limits.size() + 1, 0);
    }

    void append(std::span<const IqSample> samples)
    {
        for (const IqSample &sample : samples) {
            const double power = sample.i * sample.i + sample.q * sample.q;
            if (power > m_limits.front()) {
                const auto passed = std::lower_bound(m_limits.begin(), m_limits.end(), power);
                ++m_counts[static_cast<std::size_t>(passed - m_limits.begin())];
            }
        }
    }

    [[nodiscard]] std::vector<CcdfPoint> points(qint64 samples)
    {
        qint64 above = 0;
        for (std::size_t k = m_points.size(); k-- > 0;) {
            above += m_counts[k + 1];
            m_points[k].probability = static_cast<double>(above) / static_cast<double>(samples);
        }
        return m_points;
    }

private:
    std::vector<CcdfPoint> m_points;
    std::vector<double> m_limits; ///< powers
    std::vector<qint64> m_counts; ///< [k]: powers that pass k limits
};

} // namespace

double SignalFigures::crestDb() const
{
    return rms > 0 ? 20 * std::log10(peak / rms) : 0;
}

std::optional<SignalFigures> measureFigures(SampleSource &source, double clockHz,
                                            const std::optional<FrequencyBand> &band)
{
    SignalFigures figures;
    figures.samples = source.count();
    AveragedSpectrum spectrum(source.count(), SpectrumLength, HannWindow);
    double power = 0;
    double peakPower = 0;
    const auto sum = [&](std::span<const IqSample> samples) {
        for (const IqSample &sample : samples) {
            const double square = sample.i * sample.i + sample.q * sample.q;
            power += square;
            peakPower = std::max(peakPower, square);
            figures.dcI += sample.i;
            figures.dcQ += sample.q;
            figures.clipped +=
                (std::fabs(sample.i) >= 1 ? 1 : 0) + (std::fabs(sample.q) >= 1 ? 1 : 0);
        }
        spectrum.append(samples);
    };
    if (!forEachBlock(source, sum)) {
        return std::nullopt;
    }
    const auto count = static_cast<double>(std::max<qint64>(figures.samples, 1));
    figures.dcI /= count;
    figures.dcQ /= count;
    figures.peak = std::sqrt(peakPower);
    figures.rms = std::sqrt(power / count);
    if (!(power > 0)) {
        return figures;
    }
    const std::vector<double> mean = spectrum.mean();
    if (clockHz > 0) {
        if (const auto occupied = occupiedBand(mean, clockHz)) {
            figures.occupiedHz = occupied->highHz - occupied->lowHz;
            figures.occupiedCentreHz = (occupied->highHz + occupied->lowHz) / 2;
        }
        if (band) {
            figures.bandDb = 10 * std::log10(powerShare(mean, clockHz, *band));
        }
    }
    CcdfCounter counter(power / count, peakPower);
    if (!forEachBlock(source, [&](auto samples) { counter.append(samples); })) {
        return std::nullopt;
    }
    figures.ccdf = counter.points(figures.samples);
    return figures;
}

double gaussianCcdf(double overMeanDb)
{
    return std::exp(-std::pow(10.0, overMeanDb / 10));
}

double powerShare(std::span<const double> power, double clockHz, const FrequencyBand &band)
{
    if (power.empty() || !(clockHz > 0)) {
        return 0;
    }
    const PowerLine line(power);
    const double within =
        line.below(band.highHz / clockHz + 0.5) - line.below(band.lowHz / clockHz + 0.5);
    return line.total() > 0 ? std::clamp(within / line.total(), 0.0, 1.0) : 0;
}

std::optional<FrequencyBand> occupiedBand(std::span<const double> power, double clockHz,
                                          double outside)
{
    if (power.empty()) {
        return std::nullopt;
    }
    const PowerLine line(power);
    if (!(line.total() > 0)) {
        return std::nullopt;
    }
    return FrequencyBand{(line.placeOf(line.total() * outside / 2) - 0.5) * clockHz,
                         (line.placeOf(line.total() * (1 - outside / 2)) - 0.5) * clockHz};
}
