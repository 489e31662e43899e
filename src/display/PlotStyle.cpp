// SPDX-License-Identifier: Apache-2.0
#include "PlotStyle.h"

#include <algorithm>

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

QColor PlotStyle::color(ColorSlot slot, int alpha) const
{
    QColor result = color(slot);
    result.setAlpha(alpha);
    return result;
}
