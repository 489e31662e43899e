// SPDX-License-Identifier: Apache-2.0
#include "ColorSet.h"

#include <array>
#include <cstddef>

namespace {

struct SlotEntry
{
    const char *name;
    QRgb color;
};

// The values of the set "Classic": traces are chosen to stay apart on the near-black panel for
// people with red-green weakness too (they differ in lightness, not in hue alone).
constexpr std::array<SlotEntry, ColorSlotCount> Slots{{
    {"ApplicationEntryEdit", qRgb(200, 200, 230)},
    {"PanelBackground", qRgb(10, 12, 15)},
    {"MarkedBackground", qRgb(0, 31, 47)},
    {"TextboxBackground", qRgb(69, 72, 75)},
    {"TextboxBackgroundFr", qRgb(0, 94, 142)},
    {"GridLines", qRgb(124, 129, 132)},
    {"TriggerSymbol", qRgb(255, 255, 255)},
    {"Text", qRgb(225, 228, 230)},
    {"CursorLine", qRgb(255, 255, 255)},
    {"PrimaryMarker", qRgb(120, 235, 140)},
    {"SecondaryMarker", qRgb(245, 110, 190)},
    {"AverageTrace", qRgb(220, 195, 25)},
    {"PeakTrace", qRgb(80, 190, 255)},
    {"RandomTrace", qRgb(0, 151, 89)},
    {"Trace4", qRgb(201, 35, 43)},
    {"Trace5", qRgb(240, 150, 50)},
    {"Trace6", qRgb(175, 130, 235)},
    {"Trace7", qRgb(110, 220, 190)},
    {"Trace8", qRgb(235, 130, 180)},
    {"Ref1", qRgb(255, 255, 255)},
    {"Ref2", qRgb(160, 200, 120)},
    {"Ref3", qRgb(150, 165, 215)},
    {"Ref4", qRgb(215, 170, 130)},
    {"App.LCD.Background1", qRgb(20, 26, 32)},
    {"App.LCD.Background2", qRgb(10, 12, 15)},
    {"App.LCD.Grid", qRgb(60, 70, 78)},
    {"App.Background.Window", qRgb(52, 56, 60)},
    {"App.Button.Base", qRgb(76, 82, 88)},
    {"App.Background.Text", qRgb(32, 35, 38)},
    {"App.Selection", qRgb(0, 94, 142)},
    {"App.Text", qRgb(235, 237, 238)},
    {"App.Text.Disabled", qRgb(140, 145, 148)},
    {"App.Borders", qRgb(104, 110, 115)},
}};

constexpr QRgb UnknownSlot = qRgb(200, 200, 200);

bool isSlot(int slot)
{
    return slot >= 0 && slot < ColorSlotCount;
}

} // namespace

QString colorSlotName(int slot)
{
    return isSlot(slot) ? QString::fromLatin1(Slots[static_cast<std::size_t>(slot)].name)
                        : QString();
}

QColor colorOf(int slot, [[maybe_unused]] bool adjusted)
{
    // Brightness and contrast are neutral, so the adjusted colour is the plain one.
    return QColor(isSlot(slot) ? Slots[static_cast<std::size_t>(slot)].color : UnknownSlot);
}
