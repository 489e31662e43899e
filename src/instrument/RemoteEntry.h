// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <QList>
#include <QString>

#include <memory>

/// What is known of a file or folder on an instrument.
struct RemoteEntryInfo
{
    QString name;
    qint64 size = 0; ///< bytes
    bool isDirectory = false;
    bool isFile = false;
    QString owner; ///< "ROOT" for a top folder, else the type in the catalogue

    [[nodiscard]] bool isValid() const { return isDirectory || isFile; }
};

/// A file or folder in the tree of an instrument: a handle to shared data, so a copy is the same
/// entry. The tree holds pointers to entries; an entry owns its children. Whoever keeps a copy
/// must not outlive the tree's own handle of the parent.
///
/// A folder that was not read has a placeholder for its single child.
class RemoteEntry
{
public:
    /// A placeholder below `parent`.
    explicit RemoteEntry(RemoteEntry *parent);
    RemoteEntry(const RemoteEntryInfo &info, RemoteEntry *parent);

    [[nodiscard]] bool isPlaceholder() const { return !info().isValid(); }
    [[nodiscard]] const RemoteEntryInfo &info() const;
    [[nodiscard]] RemoteEntry *parent() const; ///< null for a top folder
    [[nodiscard]] const QList<RemoteEntry *> &children() const;

    /// Its place among the children of the parent; of no meaning for a top folder.
    [[nodiscard]] int row() const;

    /// The names from the top down with "/" between; a folder's path ends in "/".
    [[nodiscard]] QString fullPath() const;

    /// Name of its picture: "drive", "folder", "file_waveform", "file_binary", "file_ascii" or
    /// "file_settings"; empty for a placeholder.
    [[nodiscard]] QString iconName() const;

    [[nodiscard]] bool isRead() const; ///< the children are known; true for files
    void setRead(bool read);
    [[nodiscard]] bool isReading() const;
    void setReading(bool reading);
    [[nodiscard]] bool hasReadError() const; ///< the last read failed
    void setReadError(bool failed);
    [[nodiscard]] bool isExpanded() const; ///< in the view
    void setExpanded(bool expanded);

    /// What was just read waits here until publishStaged(), so that a model can tell its views
    /// before and after the change.
    void stage(std::unique_ptr<RemoteEntry> child);
    [[nodiscard]] const QList<RemoteEntry *> &staged() const;
    /// Appends what waits to the children, in the given order of the same entries.
    void publishStaged(const QList<RemoteEntry *> &order);
    /// Takes the first children away; the caller deletes them.
    [[nodiscard]] QList<RemoteEntry *> takeFirstChildren(qsizetype count);
    /// Puts the children into another order.
    void reorderChildren(const QList<RemoteEntry *> &order);

private:
    struct Data;
    std::shared_ptr<Data> m_data;
};
