// SPDX-License-Identifier: Apache-2.0
#pragma once

#include "ColorTable.h"

#include <QAction>
#include <QActionGroup>
#include <QImage>
#include <QMenu>
#include <QPixmap>

#include <array>

/// Adds the colour scales with a sample of each to a context menu, the present one checked.
/// `modeSlots` are the display's slots in the order of ColorMode.
template <typename Display>
void addColorModes(QMenu &menu, Display *display, int present,
                   const std::array<void (Display::*)(), ColorModeCount> &modeSlots)
{
    auto *group = new QActionGroup(&menu);
    for (const ColorMode mode : colorModeOrder()) {
        const int number = static_cast<int>(mode);
        QAction *action = menu.addAction(colorModeName(mode), display,
                                         modeSlots[static_cast<std::size_t>(number)]);
        constexpr int Side = 16;
        QImage swatch(Side, Side, QImage::Format_RGB32);
        for (int y = 0; y < Side; ++y) {
            for (int x = 0; x < Side; ++x) {
                swatch.setPixel(
                    x, y,
                    ColorTable::colorOfLevel(mode, (1 - (x + 0.5) / Side) * ColorTable::LowestDb));
            }
        }
        action->setIcon(QPixmap::fromImage(swatch));
        action->setCheckable(true);
        action->setChecked(number == present);
        group->addAction(action);
    }
}
