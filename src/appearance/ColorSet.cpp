// SPDX-License-Identifier: Apache-2.0
#include "ColorSet.h"

#include <QMap>
#include <QSettings>

#include <algorithm>
#include <array>
#include <cmath>
#include <cstddef>

namespace {

constexpr int BuiltInCount = ColorPresetCount - 1;

// Shares of the contrast: it darkens what lies behind and lightens what is drawn upon.
constexpr double Background = -1;
constexpr double Line = 1;
constexpr double Trace = 0.5;

constexpr QRgb White = qRgb(255, 255, 255);
constexpr QRgb Green = qRgb(0, 151, 89);
constexpr QRgb Red = qRgb(201, 35, 43);
constexpr QRgb Yellow = qRgb(220, 195, 25);
constexpr QRgb UnknownSlot = qRgb(200, 200, 200);

struct SlotEntry
{
    const char *name;
    double weight;
    std::array<QRgb, BuiltInCount> colors; // Classic, Charcoal, Copper, Chalk, Beach, Sky
};

// Traces differ in lightness, not in hue alone, so that people with red-green weakness can tell
// them apart. Texts keep a contrast of 4.5 to 1 to what they may stand on, traces 3 to 1.
constexpr std::array<SlotEntry, ColorSlotCount> Slots{{
    {"ApplicationEntryEdit",
     Background,
     {qRgb(200, 200, 230), qRgb(232, 222, 160), qRgb(248, 216, 176), Yellow, Yellow, Yellow}},
    {"PanelBackground",
     Background,
     {qRgb(10, 12, 15), qRgb(20, 21, 23), qRgb(20, 15, 12), White, qRgb(255, 251, 240),
      qRgb(246, 251, 255)}},
    {"MarkedBackground",
     Background,
     {qRgb(0, 31, 47), qRgb(40, 43, 48), qRgb(48, 32, 22), qRgb(236, 239, 243), qRgb(243, 232, 207),
      qRgb(223, 237, 249)}},
    {"TextboxBackground",
     Background,
     {qRgb(69, 72, 75), qRgb(58, 61, 66), qRgb(74, 54, 42), qRgb(248, 249, 250),
      qRgb(255, 253, 247), qRgb(252, 254, 255)}},
    {"TextboxBackgroundFr",
     Background,
     {qRgb(0, 94, 142), qRgb(104, 112, 124), qRgb(168, 104, 62), qRgb(120, 126, 134),
      qRgb(160, 130, 84), qRgb(84, 134, 178)}},
    {"GridLines",
     Line,
     {qRgb(124, 129, 132), qRgb(118, 122, 128), qRgb(134, 116, 102), qRgb(120, 126, 134),
      qRgb(146, 126, 94), qRgb(104, 132, 158)}},
    {"TriggerSymbol", Line, {White, White, White, Red, Red, Red}},
    {"Text",
     Line,
     {qRgb(225, 228, 230), qRgb(230, 232, 235), qRgb(242, 230, 218), qRgb(24, 26, 30),
      qRgb(52, 40, 24), qRgb(14, 36, 58)}},
    {"CursorLine",
     Line,
     {White, White, qRgb(255, 240, 224), qRgb(60, 62, 66), qRgb(84, 62, 34), qRgb(30, 62, 96)}},
    {"PrimaryMarker",
     Line,
     {qRgb(120, 235, 140), qRgb(134, 222, 148), qRgb(150, 222, 130), qRgb(0, 128, 60),
      qRgb(22, 116, 66), qRgb(0, 122, 78)}},
    {"SecondaryMarker",
     Line,
     {qRgb(245, 110, 190), qRgb(240, 130, 186), qRgb(244, 128, 158), qRgb(190, 40, 110),
      qRgb(178, 44, 92), qRgb(176, 38, 124)}},
    {"AverageTrace",
     Trace,
     {Yellow, Yellow, Yellow, qRgb(20, 84, 176), qRgb(0, 98, 128), qRgb(0, 84, 168)}},
    {"PeakTrace",
     Trace,
     {qRgb(80, 190, 255), qRgb(98, 184, 246), qRgb(110, 196, 226), qRgb(196, 78, 0),
      qRgb(190, 82, 10), qRgb(198, 76, 14)}},
    {"RandomTrace", Trace, {Green, Green, Green, Green, Green, Green}},
    {"Trace4", Trace, {Red, Red, Red, Red, Red, Red}},
    {"Trace5",
     Trace,
     {qRgb(240, 150, 50), qRgb(238, 160, 72), qRgb(238, 146, 70), qRgb(128, 70, 160),
      qRgb(124, 70, 136), qRgb(112, 66, 172)}},
    {"Trace6",
     Trace,
     {qRgb(175, 130, 235), qRgb(176, 146, 232), qRgb(190, 150, 222), qRgb(0, 124, 138),
      qRgb(0, 116, 116), qRgb(0, 118, 146)}},
    {"Trace7",
     Trace,
     {qRgb(110, 220, 190), qRgb(122, 214, 192), qRgb(138, 212, 178), qRgb(140, 98, 0),
      qRgb(132, 98, 20), qRgb(132, 100, 0)}},
    {"Trace8",
     Trace,
     {qRgb(235, 130, 180), qRgb(232, 146, 186), qRgb(240, 150, 160), qRgb(92, 104, 120),
      qRgb(104, 96, 84), qRgb(84, 106, 130)}},
    {"Ref1", Trace, {White, White, White, qRgb(40, 44, 50), qRgb(66, 52, 34), qRgb(22, 50, 80)}},
    {"Ref2",
     Trace,
     {qRgb(160, 200, 120), qRgb(164, 198, 132), qRgb(176, 196, 112), qRgb(78, 122, 34),
      qRgb(92, 112, 24), qRgb(64, 122, 60)}},
    {"Ref3",
     Trace,
     {qRgb(150, 165, 215), qRgb(154, 170, 212), qRgb(164, 176, 202), qRgb(86, 98, 178),
      qRgb(76, 96, 150), qRgb(78, 92, 190)}},
    {"Ref4",
     Trace,
     {qRgb(215, 170, 130), qRgb(212, 176, 142), qRgb(222, 178, 138), qRgb(158, 84, 60),
      qRgb(160, 80, 48), qRgb(162, 80, 72)}},
    {"App.LCD.Background1",
     Background,
     {qRgb(20, 26, 32), qRgb(34, 36, 39), qRgb(36, 27, 21), qRgb(244, 246, 248),
      qRgb(248, 240, 222), qRgb(234, 243, 251)}},
    {"App.LCD.Background2",
     Background,
     {qRgb(10, 12, 15), qRgb(24, 25, 27), qRgb(24, 18, 14), qRgb(228, 232, 237),
      qRgb(238, 226, 198), qRgb(214, 230, 244)}},
    {"App.LCD.Grid",
     Line,
     {qRgb(60, 70, 78), qRgb(70, 74, 80), qRgb(90, 68, 52), qRgb(178, 186, 196),
      qRgb(196, 176, 138), qRgb(152, 182, 208)}},
    {"App.Background.Window",
     Background,
     {qRgb(52, 56, 60), qRgb(46, 48, 52), qRgb(48, 38, 32), qRgb(238, 240, 242),
      qRgb(240, 229, 206), qRgb(222, 234, 245)}},
    {"App.Button.Base",
     Background,
     {qRgb(72, 78, 84), qRgb(64, 67, 73), qRgb(78, 58, 45), qRgb(222, 226, 231),
      qRgb(228, 211, 178), qRgb(200, 219, 237)}},
    {"App.Background.Text",
     Background,
     {qRgb(32, 35, 38), qRgb(30, 31, 34), qRgb(32, 25, 21), White, qRgb(255, 252, 245), White}},
    {"App.Selection",
     Background,
     {qRgb(0, 94, 142), qRgb(52, 94, 146), qRgb(142, 76, 34), qRgb(168, 205, 244),
      qRgb(150, 208, 204), qRgb(140, 196, 242)}},
    {"App.Text",
     Line,
     {qRgb(235, 237, 238), qRgb(232, 234, 237), qRgb(244, 234, 224), qRgb(26, 28, 32),
      qRgb(54, 42, 26), qRgb(14, 36, 58)}},
    {"App.Text.Disabled",
     Line,
     {qRgb(158, 163, 167), qRgb(150, 154, 160), qRgb(168, 148, 134), qRgb(112, 117, 124),
      qRgb(124, 105, 76), qRgb(86, 108, 130)}},
    {"App.Borders",
     Line,
     {qRgb(112, 118, 123), qRgb(102, 107, 114), qRgb(132, 100, 76), qRgb(150, 157, 166),
      qRgb(168, 144, 102), qRgb(120, 152, 182)}},
}};

struct State
{
    ColorPreset preset = DefaultColorPreset;
    int brightness = 0;
    double contrast = 0;
    QMap<int, QColor> userColors; // by slot + 1
};

State &state()
{
    static State instance;
    return instance;
}

bool isSlot(int slot)
{
    return slot >= 0 && slot < ColorSlotCount;
}

const SlotEntry &entryOf(int slot)
{
    return Slots[static_cast<std::size_t>(slot)];
}

QColor userColor(int slot)
{
    return state().userColors.value(slot + 1, presetColor(ColorPreset::User, slot));
}

} // namespace

