// SPDX-License-Identifier: Apache-2.0
#include "polar.h"

#include <cmath>
#include <cstddef>
#include <numbers>

namespace {

double phaseOf(double re, double im)
{
    if (re == 0) {
        return im > 0 ? 2 * std::numbers::pi : -2 * std::numbers::pi;
    }
    if (im == 0) {
        return re < 0 ? std::numbers::pi : 0.0;
    }
    return std::atan2(im, re);
}

} // namespace

void cartesianToPolar(std::span<const double> re, std::span<const double> im,
                      std::span<double> magnitude, std::span<double> phase)
{
    for (std::size_t i = 0; i < re.size(); ++i) {
        const double x = re[i];
        const double y = im[i];
        magnitude[i] = std::sqrt(x * x + y * y);
        phase[i] = phaseOf(x, y);
    }
}

void polarToCartesian(std::span<const double> magnitude, std::span<const double> phase,
                      std::span<double> re, std::span<double> im)
{
    for (std::size_t i = 0; i < magnitude.size(); ++i) {
        const double length = magnitude[i];
        const double angle = phase[i];
        re[i] = length * std::cos(angle);
        im[i] = length * std::sin(angle);
    }
}
