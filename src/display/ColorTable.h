// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <QRgb>
#include <QStringList>

#include <array>

/// The colour scales of waterfall and constellation; the numbers are those of their menus.
enum class ColorMode {
    Rainbow = 0,
    BlackWhite = 1,
    Blue = 2,
    NoiseBlue = 3,
};

constexpr int ColorModeCount = 4;

/// The names of the scales as menus show them.
[[nodiscard]] QStringList colorModeNames();

/// Colours for levels from 0 to -150 dB in steps of 1 dB.
class ColorTable
{
public:
    static constexpr int EntryCount = 151;
    static constexpr double LowestDb = -150;

    explicit ColorTable(ColorMode mode = ColorMode::Rainbow);

    [[nodiscard]] ColorMode mode() const { return m_mode; }
    /// The colour of `-index` dB, for an index from 0 to 150.
    [[nodiscard]] QRgb entry(int index) const { return m_entries[static_cast<std::size_t>(index)]; }
    /// The colour below the scale.
    [[nodiscard]] QRgb background() const { return m_entries.back(); }

    /// The colour of any level, limited to the scale, without rounding it to whole dB.
    [[nodiscard]] static QRgb colorOfLevel(ColorMode mode, double db);

private:
    ColorMode m_mode;
    std::array<QRgb, EntryCount> m_entries{};
};
