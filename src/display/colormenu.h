// SPDX-License-Identifier: Apache-2.0
#pragma once

#include "ColorTable.h"

#include <QAction>
#include <QActionGroup>
#include <QMenu>

#include <array>

/// Adds the four colour scales to a context menu, the present one checked. `modeSlots` are the
/// display's slots in the order of ColorMode.
template <typename Display>
void addColorModes(QMenu &menu, Display *display, int present,
                   const std::array<void (Display::*)(), ColorModeCount> &modeSlots)
{
    auto *group = new QActionGroup(&menu);
    const QStringList names = colorModeNames();
    for (int mode = 0; mode < ColorModeCount; ++mode) {
        QAction *action =
            menu.addAction(names.at(mode), display, modeSlots[static_cast<std::size_t>(mode)]);
        action->setCheckable(true);
        action->setChecked(mode == present);
        group->addAction(action);
    }
}
