// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <QList>
#include <Qt>

class RemoteEntry;

/// What the entries of a folder are ordered by.
enum class RemoteSortKey {
    Name, ///< without regard to case
    Size, ///< of a folder, the number of its children
    Type, ///< as the catalogue tells it; equal ones by name, upwards in both orders
};

/// The same entries in order; equal ones stay as they were. Folders lead in both orders, except by
/// type.
[[nodiscard]] QList<RemoteEntry *> sortedEntries(const QList<RemoteEntry *> &entries,
                                                 RemoteSortKey key, Qt::SortOrder order);
