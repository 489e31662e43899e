// SPDX-License-Identifier: Apache-2.0
#include "LocalPaneFiles.h"

#include "LocalTreeRemover.h"
#include "instrument/remotepaths.h"
#include "log/Tracer.h"
#include "toolframe/runjob.h"

#include <QDir>
#include <QFile>
#include <QFileInfo>
#include <QFileSystemModel>
#include <QStandardPaths>

#include <cerrno>
#include <cstring>

namespace {

/// The reason of the last failed system call; 0 gives no text.
QString systemReason(int number)
{
    return number == 0 ? QString() : QString::fromLocal8Bit(std::strerror(number));
}

void logStep(const QString &what, const QString &path)
{
    Tracer::Trace(Tracer::Information, QString("%1 '%2'...").arg(what, entryName(path)));
}

} // namespace

LocalPaneFiles::LocalPaneFiles(QFileSystemModel *model)
    : m_model(model)
{
    connect(model, &QFileSystemModel::directoryLoaded, this, &PaneFiles::folderLoaded);
}

QString LocalPaneFiles::settingsName() const
{
    return "local";
}

QString LocalPaneFiles::pathOf(const QModelIndex &index) const
{
    if (!index.isValid()) {
        return {};
    }
    const QString path = m_model->filePath(index);
    return m_model->isDir(index) && !isFolderPath(path) ? path + '/' : path;
}

QModelIndex LocalPaneFiles::indexOf(const QString &path) const
{
    return path.isEmpty() ? QModelIndex() : m_model->index(withoutEndSlash(path));
}

qint64 LocalPaneFiles::sizeOf(const QModelIndex &index) const
{
    return m_model->size(index);
}

void LocalPaneFiles::setNameFilters(const QStringList &wildcards)
{
    m_model->setNameFilters(wildcards);
    m_model->setNameFilterDisables(false);
}

bool LocalPaneFiles::exists(const QString &path) const
{
    const QFileInfo info(withoutEndSlash(path));
    return info.exists() || info.isSymLink();
}

bool LocalPaneFiles::isRoot(const QString &path) const
{
    return QDir(path).isRoot();
}

bool LocalPaneFiles::isRealFolder(const QString &path) const
{
    const QFileInfo info(withoutEndSlash(path));
    return info.isDir() && !info.isSymLink();
}

bool LocalPaneFiles::isEmptyFolder(const QString &path) const
{
    return QDir(path).isEmpty(LocalTreeRemover::Everything);
}

QString LocalPaneFiles::removeTreeQuestion(const QString &path) const
{
    return QString("The selected folder %1 is not empty.\n"
                   "Do you really want to delete this folder and all its contents?")
        .arg(withoutEndSlash(path));
}

bool LocalPaneFiles::createFolder(const QString &parent, const QString &name)
{
    logStep("Creating folder", name);
    errno = 0;
    return QDir(parent).mkdir(name) ||
           fail("Creation of the new folder failed.", parent + name, systemReason(errno));
}

bool LocalPaneFiles::rename(const QString &path, const QString &newName)
{
    const bool folder = isFolderPath(path);
    logStep(folder ? "Renaming folder" : "Renaming file", path);
    const QString words = folder ? "Renaming folder failed." : "Renaming file failed.";
    const QString target = parentFolder(path) + newName;
    if (exists(target)) {
        return fail(words, target, "The name is taken.");
    }
    QFile file(withoutEndSlash(path));
    return file.rename(target) || fail(words, path, file.errorString());
}

QString LocalPaneFiles::moveToTrash(const QString &path)
{
    logStep(!isRealFolder(path)   ? "Deleting file"
            : isEmptyFolder(path) ? "Deleting folder"
                                  : "Deleting folder structure",
            path);
    // Without the folder of the trash the toolkit takes the working folder for one.
    if (!QDir().mkpath(QStandardPaths::writableLocation(QStandardPaths::GenericDataLocation))) {
        return "There is no folder for it.";
    }
    QFile file(withoutEndSlash(path));
    if (file.moveToTrash()) {
        return {};
    }
    return file.errorString().isEmpty() ? QString("The system refuses.") : file.errorString();
}

bool LocalPaneFiles::removeFile(const QString &path)
{
    logStep("Deleting file", path);
    QFile file(withoutEndSlash(path));
    return file.remove() || fail("Deleting file failed.", path, file.errorString());
}

bool LocalPaneFiles::removeEmptyFolder(const QString &path)
{
    logStep("Deleting folder", path);
    errno = 0;
    return QDir().rmdir(withoutEndSlash(path)) ||
           fail("Deleting folder failed.", path, systemReason(errno));
}

bool LocalPaneFiles::removeTree(const QString &path, QWidget *parent)
{
    logStep("Deleting folder structure", path);
    LocalTreeRemover remover(withoutEndSlash(path));
    return runJob(remover, parent, nullptr) == JobOutcome::Finished ||
           fail("Deleting folder structure failed.", remover.failedPath(), remover.reason());
}

bool LocalPaneFiles::fail(const QString &words, const QString &path, const QString &reason)
{
    emit failed(QString("%1 %2: %3").arg(words, withoutEndSlash(path), reason).simplified());
    return Tracer::fail(words);
}
