// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <QColor>
#include <QString>

/// The numbered places of the process-wide colour set. Slots 0 to 22 colour the plots, the others
/// the controls.
enum class ColorSlot {
    EntryEdit = 0,     ///< an entry field during typing
    PanelBackground,   ///< around the plot, behind the axis texts
    MarkedBackground,  ///< a marked stretch of a plot
    TextboxBackground, ///< value boxes over a plot
    TextboxFrame,
    GridLines,
    TriggerSymbol,
    Text,
    CursorLine,
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
    LcdBackground1,
    LcdBackground2,
    LcdGrid,
    WindowBackground,
    ButtonBase,
    TextBackground,
    Selection,
    AppText,
    AppTextDisabled,
    Borders,
};

constexpr int ColorSlotCount = 33;

/// The name of a slot, which is also its key in the settings; empty outside 0 to 32.
[[nodiscard]] QString colorSlotName(int slot);

/// The colour of a slot in the current set, with or without the global brightness and contrast.
/// Numbers that are no slot give a light grey. To be called from the thread of the window.
[[nodiscard]] QColor colorOf(int slot, bool adjusted = true);

[[nodiscard]] inline QColor colorOf(ColorSlot slot, bool adjusted = true)
{
    return colorOf(static_cast<int>(slot), adjusted);
}
