// SPDX-License-Identifier: Apache-2.0
#include "RemoteDirModel.h"

#include "VisaDevice.h"
#include "remoteorder.h"

#include <QHash>
#include <QScopedValueRollback>

#include <algorithm>
#include <utility>

namespace {

/// Six significant digits, what stands behind the third decimal cut off.
QString cutNumber(double value)
{
    QString text = QString::number(value, 'g', 6);
    const qsizetype point = text.indexOf('.');
    return point < 0 ? text : text.left(point + 4);
}

QString sizeText(qint64 bytes)
{
    constexpr qint64 Kilobyte = 1024;
    constexpr qint64 Megabyte = Kilobyte * Kilobyte;
    if (bytes < Kilobyte) {
        return QString("%1 bytes").arg(bytes);
    }
    const auto size = static_cast<double>(bytes);
    return bytes < Megabyte ? cutNumber(size / Kilobyte) + " KB"
                            : cutNumber(size / Megabyte) + " MB";
}

QString typeText(const QString &owner)
{
    static const QHash<QString, QString> texts{{"DIR", "File Folder"},
                                               {"ASC", "Text File"},
                                               {"BIN", "Binary File"},
                                               {"SET", "Settings File"},
                                               {"ROOT", "Drive"}};
    return texts.value(owner, owner);
}

bool isSamePath(const QString &path, const RemoteEntry &entry)
{
    const QString full = entry.fullPath();
    return path == full || (entry.info().isDirectory && path + '/' == full);
}

bool leadsTo(const RemoteEntry &entry, const QString &path)
{
    return isSamePath(path, entry) ||
           (entry.info().isDirectory && path.startsWith(entry.fullPath()));
}

void collectExpanded(const RemoteEntry &entry, QStringList &paths)
{
    if (!entry.isExpanded()) {
        return;
    }
    paths.append(entry.fullPath());
    for (const RemoteEntry *child : entry.children()) {
        collectExpanded(*child, paths);
    }
}

} // namespace

RemoteDirModel::RemoteDirModel(QObject *parent)
    : QAbstractItemModel(parent)
{
    connect(&m_reader, &instrIO::readingDone, this, &RemoteDirModel::slotReadingDone);
    connect(&m_reader, &instrIO::readingFailed, this, &RemoteDirModel::slotReadingFailed);
}

void RemoteDirModel::setNameFilters(const QStringList &filters)
{
    m_nameFilters = filters;
    m_reader.setNameFilters(filters);
}

RemoteEntry *RemoteDirModel::entryOf(const QModelIndex &index)
{
    return index.isValid() ? static_cast<RemoteEntry *>(index.internalPointer()) : nullptr;
}

QModelIndex RemoteDirModel::indexOf(const RemoteEntry *entry, int column) const
{
    if (entry == nullptr) {
        return {};
    }
    const RemoteEntry *top = entry;
    while (top->parent() != nullptr) {
        top = top->parent();
    }
    const auto found = std::find(m_roots.cbegin(), m_roots.cend(), top);
    if (found == m_roots.cend()) {
        return {};
    }
    const int row = entry == top ? static_cast<int>(found - m_roots.cbegin()) : entry->row();
    return createIndex(row, column, const_cast<RemoteEntry *>(entry));
}

QModelIndex RemoteDirModel::index(int row, int column, const QModelIndex &parent) const
{
    if (row < 0 || column < 0 || column >= columnCount(parent) || parent.column() > 0) {
        return {};
    }
    if (!parent.isValid()) {
        if (m_roots.isEmpty()) {
            return row == 0 ? createIndex(0, column, nullptr) : QModelIndex();
        }
        return row < m_roots.size() ? createIndex(row, column, m_roots.at(row)) : QModelIndex();
    }
    RemoteEntry *entry = entryOf(parent);
    if (entry == nullptr) {
        return {};
    }
    if (canFetchMore(parent)) {
        // A view looks into a folder by asking for what is in it.
        auto *self = const_cast<RemoteDirModel *>(this);
        const QScopedValueRollback guard(self->m_isInIndex, true);
        self->look(entry);
    }
    return row < entry->children().size() ? createIndex(row, column, entry->children().at(row))
                                          : QModelIndex();
}