QString colorSlotName(int slot)
{
    return isSlot(slot) ? QString::fromLatin1(entryOf(slot).name) : QString();
}

QString colorPresetName(ColorPreset preset)
{
    constexpr std::array<const char *, ColorPresetCount> Names{
        "Classic", "Charcoal", "Copper", "Chalk", "Beach", "Sky", "User"};
    return QString::fromLatin1(Names[static_cast<std::size_t>(preset)]);
}

QColor presetColor(ColorPreset preset, int slot)
{
    if (!isSlot(slot)) {
        return {UnknownSlot};
    }
    const ColorPreset table = preset == ColorPreset::User ? DefaultColorPreset : preset;
    return {entryOf(slot).colors[static_cast<std::size_t>(table)]};
}

QColor colorOf(int slot, bool adjusted)
{
    const QColor color =
        state().preset == ColorPreset::User ? userColor(slot) : presetColor(state().preset, slot);
    if (!adjusted || !isSlot(slot)) {
        return color;
    }
    // As floating point, since a store may hold any number.
    const double shift = std::trunc(state().contrast * entryOf(slot).weight * -100);
    const double level = std::clamp(state().brightness - shift + 100, 0.0, 200.0);
    const int percent = static_cast<int>(level);
    if (percent > 100) {
        return color.lighter(percent);
    }
    return percent == 100 ? color : color.darker(200 - percent);
}

