// SPDX-License-Identifier: Apache-2.0
#pragma once

#include "appearance/ColorSet.h"

#include <QColor>
#include <QFont>

#include <array>

/// The ground of pictures that are made for documents.
enum class PlotTheme {
    Dark = 0,
    Light = 1,
};

/// Colours and font of a plot: all that painters need to know of the application's look.
struct PlotStyle
{
    std::array<QColor, ColorSlotCount> palette;
    QFont font;

    /// The current colours and the application's font, a little smaller. Needs a QGuiApplication.
    [[nodiscard]] static PlotStyle current();

    /// The colours of a preset for pictures, the same whatever the user has chosen.
    [[nodiscard]] static PlotStyle themed(PlotTheme theme);

    [[nodiscard]] QColor color(ColorSlot slot) const
    {
        return palette[static_cast<std::size_t>(slot)];
    }
    [[nodiscard]] QColor color(ColorSlot slot, int alpha) const;
};
