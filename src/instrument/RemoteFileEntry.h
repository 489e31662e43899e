// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <QString>

/// One line of an instrument's catalogue.
struct RemoteFileEntry
{
    QString name;
    QString type;    ///< "DIR", "ASC", "BIN", "SET" or what the instrument sends
    qint64 size = 0; ///< bytes

    [[nodiscard]] bool isDirectory() const { return type == "DIR"; }
};
