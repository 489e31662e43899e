// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <vector>

/// Filter kinds of the stream processor.
enum class FilterKind {
    Rectangular = 0, ///< sinc, a brick-wall low-pass
    RootCosine = 1,  ///< root raised cosine, the parameter is the roll-off
    Cosine = 2,      ///< raised cosine, the parameter is the roll-off
    Gauss = 3,       ///< Gaussian, the parameter is B*T with the input sample as the symbol
    Custom = 4,      ///< reserved for coefficient lists; no pass can build it
};

/// What a filter is made of.
struct FilterSettings
{
    int window = 1;                              ///< window kind, 0 to 6
    FilterKind filter = FilterKind::Rectangular; ///< shape of the impulse response
    int length = 21;                             ///< in input samples
    double rate = 1.0;                           ///< sample rate of the input, in any unit
    double cutoff = 0.45;                        ///< edge frequency, in the unit of the rate
    double parameter = 0.5;                      ///< roll-off or B*T

    bool operator==(const FilterSettings &) const = default;
};

/// Points in a table; the first lies at -half, the last at +half input samples.
inline constexpr int FilterTablePoints = 20000;

/// Filter lengths that a table can be made for. Shorter filters have no tap, longer ones don't fit
/// the block of the sliding window.
inline constexpr int MinFilterLength = 3;
inline constexpr int MaxFilterLength = 4999;

/// A windowed impulse response, sampled finely, with the slopes to the next point for linear
/// interpolation between the points.
struct FilterTable
{
    std::vector<double> value;
    std::vector<double> slope;
};

/// Half of the filter's reach in input samples; an even length reaches no further than the odd one
/// below it.
[[nodiscard]] constexpr int halfLength(int length)
{
    return (length - 1) / 2;
}

/// Fills the table. False if the settings describe no filter: a reserved kind, a length without
/// taps, or values that give no finite response.
[[nodiscard]] bool buildFilterTable(const FilterSettings &settings, FilterTable &table);
