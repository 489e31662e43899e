// SPDX-License-Identifier: Apache-2.0
#include "LocalTreeRemover.h"

#include "base/ProgressClock.h"

#include <QFile>
#include <QFileInfo>

#include <cerrno>
#include <cstring>
#include <utility>

LocalTreeRemover::LocalTreeRemover(QString folder, QObject *parent)
    : ToolJob(parent)
    , m_folder(std::move(folder))
{
}

bool LocalTreeRemover::work()
{
    emit stepStarted("Deleting Files...");
    // Nobody has counted the entries, so that there is no progress to tell.
    ProgressClock clock([this](int percent) { emit ProgressUpdate(percent); }, cancelFlag());
    return removeContents(m_folder, clock);
}

bool LocalTreeRemover::removeContents(const QString &folder, ProgressClock &clock)
{
    const QFileInfoList entries = QDir(folder).entryInfoList(Everything, QDir::Unsorted);
    for (const QFileInfo &entry : entries) {
        if (clock.shouldStop(-1) || isCancelled()) {
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
