// SPDX-License-Identifier: Apache-2.0
#include "PlotStyle.h"

#include <algorithm>
#include <utility>

PlotStyle PlotStyle::current()
{
    PlotStyle style;
    for (int slot = 0; slot < ColorSlotCount; ++slot) {
        style.palette[static_cast<std::size_t>(slot)] = colorOf(slot);
    }
    constexpr double SmallestPointSize = 7.5; // points; below it digits run together
    if (style.font.pointSizeF() > 0) {
        style.font.setPointSizeF(std::max(SmallestPointSize, style.font.pointSizeF() * 0.9));
    }
    return style;
}

PlotStyle PlotStyle::themed(PlotTheme theme)
{
    PlotStyle style = current();
    if (theme == PlotTheme::Light) {
        const std::pair<ColorSlot, QColor> colors[] = {
            {ColorSlot::PanelBackground, {255, 255, 255}},
            {ColorSlot::MarkedBackground, {238, 240, 244}},
            {ColorSlot::TextboxBackground, {250, 250, 250}},
            {ColorSlot::TextboxFrame, {120, 120, 120}},
            {ColorSlot::GridLines, {120, 126, 134}},
            {ColorSlot::Text, {24, 26, 30}},
            {ColorSlot::CursorLine, {60, 60, 60}},
            {ColorSlot::PrimaryMarker, {0, 128, 60}},
            {ColorSlot::SecondaryMarker, {190, 40, 110}},
            {ColorSlot::AverageTrace, {20, 84, 176}},
            {ColorSlot::PeakTrace, {196, 78, 0}},
        };
        for (const auto &[slot, color] : colors) {
            style.palette[static_cast<std::size_t>(slot)] = color;
        }
    }
    return style;
}

QColor PlotStyle::color(ColorSlot slot, int alpha) const
{
    QColor result = color(slot);
    result.setAlpha(alpha);
    return result;
}
