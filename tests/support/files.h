// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <QByteArray>
#include <QString>
#include <QStringList>
#include <QTemporaryDir>

/// Makes a file with these bytes, or fills it anew. False where that fails.
[[nodiscard]] bool store(const QString &path, const QByteArray &bytes);

/// What a file holds; null if it can't be read, also where an empty file isn't.
[[nodiscard]] QByteArray load(const QString &path);

/// A folder that vanishes with the object and all that it holds.
class TestFolder
{
public:
    [[nodiscard]] QString path(const QString &name = {}) const;
    [[nodiscard]] bool store(const QString &name, const QByteArray &bytes) const;
    [[nodiscard]] QByteArray load(const QString &name) const;

    /// Names of all entries, hidden ones too, sorted.
    [[nodiscard]] QStringList entries() const;

private:
    QTemporaryDir m_folder;
};
