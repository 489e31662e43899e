// SPDX-License-Identifier: Apache-2.0
#include "CopyJob.h"

#include "waveformcheck.h"

#include "base/ProgressClock.h"
#include "instrument/VisaDevice.h"
#include "instrument/remotepaths.h"
#include "log/Tracer.h"

#include <QDir>
#include <QFile>
#include <QFileInfo>
#include <QTemporaryDir>

#include <algorithm>
#include <utility>

namespace {

constexpr const char *SendingFailed = "Sending file to instrument failed.";

QString nativePathOn(const VisaDevice &device, const QString &path)
{
    return nativePath(path, device.pathSeparator());
}

QString deviceName(const VisaDevice &device)
{
    // One that could not be opened has told nothing about itself.
    return device.model().isEmpty() ? QString("that is not open")
                                    : device.model() + ", " + device.serial();
}

} // namespace

CopyJob::CopyJob(CopyRequest request, CopyQuestions questions, QObject *parent)
    : ToolJob(parent)
    , m_request(std::move(request))
    , m_questions(std::move(questions))
{
}

bool CopyJob::isFolderRequest() const
{
    return isFolderPath(m_request.source);
}

bool CopyJob::work()
{
    if (m_request.sourceDevice == nullptr && m_request.targetDevice == nullptr) {
        return Tracer::fail("Copy operations between local file systems are not supported.");
    }
    if (!isFolderPath(m_request.targetFolder) && m_request.targetName.isEmpty()) {
        return Tracer::fail("The target location for the copy operation must be a folder.");
    }
    m_legCount = m_request.sourceDevice && m_request.targetDevice ? 2 : 1;
    if (!collect() || !mayProceed()) {
        return false;
    }
    const bool agreed = (!isFolderRequest() || !m_questions.proceed ||
                         m_questions.proceed(m_files.size(), m_totalBytes)) &&
                        mayReplace() && maySend();
    if (!agreed) {
        cancel();
        return false;
    }
    for (m_fileIndex = 0; m_fileIndex < m_files.size(); ++m_fileIndex) {
        const File &file = m_files.at(m_fileIndex);
        showProgress(0);
        if (isCancelled()) {
            return false; // a transfer would forget a cancel from before it
        }
        if (isFolderRequest()) {
            Tracer::Trace(Tracer::Information,
                          QString("Copying %1 to %2").arg(file.source, file.target));
        }
        const bool copied = copy(file);
        if (isCancelled()) {
            return false;
        }
        m_doneBytes += file.bytes;
        m_copiedCount += copied ? 1 : 0;
        if (!copied && (!isFolderRequest() || (m_questions.goOn && !m_questions.goOn()))) {
            return false;
        }
    }
    return m_copiedCount == m_files.size();
}

bool CopyJob::collect()
{
    if (!isFolderRequest()) {
        const qint64 bytes =
            m_request.sourceDevice ? m_request.sourceBytes : QFileInfo(m_request.source).size();
        const QString name =
            m_request.targetName.isEmpty() ? entryName(m_request.source) : m_request.targetName;
        m_files = {{m_request.source, m_request.targetFolder + name, bytes}};
        m_totalBytes = bytes;
        return true;
    }
    const char *label = m_request.sourceDevice ? "Building remote source files list..."
                                               : "Building local source files list...";
    Tracer::Trace(Tracer::Information, label);
    if (m_request.sourceDevice) {
        const JobStep step(*this, label, *m_request.sourceDevice);
        return collectRemote();
    }
    emit stepStarted(label);
    ProgressClock clock([this](int percent) { emit ProgressUpdate(percent); }, cancelFlag());
    return collectLocal({}, clock);
}

void CopyJob::addFile(const QString &relativeName, qint64 bytes)
{
    m_files.append({m_request.source + relativeName, m_request.targetFolder + relativeName, bytes});
    m_totalBytes += bytes;
}

bool CopyJob::collectLocal(const QString &folder, ProgressClock &clock)
{
    const QDir directory(m_request.source + folder);
    if (!directory.isReadable()) {
        return Tracer::fail(QString("The folder '%1' cannot be read.").arg(directory.path()));
    }
    // Links are left out, as in the pane; they could lead in circles.
    const QFileInfoList entries = directory.entryInfoList(
        QDir::Files | QDir::Dirs | QDir::NoDotAndDotDot | QDir::NoSymLinks, QDir::Name);
    for (const QFileInfo &entry : entries) {
        if (clock.shouldStop(-1)) {
            return false;
        }
        const QString name = folder + entry.fileName();
        if (entry.isDir()) {
            if (!collectLocal(name + '/', clock)) {
                return false;
            }
        } else {
            addFile(name, entry.size());
        }
    }
    return true;
}

bool CopyJob::collectRemote()
{
    VisaDevice &device = *m_request.sourceDevice;
    QList<RemoteFileEntry> entries;
    if (!device.listTreeEntries(entries, nativePathOn(device, withoutEndSlash(m_request.source)))) {
        return false;
    }
    for (const RemoteFileEntry &entry : std::as_const(entries)) {
        if (!staysBelow(entry.name)) {
            return Tracer::fail(QString("The instrument lists a file '%1', whose name leads out of "
                                        "the folder that is copied.")
                                    .arg(entry.name));
        }
        if (!entry.isDirectory()) {
            addFile(entry.name, entry.size);
        }
    }
    return true;
}

