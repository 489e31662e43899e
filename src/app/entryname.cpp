// SPDX-License-Identifier: Apache-2.0
#include "entryname.h"

#include <algorithm>

bool isFolderPath(const QString &path)
{
    return path.endsWith('/');
}

QString withoutSlash(const QString &path)
{
    return path.size() > 1 && isFolderPath(path) ? path.chopped(1) : path;
}

QString entryName(const QString &path)
{
    return withoutSlash(path).section('/', -1);
}

QString parentFolder(const QString &path)
{
    const QString entry = withoutSlash(path);
    return entry == "/" ? entry : entry.left(entry.lastIndexOf('/') + 1);
}

QString folderOf(const QString &path)
{
    return path.left(path.lastIndexOf('/') + 1);
}

bool hasForbiddenCharacter(const QString &name)
{
    static const QString forbidden = "*#+/\\&'\"?%";
    return std::any_of(name.begin(), name.end(),
                       [](QChar character) { return forbidden.contains(character); });
}
