// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <QByteArray>
#include <QString>

/// What the first bytes and the name of a file tell about it.
struct DataGuess
{
    static constexpr qint64 HeadSize = 1024; ///< bytes that are looked at

    QByteArray head;
    bool binary = false;
    QString
        partner; ///< path of the file with the other half of the samples; empty if there is none
};

/// Looks at a file, with its reasons in the log. False if it can't be read.
[[nodiscard]] bool guessData(const QString &fileName, DataGuess &guess);

/// Whether a file that begins like this holds no text.
[[nodiscard]] bool looksBinary(const QByteArray &head);

/// The start of a file as it is shown: its first lines, or its first bytes in hexadecimal.
[[nodiscard]] QString previewText(const QByteArray &head, bool binary);
