// SPDX-License-Identifier: Apache-2.0
#include "filtertable.h"

#include "windows.h"

#include <algorithm>
#include <cmath>
#include <cstddef>
#include <numbers>

namespace {

// The short constants are part of the established sample values.
constexpr double Circle = 6.2831853;
constexpr double HalfCircle = 3.14159265;
constexpr double LastPoint = FilterTablePoints - 1;

/// Keeps sin(A) / A and its kin away from zero in the centre.
constexpr double CentreOffset = 1e-12;

double impulseResponse(const FilterSettings &settings, double x)
{
    const double ratio = settings.cutoff / settings.rate;
    const double a = settings.parameter;
    const double angle = x * Circle * ratio + CentreOffset;
    switch (settings.filter) {
    case FilterKind::Rectangular:
        return std::sin(angle) / angle;
    case FilterKind::RootCosine: {
        const double b = 4 * a * angle / HalfCircle;
        const double c = 4 * a / (std::sqrt(1 / (2 * ratio)) * HalfCircle);
        return c * (std::cos((1 + a) * angle) + std::sin((1 - a) * angle) / b) / (1 - b * b);
    }
    case FilterKind::Cosine: {
        const double b = angle * a / HalfCircle;
        return (std::sin(angle) / angle) * std::cos(angle * a / 2) / (1 - b * b);
    }
    case FilterKind::Gauss:
        return std::sqrt(Circle) * a / std::sqrt(std::numbers::ln2) * a *
               std::exp((-2 / std::numbers::ln2) * x * x * a * a * HalfCircle * HalfCircle);
    case FilterKind::Custom:
        break;
    }
    return 0;
}

double windowValue(const std::array<double, 5> &coefficients, int k)
{
    double sum = 0;
    int order = 0;
    for (const double coefficient : coefficients) {
        if (std::abs(coefficient) > 1e-12) {
            sum += coefficient * std::cos(2 * order * HalfCircle * k / LastPoint);
            ++order;
        }
    }
    return sum;
}

} // namespace

bool buildFilterTable(const FilterSettings &settings, FilterTable &table)
{
    if (settings.filter == FilterKind::Custom || settings.length < MinFilterLength ||
        settings.length > MaxFilterLength) {
        return false;
    }
    const int half = halfLength(settings.length);
    const std::array<double, 5> &coefficients = windowCoefficients(settings.window);
    table.value.resize(FilterTablePoints);
    table.slope.resize(FilterTablePoints);
    for (int k = 0; k < FilterTablePoints; ++k) {
        const double x = k * (2 * half / LastPoint) - half;
        table.value[static_cast<std::size_t>(k)] =
            impulseResponse(settings, x) * windowValue(coefficients, k);
    }
    for (std::size_t k = 0; k + 1 < table.value.size(); ++k) {
        table.slope[k] = table.value[k + 1] - table.value[k];
    }
    table.slope.back() = table.slope[table.slope.size() - 2];
    return std::all_of(table.value.begin(), table.value.end(),
                       [](double value) { return std::isfinite(value); });
}
