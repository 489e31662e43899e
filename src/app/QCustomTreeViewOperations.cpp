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

void QCustomTreeView::slot_create()
{
    const QString parent = folderOf(currentPath());
    if (parent.isEmpty()) {
        return;
    }
    const auto name =
        askText(this, "Create folder", QString("\nCreate new folder in\n'%1'").arg(parent), {});
    if (name && acceptsName(parent, *name, "The new folder name contains invalid characters.") &&
        m_files->createFolder(parent, *name)) {
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
    const auto name =
        askText(this, "Rename entry", QString("Enter new name for\n'%1'").arg(entryName(path)),
                entryName(path));
    if (name && acceptsName(parent, *name, "The new entry name contains invalid characters.") &&
        m_files->rename(path, *name)) {
        updateAndExpandTree(parent + *name);
        emit errMsg(QString("'%1' renamed to '%2'.").arg(entryName(path), *name));
    }
}

void QCustomTreeView::slot_remove()
{
    const QString path = currentPath();
    if (path.isEmpty()) {
        return;
    }
    if (m_files->isRoot(path)) {
        emit infoTextAvailable("Cannot delete root node.");
        return;
    }
    bool done = false;
    if (!m_files->isRealFolder(path)) {
        if (!askYesNo(this, "Delete File",
                      QString("Do you really want to delete the file\n%1 ?")
                          .arg(withoutEndSlash(path)))) {
            return;
        }
        done = m_files->removeFile(path);
    } else if (m_files->isEmptyFolder(path)) {
        done = m_files->removeEmptyFolder(path);
    } else {
        if (!askYesNo(this, "Delete Folder", m_files->removeTreeQuestion(path))) {
            return;
        }
        done = m_files->removeTree(path, this);
    }
    // Also after a failure: what could be removed is gone.
    updateAndExpandTree(parentFolder(path));
    if (done) {
        emit errMsg(QString("'%1' deleted.").arg(entryName(path)));
    }
}
