// SPDX-License-Identifier: Apache-2.0
#include "files.h"

#include <QDir>
#include <QFile>

bool store(const QString &path, const QByteArray &bytes)
{
    QFile file(path);
    return file.open(QIODevice::WriteOnly) && file.write(bytes) == bytes.size() && file.flush();
}

QByteArray load(const QString &path)
{
    QFile file(path);
    if (!file.open(QIODevice::ReadOnly)) {
        return {};
    }
    const QByteArray bytes = file.readAll();
    return bytes.isNull() ? QByteArray("") : bytes;
}

QString TestFolder::path(const QString &name) const
{
    return m_folder.filePath(name);
}

bool TestFolder::store(const QString &name, const QByteArray &bytes) const
{
    return ::store(path(name), bytes);
}

QByteArray TestFolder::load(const QString &name) const
{
    return ::load(path(name));
}

QStringList TestFolder::entries() const
{
    return QDir(path()).entryList(QDir::AllEntries | QDir::Hidden | QDir::System |
                                  QDir::NoDotAndDotDot);
}
