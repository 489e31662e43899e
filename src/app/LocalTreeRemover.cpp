// SPDX-License-Identifier: Apache-2.0
#include "LocalTreeRemover.h"

#include "base/ProgressClock.h"

#include <QFile>
#include <QFileInfo>

#include <cerrno>
#include <cstring>

bool LocalTreeRemover::remove(const QString &folder)
{
    ProgressClock clock([this](int percent) { emit ProgressUpdate(percent); }, m_cancelled);
    return removeContents(folder, clock);
}

void LocalTreeRemover::cancel()
{
    m_cancelled = true;
}

bool LocalTreeRemover::removeContents(const QString &folder, ProgressClock &clock)
{
    const QFileInfoList entries = QDir(folder).entryInfoList(Everything, QDir::Unsorted);
    for (const QFileInfo &entry : entries) {
        if (clock.shouldStop(-1) || m_cancelled) {
            return fail(folder, "Cancelled.");
        }
        const QString path = entry.filePath();
        if (entry.isDir() && !entry.isSymLink()) {
            if (!removeContents(path, clock)) {
                return false;
            }
        } else if (QFile file(path); !file.remove()) {
            return fail(path, file.errorString());
        }
    }
    errno = 0;
    return QDir().rmdir(folder) || fail(folder, QString::fromLocal8Bit(std::strerror(errno)));
}

bool LocalTreeRemover::fail(const QString &path, const QString &reason)
{
    m_failedPath = path;
    m_reason = reason;
    return false;
}
