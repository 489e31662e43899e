// SPDX-License-Identifier: Apache-2.0
#include "freespace.h"

#include "log/Tracer.h"

#include <QDir>
#include <QFileInfo>
#include <QStorageInfo>

namespace {

bool fits(const QString &folder, const QString &folderText, qint64 bytes)
{
    const QStorageInfo storage(folder);
    return !storage.isValid() || storage.bytesAvailable() >= bytes ||
           Tracer::fail(QString("Not enough space in %1 '%2': %3 bytes are needed, %4 are free.")
                            .arg(folderText, folder)
                            .arg(bytes)
                            .arg(storage.bytesAvailable()));
}

} // namespace

bool hasRoomFor(const QString &path, qint64 bytes)
{
    const QFileInfo info(path);
    // A device or a pipe takes whatever comes.
    if (info.exists() && !info.isFile() && !info.isDir()) {
        return true;
    }
    const QString folder = info.isDir() ? info.absoluteFilePath() : info.absolutePath();
    // Where nothing can be added the file is written in place, over what stands in it.
    const bool inPlace = info.isFile() && !QFileInfo(folder).isWritable();
    return fits(folder, "the folder", inPlace ? bytes - info.size() : bytes);
}

bool hasTemporaryRoomFor(qint64 bytes)
{
    return fits(QDir::tempPath(), "the temporary folder", bytes);
}
