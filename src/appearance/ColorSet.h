// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <QColor>
#include <QString>

class QSettings;

/// The process-wide colour set, which all windows and plots take their colours from: one of six
/// built-in presets or the user's own set, shifted by a brightness and a contrast. All functions
/// are to be called from the thread of the window.

/// The numbered places of the set. Slots 0 to 22 colour the plots, the others the controls.
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

/// The presets by their numbers, as they are stored.
enum class ColorPreset {
    Classic = 0,
    Charcoal,
    Copper,
    Chalk,
    Beach,
    Sky,
    User, ///< the colours set by setUserColor
};

constexpr int ColorPresetCount = 7; ///< the user's set included
constexpr ColorPreset DefaultColorPreset = ColorPreset::Copper;

/// The name of a slot, which is also its key in the settings; empty outside 0 to 32.
[[nodiscard]] QString colorSlotName(int slot);

/// The name of a preset as the user reads it.
[[nodiscard]] QString colorPresetName(ColorPreset preset);

/// The built-in colour of a slot. The user's set stands on the default preset. Numbers that are no
/// slot give a light grey.
[[nodiscard]] QColor presetColor(ColorPreset preset, int slot);

/// The colour of a slot in the current set, with or without the global brightness and contrast.
[[nodiscard]] QColor colorOf(int slot, bool adjusted = true);

[[nodiscard]] inline QColor colorOf(ColorSlot slot, bool adjusted = true)
{
    return colorOf(static_cast<int>(slot), adjusted);
}

[[nodiscard]] ColorPreset colorPreset();
void setColorPreset(ColorPreset preset);

/// In percent of the toolkit's lighter and darker: 0 leaves the colours as they are.
[[nodiscard]] int colorBrightness();
void setColorBrightness(int percent);

/// From -1 to 1: backgrounds go one way, texts and lines the other, traces half as far. 0 leaves
/// the colours as they are.
[[nodiscard]] double colorContrast();
void setColorContrast(double contrast);

/// Sets a slot of the user's set; seen while that is the preset.
void setUserColor(int slot, const QColor &color);

/// Makes the user's set a copy of the current preset, if that is a built-in one.
void fillDefaults();

/// Reads the whole set. A slot without a value takes the colour of the preset that was current
/// before, one whose value isn't a colour pure red, and an unknown preset is the default one.
void loadColors(QSettings &settings);

/// Writes the whole set, the user's colours under the names of their slots.
void saveColors(QSettings &settings);
