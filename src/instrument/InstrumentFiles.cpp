// SPDX-License-Identifier: Apache-2.0
#include "InstrumentFiles.h"

#include "InstrumentIdentity.h"
#include "VisaSession.h"
#include "remotepaths.h"

#include "base/ProgressClock.h"
#include "log/Tracer.h"

#include <QCoreApplication>

#include <algorithm>

namespace {

/// No real folder lies deeper; an instrument that lists a folder in itself ends here.
constexpr int MaxDepth = 64;
/// One that lists two folders in themselves would have folders without end above that depth.
constexpr qsizetype MaxEntries = 1'000'000;
constexpr qint64 MostBytes = qint64{1} << 60; ///< of a tree

bool tooDeep(const QString &directory)
{
    return Tracer::fail(QString("The directory '%1' is nested deeper than the %2 levels that are "
                                "walked.")
                            .arg(directory)
                            .arg(MaxDepth));
}

QString removal(const QString &path)
{
    return ":MMEM:RDIR " + commandString(path) + "; *OPC?";
}

/// A path must name more than a root, and with an empty name a folder would turn into its parent.
bool isUsable(const QString &path, const QString &name, const char *reason)
{
    const bool isNamed = std::any_of(name.cbegin(), name.cend(), [](QChar character) {
        return character != '/' && character != '\\' && character != '\'';
    });
    return (isNamed && path.size() >= 2) || Tracer::fail(reason);
}

bool broken()
{
    return Tracer::fail("*** User break.");
}

const char *const EmptyDirectory = "Directory path cannot be empty.";

} // namespace

InstrumentFiles::InstrumentFiles(VisaSession &session, const InstrumentIdentity &identity,
                                 OperationControl &control)
    : m_session(session)
    , m_identity(identity)
    , m_control(control)
{
}

QString InstrumentFiles::joined(const QString &parent, const QString &name) const
{
    return joinRemotePath(parent, name, m_identity.pathSeparator());
}

bool InstrumentFiles::listDirectory(QList<RemoteFileEntry> &entries, const QString &path)
{
    entries.clear();
    // Only what this query is answered counts below.
    const QString earlierErrors = m_session.takeErrors();
    QString answer;
    const bool answered(
        m_session.query(":MMEM:CAT? " + commandString(path), answer, VisaSession::Blanks::Kept));
    const QString errors = m_session.takeErrors();
    // An error number that ends so tells of an empty or missing directory.
    const bool isEmpty = !answered && errors.contains("469");
    m_session.setErrors(isEmpty ? earlierErrors : earlierErrors + errors);
    if (!answered && !isEmpty) {
        return Tracer::fail("Cannot read files list from instrument.");
    }
    entries = parseCatalogue(isEmpty ? QString() : answer);
    return true;
}

bool InstrumentFiles::listTree(QStringList &files, qint64 &totalSize, const QString &directory)
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
            // Two absurd sizes must not wrap around to a small sum.
            totalSize =
                std::min(totalSize + std::clamp<qint64>(entry.size, 0, MostBytes), MostBytes);
        }
    }
    return true;
}

bool InstrumentFiles::listTreeEntries(QList<RemoteFileEntry> &entries, const QString &directory)
{
    entries.clear();
    ProgressClock clock(m_control.report, m_control.cancelled);
    return collectTree(entries, directory, QString(), 0, clock);
}

bool InstrumentFiles::collectTree(QList<RemoteFileEntry> &entries, const QString &directory,
                                  const QString &prefix, int depth, ProgressClock &clock)
{
    const QString path = prefix.isEmpty() ? directory : directory + '/' + prefix;
    if (depth > MaxDepth) {
        return tooDeep(path);
    }
    if (entries.size() > MaxEntries) {
        return Tracer::fail(
            QString("The instrument lists more than %1 files and folders.").arg(MaxEntries));
    }
    // How many folders there are shows only at the end.
    if (clock.shouldStop(-1) || m_control.cancelled) {
        return broken();
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
        if (entry.isDirectory() && !collectTree(entries, directory, entry.name, depth + 1, clock)) {
            return false;
        }
    }
    return true;
}

bool InstrumentFiles::holds(const QList<RemoteFileEntry> &entries, const QString &fileName) const
{
    return std::any_of(entries.cbegin(), entries.cend(), [&](const RemoteFileEntry &entry) {
        return !entry.isDirectory() &&
               isSameName(entry.name, fileName, m_identity.isUnixFileSystem());
    });
}

