// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <QModelIndex>
#include <QObject>
#include <QString>
#include <QStringList>

#include <memory>

class QAbstractItemModel;
class QTreeView;
class QWidget;
class VisaDevice;

/// The entries that a pane shows and the operations on them: the one place where the sides differ
/// on which a pane can stand. The view asks and confirms, this does.
///
/// Paths use "/", and a folder's path ends in it. An operation logs what it does and, when it
/// fails, its words; the reason that the system gave goes out by failed().
class PaneFiles : public QObject
{
    Q_OBJECT

public:
    /// The operations that belong to the class of a model, which isn't owned and must live longer;
    /// null for a null model or one of another class.
    [[nodiscard]] static std::unique_ptr<PaneFiles> create(QAbstractItemModel *model);

    /// Whether the entries lie on the local file system.
    [[nodiscard]] virtual bool isLocal() const = 0;

    /// The instrument that holds the entries; null for the local file system.
    [[nodiscard]] virtual VisaDevice *device() const { return nullptr; }

    /// Name of this side in the keys of the settings, one of those that ColumnWidths knows.
    [[nodiscard]] virtual QString settingsName() const = 0;

    /// Path of an entry of the model; empty for an invalid index.
    [[nodiscard]] virtual QString pathOf(const QModelIndex &index) const = 0;

    /// The entry of a path, with or without a slash at its end; invalid if there is none.
    [[nodiscard]] virtual QModelIndex indexOf(const QString &path) const = 0;

    /// Size of a file in bytes as the model knows it.
    [[nodiscard]] virtual qint64 sizeOf(const QModelIndex &index) const = 0;

    /// Tells a model that keeps it which folders are open in a view, from now on.
    virtual void follow(const QTreeView &view);

    /// Reads a model anew that doesn't follow its side by itself: the folders that were open and
    /// those on the way to `path`. Gives the paths of those that a view is to open again.
    virtual QStringList reload(const QString &path);

    /// Shows only the files whose names match one of these wildcards; an empty list shows all.
    virtual void setNameFilters(const QStringList &wildcards) = 0;

    /// Whether anything has this path, shown or not.
    [[nodiscard]] virtual bool exists(const QString &path) const = 0;

    /// Whether a path is the top of a tree.
    [[nodiscard]] virtual bool isRoot(const QString &path) const = 0;

    /// Whether the entry is to be removed with its contents: a folder, but not a link to one.
    [[nodiscard]] virtual bool isRealFolder(const QString &path) const = 0;

    [[nodiscard]] virtual bool isEmptyFolder(const QString &path) const = 0;

    /// The question before removeTree.
    [[nodiscard]] virtual QString removeTreeQuestion(const QString &path) const = 0;

    [[nodiscard]] virtual bool createFolder(const QString &parent, const QString &name) = 0;

    /// Renames within the folder; never replaces another entry.
    [[nodiscard]] virtual bool rename(const QString &path, const QString &newName) = 0;

    /// Whether entries can be moved to a trash from where they can be fetched back.
    [[nodiscard]] virtual bool hasTrash() const { return false; }

    /// Moves an entry to the trash, a folder with its contents; the reason if that fails.
    [[nodiscard]] virtual QString moveToTrash(const QString &path);

    /// Removes a file or a link.
    [[nodiscard]] virtual bool removeFile(const QString &path) = 0;

    [[nodiscard]] virtual bool removeEmptyFolder(const QString &path) = 0;

    /// Removes a folder and what it holds, behind a progress dialog over `parent`. Stops at the
    /// first failure and when the user cancels; what was removed by then is gone.
    [[nodiscard]] virtual bool removeTree(const QString &path, QWidget *parent) = 0;

signals:
    /// All entries of a folder are known to the model now.
    void folderLoaded(const QString &path);

    /// A failed operation, with its reason, for the status bar.
    void failed(const QString &text);

    /// A text that the user must acknowledge.
    void infoTextAvailable(const QString &text);

protected:
    using QObject::QObject;
};