QModelIndex RemoteDirModel::parent(const QModelIndex &index) const
{
    const RemoteEntry *entry = entryOf(index);
    return entry == nullptr ? QModelIndex() : indexOf(entry->parent());
}

int RemoteDirModel::rowCount(const QModelIndex &parent) const
{
    if (!parent.isValid()) {
        return std::max(1, static_cast<int>(m_roots.size()));
    }
    const RemoteEntry *entry = entryOf(parent);
    return entry == nullptr || parent.column() > 0 ? 0 : static_cast<int>(entry->children().size());
}

int RemoteDirModel::columnCount(const QModelIndex & /*parent*/) const
{
    return m_roots.isEmpty() ? 1 : ColumnCount;
}

bool RemoteDirModel::canFetchMore(const QModelIndex &parent) const
{
    const RemoteEntry *entry = parent.column() > 0 ? nullptr : entryOf(parent);
    return entry != nullptr && !entry->isRead() && !entry->isReading() && !entry->hasReadError();
}

void RemoteDirModel::fetchMore(const QModelIndex &parent)
{
    if (canFetchMore(parent)) {
        look(entryOf(parent));
    }
}

void RemoteDirModel::look(RemoteEntry *entry)
{
    if (m_isChanging) {
        postpone(entry);
    } else {
        m_reader.read(entry);
    }
}

QVariant RemoteDirModel::data(const QModelIndex &index, int role) const
{
    if (!index.isValid()) {
        return {};
    }
    const bool isText = role == Qt::DisplayRole && index.column() == NameColumn;
    const RemoteEntry *entry = entryOf(index);
    if (entry == nullptr) {
        return isText ? QString(m_reader.rootsRead() ? "failed reading %1" : "no data for %1...")
                            .arg(m_reader.url().toString())
                      : QVariant();
    }
    if (entry->isPlaceholder()) {
        return isText ? QVariant(entry->parent()->hasReadError() ? "Read Error" : "Reading...")
                      : QVariant();
    }
    return entryData(*entry, index.column(), role);
}

QVariant RemoteDirModel::entryData(const RemoteEntry &entry, int column, int role) const
{
    constexpr int RightAligned = Qt::AlignRight | Qt::AlignVCenter;
    if (column == NameColumn) {
        switch (role) {
        case Qt::DisplayRole:
            return entry.info().name;
        case Qt::DecorationRole:
            return m_iconProvider ? m_iconProvider(entry.iconName()) : QVariant();
        case Qt::ToolTipRole:
            return entry.fullPath();
        case IconNameRole:
            return entry.iconName();
        default:
            return {};
        }
    }
    if (column == SizeColumn && role == Qt::TextAlignmentRole) {
        return RightAligned;
    }
    if (role != Qt::DisplayRole) {
        return {};
    }
    if (column == TypeColumn) {
        return typeText(entry.info().owner);
    }
    if (entry.hasReadError()) {
        return "Read Error";
    }
    return entry.info().isDirectory ? QVariant() : sizeText(entry.info().size);
}

QVariant RemoteDirModel::headerData(int section, Qt::Orientation orientation, int role) const
{
    static const QStringList titles{"Name", "Size", "Type"};
    if (orientation != Qt::Horizontal || role != Qt::DisplayRole) {
        return {};
    }
    return m_roots.isEmpty() ? QString() : titles.value(section);
}

