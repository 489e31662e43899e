// SPDX-License-Identifier: Apache-2.0
#include "RemotePaneFiles.h"

#include "instrument/RemoteDirModel.h"
#include "instrument/VisaDevice.h"
#include "instrument/remotepaths.h"
#include "log/Tracer.h"
#include "toolframe/runjob.h"

#include <QTreeView>

#include <algorithm>

namespace {

void logStep(const QString &what, const QString &path)
{
    Tracer::Trace(Tracer::Information, QString("%1 '%2'...").arg(what, entryName(path)));
}

} // namespace

RemotePaneFiles::RemotePaneFiles(RemoteDirModel *model)
    : m_model(model)
{
}

VisaDevice *RemotePaneFiles::device() const
{
    return m_model->device();
}

QString RemotePaneFiles::settingsName() const
{
    return "remote";
}

QString RemotePaneFiles::pathOf(const QModelIndex &index) const
{
    const RemoteEntry *entry = RemoteDirModel::entryOf(index);
    return entry == nullptr || entry->isPlaceholder() ? QString() : entry->fullPath();
}

QModelIndex RemotePaneFiles::indexOf(const QString &path) const
{
    return m_model->indexOfPath(path);
}

qint64 RemotePaneFiles::sizeOf(const QModelIndex &index) const
{
    const RemoteEntry *entry = RemoteDirModel::entryOf(index);
    return entry == nullptr ? 0 : entry->info().size;
}

void RemotePaneFiles::follow(const QTreeView &view)
{
    // Ends with this object, for the view's indexes are of another model from then on.
    connect(&view, &QTreeView::expanded, this,
            [this](const QModelIndex &index) { m_model->slotExpanded(index); });
    connect(&view, &QTreeView::collapsed, this,
            [this](const QModelIndex &index) { m_model->slotCollapsed(index); });
}

bool RemotePaneFiles::answers(const RemoteDirModel &model)
{
    for (int row = 0; row < model.rowCount(); ++row) {
        const RemoteEntry *root = RemoteDirModel::entryOf(model.index(row, 0));
        if (root == nullptr || root->hasReadError()) {
            return false;
        }
    }
    return true;
}

QStringList RemotePaneFiles::reload(const QString &path)
{
    const QStringList wanted = m_model->expandedPaths();
    m_model->refresh();
    QStringList open;
    // One that doesn't answer is not asked for every folder: each would take its time-out.
    for (qsizetype i = 0; i < wanted.size() && answers(*m_model); ++i) {
        if (m_model->expandPath(wanted.at(i))) {
            open.append(wanted.at(i));
        }
    }
    if (open.size() < wanted.size()) {
        Tracer::Trace(Tracer::Information, "Not all paths could be reloaded.");
    }
    const QString folder = folderOf(path);
    if (!open.contains(folder) && answers(*m_model) && m_model->expandPath(folder)) {
        open.append(folder);
    }
    emit folderLoaded(folder);
    return open;
}

void RemotePaneFiles::setNameFilters(const QStringList &wildcards)
{
    m_model->setNameFilters(wildcards);
}

bool RemotePaneFiles::exists(const QString &path) const
{
    const QString name = entryName(path);
    const auto sameCase = device()->isUnixFileSystem() ? Qt::CaseSensitive : Qt::CaseInsensitive;
    QList<RemoteFileEntry> entries;
    // The model may hide the entry behind its filter, so the instrument is asked.
    return device()->listDirectory(entries, native(parentFolder(path))) &&
           std::any_of(entries.cbegin(), entries.cend(), [&](const RemoteFileEntry &entry) {
               return entry.name.compare(name, sameCase) == 0;
           });
}

bool RemotePaneFiles::isRoot(const QString &path) const
{
    const RemoteEntry *entry = RemoteDirModel::entryOf(indexOf(path));
    return entry != nullptr && entry->parent() == nullptr;
}

bool RemotePaneFiles::isRealFolder(const QString &path) const
{
    return isFolderPath(path);
}

bool RemotePaneFiles::isEmptyFolder(const QString &path) const
{
    QList<RemoteFileEntry> entries;
    return device()->listDirectory(entries, native(path)) && entries.isEmpty();
}

QString RemotePaneFiles::removeTreeQuestion(const QString &path) const
{
    return QString("Do you want to delete the folder '%1'\nand all its content?")
        .arg(withoutEndSlash(path));
}

bool RemotePaneFiles::createFolder(const QString &parent, const QString &name)
{
    return run(EntryJob::Operation::MakeFolder, parent + name, {},
               "Creation of the new folder failed.");
}

bool RemotePaneFiles::rename(const QString &path, const QString &newName)
{
    const bool folder = isFolderPath(path);
    logStep(folder ? "Renaming folder" : "Renaming file", path);
    return run(EntryJob::Operation::Rename, path, newName,
               folder ? "Renaming folder failed." : "Renaming file failed.");
}

bool RemotePaneFiles::removeFile(const QString &path)
{
    logStep("Deleting file", path);
    return run(EntryJob::Operation::RemoveFile, path, {}, "Deleting file failed.");
}

bool RemotePaneFiles::removeEmptyFolder(const QString &path)
{
    logStep("Deleting folder", path);
    const QString words = "Deleting folder failed.";
    EntryJob job({.device = device()}, EntryJob::Operation::RemoveFolder, path, {});
    if (job.run() == JobOutcome::Finished) {
        return true;
    }
    Tracer::Trace(Tracer::Error, words);
    // The folder was empty as far as its list tells.
    emit infoTextAvailable(
        QString("%1 %2\nIt may hold files whose names begin with a dot, which the "
                "program doesn't show.")
            .arg(words, job.reported()));
    return false;
}

bool RemotePaneFiles::removeTree(const QString &path, QWidget *parent)
{
    RemoveTreeJob job({.device = device()}, path);
    const JobOutcome outcome = runJob(job, parent, nullptr);
    if (outcome == JobOutcome::Failed) {
        emit infoTextAvailable("An error occured while trying to delete a folder.\n"
                               "Please see the message log for details.");
    }
    return outcome == JobOutcome::Finished;
}

QString RemotePaneFiles::native(const QString &path) const
{
    return nativePath(path, device()->pathSeparator());
}

bool RemotePaneFiles::run(EntryJob::Operation operation, const QString &path,
                          const QString &newName, const QString &words)
{
    EntryJob job({.device = device()}, operation, path, newName);
    if (job.run() == JobOutcome::Finished) {
        return true;
    }
    emit failed(QString("%1 %2").arg(words, job.reported()).simplified());
    return Tracer::fail(words);
}
