// SPDX-License-Identifier: Apache-2.0
#include "PlotStyle.h"

#include <algorithm>
#include <functional>

namespace {

PlotStyle styleOf(const std::function<QColor(int)> &colorOfSlot)
{
    PlotStyle style;
    for (int slot = 0; slot < ColorSlotCount; ++slot) {
        style.palette[static_cast<std::size_t>(slot)] = colorOfSlot(slot);
    }
    constexpr double SmallestPointSize = 7.5; // points; below it digits run together
    if (style.font.pointSizeF() > 0) {
        style.font.setPointSizeF(std::max(SmallestPointSize, style.font.pointSizeF() * 0.9));
    }
    return style;
}

} // namespace

PlotStyle PlotStyle::current()
{
    return styleOf([](int slot) { return colorOf(slot); });
}

PlotStyle PlotStyle::themed(PlotTheme theme)
{
    const ColorPreset preset =
        theme == PlotTheme::Light ? ColorPreset::Chalk : ColorPreset::Classic;
    return styleOf([preset](int slot) { return presetColor(preset, slot); });
}

QColor PlotStyle::color(ColorSlot slot, int alpha) const
{
    QColor result = color(slot);
    result.setAlpha(alpha);
    return result;
}
