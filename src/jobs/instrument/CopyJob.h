// SPDX-License-Identifier: Apache-2.0
#pragma once

#include "jobs/ToolJob.h"

#include "base/OutputFile.h"

#include <QList>
#include <QStringList>

#include <functional>

class ProgressClock;
class VisaDevice;

/// What is to be copied, and where to. At least one end lies on an instrument. Devices are not
/// owned and are open; null stands for the local disk. Paths use "/" on either side.
struct CopyRequest
{
    VisaDevice *sourceDevice = nullptr;
    QString source;         ///< a file; with "/" at its end a folder, whose contents are copied
    qint64 sourceBytes = 0; ///< of a file on an instrument, as its catalogue told
    VisaDevice *targetDevice = nullptr;
    QString targetFolder; ///< ends in "/"; empty for the present one, with a name
    QString targetName{}; ///< of a file at the target; empty for that of the source

    /// What becomes of a local file that appears under the name of the target meanwhile.
    OutputFile::Existing existing = OutputFile::Existing::Replaced;
};

/// What a copy asks its user in the middle of the run; an empty function stands for yes.
struct CopyQuestions
{
    /// Whether to copy a folder of so many files and bytes.
    std::function<bool(qsizetype files, qint64 bytes)> proceed;

    /// Whether local files that exist may be replaced. A file on an instrument is replaced unasked.
    std::function<bool(const QStringList &paths)> replace;

    /// Whether to send waveforms that the instrument can't play, for these reasons.
    std::function<bool(const QStringList &problems)> sendMisfits;

    /// Whether to go on with the next file after one that failed.
    std::function<bool()> goOn;
};

/// Copies a file, or all files below a folder, between the disk and an instrument or between two
/// instruments. Folders that lack at the target are made; empty ones are not copied.
///
/// Finishes when all files were copied. What was copied before a failure or a cancel stays,
/// the file in hand is removed on either side.
class CopyJob : public ToolJob
{
    Q_OBJECT

public:
    explicit CopyJob(CopyRequest request, CopyQuestions questions = {}, QObject *parent = nullptr);

    /// Files to copy, and those that were copied; also while and after running.
    [[nodiscard]] qsizetype fileCount() const { return m_files.size(); }
    [[nodiscard]] qsizetype copiedCount() const { return m_copiedCount; }

    /// What the instruments have reported on the last file that failed, one error a line.
    [[nodiscard]] const QString &reported() const { return m_reported; }

private:
    struct File
    {
        QString source;
        QString target;
        qint64 bytes = 0;
    };

    [[nodiscard]] bool work() override;
    [[nodiscard]] bool collect();
    [[nodiscard]] bool collectLocal(const QString &folder, ProgressClock &clock);
    [[nodiscard]] bool collectRemote();
    void addFile(const QString &relativeName, qint64 bytes);
    [[nodiscard]] bool mayReplace() const;
    [[nodiscard]] bool maySend() const;
    [[nodiscard]] bool copy(const File &file);
    [[nodiscard]] bool send(const QString &local, const QString &remote);
    [[nodiscard]] bool fetch(const QString &remote, const QString &local);
    [[nodiscard]] bool relay(const File &file);
    [[nodiscard]] bool makeRemoteFolder(const QString &folder);
    [[nodiscard]] bool isFolderRequest() const;
    template <typename Transfer>
    [[nodiscard]] bool transfer(VisaDevice *device, const QString &label, const char *failure,
                                const Transfer &run);
    void showProgress(int percentOfFile);

    CopyRequest m_request;
    CopyQuestions m_questions;
    QList<File> m_files;
    qint64 m_totalBytes = 0;
    qint64 m_doneBytes = 0;    ///< of the files before the one in hand
    qsizetype m_fileIndex = 0; ///< of the one in hand
    qsizetype m_copiedCount = 0;
    int m_leg = 0;      ///< part of the way that the file in hand is on: 1 from the disk onwards
    int m_legCount = 1; ///< 2 between two instruments, which is by way of the disk
    QString m_reported;
    QStringList m_remoteFolders; ///< known to exist at the target
};
