// SPDX-License-Identifier: Apache-2.0
// Files and folders of the instrument.
#include "VisaDevice.h"

#include "CancelScope.h"
#include "VisaLibrary.h"
#include "remotepaths.h"

#include "log/Tracer.h"

#include <QCoreApplication>

#include <algorithm>

namespace {

/// No real folder lies deeper; an instrument that lists a folder in itself ends here.
constexpr int maxDepth = 64;

bool tooDeep(const QString &directory)
{
    return Tracer::fail(QString("The directory '%1' is nested deeper than the %2 levels that are "
                                "walked.")
                            .arg(directory)
                            .arg(maxDepth));
}

/// A path must name more than a root, and with an empty name a folder would turn into its parent.
bool isUsable(const QString &path, const QString &name, const char *reason)
{
    const bool isNamed = std::any_of(name.cbegin(), name.cend(), [](QChar character) {
        return character != '/' && character != '\\' && character != '\'';
    });
    return (isNamed && path.size() >= 2) || Tracer::fail(reason);
}

const char *const emptyDirectory = "Directory path cannot be empty.";

} // namespace

bool VisaDevice::queryCatalogue(QList<RemoteFileEntry> &entries, const QString &path)
{
    entries.clear();
    // Only what this query is answered counts below.
    const QString earlierErrors = takeLastError();
    QString answer;
    const bool answered = queryText(":MMEM:CAT? '" + path + "'", answer);
    // An error number that ends so tells of an empty or missing directory.
    const bool isEmpty = !answered && m_errorText.contains("469");
    m_errorText = isEmpty ? earlierErrors : earlierErrors + m_errorText;
    if (!answered && !isEmpty) {
        return Tracer::fail("Cannot read files list from instrument.");
    }
    if (isEmpty) {
        answer.clear();
    }
    entries = parseCatalogue(answer);
    return true;
}

bool VisaDevice::listDirectory(QList<RemoteFileEntry> &entries, const QString &path)
{
    return queryCatalogue(entries, path);
}

bool VisaDevice::listTree(QStringList &files, qint64 &totalSize, const QString &directory)
{
    files.clear();
    totalSize = 0;
    QList<RemoteFileEntry> entries;
    if (!listTreeEntries(entries, directory)) {
        return false;
    }
    for (const RemoteFileEntry &entry : std::as_const(entries)) {
        if (!entry.isDirectory()) {
            files.append(directory + '/' + entry.name);
            totalSize += entry.size;
        }
    }
    return true;
}

bool VisaDevice::listTreeEntries(QList<RemoteFileEntry> &entries, const QString &directory)
{
    entries.clear();
    return collectTree(entries, directory, QString(), 0);
}

bool VisaDevice::collectTree(QList<RemoteFileEntry> &entries, const QString &directory,
                             const QString &prefix, int depth)
{
    const QString path = prefix.isEmpty() ? directory : directory + '/' + prefix;
    if (depth > maxDepth) {
        return tooDeep(path);
    }
    QList<RemoteFileEntry> level;
    if (!listDirectory(level, path)) {
        return false;
    }
    for (RemoteFileEntry &entry : level) {
        if (!prefix.isEmpty()) {
            entry.name.prepend(prefix + '/');
        }
        entries.append(entry);
        if (entry.isDirectory() && !collectTree(entries, directory, entry.name, depth + 1)) {
            return false;
        }
    }
    return true;
}

bool VisaDevice::deleteRemoteFile(const QString &path, bool ask)
{
    Tracer::Trace(Tracer::Information, "Deleting file '" + path + "'");
    const RemotePath parts = splitPath(path);
    // The instrument itself cuts the list down to files of the same kind.
    const QString pattern = parts.suffix.isEmpty() ? QString("*.*") : "*." + parts.suffix;
    QList<RemoteFileEntry> entries;
    if (!queryCatalogue(entries, parts.directory + pattern)) {
        return false;
    }
    const bool exists =
        std::any_of(entries.cbegin(), entries.cend(),
                    [&](const RemoteFileEntry &entry) { return entry.name == parts.fileName; });
    if (!exists) {
        // What is gone need not be deleted.
        Tracer::Trace(Tracer::Warning, "*** File does not exist on instrument.");
        return true;
    }
    if (ask && (!m_question || !m_question("WARNING", "File exists on instrument. Delete ?"))) {
        return true;
    }
    if (!sendCommand("MMEM:DEL '" + path + "'; *OPC?")) {
        return Tracer::fail("*** Error deleting file on instrument.");
    }
    return checkErrorQueue();
}

