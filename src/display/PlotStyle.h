// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <QColor>
#include <QFont>

#include <array>

/// The places of the plot palette, in the order in which they are taken from the colour set.
enum class PlotColor {
    Background,
    TextBox,
    Marked,
    Grid,
    Trigger,
    Text,
    Cursor,
    PrimaryMarker,
    SecondaryMarker,
    AverageTrace,
    PeakTrace,
    RandomTrace,
    Trace4,
    Trace5,
    Trace6,
    Trace7,
    Trace8,
    Ref1,
    Ref2,
    Ref3,
    Ref4,
};

constexpr int PlotColorCount = 21;

/// Colours and font of a plot: all that painters need to know of the application's look.
struct PlotStyle
{
    std::array<QColor, PlotColorCount> palette;
    QFont font;

    /// The current colours and the application's font, a little smaller. Needs a QGuiApplication.
    [[nodiscard]] static PlotStyle current();

    [[nodiscard]] QColor color(PlotColor place) const
    {
        return palette[static_cast<std::size_t>(place)];
    }
    [[nodiscard]] QColor color(PlotColor place, int alpha) const;
};
