// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <QMetaType>
#include <QString>

/// One instrument that the user has configured.
struct InstrConfigEntry
{
    bool enabled = true; ///< offered in the panes, and asked whether it is there
    QString model;
    QString serial;
    QString resource;  ///< VISA resource string
    QString interface; ///< first section of the resource: "TCPIP", "GPIB0"
    QString comment;
    QString folder; ///< default folder of a pane; at first the way on which the entry came in

    friend bool operator==(const InstrConfigEntry &, const InstrConfigEntry &) = default;
};

Q_DECLARE_METATYPE(InstrConfigEntry)
