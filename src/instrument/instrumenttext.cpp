// SPDX-License-Identifier: Apache-2.0
#include "instrumenttext.h"

#include "log/Tracer.h"

#include <algorithm>

std::optional<QByteArray> toInstrument(const QString &command)
{
    constexpr char16_t LastCharacter = 0xFF;
    const auto found = std::find_if(command.cbegin(), command.cend(), [](QChar character) {
        return character.unicode() > LastCharacter;
    });
    if (found != command.cend()) {
        Tracer::Trace(Tracer::Error,
                      QString("The command '%1' holds the character '%2', which can't be sent to "
                              "an instrument; those of Latin-1 can.")
                          .arg(command, *found));
        return std::nullopt;
    }
    return command.toLatin1();
}

namespace {

QString textOf(const char *bytes, qsizetype count)
{
    return QString::fromLatin1(bytes, std::find(bytes, bytes + count, '\0') - bytes);
}

} // namespace

QString fromInstrument(const char *bytes, qsizetype count)
{
    return textOf(bytes, count).simplified();
}

QString wholeTextOf(const QByteArray &bytes)
{
    return textOf(bytes.constData(), bytes.size()).trimmed();
}
