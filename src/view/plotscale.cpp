// SPDX-License-Identifier: Apache-2.0
#include "plotscale.h"

#include <algorithm>
#include <cmath>
#include <cstddef>
#include <numbers>

namespace {

constexpr double SilentLevelDbm = -60.0;

struct PowerPrefix
{
    double limit;
    double factor;
    const char *format;
};

constexpr PowerPrefix PowerPrefixes[] = {
    {1e9, 1e-9, "%7.3f GW"}, {1e6, 1e-6, "%7.3f MW"},   {1e3, 1e-3, "%7.3f kW"},
    {1, 1, "%7.3f W "},      {1e-3, 1e3, "%7.3f mW"},   {1e-6, 1e6, "%7.3f uW"},
    {1e-9, 1e9, "%7.3f nW"}, {1e-12, 1e12, "%7.3f pW"},
};

} // namespace

double niceStep(double value)
{
    if (value == 0 || !std::isfinite(value)) {
        return 0;
    }
    if (value < 0) {
        return -niceStep(-value);
    }
    double exponent = std::floor(std::log10(value));
    double mantissa = value / std::pow(10.0, exponent);
    // The logarithm may miss a power of ten by one unit in the last place.
    if (mantissa >= 10) {
        mantissa /= 10;
        exponent += 1;
    } else if (mantissa < 1) {
        mantissa *= 10;
        exponent -= 1;
    }
    constexpr double Tolerance = 1e-12; // 2 arrives as 2.0000000000000004 from a division
    for (const double step : {1.0, 2.0, 5.0}) {
        if (mantissa <= step * (1 + Tolerance)) {
            return step * std::pow(10.0, exponent);
        }
    }
    return std::pow(10.0, exponent + 1);
}

QString powerText(double value, bool relative, bool linearPower)
{
    if (!linearPower) {
        return QString::asprintf(relative ? "%6.2f dB " : "%6.2f dBm", value);
    }
    const double size = std::fabs(value);
    for (const PowerPrefix &prefix : PowerPrefixes) {
        if (size >= prefix.limit) {
            // Dividing by 1e9 and multiplying by 1e-9 round differently; the text is the quotient.
            const double shown = prefix.limit > 1 ? value / prefix.limit : value * prefix.factor;
            return QString::asprintf(prefix.format, shown);
        }
    }
    return {};
}

double powerToDbm(double watts)
{
    return watts == 0 ? SilentLevelDbm : 10 * std::log10(std::fabs(watts)) + 30;
}

void powerToDbm(std::span<double> in, std::span<double> out)
{
    const auto firstValue = std::find_if(in.begin(), in.end(), [](double v) { return v != 0; });
    double fill = firstValue != in.end() ? *firstValue : SilentLevelDbm;
    for (std::size_t i = 0; i < in.size(); ++i) {
        if (in[i] == 0) {
            in[i] = fill;
        }
        fill = in[i];
        out[i] = 10 * std::log10(std::fabs(in[i])) + 30;
    }
}

double magnitudeToDb(double magnitude)
{
    // The natural logarithm is several times as fast as the decimal one, and a spectrum takes 512
    // of them a line; the results agree to the last digits.
    constexpr double NepersToDb = 20 / std::numbers::ln10;
    return NepersToDb * std::log(magnitude + 1e-32);
}

int labelStride(double spacing, double extent)
{
    if (!(spacing > 0) || !(extent > spacing)) {
        return 1;
    }
    return static_cast<int>(std::min(niceStep(std::ceil(extent / spacing)), 1e9));
}
