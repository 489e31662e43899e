// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <QtGlobal>

#include <cmath>
#include <span>

/// Power sums over samples, gathered in the order of the samples.
struct LevelSums
{
    double sum = 0;  ///< sum of I² + Q²
    double peak = 0; ///< largest I² + Q²

    [[nodiscard]] double rmsLevel(qint64 samples) const
    {
        return std::sqrt(sum / static_cast<double>(samples));
    }
    [[nodiscard]] double peakLevel() const { return std::sqrt(peak); }
};

/// Adds I² + Q² of each sample, in double precision; `values` holds I and Q in turn. The sums don't
/// depend on how the samples are cut into blocks.
void addLevels(std::span<const float> values, LevelSums &sums);

/// Offset in dB below full scale of a linear level. `floor` is added to the level to keep silence
/// finite; without one silence gives infinity.
[[nodiscard]] inline double levelOffset(double level, double floor = 0)
{
    return 20 * std::log10(1 / (level + floor));
}

/// Offset of a level that was measured on the samples of a file; silence lies at 140 dB.
[[nodiscard]] inline double measuredOffset(double level)
{
    return levelOffset(level, 1e-7);
}

/// The linear level that lies `offset` dB below full scale.
[[nodiscard]] inline double levelOfOffset(double offset)
{
    return 1 / std::pow(10.0, offset / 20);
}
