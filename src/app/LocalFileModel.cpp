// SPDX-License-Identifier: Apache-2.0
#include "LocalFileModel.h"

#include <QDateTime>
#include <QFileInfo>
#include <QLocale>

namespace {

constexpr int SizeColumn = 1;
constexpr int DateColumn = 3;

} // namespace

LocalFileModel::LocalFileModel(QAbstractFileIconProvider *icons)
{
    setIconProvider(icons);
    setRootPath({});
    setFilter(QDir::Files | QDir::Drives | QDir::AllDirs | QDir::NoSymLinks | QDir::NoDotAndDotDot);
}

QVariant LocalFileModel::data(const QModelIndex &index, int role) const
{
    // The base class watches folders, not the files that grow in them: the shown rows ask anew.
    if (index.column() == SizeColumn && !isDir(index)) {
        const qint64 bytes = QFileInfo(filePath(index)).size();
        if (role == Qt::DisplayRole) {
            return shortSize(bytes);
        }
        if (role == Qt::ToolTipRole) {
            return QString("%1 bytes").arg(QLocale().toString(bytes));
        }
    }
    if (index.column() == DateColumn && role == Qt::DisplayRole) {
        return QLocale::system().toString(QFileInfo(filePath(index)).lastModified(),
                                          QLocale::ShortFormat);
    }
    return QFileSystemModel::data(index, role);
}

QString shortSize(qint64 bytes)
{
    static const QString units = "BKMGTPE";
    auto value = static_cast<double>(bytes);
    qsizetype unit = 0;
    // 999.5 would be shown with four digits.
    while (value >= 999.5 && unit + 1 < units.size()) {
        value /= 1024;
        ++unit;
    }
    const int decimals = unit == 0 || value >= 99.95 ? 0 : value >= 9.995 ? 1 : 2;
    return QString("%1 %2").arg(value, 0, 'f', decimals).arg(units.at(unit));
}
