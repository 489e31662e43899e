// SPDX-License-Identifier: Apache-2.0
// What the context menu does with an entry of either side.
#include "QCustomTreeView.h"

#include "PaneFiles.h"
#include "deviceactions.h"
#include "instrument/VisaDevice.h"
#include "instrument/remotepaths.h"
#include "toolframe/questions.h"

void QCustomTreeView::slot_default()
{
    const QString folder = folderOf(currentPath());
    if (folder.isEmpty()) {
        return;
    }
    if (VisaDevice *instrument = device()) {
        emit remoteDefaultFolderSet(instrument, folder);
    } else {
        emit localDefaultFolderSet(folder);
    }
}

void QCustomTreeView::slot_runwaveform()
{
    const QString path = currentPath();
    if (!isBusy() && isRunnable(path, device())) {
        emit errMsg(runWaveform(this, *device(), path));
        emit generatorChanged();
    }
}

bool QCustomTreeView::acceptsName(const QString &parent, const QString &name,
                                  const QString &forbiddenText)
{
    QString refusal;
    if (name.trimmed().isEmpty()) {
        refusal = "The new folder name cannot be empty.";
    } else if (hasForbiddenCharacter(name)) {
        refusal = forbiddenText;
    } else if (m_files->exists(parent + name)) {
        refusal = "An entry with this name already exists.";
    } else {
        return true;
    }
    emit infoTextAvailable(refusal);
    return false;
}

/// A name that is refused stands again to be corrected.
std::optional<QString> QCustomTreeView::askName(const NameRequest &request, const QString &initial,
                                                qsizetype marked)
{
    auto name = askText(this, request.title, request.label, initial, marked);
    while (name && !acceptsName(request.parent, *name, request.forbiddenText)) {
        name = askText(this, request.title, request.label, *name);
    }
    return name;
}

void QCustomTreeView::slot_create()
{
    const QString parent = folderOf(currentPath());
    if (parent.isEmpty()) {
        return;
    }
    const auto name = askName({"Create folder", QString("\nCreate new folder in\n'%1'").arg(parent),
                               parent, "The new folder name contains invalid characters."},
                              {});
    if (name && m_files->createFolder(parent, *name)) {
        updateAndExpandTree(parent + *name + '/');
        emit errMsg(QString("Folder '%1' created.").arg(*name));
    }
}

void QCustomTreeView::slot_rename()
{
    const QString path = currentPath();
    if (path.isEmpty()) {
        return;
    }
    if (m_files->isRoot(path)) {
        emit infoTextAvailable("Cannot rename root node.");
        return;
    }
    const QString parent = parentFolder(path);
    // The ending mostly stays.
    const qsizetype ending = isFolderPath(path) ? -1 : entryName(path).lastIndexOf('.');
    const auto name =
        askName({"Rename entry", QString("Enter new name for\n'%1'").arg(entryName(path)), parent,
                 "The new entry name contains invalid characters."},
                entryName(path), ending);
    if (name && m_files->rename(path, *name)) {
        updateAndExpandTree(parent + *name);
        emit errMsg(QString("'%1' renamed to '%2'.").arg(entryName(path), *name));
    }
}

void QCustomTreeView::slot_remove()
{
    removeSelected(false);
}

void QCustomTreeView::removeForGood()
{
    removeSelected(true);
}

void QCustomTreeView::removeSelected(bool forGood)
{
    const QStringList paths = selectedPaths();
    for (const QString &path : paths) {
        if (m_files->isRoot(path)) {
            emit infoTextAvailable("Cannot delete root node.");
            return;
        }
    }
    if (paths.isEmpty() || !confirmRemoval(paths)) {
        return;
    }
    const QString next = neighbourOf(paths);
    qsizetype removed = 0;
    while (removed < paths.size() && removeEntry(paths.at(removed), forGood)) {
        ++removed;
    }
    // Also after a failure: what could be removed is gone.
    const bool done = removed == paths.size();
    updateAndExpandTree(done ? next : paths.at(removed));
    if (done) {
        emit errMsg(removed == 1 ? QString("'%1' deleted.").arg(entryName(paths.first()))
                                 : QString("%1 entries deleted.").arg(removed));
    }
}

/// The entry that is to be current when others have gone: the next one in their folder, the one
/// before, or the folder.
QString QCustomTreeView::neighbourOf(const QStringList &paths) const
{
    const QModelIndex last = m_files->indexOf(paths.last());
    for (const int step : {1, -1}) {
        QModelIndex sibling = last.siblingAtRow(last.row() + step);
        while (sibling.isValid() && paths.contains(m_files->pathOf(sibling))) {
            sibling = sibling.siblingAtRow(sibling.row() + step);
        }
        if (sibling.isValid()) {
            return m_files->pathOf(sibling);
        }
    }
    return parentFolder(paths.last());
}

bool QCustomTreeView::confirmRemoval(const QStringList &paths)
{
    const QString &path = paths.first();
    if (paths.size() > 1) {
        constexpr qsizetype MostNames = 10;
        QStringList names;
        for (const QString &one : paths.first(std::min(MostNames, paths.size()))) {
            names.append(entryName(one));
        }
        return askYesNo(this, "Delete Entries",
                        QString("Do you really want to delete these %1 entries and all their "
                                "contents?\n%2%3")
                            .arg(paths.size())
                            .arg(names.join('\n'), paths.size() > MostNames ? "\n..." : ""));
    }
    if (!m_files->isRealFolder(path)) {
        return askYesNo(
            this, "Delete File",
            QString("Do you really want to delete the file\n%1 ?").arg(withoutEndSlash(path)));
    }
    return m_files->isEmptyFolder(path) ||
           askYesNo(this, "Delete Folder", m_files->removeTreeQuestion(path));
}

bool QCustomTreeView::removeEntry(const QString &path, bool forGood)
{
    // What has gone meanwhile fails in the usual words.
    if (!forGood && m_files->hasTrash() && m_files->exists(path)) {
        const QString problem = m_files->moveToTrash(path);
        if (problem.isEmpty()) {
            return true;
        }
        if (!askYesNo(this, "Delete",
                      QString("'%1' cannot be moved to the trash: %2\n"
                              "Do you want to delete it for good?")
                          .arg(entryName(path), problem))) {
            return false;
        }
    }
    if (!m_files->isRealFolder(path)) {
        return m_files->removeFile(path);
    }
    return m_files->isEmptyFolder(path) ? m_files->removeEmptyFolder(path)
                                        : m_files->removeTree(path, this);
}
