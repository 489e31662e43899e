// SPDX-License-Identifier: Apache-2.0
#include "ColorTable.h"

#include <algorithm>
#include <cmath>
#include <cstddef>
#include <span>

namespace {

struct Rgb
{
    int red;
    int green;
    int blue;
};

/// From -150 dB to 0 dB.
constexpr std::array<std::array<Rgb, 5>, 4> PlainScales{{
    {{{0, 0, 64}, {0, 0, 144}, {192, 0, 0}, {208, 80, 0}, {255, 255, 0}}},
    {{{240, 240, 240}, {160, 160, 160}, {96, 96, 96}, {32, 32, 32}, {16, 16, 16}}},
    {{{0, 0, 0}, {16, 16, 64}, {48, 48, 96}, {80, 80, 128}, {112, 112, 192}}},
    {{{0, 0, 0}, {160, 160, 240}, {112, 112, 192}, {48, 48, 96}, {16, 16, 64}}},
}};

/// Nine steps of the map of van der Walt and Smith, which is even to the eye.
constexpr std::array<Rgb, 9> ViridisScale{{{68, 1, 84},
                                           {71, 45, 123},
                                           {59, 82, 139},
                                           {44, 114, 142},
                                           {33, 144, 140},
                                           {39, 173, 129},
                                           {93, 200, 99},
                                           {170, 220, 50},
                                           {253, 231, 37}}};

std::span<const Rgb> rowsOf(ColorMode mode)
{
    if (mode == ColorMode::Viridis) {
        return ViridisScale;
    }
    return PlainScales[static_cast<std::size_t>(mode)];
}

int mixed(int from, int to, double share)
{
    return static_cast<int>(from * (1 - share) + to * share);
}

} // namespace

QString colorModeName(ColorMode mode)
{
    constexpr std::array<const char *, ColorModeCount> Names{"Rainbow", "Black/White", "Blue",
                                                             "Noise (Blue)", "Viridis"};
    return Names[static_cast<std::size_t>(mode)];
}

QStringList colorModeKeys()
{
    return {"viridis", "rainbow", "blackwhite", "blue", "noise"};
}

const std::array<ColorMode, ColorModeCount> &colorModeOrder()
{
    static constexpr std::array<ColorMode, ColorModeCount> Order{
        ColorMode::Viridis, ColorMode::Rainbow, ColorMode::BlackWhite, ColorMode::Blue,
        ColorMode::NoiseBlue};
    return Order;
}

ColorTable::ColorTable(ColorMode mode)
    : m_mode(mode)
{
    for (int index = 0; index < EntryCount; ++index) {
        m_entries[static_cast<std::size_t>(index)] = colorOfLevel(mode, -index);
    }
}

QRgb ColorTable::colorOfLevel(ColorMode mode, double db)
{
    const std::span<const Rgb> rows = rowsOf(mode);
    const std::size_t last = rows.size() - 1;
    // Written so that a level that is no number counts as the lowest.
    const double depth = (db > LowestDb ? std::min(db, 0.0) : LowestDb) / LowestDb;
    const double place = (1 - depth) * static_cast<double>(last);
    const auto row = static_cast<std::size_t>(place);
    const Rgb &from = rows[row];
    const Rgb &to = rows[std::min(row + 1, last)];
    const double share = place - std::floor(place);
    return qRgb(mixed(from.red, to.red, share), mixed(from.green, to.green, share),
                mixed(from.blue, to.blue, share));
}
