// SPDX-License-Identifier: Apache-2.0
#include "fir.h"

#include "windows.h"

#include <algorithm>
#include <cmath>
#include <cstddef>
#include <numbers>

std::vector<double> sincFir(int n, double cutoff)
{
    std::vector<double> coefficients = windowList(n, 1);
    const int half = (n - 1) / 2;
    const double step = n > 1 ? 2.0 * half / (n - 1) : 1.0;
    for (std::size_t i = 0; i < coefficients.size(); ++i) {
        const double position = static_cast<double>(i) * step - half;
        const double x = position * 2.0 * std::numbers::pi * cutoff;
        coefficients[i] *= x == 0.0 ? 1.0 : std::sin(x) / x;
    }
    return coefficients;
}

void interpolateQuadratic(std::span<const double> in, double inStep, std::span<double> out,
                          double outStep)
{
    if (in.empty()) {
        return;
    }
    const std::size_t count = in.size();
    for (std::size_t k = 0; k < out.size(); ++k) {
        const double position = static_cast<double>(k) * outStep;
        // The bounds also catch a position that is no number.
        const double nearest = std::round(position / inStep);
        const double last = static_cast<double>(count - 1);
        const auto m = static_cast<std::size_t>(nearest > 0 ? std::min(nearest, last) : 0.0);
        const double f = (position - static_cast<double>(m) * inStep) / inStep;
        if (count < 3 || m == count - 1) {
            out[k] = in[m];
            continue;
        }
        const double line = (in[m + 1] - in[m]) * f + in[m];
        if (m == 0) {
            out[k] = line + 0.5 * f * (f - 1) * (in[2] - 2 * in[1] + in[0]);
        } else if (m == count - 2) {
            out[k] = line + 0.5 * f * (f - 1) * (in[m + 1] - 2 * in[m] + in[m - 1]);
        } else {
            out[k] = line + 0.25 * f * (f - 1) * (in[m + 2] - in[m + 1] - in[m] + in[m - 1]);
        }
    }
}