bool InstrumentFiles::deleteRemoteFile(const QString &path, const std::function<bool()> &agreed)
{
    Tracer::Trace(Tracer::Information, "Deleting file '" + path + "'");
    const RemotePath parts = splitPath(path);
    // The instrument itself cuts the list down to files of the same kind.
    const QString pattern = parts.suffix.isEmpty() ? QString("*.*") : "*." + parts.suffix;
    QList<RemoteFileEntry> entries;
    if (!listDirectory(entries, parts.directory + pattern)) {
        return false;
    }
    if (parts.suffix.isEmpty() && !holds(entries, parts.fileName) &&
        !listDirectory(entries, parts.directory)) {
        // To some, "*.*" is only what has a point in its name.
        return false;
    }
    if (!holds(entries, parts.fileName)) {
        // What is gone need not be deleted.
        Tracer::Trace(Tracer::Warning, "*** File does not exist on instrument.");
        return true;
    }
    if (agreed && !agreed()) {
        return true;
    }
    if (!m_session.send("MMEM:DEL " + commandString(path) + "; *OPC?")) {
        return Tracer::fail("*** Error deleting file on instrument.");
    }
    return bool(m_session.checkErrorQueue());
}

bool InstrumentFiles::makeDirectory(const QString &parent, const QString &name)
{
    const QString path = joined(parent, name);
    if (!isUsable(path, name, EmptyDirectory)) {
        return false;
    }
    Tracer::Trace(Tracer::Information, "Creating directory '" + path + "'");
    return bool(m_session.send(":MMEM:MDIR " + commandString(path) + "; *OPC?"));
}

bool InstrumentFiles::renameEntry(const QString &directory, const QString &oldName,
                                  const QString &newName)
{
    const QString oldPath = joined(directory, oldName);
    const QString newPath = joined(directory, newName);
    if (!isUsable(oldPath, oldName, "Entry name cannot be empty.") ||
        !isUsable(newPath, newName, "Entry name cannot be empty.")) {
        return false;
    }
    Tracer::Trace(Tracer::Information, "Renaming '" + oldPath + "'");
    return bool(m_session.send(":MMEM:MOVE " + commandString(oldPath) + ',' +
                               commandString(newPath) + "; *OPC?"));
}

bool InstrumentFiles::removeDirectory(const QString &parent, const QString &name)
{
    const QString path = joined(parent, name);
    if (!isUsable(path, name, EmptyDirectory)) {
        return false;
    }
    Tracer::Trace(Tracer::Information, "Removing directory '" + path + "'");
    return bool(m_session.send(removal(path)));
}

bool InstrumentFiles::removeEmptyTree(const QString &parent, const QString &name)
{
    ProgressClock clock(m_control.report, m_control.cancelled);
    return removeFolders(parent, name, 0, clock);
}

bool InstrumentFiles::removeFolders(const QString &parent, const QString &name, int depth,
                                    ProgressClock &clock)
{
    const QString path = joined(parent, name);
    if (!isUsable(path, name, EmptyDirectory)) {
        return false;
    }
    if (depth > MaxDepth) {
        return tooDeep(path);
    }
    if (clock.shouldStop(-1) || m_control.cancelled) {
        return broken();
    }
    QList<RemoteFileEntry> entries;
    if (!listDirectory(entries, path)) {
        return false;
    }
    for (const RemoteFileEntry &entry : std::as_const(entries)) {
        if (!entry.isDirectory()) {
            continue;
        }
        Tracer::Trace(Tracer::Information, "Descending into '" + joined(path, entry.name) + "'");
        if (!removeFolders(path, entry.name, depth + 1, clock)) {
            return false;
        }
    }
    // What is refused here, such as a folder with a hidden file, is told by the queue alone.
    return m_session.send(removal(path)) && m_session.checkErrorQueue();
}

bool InstrumentFiles::removeTree(const QString &parent, const QString &name)
{
    const QString path = joined(parent, name);
    Tracer::Trace(Tracer::Information, "Removing tree '" + path + "'");
    QCoreApplication::processEvents();
    if (!isUsable(path, name, EmptyDirectory)) {
        return false;
    }
    // Old errors would be taken for errors of the removal.
    (void)m_session.checkErrorQueue();
    m_control.report(0);
    QStringList files;
    qint64 totalSize = 0;
    if (!listTree(files, totalSize, path)) {
        return false;
    }
    for (qsizetype i = 0; i < files.size(); ++i) {
        if (!m_session.send(":MMEM:DEL " + commandString(files.at(i)) + "; *OPC?") ||
            !m_session.checkErrorQueue()) {
            return false;
        }
        m_control.report(static_cast<int>(100 * (i + 1) / files.size()));
        QCoreApplication::processEvents();
        if (m_control.cancelled) {
            return broken();
        }
    }
    return removeEmptyTree(parent, name);
}
