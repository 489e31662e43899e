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
    Viridis = 4,
};

constexpr int ColorModeCount = 5;

/// The scale that displays start with: equal steps of level look equally large in it.
constexpr ColorMode DefaultColorMode = ColorMode::Viridis;

/// The name of a scale as menus show it.
[[nodiscard]] QString colorModeName(ColorMode mode);

/// The names of the scales on a command line, in the order of menus.
[[nodiscard]] QStringList colorModeKeys();

/// The scales in the order of menus.
[[nodiscard]] const std::array<ColorMode, ColorModeCount> &colorModeOrder();

/// Levels between which a colour scale runs, in dB.
struct LevelRange
{
    double low = -150;
    double high = 0;

    /// The level on the scale of a ColorTable, which runs from 0 to -150 dB.
    [[nodiscard]] double scaled(double db) const { return (db - high) * 150 / (high - low); }

    friend bool operator==(const LevelRange &, const LevelRange &) = default;
};

/// Colours for levels from 0 to -150 dB in steps of 1 dB.
class ColorTable
{
public:
    static constexpr int EntryCount = 151;
    static constexpr double LowestDb = -150;

    explicit ColorTable(ColorMode mode = DefaultColorMode);

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
