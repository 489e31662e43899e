// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <QFileSystemModel>

class QAbstractFileIconProvider;

/// The local file system as a pane shows it: from all drives down, files and folders, no links.
/// Sizes are written short, so that the narrow column holds them; the tool tip has all digits.
class LocalFileModel : public QFileSystemModel
{
    Q_OBJECT

public:
    /// The provider isn't owned and must live longer.
    explicit LocalFileModel(QAbstractFileIconProvider *icons);

    [[nodiscard]] QVariant data(const QModelIndex &index, int role) const override;
};

/// A size in three digits: "512 B", "93.9 K", "1.21 G", in
/// powers of 1024.
[[nodiscard]] QString shortSize(qint64 bytes);
