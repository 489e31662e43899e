// SPDX-License-Identifier: Apache-2.0
#include "levels.h"

#include "base/simd.h"

#include <algorithm>
#include <array>
#include <cstddef>

namespace {

constexpr std::size_t PowerBlock = 256;

CORVANE_CLONES void powersOf(const float *values, double *powers, std::size_t count)
{
    for (std::size_t i = 0; i < count; ++i) {
        const double inPhase = values[2 * i];
        const double quadrature = values[2 * i + 1];
        powers[i] = inPhase * inPhase + quadrature * quadrature;
    }
}

CORVANE_CLONES double largestOf(const double *powers, std::size_t count, double peak)
{
    // Eight independent maxima let the compiler vectorise; the order doesn't matter to a maximum.
    std::array<double, 8> lanes{};
    lanes.fill(peak);
    std::size_t i = 0;
    for (; i + lanes.size() <= count; i += lanes.size()) {
        for (std::size_t lane = 0; lane < lanes.size(); ++lane) {
            lanes[lane] = powers[i + lane] > lanes[lane] ? powers[i + lane] : lanes[lane];
        }
    }
    for (; i < count; ++i) {
        lanes[0] = powers[i] > lanes[0] ? powers[i] : lanes[0];
    }
    return *std::max_element(lanes.begin(), lanes.end());
}

} // namespace

void addLevels(std::span<const float> values, LevelSums &sums)
{
    std::array<double, PowerBlock> powers;
    const std::size_t samples = values.size() / 2;
    for (std::size_t done = 0; done < samples; done += PowerBlock) {
        const std::size_t count = std::min(PowerBlock, samples - done);
        powersOf(values.data() + 2 * done, powers.data(), count);
        for (std::size_t i = 0; i < count; ++i) {
            sums.sum += powers[i];
        }
        sums.peak = largestOf(powers.data(), count, sums.peak);
    }
}
