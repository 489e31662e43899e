// SPDX-License-Identifier: Apache-2.0
#include "PaneFiles.h"

#include "LocalPaneFiles.h"
#include "RemotePaneFiles.h"
#include "instrument/RemoteDirModel.h"

#include <QFileSystemModel>

std::unique_ptr<PaneFiles> PaneFiles::create(QAbstractItemModel *model)
{
    if (auto *local = qobject_cast<QFileSystemModel *>(model)) {
        return std::make_unique<LocalPaneFiles>(local);
    }
    if (auto *remote = qobject_cast<RemoteDirModel *>(model)) {
        return std::make_unique<RemotePaneFiles>(remote);
    }
    return nullptr;
}

void PaneFiles::follow(const QTreeView & /*view*/) {}

QStringList PaneFiles::reload(const QString & /*path*/)
{
    return {};
}

QString PaneFiles::moveToTrash(const QString & /*path*/)
{
    return "There is no trash here.";
}
