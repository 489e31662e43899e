// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <QList>
#include <QString>

class QComboBox;
struct InstrConfigEntry;

// The choice of what a pane shows: the local file system, or one of the enabled instruments.

/// Enters "Local", with an empty text for its data, and the enabled instruments, their resource
/// for their data. What was chosen before is lost.
void fillDeviceChoice(QComboBox &choice, const QList<InstrConfigEntry> &instruments);

/// Whether two choices stand on the same instrument: the same model, and the first six characters
/// of its serial number. "Local" is none.
[[nodiscard]] bool isSameInstrument(const QComboBox &one, const QComboBox &other);