Qt::ItemFlags RemoteDirModel::flags(const QModelIndex &index) const
{
    if (!index.isValid()) {
        return Qt::NoItemFlags;
    }
    const RemoteEntry *entry = entryOf(index);
    const bool isReal = entry != nullptr && !entry->isPlaceholder();
    return isReal ? Qt::ItemIsSelectable | Qt::ItemIsEnabled : Qt::ItemFlags(Qt::ItemIsEnabled);
}

QList<RemoteEntry *> RemoteDirModel::sorted(const QList<RemoteEntry *> &entries) const
{
    switch (m_sortColumn) {
    case -1:
        return entries;
    case SizeColumn:
        return sortedEntries(entries, RemoteSortKey::Size, m_sortOrder);
    case TypeColumn:
        return sortedEntries(entries, RemoteSortKey::Type, m_sortOrder);
    default:
        return sortedEntries(entries, RemoteSortKey::Name, m_sortOrder);
    }
}

void RemoteDirModel::sortChildren(RemoteEntry *entry)
{
    entry->reorderChildren(sorted(entry->children()));
    for (RemoteEntry *child : entry->children()) {
        if (child->info().isDirectory) {
            sortChildren(child);
        }
    }
}

void RemoteDirModel::sort(int column, Qt::SortOrder order)
{
    m_sortColumn = column;
    m_sortOrder = order;
    const QScopedValueRollback guard(m_isChanging, true);
    emit layoutAboutToBeChanged({}, QAbstractItemModel::VerticalSortHint);
    const QModelIndexList before = persistentIndexList();
    if (column >= 0) {
        for (RemoteEntry *root : std::as_const(m_roots)) {
            sortChildren(root);
        }
    }
    QModelIndexList after;
    after.reserve(before.size());
    for (const QModelIndex &index : before) {
        const RemoteEntry *entry = entryOf(index);
        after.append(entry == nullptr ? index : indexOf(entry, index.column()));
    }
    changePersistentIndexList(before, after);
    emit layoutChanged({}, QAbstractItemModel::VerticalSortHint);
}

void RemoteDirModel::refresh(const QModelIndex &index)
{
    if (!index.isValid()) {
        const QScopedValueRollback guard(m_isChanging, true);
        beginResetModel();
        m_roots.clear();
        m_postponed.clear();
        m_reader.refresh();
        endResetModel();
        return;
    }
    RemoteEntry *entry = entryOf(index);
    if (entry == nullptr || !entry->info().isDirectory || entry->isReading()) {
        return;
    }
    entry->setRead(false);
    entry->setReadError(false);
    m_reader.read(entry);
}

void RemoteDirModel::slotExpanded(const QModelIndex &index)
{
    RemoteEntry *entry = entryOf(index);
    if (entry != nullptr && !entry->isPlaceholder()) {
        entry->setExpanded(true);
    }
}

void RemoteDirModel::slotCollapsed(const QModelIndex &index)
{
    RemoteEntry *entry = entryOf(index);
    if (entry != nullptr && !entry->isPlaceholder()) {
        entry->setExpanded(false);
    }
}

void RemoteDirModel::slotReadingDone(RemoteEntry *entry)
{
    if (entry == nullptr) {
        // The views are told by refresh(), which alone makes the reader do this.
        m_roots = m_reader.roots();
        return;
    }
    const QModelIndex folder = indexOf(entry);
    const qsizetype oldCount = entry->children().size();
    const QList<RemoteEntry *> found = sorted(entry->staged());
    // The new ones come before the old ones go, so that an expanded folder is never empty between.
    if (!found.isEmpty()) {
        const QScopedValueRollback guard(m_isChanging, true);
        beginInsertRows(folder, static_cast<int>(oldCount),
                        static_cast<int>(oldCount + found.size()) - 1);
        entry->publishStaged(found);
        endInsertRows();
    } else if (m_isInIndex) {
        // Whoever looks into the folder has counted the placeholder and asks for its index.
        postpone(entry);
        return;
    }
    removeFirstChildren(entry, oldCount);
    emit dataChanged(folder, indexOf(entry, TypeColumn));
}

