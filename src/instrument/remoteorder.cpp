// SPDX-License-Identifier: Apache-2.0
#include "remoteorder.h"

#include "RemoteEntry.h"

#include <QString>

#include <algorithm>
#include <vector>

namespace {

/// What is compared of an entry, made once for each sort.
struct Keys
{
    explicit Keys(RemoteEntry *sortedEntry)
        : entry(sortedEntry)
        , isDirectory(entry->info().isDirectory)
        , size(isDirectory ? entry->children().size() : entry->info().size)
        , name(entry->fullPath().toLower().section('/', -1, -1, QString::SectionSkipEmpty))
    {
    }

    [[nodiscard]] const QString &type() const { return entry->info().owner; }

    RemoteEntry *entry;
    bool isDirectory;
    qint64 size;
    QString name;
};

bool isLess(const Keys &a, const Keys &b, RemoteSortKey key, bool ascending)
{
    if (key == RemoteSortKey::Type) {
        if (a.type() == b.type()) {
            return a.name < b.name;
        }
        return ascending ? a.type() < b.type() : b.type() < a.type();
    }
    if (a.isDirectory != b.isDirectory) {
        return a.isDirectory;
    }
    if (key == RemoteSortKey::Size) {
        return ascending ? a.size < b.size : b.size < a.size;
    }
    return ascending ? a.name < b.name : b.name < a.name;
}

} // namespace

QList<RemoteEntry *> sortedEntries(const QList<RemoteEntry *> &entries, RemoteSortKey key,
                                   Qt::SortOrder order)
{
    std::vector<Keys> keys;
    keys.reserve(static_cast<size_t>(entries.size()));
    for (RemoteEntry *entry : entries) {
        keys.emplace_back(entry);
    }
    std::stable_sort(keys.begin(), keys.end(), [key, order](const Keys &a, const Keys &b) {
        return isLess(a, b, key, order == Qt::AscendingOrder);
    });
    QList<RemoteEntry *> result;
    result.reserve(entries.size());
    for (const Keys &entryKeys : keys) {
        result.append(entryKeys.entry);
    }
    return result;
}
