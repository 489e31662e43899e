// SPDX-License-Identifier: Apache-2.0
#include "PaneFiles.h"

#include "LocalPaneFiles.h"

#include <QFileSystemModel>

std::unique_ptr<PaneFiles> PaneFiles::create(QAbstractItemModel *model)
{
    if (auto *local = qobject_cast<QFileSystemModel *>(model)) {
        return std::make_unique<LocalPaneFiles>(local);
    }
    return nullptr;
}