void RemoteDirModel::removeFirstChildren(RemoteEntry *entry, qsizetype count)
{
    if (count == 0) {
        return;
    }
    const QScopedValueRollback guard(m_isChanging, true);
    beginRemoveRows(indexOf(entry), 0, static_cast<int>(count) - 1);
    const QList<RemoteEntry *> gone = entry->takeFirstChildren(count);
    endRemoveRows();
    forget(gone);
    qDeleteAll(gone);
}

void RemoteDirModel::forget(const QList<RemoteEntry *> &entries)
{
    m_postponed.removeIf([&entries](RemoteEntry *folder) {
        RemoteEntry *entry = folder;
        while (entry != nullptr && !entries.contains(entry)) {
            entry = entry->parent();
        }
        return entry != nullptr;
    });
}

void RemoteDirModel::postpone(RemoteEntry *entry)
{
    if (m_postponed.isEmpty()) {
        QMetaObject::invokeMethod(this, &RemoteDirModel::servePostponed, Qt::QueuedConnection);
    }
    if (!m_postponed.contains(entry)) {
        m_postponed.append(entry);
    }
}

void RemoteDirModel::servePostponed()
{
    // Serving one may bring more, and make others vanish.
    for (qsizetype count = m_postponed.size(); count > 0 && !m_postponed.isEmpty(); --count) {
        RemoteEntry *folder = m_postponed.takeFirst();
        if (!folder->isRead()) {
            m_reader.read(folder);
        } else if (!folder->children().isEmpty() && folder->children().first()->isPlaceholder()) {
            removeFirstChildren(folder, 1);
        }
    }
    if (!m_postponed.isEmpty()) {
        QMetaObject::invokeMethod(this, &RemoteDirModel::servePostponed, Qt::QueuedConnection);
    }
}

void RemoteDirModel::slotReadingFailed(RemoteEntry *entry)
{
    const QModelIndex folder = indexOf(entry);
    if (!folder.isValid()) {
        return;
    }
    emit dataChanged(folder, indexOf(entry, TypeColumn));
    if (!entry->children().isEmpty()) {
        const QModelIndex placeholder = indexOf(entry->children().first());
        emit dataChanged(placeholder, placeholder);
    }
}

QStringList RemoteDirModel::expandedPaths() const
{
    QStringList paths;
    for (const RemoteEntry *root : m_roots) {
        collectExpanded(*root, paths);
    }
    return paths;
}

RemoteEntry *RemoteDirModel::walk(const QString &path,
                                  const std::function<void(RemoteEntry *)> &visit) const
{
    const QList<RemoteEntry *> *level = &m_roots;
    for (;;) {
        const auto found =
            std::find_if(level->cbegin(), level->cend(), [&path](const RemoteEntry *entry) {
                return !entry->isPlaceholder() && leadsTo(*entry, path);
            });
        if (found == level->cend()) {
            return nullptr;
        }
        RemoteEntry *entry = *found;
        if (visit) {
            visit(entry);
        }
        if (isSamePath(path, *entry)) {
            return entry;
        }
        level = &entry->children();
    }
}

bool RemoteDirModel::expandPath(const QString &path)
{
    bool allRead = true;
    const auto expand = [this, &allRead](RemoteEntry *entry) {
        if (entry->info().isDirectory) {
            m_reader.read(entry);
            allRead = allRead && entry->isRead();
            entry->setExpanded(entry->isRead());
        }
    };
    return walk(path, expand) != nullptr && allRead;
}

bool RemoteDirModel::expandPaths(const QStringList &paths)
{
    bool allFound = true;
    for (const QString &path : paths) {
        allFound = expandPath(path) && allFound;
    }
    return allFound;
}

QModelIndex RemoteDirModel::indexOfPath(const QString &path) const
{
    return indexOf(walk(path, nullptr));
}
