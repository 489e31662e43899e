// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <QIODevice>
#include <QList>
#include <QString>

#include <optional>

/// A regular file in a tar archive.
struct TarEntry
{
    QString name;        ///< with its folders
    qint64 position = 0; ///< byte of the archive where its content begins
    qint64 size = 0;     ///< bytes, all of which the archive holds
};

/// The regular files of an archive in the forms ustar, GNU and pax. Nothing, with the reason
/// logged, if it is none or is cut off. The device can seek.
[[nodiscard]] std::optional<QList<TarEntry>> tarEntries(QIODevice &archive);
