// SPDX-License-Identifier: Apache-2.0
#pragma once

#include "PaneFiles.h"

class QFileSystemModel;

/// The operations on the local file system.
class LocalPaneFiles final : public PaneFiles
{
    Q_OBJECT

public:
    explicit LocalPaneFiles(QFileSystemModel *model);

    [[nodiscard]] bool isLocal() const override { return true; }
    [[nodiscard]] QString settingsName() const override;
    [[nodiscard]] QString pathOf(const QModelIndex &index) const override;
    [[nodiscard]] QModelIndex indexOf(const QString &path) const override;
    [[nodiscard]] qint64 sizeOf(const QModelIndex &index) const override;
    void setNameFilters(const QStringList &wildcards) override;
    [[nodiscard]] bool exists(const QString &path) const override;
    [[nodiscard]] bool isRoot(const QString &path) const override;
    [[nodiscard]] bool isRealFolder(const QString &path) const override;
    [[nodiscard]] bool isEmptyFolder(const QString &path) const override;
    [[nodiscard]] QString removeTreeQuestion(const QString &path) const override;
    [[nodiscard]] bool createFolder(const QString &parent, const QString &name) override;
    [[nodiscard]] bool rename(const QString &path, const QString &newName) override;
    [[nodiscard]] bool hasTrash() const override { return true; }
    [[nodiscard]] QString moveToTrash(const QString &path) override;
    [[nodiscard]] bool removeFile(const QString &path) override;
    [[nodiscard]] bool removeEmptyFolder(const QString &path) override;
    [[nodiscard]] bool removeTree(const QString &path, QWidget *parent) override;

private:
    /// Logs the words, passes them on with the reason, and returns false.
    bool fail(const QString &words, const QString &path, const QString &reason);

    QFileSystemModel *m_model;
};
