// SPDX-License-Identifier: Apache-2.0
#include "VisaDevice.h"

#include "ArbControl.h"
#include "BlockReader.h"
#include "BlockWriter.h"
#include "GeneratorControl.h"
#include "InstrumentFiles.h"
#include "InstrumentIdentity.h"
#include "OperationControl.h"
#include "VisaSession.h"
#include "instrumentscan.h"
#include "remotepaths.h"

#include "log/Tracer.h"

#include <QMutexLocker>

#include <algorithm>
#include <optional>

struct VisaDevice::Parts
{
    VisaSession session;
    InstrumentIdentity identity;
    OperationControl control;
    InstrumentFiles files{session, identity, control};
    ArbIntervals arbIntervals;
    Question question;
};

namespace {

VisaLibrary &library()
{
    return VisaLibrary::instance();
}

bool areNamed(const QString &localPath, const QString &remotePath)
{
    if (localPath.isEmpty()) {
        return Tracer::fail("Local file name cannot be empty.");
    }
    return !remotePath.isEmpty() || Tracer::fail("Remote file name cannot be empty.");
}

} // namespace

VisaDevice::VisaDevice(bool noVisa, QObject *parent)
    : QObject(parent)
    , m_parts(std::make_unique<Parts>())
{
    m_parts->control.report = [this](int percent) { emit ProgressUpdate(percent); };
    VisaLibrary &visa = library();
    const QMutexLocker locker(&visa.mutex);
    if (visa.devices.isEmpty() && !noVisa) {
        m_parts->session.setErrors(visa.openManager());
    }
    visa.devices.append(this);
}

VisaDevice::~VisaDevice()
{
    closeResource();
    VisaLibrary &visa = library();
    const QMutexLocker locker(&visa.mutex);
    visa.devices.removeOne(this);
    if (visa.devices.isEmpty()) {
        visa.closeManager();
    }
}

void VisaDevice::cancel()
{
    m_parts->control.cancelled = true;
}

// Session

bool VisaDevice::openResource(const QString &resource)
{
    InstrumentIdentity &identity = m_parts->identity;
    VisaSession &session = m_parts->session;
    if (!session.isOpen()) {
        identity = {};
    }
    m_parts->control.cancelled = false;
    const Exchange opened = session.open(resource, m_parts->control);
    if (!opened) {
        // What is open from before stays; what could not be configured does not.
        if (opened.outcome == Exchange::Outcome::Failed) {
            closeResource();
        }
        return false;
    }
    identity.resource = resource;
    if (!session.send("*CLS") || !session.query("*IDN?", identity.idn) ||
        !session.query("*OPT?", identity.options) || !identity.identify()) {
        closeResource();
        return false;
    }
    return true;
}

bool VisaDevice::closeResource()
{
    const bool wasOpen = m_parts->session.isOpen();
    if (!m_parts->session.close()) {
        return false;
    }
    if (wasOpen) {
        Tracer::Trace(Tracer::Information, "Device " + model() + ", " + serial() + " closed.");
    }
    return true;
}

bool VisaDevice::isOpen() const
{
    return m_parts->session.isOpen();
}

bool VisaDevice::sendCommand(const QString &command)
{
    return bool(m_parts->session.send(command));
}

bool VisaDevice::queryText(const QString &command, QString &answer)
{
    return bool(m_parts->session.query(command, answer));
}

bool VisaDevice::checkErrorQueue()
{
    return bool(m_parts->session.checkErrorQueue());
}

QString VisaDevice::takeLastError()
{
    return m_parts->session.takeErrors();
}

bool VisaDevice::setTimeoutMs(quint32 milliseconds)
{
    return bool(m_parts->session.setTimeoutMs(milliseconds));
}

quint32 VisaDevice::timeoutMs() const
{
    return m_parts->session.timeoutMs().value_or(0);
}

bool VisaDevice::interfaceType(quint16 &type) const
{
    const std::optional<quint16> found = m_parts->session.interfaceType();
    type = found.value_or(type);
    return found.has_value();
}

void VisaDevice::reportStatus(qint32 status) const
{
    m_parts->session.reportStatus(status);
}

void VisaDevice::setTakesInput(bool takesInput)
{
    m_parts->control.takesInput = takesInput;
}

