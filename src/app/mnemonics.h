// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <QList>
#include <QString>

class QAction;

/// Gives each entry of one menu a mnemonic of its own: the first letter of a word if it is free,
/// else any free letter. Entries that can't get one stay without. The texts carry none yet.
void assignMnemonics(const QList<QAction *> &actions);

/// The text of an entry as the user reads it, without the mark of the mnemonic.
[[nodiscard]] QString withoutMnemonic(QString text);
