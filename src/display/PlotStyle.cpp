// SPDX-License-Identifier: Apache-2.0
#include "PlotStyle.h"

#include "appearance/ColorSet.h"

#include <algorithm>

namespace {

constexpr std::array<ColorSlot, PlotColorCount> PaletteSlots{
    ColorSlot::PanelBackground,
    ColorSlot::TextboxBackground,
    ColorSlot::MarkedBackground,
    ColorSlot::GridLines,
    ColorSlot::TriggerSymbol,
    ColorSlot::Text,
    ColorSlot::CursorLine,
    ColorSlot::PrimaryMarker,
    ColorSlot::SecondaryMarker,
    ColorSlot::AverageTrace,
    ColorSlot::PeakTrace,
    ColorSlot::RandomTrace,
    ColorSlot::Trace4,
    ColorSlot::Trace5,
    ColorSlot::Trace6,
    ColorSlot::Trace7,
    ColorSlot::Trace8,
    ColorSlot::Ref1,
    ColorSlot::Ref2,
    ColorSlot::Ref3,
    ColorSlot::Ref4,
};

} // namespace

PlotStyle PlotStyle::current()
{
    PlotStyle style;
    std::transform(PaletteSlots.begin(), PaletteSlots.end(), style.palette.begin(),
                   [](ColorSlot slot) { return colorOf(slot); });
    constexpr double smallest = 7.5; // points; below it digits run together
    if (style.font.pointSizeF() > 0) {
        style.font.setPointSizeF(std::max(smallest, style.font.pointSizeF() * 0.9));
    }
    return style;
}

QColor PlotStyle::color(PlotColor place, int alpha) const
{
    QColor result = color(place);
    result.setAlpha(alpha);
    return result;
}
