// SPDX-License-Identifier: Apache-2.0
#include "fetchfile.h"

#include "VisaDevice.h"

#include "log/Tracer.h"

#include <QFile>
#include <QFileInfo>

#include <cerrno>
#include <cstdio>
#include <cstring>

namespace {

/// Makes a new file beside the target, with the permissions of any new file. Empty, with the reason
/// logged, if that fails.
QString makePartFile(const QString &target)
{
    constexpr int maxTries = 100;
    QString reason;
    for (int i = 0; i < maxTries; ++i) {
        QString name = i == 0 ? target + ".part" : QString("%1.part%2").arg(target).arg(i);
        QFile file(name);
        if (file.open(QIODevice::WriteOnly | QIODevice::NewOnly)) {
            return name;
        }
        reason = file.errorString();
        if (!QFileInfo::exists(name)) {
            break;
        }
    }
    Tracer::Trace(Tracer::Error,
                  QString("Cannot create a file beside '%1': %2").arg(target, reason));
    return {};
}

} // namespace

bool fetchRemoteFile(VisaDevice &device, const QString &remotePath, const QString &localPath)
{
    const QFileInfo info(localPath);
    if (localPath.isEmpty() || (info.exists() && !info.isFile())) {
        return device.readRemoteFile(remotePath, localPath);
    }
    // A link stays, what it points to is replaced.
    const QString target = info.exists() ? info.canonicalFilePath() : localPath;
    const QString part = makePartFile(target);
    if (part.isEmpty()) {
        return false;
    }
    bool done = device.readRemoteFile(remotePath, part);
    if (done && info.exists()) {
        QFile::setPermissions(part, info.permissions());
    }
    if (done && std::rename(QFile::encodeName(part).constData(),
                            QFile::encodeName(target).constData()) != 0) {
        done = Tracer::fail(QString("Cannot replace '%1': %2")
                                .arg(target, QString::fromLocal8Bit(std::strerror(errno))));
    }
    if (!done) {
        QFile::remove(part);
    }
    return done;
}
