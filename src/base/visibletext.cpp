// SPDX-License-Identifier: Apache-2.0
#include "visibletext.h"

#include <algorithm>

namespace {

bool isControl(QChar character)
{
    return character.category() == QChar::Other_Control;
}

} // namespace

QString visibleText(const QString &text)
{
    if (std::none_of(text.cbegin(), text.cend(), isControl)) {
        return text;
    }
    QString visible;
    for (const QChar character : text) {
        if (isControl(character)) {
            visible += QString::asprintf("\\x%02X", static_cast<unsigned>(character.unicode()));
        } else {
            visible += character;
        }
    }
    return visible;
}
