// SPDX-License-Identifier: Apache-2.0
#pragma once

#include "PaneFiles.h"

#include "jobs/instrument/EntryJob.h"

class RemoteDirModel;

/// The operations on the files of an instrument. Each asks the instrument and so blocks for the
/// length of its answer; the model must have a device.
class RemotePaneFiles final : public PaneFiles
{
    Q_OBJECT

public:
    explicit RemotePaneFiles(RemoteDirModel *model);

    /// Whether the tops of the tree are known and, as far as they were read, could be read.
    [[nodiscard]] static bool answers(const RemoteDirModel &model);

    [[nodiscard]] bool isLocal() const override { return false; }
    [[nodiscard]] VisaDevice *device() const override;
    [[nodiscard]] QString settingsName() const override;
    [[nodiscard]] QString pathOf(const QModelIndex &index) const override;
    [[nodiscard]] QModelIndex indexOf(const QString &path) const override;
    [[nodiscard]] qint64 sizeOf(const QModelIndex &index) const override;
    void follow(const QTreeView &view) override;
    QStringList reload(const QString &path) override;
    void setNameFilters(const QStringList &wildcards) override;
    [[nodiscard]] bool exists(const QString &path) const override;
    [[nodiscard]] bool isRoot(const QString &path) const override;
    [[nodiscard]] bool isRealFolder(const QString &path) const override;
    [[nodiscard]] bool isEmptyFolder(const QString &path) const override;
    [[nodiscard]] QString removeTreeQuestion(const QString &path) const override;
    [[nodiscard]] bool createFolder(const QString &parent, const QString &name) override;
    [[nodiscard]] bool rename(const QString &path, const QString &newName) override;
    [[nodiscard]] bool removeFile(const QString &path) override;
    [[nodiscard]] bool removeEmptyFolder(const QString &path) override;
    [[nodiscard]] bool removeTree(const QString &path, QWidget *parent) override;

private:
    /// The path as the instrument writes it.
    [[nodiscard]] QString native(const QString &path) const;

    /// Runs an operation; the words of a failure go out with what the instrument reported.
    [[nodiscard]] bool run(EntryJob::Operation operation, const QString &path,
                           const QString &newName, const QString &words);

    RemoteDirModel *m_model;
};
