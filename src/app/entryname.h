// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <QString>

/// Paths of entries use "/" on every side, and a folder's path ends in it.

/// Whether a path names a folder.
[[nodiscard]] bool isFolderPath(const QString &path);

/// The path without the slash at its end; a root stays as it is.
[[nodiscard]] QString withoutSlash(const QString &path);

/// The last part of a path, without a slash.
[[nodiscard]] QString entryName(const QString &path);

/// The folder that holds an entry, with its slash; for the path of a root the root itself.
[[nodiscard]] QString parentFolder(const QString &path);

/// The path itself if it names a folder, else the folder of the file.
[[nodiscard]] QString folderOf(const QString &path);

/// Whether a name holds one of the characters that no new name may have, on any side, since
/// instruments give them a meaning: * # + / \ & ' " ? %
[[nodiscard]] bool hasForbiddenCharacter(const QString &name);
