// SPDX-License-Identifier: Apache-2.0
#pragma once

#include "dsp/filtertable.h"

#include <cmath>
#include <complex>
#include <cstdint>
#include <optional>
#include <vector>

/// The conversion written sample by sample in double precision, as the judge of the quick forms.
/// Nothing if the filter's reach doesn't cover the step from output to output.
inline std::optional<std::vector<std::complex<double>>>
literalResample(const FilterSettings &settings, const std::vector<std::complex<float>> &input,
                int outputCount)
{
    FilterTable table;
    if (!buildFilterTable(settings, table)) {
        return {};
    }
    const auto n = static_cast<std::int64_t>(input.size());
    const int half = (settings.length - 1) / 2;
    const double scale = 1 / ((2 * half) / 19999.0);
    const double ratio = static_cast<double>(outputCount) / static_cast<double>(n);
    const auto at = [&](std::int64_t k) -> std::complex<double> {
        if (k < 0) {
            return k > -201 && k >= -n ? std::complex<double>(input[static_cast<size_t>(n + k)])
                                       : 0;
        }
        if (k >= n) {
            return k < n + 201 && k < 2 * n
                       ? std::complex<double>(input[static_cast<size_t>(k - n)])
                       : 0;
        }
        return std::complex<double>(input[static_cast<size_t>(k)]);
    };
    std::int64_t next = 0;
    std::vector<std::complex<double>> output(static_cast<size_t>(outputCount));
    for (int i = 0; i < outputCount; ++i) {
        const double t = i / ratio;
        const auto low = static_cast<std::int64_t>(std::ceil(t - half));
        const auto high = static_cast<std::int64_t>(std::floor(half + t));
        double position = (t - std::ceil(t) + (settings.length - 1)) * scale;
        double sumI = 0;
        double sumQ = 0;
        for (std::int64_t k = low; k < high; ++k) {
            if (k >= 0 && k < n) {
                if (k > next) {
                    return {};
                }
                next = std::max(next, k + 1);
            }
            const auto index = static_cast<std::int64_t>(position);
            if (index >= 0 && index <= 19999) {
                const auto point = static_cast<size_t>(index);
                const double h = table.value[point] +
                                 table.slope[point] * (position - static_cast<double>(index));
                sumI += h * at(k).real();
                sumQ += h * at(k).imag();
            }
            position -= scale;
        }
        output[static_cast<size_t>(i)] = {sumI, sumQ};
    }
    return output;
}
