// SPDX-License-Identifier: Apache-2.0
#pragma once

#include "instrIO.h"

#include <QAbstractItemModel>
#include <QStringList>
#include <QVariant>

#include <functional>

/// The files of an instrument as an item model with the columns name, size and type. A folder is
/// read when it is first looked into. Without a device, or one without a file system, the model
/// has one row that says so.
///
/// A read blocks for the length of one query and has changed the model when the call that asked for
/// it returns; only a look from within a slot of one of the model's own signals is answered with
/// "Reading..." and served when the event loop comes round. A folder that could not be read says so
/// until it is refreshed.
class RemoteDirModel : public QAbstractItemModel
{
    Q_OBJECT

public:
    enum Column {
        NameColumn,
        SizeColumn,
        TypeColumn,
        ColumnCount,
    };
    enum Role {
        IconNameRole = Qt::UserRole, ///< RemoteEntry::iconName()
    };
    /// Makes the decoration from a RemoteEntry::iconName(), for this model knows no pictures.
    using IconProvider = std::function<QVariant(const QString &iconName)>;

    explicit RemoteDirModel(QObject *parent = nullptr);

    /// Not owned. The caller then refreshes.
    void setDevice(VisaDevice *device) { m_reader.setDevice(device); }
    [[nodiscard]] VisaDevice *device() const { return m_reader.device(); }

    void setIconProvider(IconProvider provider) { m_iconProvider = std::move(provider); }

    /// Wildcards for file names, "*.*" at the start, in effect for folders that are read from now
    /// on.
    void setNameFilters(const QStringList &filters);
    [[nodiscard]] QStringList nameFilters() const { return m_nameFilters; }

    /// The entry behind an index; null for an invalid index, and for the row that stands in for the
    /// top folders.
    [[nodiscard]] static RemoteEntry *entryOf(const QModelIndex &index);
    [[nodiscard]] QModelIndex indexOf(const RemoteEntry *entry, int column = NameColumn) const;

    /// Full paths of all expanded folders, depth first, to be handed to expandPaths() later.
    [[nodiscard]] QStringList expandedPaths() const;
    /// Walks down a path, reads the folders on the way and marks them as expanded. False if the
    /// path is not there.
    bool expandPath(const QString &path);
    /// True if all paths were there.
    bool expandPaths(const QStringList &paths);
    /// Invalid if the path is not there, or its folder was not read yet.
    [[nodiscard]] QModelIndex indexOfPath(const QString &path) const;

    [[nodiscard]] QModelIndex index(int row, int column,
                                    const QModelIndex &parent = {}) const override;
    [[nodiscard]] QModelIndex parent(const QModelIndex &index) const override;
    [[nodiscard]] int rowCount(const QModelIndex &parent = {}) const override;
    [[nodiscard]] int columnCount(const QModelIndex &parent = {}) const override;
    [[nodiscard]] bool canFetchMore(const QModelIndex &parent) const override;
    void fetchMore(const QModelIndex &parent) override;
    [[nodiscard]] QVariant data(const QModelIndex &index,
                                int role = Qt::DisplayRole) const override;
    [[nodiscard]] QVariant headerData(int section, Qt::Orientation orientation,
                                      int role = Qt::DisplayRole) const override;
    [[nodiscard]] Qt::ItemFlags flags(const QModelIndex &index) const override;
    /// Also orders the folders that are read later.
    void sort(int column, Qt::SortOrder order = Qt::AscendingOrder) override;

public slots:
    /// Reads a folder anew, or with an invalid index the whole tree.
    void refresh(const QModelIndex &index = {});
    void slotExpanded(const QModelIndex &index = {});
    void slotCollapsed(const QModelIndex &index = {});
    void slotReadingDone(RemoteEntry *entry);
    void slotReadingFailed(RemoteEntry *entry);

private:
    [[nodiscard]] QVariant entryData(const RemoteEntry &entry, int column, int role) const;
    [[nodiscard]] QList<RemoteEntry *> sorted(const QList<RemoteEntry *> &entries) const;
    void sortChildren(RemoteEntry *entry);
    void removeFirstChildren(RemoteEntry *entry, qsizetype count);
    void look(RemoteEntry *entry);
    void postpone(RemoteEntry *entry);
    void servePostponed();
    void forget(const QList<RemoteEntry *> &entries);
    [[nodiscard]] RemoteEntry *walk(const QString &path,
                                    const std::function<void(RemoteEntry *)> &visit) const;

    instrIO m_reader;
    QList<RemoteEntry *> m_roots;
    QStringList m_nameFilters{"*.*"};
    IconProvider m_iconProvider;
    int m_sortColumn = -1; ///< -1: in the order of the catalogue
    Qt::SortOrder m_sortOrder = Qt::AscendingOrder;
    bool m_isChanging = false;        ///< between the signals before and after a change
    bool m_isInIndex = false;         ///< a read was asked for by index()
    QList<RemoteEntry *> m_postponed; ///< folders to be read, or to lose their placeholder
};
