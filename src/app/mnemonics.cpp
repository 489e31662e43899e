// SPDX-License-Identifier: Apache-2.0
#include "mnemonics.h"

#include <QAction>
#include <QSet>

namespace {

/// Index of the letter to mark, -1 if all are taken.
qsizetype findFreeLetter(const QString &text, const QSet<QChar> &taken)
{
    const auto isFree = [&](qsizetype i) {
        return text.at(i).isLetterOrNumber() && !taken.contains(text.at(i).toLower());
    };
    for (qsizetype i = 0; i < text.size(); ++i) {
        const bool startsWord = i == 0 || text.at(i - 1).isSpace();
        if (startsWord && isFree(i)) {
            return i;
        }
    }
    for (qsizetype i = 0; i < text.size(); ++i) {
        if (isFree(i)) {
            return i;
        }
    }
    return -1;
}

} // namespace

void assignMnemonics(const QList<QAction *> &actions)
{
    QSet<QChar> taken;
    for (QAction *action : actions) {
        QString text = withoutMnemonic(action->text());
        const qsizetype index = findFreeLetter(text, taken);
        if (index >= 0) {
            taken.insert(text.at(index).toLower());
            action->setText(text.insert(index, '&'));
        }
    }
}

QString withoutMnemonic(QString text)
{
    return text.remove('&');
}
