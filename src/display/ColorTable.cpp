// SPDX-License-Identifier: Apache-2.0
#include "ColorTable.h"

#include <algorithm>
#include <cmath>
#include <cstddef>

namespace {

struct Rgb
{
    int red;
    int green;
    int blue;
};

constexpr int RowCount = 5;
using Rows = std::array<Rgb, RowCount>;

/// From -150 dB to 0 dB.
constexpr std::array<Rows, ColorModeCount> Scales{{
    {{{0, 0, 64}, {0, 0, 144}, {192, 0, 0}, {208, 80, 0}, {255, 255, 0}}},
    {{{240, 240, 240}, {160, 160, 160}, {96, 96, 96}, {32, 32, 32}, {16, 16, 16}}},
    {{{0, 0, 0}, {16, 16, 64}, {48, 48, 96}, {80, 80, 128}, {112, 112, 192}}},
    {{{0, 0, 0}, {160, 160, 240}, {112, 112, 192}, {48, 48, 96}, {16, 16, 64}}},
}};

int mixed(int from, int to, double share)
{
    return static_cast<int>(from * (1 - share) + to * share);
}

} // namespace

QStringList colorModeNames()
{
    return {"Rainbow", "Black/White", "Blue", "Noise (Blue)"};
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
    const Rows &rows = Scales[static_cast<std::size_t>(mode)];
    // Written so that a level that is no number counts as the lowest.
    const double depth = (db > LowestDb ? std::min(db, 0.0) : LowestDb) / LowestDb;
    const double place = (1 - depth) * (RowCount - 1);
    const auto row = static_cast<std::size_t>(place);
    const Rgb &from = rows[row];
    const Rgb &to = rows[std::min<std::size_t>(row + 1, RowCount - 1)];
    const double share = place - std::floor(place);
    return qRgb(mixed(from.red, to.red, share), mixed(from.green, to.green, share),
                mixed(from.blue, to.blue, share));
}
