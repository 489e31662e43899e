// SPDX-License-Identifier: Apache-2.0
#include "devicechoice.h"

#include "instrument/InstrConfigEntry.h"

#include <QComboBox>

namespace {

constexpr int EntryRole = Qt::UserRole + 1;

} // namespace

void fillDeviceChoice(QComboBox &choice, const QList<InstrConfigEntry> &instruments)
{
    choice.clear();
    choice.addItem("Local", QString());
    for (const InstrConfigEntry &entry : instruments) {
        if (entry.enabled) {
            choice.addItem(QString("%1, %2, %3").arg(entry.model, entry.serial, entry.interface),
                           entry.resource);
            choice.setItemData(choice.count() - 1, QVariant::fromValue(entry), EntryRole);
        }
    }
}

bool isSameInstrument(const QComboBox &one, const QComboBox &other)
{
    constexpr int ComparedLength = 6;
    const auto first = one.currentData(EntryRole).value<InstrConfigEntry>();
    const auto second = other.currentData(EntryRole).value<InstrConfigEntry>();
    return !first.resource.isEmpty() && first.model == second.model &&
           first.serial.left(ComparedLength) == second.serial.left(ComparedLength);
}