bool CopyJob::mayReplace() const
{
    if (m_request.targetDevice || !m_questions.replace) {
        return true;
    }
    QStringList existing;
    for (const File &file : m_files) {
        if (QFileInfo::exists(file.target)) {
            existing.append(file.target);
        }
    }
    return existing.isEmpty() || m_questions.replace(existing);
}

bool CopyJob::maySend() const
{
    if (m_request.sourceDevice || !m_request.targetDevice || !m_questions.sendMisfits) {
        return true;
    }
    const InstrumentSummary instrument = summaryOf(*m_request.targetDevice);
    QStringList problems;
    for (const File &file : m_files) {
        problems += problemsOfFile(file.source, instrument, m_files.size() > 1, Doubts::LeftOut);
    }
    return problems.isEmpty() || m_questions.sendMisfits(problems);
}

bool CopyJob::copy(const File &file)
{
    m_leg = 0;
    if (!m_request.targetDevice) {
        return fetch(file.source, file.target);
    }
    return m_request.sourceDevice ? relay(file) : send(file.source, file.target);
}

bool CopyJob::relay(const File &file)
{
    // There is no way from one instrument to the other but by way of the disk.
    // A folder of its own keeps two running programs, and other users, apart.
    const QTemporaryDir folder;
    if (!folder.isValid()) {
        return Tracer::fail("Cannot create a temporary folder: " + folder.errorString());
    }
    const QString passed = folder.filePath("HvCorvane.tmp");
    if (!fetch(file.source, passed)) {
        return false;
    }
    m_leg = 1;
    return !isCancelled() && send(passed, file.target);
}

template <typename Transfer>
bool CopyJob::transfer(VisaDevice *device, const QString &label, const char *failure,
                       const Transfer &run)
{
    Tracer::Trace(Tracer::Information, QString(label).replace('\n', ' '));
    emit stepStarted(label);
    const auto progress =
        connect(device, &VisaDevice::ProgressUpdate, this, &CopyJob::showProgress);
    const auto stop = connect(this, &ToolJob::cancelRequested, device, &VisaDevice::cancel);
    // Only what this transfer is answered belongs to it.
    (void)device->takeLastError();
    const bool done = device->isOpen() ? run() : Tracer::fail("Device is not open.");
    disconnect(progress);
    disconnect(stop);
    const QString errors = device->takeLastError();
    if (done || isCancelled()) {
        return done;
    }
    m_reported = errors;
    const QStringList reasons = errors.split('\n', Qt::SkipEmptyParts);
    Tracer::Trace(Tracer::Error, failure);
    for (const QString &reason : reasons) {
        Tracer::Trace(Tracer::Error, reason);
    }
    return false;
}

bool CopyJob::send(const QString &local, const QString &remote)
{
    const QString name = remote.mid(m_request.targetFolder.size());
    if (const QString problem = sendingProblem(name); !problem.isEmpty()) {
        Tracer::Trace(Tracer::Error, problem);
        return Tracer::fail(SendingFailed);
    }
    VisaDevice *device = m_request.targetDevice;
    const QString label =
        QString("Sending file %1\nto instrument %2").arg(entryName(remote), deviceName(*device));
    return transfer(device, label, SendingFailed, [&] {
        return makeRemoteFolder(folderOf(remote)) &&
               device->writeRemoteFile(local, nativePathOn(*device, remote));
    });
}

bool CopyJob::fetch(const QString &remote, const QString &local)
{
    const QString folder = folderOf(local);
    if (!QFileInfo(folder).isDir()) {
        Tracer::Trace(Tracer::Information, QString("Creating path '%1'...").arg(folder));
        if (!QDir().mkpath(folder)) {
            return Tracer::fail("The path could not be created.");
        }
    }
    VisaDevice *device = m_request.sourceDevice;
    const QString label =
        QString("Reading file %1\nfrom instrument %2").arg(entryName(remote), deviceName(*device));
    return transfer(device, label, "Reading file from instrument failed.", [&] {
        const QString source = nativePathOn(*device, remote);
        return device->readRemoteFile(source, local, m_request.existing);
    });
}

bool CopyJob::makeRemoteFolder(const QString &folder)
{
    // The target itself stands in the tree of the pane, so only folders below it can lack.
    if (folder.size() <= m_request.targetFolder.size() || m_remoteFolders.contains(folder)) {
        return true;
    }
    const QString parent = folderOf(withoutEndSlash(folder));
    const QString name = entryName(withoutEndSlash(folder));
    if (!makeRemoteFolder(parent)) {
        return false;
    }
    VisaDevice &device = *m_request.targetDevice;
    QList<RemoteFileEntry> entries;
    if (!device.listDirectory(entries, nativePathOn(device, parent))) {
        return false;
    }
    const bool exists = std::any_of(entries.cbegin(), entries.cend(), [&](const auto &entry) {
        return entry.isDirectory() && entry.name == name;
    });
    if (!exists && !device.makeDirectory(nativePathOn(device, parent), name)) {
        return false;
    }
    m_remoteFolders.append(folder);
    return true;
}

void CopyJob::showProgress(int percentOfFile)
{
    const int wayPercent = (100 * m_leg + percentOfFile) / m_legCount;
    // Each file counts the same here; bytesMoved() is the exact measure.
    emit ProgressUpdate(static_cast<int>((100 * m_fileIndex + wayPercent) / m_files.size()));
    emit bytesMoved(m_doneBytes + m_files.at(m_fileIndex).bytes * wayPercent / 100, m_totalBytes);
}
