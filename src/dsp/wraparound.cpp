// SPDX-License-Identifier: Apache-2.0
#include "wraparound.h"

#include "fir.h"
#include "windows.h"

#include <cstddef>
#include <numeric>

namespace {

constexpr int TapCount = 63;

/// The windows of the cross-fade: of the signal 0.5 + 0.5 cos, of the filtered signal 1 - cos.
constexpr int FadeOutWindow = 8;
constexpr int FadeInWindow = 7;

} // namespace

Joint smoothedJoint(std::span<const std::complex<double>> joint, double cutoff, int range)
{
    const std::vector<double> taps = sincFir(TapCount, cutoff);
    const auto width = 2 * static_cast<std::size_t>(range);
    const auto first = static_cast<std::size_t>(JointHalf - range);
    Joint faded(width);
    for (std::size_t i = 0; i < width; ++i) {
        const auto window = joint.subspan(first + i - TapCount / 2, TapCount);
        std::complex<double> sum = 0;
        for (std::size_t j = 0; j < TapCount; ++j) {
            sum += taps[j] * window[j];
        }
        faded[i] = sum / static_cast<double>(TapCount);
    }
    Joint result(joint.begin(), joint.end());
    const std::span<std::complex<double>> edge = std::span(result).subspan(first, width);
    if (!applyWindow(edge, FadeOutWindow) || !applyWindow(faded, FadeInWindow)) {
        return result;
    }
    for (std::size_t i = 0; i < width; ++i) {
        edge[i] += faded[i];
    }
    return result;
}

double jointGain(double cutoff)
{
    const std::vector<double> taps = sincFir(TapCount, cutoff);
    constexpr double FadeInTop = 2;
    return FadeInTop * std::accumulate(taps.begin(), taps.end(), 0.0) / TapCount;
}