bool VisaDevice::isResourceOpenElsewhere(const QString &resource) const
{
    const QString wanted = plainResource(resource);
    const QMutexLocker locker(&library().mutex);
    return std::any_of(
        library().devices.cbegin(), library().devices.cend(), [&](const VisaDevice *other) {
            return other != this && other->isOpen() && plainResource(other->resource()) == wanted;
        });
}

bool VisaDevice::isOpenElsewhere(const QString &model, const QString &serial) const
{
    if (model.isEmpty() || serial.isEmpty()) {
        return false;
    }
    const QMutexLocker locker(&library().mutex);
    return std::any_of(library().devices.cbegin(), library().devices.cend(),
                       [&](const VisaDevice *other) {
                           return other != this && other->isOpen() && other->model() == model &&
                                  other->serial() == serial;
                       });
}

// Identity

const InstrumentIdentity &VisaDevice::identity() const
{
    return m_parts->identity;
}

QString VisaDevice::vendor() const
{
    return identity().vendor;
}

QString VisaDevice::model() const
{
    return identity().model;
}

QString VisaDevice::serial() const
{
    return identity().serial;
}

QString VisaDevice::firmware() const
{
    return identity().firmware;
}

QString VisaDevice::resource() const
{
    return identity().resource;
}

QString VisaDevice::options() const
{
    return identity().options;
}

QString VisaDevice::interfaceName() const
{
    return identity().interfaceName();
}

bool VisaDevice::isUnixFileSystem() const
{
    return identity().isUnixFileSystem();
}

QChar VisaDevice::pathSeparator() const
{
    return identity().pathSeparator();
}

bool VisaDevice::hasBasebandCoder() const
{
    return identity().hasBasebandCoder();
}

bool VisaDevice::isAnalyzer() const
{
    return identity().isAnalyzer();
}

QStringList VisaDevice::rootDirectories() const
{
    return identity().rootDirectories();
}

bool VisaDevice::rfFrequencyRange(int path, double &lower, double &upper) const
{
    const std::optional<FrequencyRange> range = identity().rfRange(path);
    if (range) {
        lower = range->lower;
        upper = range->upper;
    }
    return range.has_value();
}

bool VisaDevice::basebandCapabilities(int index, int &size, int &clock, int &bandwidth) const
{
    const std::optional<BasebandLimits> limits = identity().baseband(index);
    if (limits) {
        size = limits->size;
        clock = limits->clock;
        bandwidth = limits->bandwidth;
    }
    return limits.has_value();
}

bool VisaDevice::scanResources(QList<VisaDevice *> &found, int kind)
{
    m_parts->control.cancelled = false;
    return scanInstruments(found, kind, m_parts->session, m_parts->control);
}

// Transfers

bool VisaDevice::readRemoteFile(const QString &remotePath, const QString &localPath,
                                OutputFile::Existing existing)
{
    m_parts->control.cancelled = false;
    if (!areNamed(localPath, remotePath) ||
        library().functions(&VisaFunctions::viClear, &VisaFunctions::viSetAttribute,
                            &VisaFunctions::viRead) == nullptr) {
        return false;
    }
    OutputFile file(localPath, existing);
    return BlockReader(m_parts->session, m_parts->control).readFile(remotePath, localPath, file);
}

bool VisaDevice::readRemoteHead(const QString &remotePath, qint64 maximum, QByteArray &head)
{
    return library().functions(&VisaFunctions::viClear, &VisaFunctions::viSetAttribute,
                               &VisaFunctions::viRead) != nullptr &&
           BlockReader(m_parts->session, m_parts->control).readHead(remotePath, maximum, head);
}

bool VisaDevice::writeRemoteFile(const QString &localPath, const QString &remotePath)
{
    m_parts->control.cancelled = false;
    Tracer::Trace(Tracer::Information, "Copy file from local file system to instrument.");
    Tracer::Trace(Tracer::Information, "Source : " + localPath);
    Tracer::Trace(Tracer::Information, "Dest   : " + remotePath);
    return areNamed(localPath, remotePath) &&
           library().functions(&VisaFunctions::viGetAttribute, &VisaFunctions::viSetAttribute,
                               &VisaFunctions::viWrite, &VisaFunctions::viClear) != nullptr &&
           BlockWriter(m_parts->session, m_parts->files, m_parts->control)
               .writeFile(localPath, remotePath);
}

