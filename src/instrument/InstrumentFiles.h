// SPDX-License-Identifier: Apache-2.0
#pragma once

#include "OperationControl.h"
#include "RemoteFileEntry.h"

#include <QList>
#include <QString>
#include <QStringList>

#include <functional>

class ProgressClock;
struct InstrumentIdentity;
class VisaSession;

/// The files and folders of an instrument, by its mass memory commands. The operations are those of
/// the same names of VisaDevice.
class InstrumentFiles
{
public:
    InstrumentFiles(VisaSession &session, const InstrumentIdentity &identity,
                    OperationControl &control);

    [[nodiscard]] bool listDirectory(QList<RemoteFileEntry> &entries, const QString &path);
    /// Whether a list has a file of that name, as the instrument compares names.
    [[nodiscard]] bool holds(const QList<RemoteFileEntry> &entries, const QString &fileName) const;
    [[nodiscard]] bool listTree(QStringList &files, qint64 &totalSize, const QString &directory);
    [[nodiscard]] bool listTreeEntries(QList<RemoteFileEntry> &entries, const QString &directory);

    /// Asks nobody if `agreed` is empty; a no leaves the file and counts as done.
    [[nodiscard]] bool deleteRemoteFile(const QString &path,
                                        const std::function<bool()> &agreed = {});
    [[nodiscard]] bool makeDirectory(const QString &parent, const QString &name);
    [[nodiscard]] bool renameEntry(const QString &directory, const QString &oldName,
                                   const QString &newName);
    [[nodiscard]] bool removeDirectory(const QString &parent, const QString &name);
    [[nodiscard]] bool removeEmptyTree(const QString &parent, const QString &name);
    [[nodiscard]] bool removeTree(const QString &parent, const QString &name);

private:
    [[nodiscard]] bool collectTree(QList<RemoteFileEntry> &entries, const QString &directory,
                                   const QString &prefix, int depth, ProgressClock &clock);
    [[nodiscard]] bool removeFolders(const QString &parent, const QString &name, int depth,
                                     ProgressClock &clock);
    [[nodiscard]] QString joined(const QString &parent, const QString &name) const;

    VisaSession &m_session;
    const InstrumentIdentity &m_identity;
    OperationControl &m_control;
};
