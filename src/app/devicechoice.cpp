// SPDX-License-Identifier: Apache-2.0
#include "devicechoice.h"

#include "instrument/InstrConfigEntry.h"

#include <QComboBox>

namespace {

const QString localText = "Local";

QString serialOf(const QString &text)
{
    constexpr int comparedLength = 6;
    return text.section(',', 1, 1).trimmed().left(comparedLength);
}

} // namespace

void fillDeviceChoice(QComboBox &choice, const QList<InstrConfigEntry> &instruments)
{
    choice.clear();
    choice.addItem(localText, QString());
    for (const InstrConfigEntry &entry : instruments) {
        if (entry.enabled) {
            choice.addItem(QString("%1, %2, %3").arg(entry.model, entry.serial, entry.interface),
                           entry.resource);
        }
    }
}

bool isSameInstrument(const QString &one, const QString &other)
{
    return one != localText && one.section(',', 0, 0) == other.section(',', 0, 0) &&
           serialOf(one) == serialOf(other);
}
