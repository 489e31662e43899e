// SPDX-License-Identifier: Apache-2.0
// Binary blocks to and from the instrument.
#include "VisaDevice.h"

#include "BlockReader.h"
#include "BlockWriter.h"

#include "log/Tracer.h"

namespace {

bool areNamed(const QString &localPath, const QString &remotePath)
{
    if (localPath.isEmpty()) {
        return Tracer::fail("Local file name cannot be empty.");
    }
    return !remotePath.isEmpty() || Tracer::fail("Remote file name cannot be empty.");
}

} // namespace

bool VisaDevice::readRemoteFile(const QString &remotePath, const QString &localPath)
{
    m_cancelRequested = false;
    if (!areNamed(localPath, remotePath)) {
        return false;
    }
    const VisaFunctions *visa = VisaLibrary::instance().functions(
        &VisaFunctions::viClear, &VisaFunctions::viSetAttribute, &VisaFunctions::viRead);
    return visa != nullptr && BlockReader(*this, VisaSession(*visa, m_session), m_cancelRequested)
                                  .readFile(remotePath, localPath);
}

bool VisaDevice::writeRemoteFile(const QString &localPath, const QString &remotePath)
{
    m_cancelRequested = false;
    Tracer::Trace(Tracer::Information, "Copy file from local file system to instrument.");
    Tracer::Trace(Tracer::Information, "Source : " + localPath);
    Tracer::Trace(Tracer::Information, "Dest   : " + remotePath);
    if (!areNamed(localPath, remotePath)) {
        return false;
    }
    const VisaFunctions *visa = VisaLibrary::instance().functions(
        &VisaFunctions::viGetAttribute, &VisaFunctions::viSetAttribute, &VisaFunctions::viWrite,
        &VisaFunctions::viClear);
    return visa != nullptr && BlockWriter(*this, VisaSession(*visa, m_session), m_cancelRequested)
                                  .writeFile(localPath, remotePath);
}

bool VisaDevice::readBinaryBlock(BufferedIO *stream, qint64 maximum)
{
    if (stream == nullptr) {
        return Tracer::fail("Invalid temporary data buffer.");
    }
    if (!m_isOpen) {
        return Tracer::fail("Device is not open.");
    }
    const VisaFunctions *visa = VisaLibrary::instance().functions(
        &VisaFunctions::viGetAttribute, &VisaFunctions::viSetAttribute, &VisaFunctions::viRead,
        &VisaFunctions::viClear);
    return visa != nullptr && BlockReader(*this, VisaSession(*visa, m_session), m_cancelRequested)
                                  .readStream(*stream, maximum);
}

void VisaDevice::recoverAfterTransferError(quint16 previousEnd, quint16 interfaceKind)
{
    const VisaFunctions *visa = VisaLibrary::instance().functions(
        &VisaFunctions::viSetAttribute, &VisaFunctions::viWrite, &VisaFunctions::viClear);
    if (visa == nullptr || !m_isOpen) {
        return;
    }
    const VisaSession session(*visa, m_session);
    session.setAttribute(VI_ATTR_SEND_END_EN, VI_TRUE);
    quint32 count = 0;
    (void)session.write(" ", 1, count);
    session.clear();
    checkErrorQueue();
    (void)sendCommand("*CLS");
    session.setAttribute(VI_ATTR_SEND_END_EN, previousEnd);
    if (interfaceKind == VI_INTF_GPIB) {
        (void)sendCommand(":SYST:COMM:GPIB:LTER STAN; *OPC?");
    }
}