bool VisaDevice::makeDirectory(const QString &parent, const QString &name)
{
    const QString path = joinRemotePath(parent, name, pathSeparator());
    if (!isUsable(path, name, emptyDirectory)) {
        return false;
    }
    Tracer::Trace(Tracer::Information, "Creating directory '" + path + "'");
    return sendCommand(":MMEM:MDIR '" + path + "'; *OPC?");
}

bool VisaDevice::renameEntry(const QString &directory, const QString &oldName,
                             const QString &newName)
{
    const QString oldPath = joinRemotePath(directory, oldName, pathSeparator());
    const QString newPath = joinRemotePath(directory, newName, pathSeparator());
    if (!isUsable(oldPath, oldName, "Entry name cannot be empty.") ||
        !isUsable(newPath, newName, "Entry name cannot be empty.")) {
        return false;
    }
    Tracer::Trace(Tracer::Information, "Renaming '" + oldPath + "'");
    return sendCommand(":MMEM:MOVE '" + oldPath + "','" + newPath + "'; *OPC?");
}

bool VisaDevice::removeDirectory(const QString &parent, const QString &name)
{
    const QString path = joinRemotePath(parent, name, pathSeparator());
    if (!isUsable(path, name, emptyDirectory)) {
        return false;
    }
    Tracer::Trace(Tracer::Information, "Removing directory '" + path + "'");
    return sendCommand(":MMEM:RDIR '" + path + "'; *OPC?");
}

bool VisaDevice::removeEmptyTree(const QString &parent, const QString &name)
{
    return removeFolders(parent, name, 0);
}

bool VisaDevice::removeFolders(const QString &parent, const QString &name, int depth)
{
    const QString path = joinRemotePath(parent, name, pathSeparator());
    if (!isUsable(path, name, emptyDirectory)) {
        return false;
    }
    if (depth > maxDepth) {
        return tooDeep(path);
    }
    QList<RemoteFileEntry> entries;
    if (!listDirectory(entries, path)) {
        return false;
    }
    for (const RemoteFileEntry &entry : std::as_const(entries)) {
        if (!entry.isDirectory()) {
            continue;
        }
        Tracer::Trace(Tracer::Information, "Descending into '" +
                                               joinRemotePath(path, entry.name, pathSeparator()) +
                                               "'");
        if (!removeFolders(path, entry.name, depth + 1)) {
            return false;
        }
    }
    return sendCommand(":MMEM:RDIR '" + path + "'; *OPC?");
}

bool VisaDevice::removeTree(const QString &parent, const QString &name)
{
    const CancelScope cancelScope(m_cancelRequested);
    const QString path = joinRemotePath(parent, name, pathSeparator());
    Tracer::Trace(Tracer::Information, "Removing tree '" + path + "'");
    QCoreApplication::processEvents();
    if (!isUsable(path, name, emptyDirectory)) {
        return false;
    }
    // Old errors would be taken for errors of the removal.
    checkErrorQueue();
    emit ProgressUpdate(0);
    QStringList files;
    qint64 totalSize = 0;
    if (!listTree(files, totalSize, path)) {
        return false;
    }
    for (qsizetype i = 0; i < files.size(); ++i) {
        if (!sendCommand(":MMEM:DEL '" + files.at(i) + "'; *OPC?") || !checkErrorQueue()) {
            return false;
        }
        emit ProgressUpdate(static_cast<int>(100 * (i + 1) / files.size()));
        QCoreApplication::processEvents();
        if (m_cancelRequested) {
            return Tracer::fail("*** User break.");
        }
    }
    return removeEmptyTree(parent, name);
}
