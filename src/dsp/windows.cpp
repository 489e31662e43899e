// SPDX-License-Identifier: Apache-2.0
#include "windows.h"

#include <algorithm>
#include <cmath>
#include <cstddef>
#include <numbers>

namespace {

constexpr std::array<std::array<double, 5>, WindowKindCount> Coefficients{{
    {1.0, 0, 0, 0, 0},
    {0.375, -0.5, 0.125, 0, 0},
    {0.5, -0.5, 0, 0, 0},
    {0.53836, -0.46164, 0, 0, 0},
    {0.42, -0.5, 0.08, 0, 0},
    {0.35875, -0.48829, 0.14128, -0.01168, 0},
    {0.215508, -0.41593, 0.278, -0.083617, 0.0069394},
    {1.0, -1.0, 0, 0, 0},
    {0.5, 0.5, 0, 0, 0},
}};

constexpr std::array<const char *, NamedWindowCount> Names{
    "None", "Rife Vincent", "Hann", "Hanning", "Blackmann", "Bl. Harris", "Flat Top"};

/// The window of the last call on this thread: displays apply one window to thousands of
/// transforms, and its cosines cost far more than the transform.
struct KeptWindow
{
    int kind = -1;
    std::vector<double> values;
};

} // namespace

const std::array<double, 5> &windowCoefficients(int kind)
{
    return Coefficients[kind >= 0 && kind < WindowKindCount ? static_cast<std::size_t>(kind) : 0];
}

const char *windowName(int kind)
{
    return kind >= 0 && kind < NamedWindowCount ? Names[static_cast<std::size_t>(kind)] : "";
}

bool fillWindow(std::span<double> window, int kind)
{
    const std::array<double, 5> &a = windowCoefficients(kind);
    const auto n = static_cast<double>(window.size());
    for (std::size_t i = 0; i < window.size(); ++i) {
        double sum = 0;
        for (std::size_t j = 0; j < a.size(); ++j) {
            const double position = static_cast<double>(j) * static_cast<double>(i);
            sum += a[j] * std::cos(2.0 * std::numbers::pi * position / n);
        }
        window[i] = sum;
    }
    return true;
}

bool applyWindow(std::span<std::complex<double>> samples, int kind)
{
    if (samples.empty()) {
        return false;
    }
    thread_local KeptWindow kept;
    if (kept.kind != kind || kept.values.size() != samples.size()) {
        kept.values.resize(samples.size());
        fillWindow(kept.values, kind);
        kept.kind = kind;
    }
    const double *window = kept.values.data();
    for (std::size_t i = 0; i < samples.size(); ++i) {
        samples[i] *= window[i];
    }
    return true;
}

std::vector<double> windowList(int n, int kind)
{
    std::vector<double> window(static_cast<std::size_t>(std::max(n, 0)));
    fillWindow(window, kind);
    return window;
}