bool VisaDevice::readBinaryBlock(BufferedIO *stream, qint64 maximum)
{
    if (stream == nullptr) {
        return Tracer::fail("Invalid temporary data buffer.");
    }
    if (!isOpen()) {
        return VisaSession::failNotOpen();
    }
    return library().functions(&VisaFunctions::viGetAttribute, &VisaFunctions::viSetAttribute,
                               &VisaFunctions::viRead, &VisaFunctions::viClear) != nullptr &&
           BlockReader(m_parts->session, m_parts->control).readStream(*stream, maximum);
}

void VisaDevice::recoverAfterTransferError(quint16 previousEnd, quint16 interfaceKind)
{
    if (isOpen() && library().functions(&VisaFunctions::viSetAttribute, &VisaFunctions::viWrite,
                                        &VisaFunctions::viClear) != nullptr) {
        BlockWriter::recover(m_parts->session, previousEnd, interfaceKind);
    }
}

// Files and folders

bool VisaDevice::listDirectory(QList<RemoteFileEntry> &entries, const QString &path)
{
    return m_parts->files.listDirectory(entries, path);
}

bool VisaDevice::listTree(QStringList &files, qint64 &totalSize, const QString &directory)
{
    m_parts->control.cancelled = false;
    return m_parts->files.listTree(files, totalSize, directory);
}

bool VisaDevice::listTreeEntries(QList<RemoteFileEntry> &entries, const QString &directory)
{
    m_parts->control.cancelled = false;
    return m_parts->files.listTreeEntries(entries, directory);
}

bool VisaDevice::deleteRemoteFile(const QString &path, bool ask)
{
    const auto agreed = [this] {
        return m_parts->question &&
               m_parts->question("WARNING", "File exists on instrument. Delete ?");
    };
    return ask ? m_parts->files.deleteRemoteFile(path, agreed)
               : m_parts->files.deleteRemoteFile(path);
}

void VisaDevice::setQuestion(Question question)
{
    m_parts->question = std::move(question);
}

bool VisaDevice::makeDirectory(const QString &parent, const QString &name)
{
    return m_parts->files.makeDirectory(parent, name);
}

bool VisaDevice::renameEntry(const QString &directory, const QString &oldName,
                             const QString &newName)
{
    return m_parts->files.renameEntry(directory, oldName, newName);
}

bool VisaDevice::removeDirectory(const QString &parent, const QString &name)
{
    return m_parts->files.removeDirectory(parent, name);
}

bool VisaDevice::removeEmptyTree(const QString &parent, const QString &name)
{
    m_parts->control.cancelled = false;
    return m_parts->files.removeEmptyTree(parent, name);
}

bool VisaDevice::removeTree(const QString &parent, const QString &name)
{
    m_parts->control.cancelled = false;
    return m_parts->files.removeTree(parent, name);
}

// Playing a waveform

bool VisaDevice::startArb(const QString &path, int seconds)
{
    m_parts->control.cancelled = false;
    return ArbControl(m_parts->session, m_parts->identity, m_parts->control, m_parts->arbIntervals)
        .start(path, seconds);
}

bool VisaDevice::waitForArbReady(int seconds)
{
    m_parts->control.cancelled = false;
    return ArbControl(m_parts->session, m_parts->identity, m_parts->control, m_parts->arbIntervals)
        .waitUntilReady(seconds);
}

bool VisaDevice::stopArb()
{
    return GeneratorControl(m_parts->session, m_parts->identity).stop();
}

bool VisaDevice::readState(GeneratorState &state)
{
    return GeneratorControl(m_parts->session, m_parts->identity).read(state);
}

std::optional<bool> VisaDevice::readOutput()
{
    return GeneratorControl(m_parts->session, m_parts->identity).readOutput();
}

bool VisaDevice::changeState(const GeneratorChange &change)
{
    return GeneratorControl(m_parts->session, m_parts->identity).change(change);
}

void VisaDevice::setArbIntervals(const ArbIntervals &intervals)
{
    m_parts->arbIntervals = intervals;
}
