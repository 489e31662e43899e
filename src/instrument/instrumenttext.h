// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <QByteArray>
#include <QString>

#include <optional>

/// The bytes of a command for the instrument, one a character. Nothing, with the reason logged, if
/// a character has none: a replacement such as "?" would be a wildcard in a path.
[[nodiscard]] std::optional<QByteArray> toInstrument(const QString &command);

/// The text of an answer up to its first zero byte, each run of white space made one blank.
[[nodiscard]] QString fromInstrument(const char *bytes, qsizetype count);
[[nodiscard]] inline QString fromInstrument(const QByteArray &bytes)
{
    return fromInstrument(bytes.constData(), bytes.size());
}

/// The same with the white space that stands within the answer, for texts that hold names.
[[nodiscard]] QString wholeTextOf(const QByteArray &bytes);