ColorPreset colorPreset()
{
    return state().preset;
}

void setColorPreset(ColorPreset preset)
{
    state().preset = preset;
}

int colorBrightness()
{
    return state().brightness;
}

void setColorBrightness(int percent)
{
    state().brightness = percent;
}

double colorContrast()
{
    return state().contrast;
}

void setColorContrast(double contrast)
{
    state().contrast = std::isfinite(contrast) ? contrast : 0;
}

void setUserColor(int slot, const QColor &color)
{
    if (isSlot(slot) && color.isValid()) {
        state().userColors.insert(slot + 1, QColor(color.rgb())); // opaque
    }
}

void fillDefaults()
{
    if (state().preset == ColorPreset::User) {
        return;
    }
    for (int slot = 0; slot < ColorSlotCount; ++slot) {
        setUserColor(slot, presetColor(state().preset, slot));
    }
}

void loadColors(QSettings &settings)
{
    state().userColors.clear();
    for (int slot = 0; slot < ColorSlotCount; ++slot) {
        const QString preset = presetColor(state().preset, slot).name();
        const QColor color(settings.value(colorSlotName(slot), preset).toString());
        setUserColor(slot, color.isValid() ? color : QColor(255, 0, 0));
    }
    setColorBrightness(settings.value("_brightness_", 0).toInt());
    setColorContrast(settings.value("_contrast_", 0.0).toDouble());
    bool isNumber = false;
    const int preset =
        settings.value("_colorset_", static_cast<int>(DefaultColorPreset)).toInt(&isNumber);
    const bool isPreset = isNumber && preset >= 0 && preset < ColorPresetCount;
    setColorPreset(isPreset ? static_cast<ColorPreset>(preset) : DefaultColorPreset);
}

void saveColors(QSettings &settings)
{
    for (int slot = 0; slot < ColorSlotCount; ++slot) {
        settings.setValue(colorSlotName(slot), userColor(slot).name());
    }
    settings.setValue("_brightness_", state().brightness);
    settings.setValue("_contrast_", state().contrast);
    settings.setValue("_colorset_", static_cast<int>(state().preset));
}
