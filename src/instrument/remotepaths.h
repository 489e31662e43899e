// SPDX-License-Identifier: Apache-2.0
#pragma once

#include "RemoteFileEntry.h"

#include <QList>
#include <QString>

/// The parts of an instrument's path.
struct RemotePath
{
    QString drive;     ///< such as "D:"; empty without one
    QString directory; ///< up to and with the last separator, the drive included
    QString baseName;
    QString suffix; ///< behind the last point of the name

    /// As it stands in the catalogue of `directory`.
    QString fileName;
};

/// Cuts a path at its last "/", or where it has none at its last backslash.
[[nodiscard]] RemotePath splitPath(const QString &path);

/// Joins a folder and a name below it with the instrument's separator, which replaces both kinds in
/// the two. Apostrophes go, as they would end the string of the command.
[[nodiscard]] QString joinRemotePath(const QString &parent, const QString &name, QChar separator);

/// Reads the answer to ":MMEM:CAT?": used and free bytes, then one quoted text for each entry with
/// name, type and size between commas. Names that begin with a point are left out, as is what
/// can't be read.
[[nodiscard]] QList<RemoteFileEntry> parseCatalogue(const QString &answer);

/// The VISA resource of what a user typed: a resource string stays as it is, a host name or address
/// becomes "TCPIP::host::INSTR". Empty for a blank text.
[[nodiscard]] QString resourceOf(const QString &text);
