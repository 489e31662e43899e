// SPDX-License-Identifier: Apache-2.0
#pragma once

#include "RemoteFileEntry.h"

#include <QList>
#include <QString>
#include <QStringView>

// What a path and a name are, in one place for the panes, the jobs and the command line.
//
// Inside the program paths of entries use "/" on the disk and on any instrument, and a folder's
// path ends in it; nativePath() turns them into what the instrument writes.

// Paths with "/"

/// Whether a path names a folder.
[[nodiscard]] bool isFolderPath(QStringView path);

/// The path without the separators at its end; a root stays as it is.
[[nodiscard]] QString withoutEndSlash(const QString &path);

/// The last part of a path, without a slash.
[[nodiscard]] QString entryName(const QString &path);

/// The folder that holds an entry, with its slash; for the path of a root the root itself.
[[nodiscard]] QString parentFolder(const QString &path);

/// The path itself if it names a folder, else the folder of the file.
[[nodiscard]] QString folderOf(const QString &path);

/// Whether a path below a folder can't lead out of it again.
[[nodiscard]] bool staysBelow(const QString &relativePath);

// What a name may hold

/// Whether a name holds one of the characters that no new name may have, on any side, since
/// instruments give them a meaning: * # + / \ & ' " ? %
[[nodiscard]] bool hasForbiddenCharacter(QStringView name);

/// Why a file of that name can't be sent to an instrument: a character ends the name in its
/// command, joins two, or stands for others. Empty if it can.
[[nodiscard]] QString sendingProblem(const QString &name);

/// Why a path can't stand in a command: it is empty. Empty if it can.
[[nodiscard]] QString pathProblem(const QString &path);

/// As above, for a path that is taken apart into a folder and a name in it.
[[nodiscard]] QString fullPathProblem(const QString &path);

// Paths as an instrument writes them

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

/// A path with "/" as an instrument with this separator writes it.
[[nodiscard]] QString nativePath(const QString &path, QChar separator);

/// The reverse: what a user or an instrument with this separator has written, with "/".
[[nodiscard]] QString slashPath(const QString &path, QChar separator);

/// A text as a string of a command: between apostrophes, with those in it doubled, so that no name
/// can end it (IEEE 488.2, 7.7.5).
[[nodiscard]] QString commandString(QString text);

/// Joins a folder and a name below it with the instrument's separator, which replaces both kinds in
/// the two.
[[nodiscard]] QString joinRemotePath(const QString &parent, const QString &name, QChar separator);

/// Reads the answer to ":MMEM:CAT?": used and free bytes, then one quoted text for each entry with
/// name, type and size between commas. Names that begin with a point are left out, as is what
/// can't be read.
[[nodiscard]] QList<RemoteFileEntry> parseCatalogue(const QString &answer);

/// Whether an instrument that takes no notice of the case of names has the one for the other.
[[nodiscard]] bool isSameName(const QString &one, const QString &other, bool unixFileSystem);

/// The parts of a resource string between its "::"; those of an IPv6 address in brackets are none.
[[nodiscard]] QStringList resourceSections(const QString &resource);

/// The host, without brackets, of a TCPIP resource.
[[nodiscard]] QString hostOf(const QString &resource);

/// "TCPIP::", a host, in brackets if it is an IPv6 address, and "::".
[[nodiscard]] QString networkHead(const QString &host);

/// A resource string by which two can be compared: the same for all spellings of one resource.
[[nodiscard]] QString plainResource(const QString &resource);

/// The VISA resource of what a user typed: a resource string stays as it is, a host name or address
/// becomes "TCPIP::host::INSTR". Empty for a blank text.
[[nodiscard]] QString resourceOf(const QString &text);
