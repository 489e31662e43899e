// SPDX-License-Identifier: Apache-2.0
#include "BlockWriter.h"

#include "InstrumentFiles.h"
#include "Transcript.h"
#include "instrumenttext.h"
#include "remotepaths.h"

#include "base/ProgressClock.h"
#include "log/Tracer.h"

#include <QElapsedTimer>
#include <QFile>
#include <QFileInfo>

#include <algorithm>
#include <limits>
#include <optional>

namespace {

/// For each block a network asks for a round trip, so the fewer the better; the VISA layer cuts
/// them to what the other end takes.
qint64 blockBytesOf(quint16 interfaceKind)
{
    constexpr qint64 Network = 64 * 1024;
    constexpr qint64 Usb = 16 * 1024;
    constexpr qint64 Other = 1024;
    return interfaceKind == VI_INTF_TCPIP ? Network : interfaceKind == VI_INTF_USB ? Usb : Other;
}

/// Largest byte count that fits in the nine digits of the definite form.
constexpr qint64 MaxDefiniteBytes = 999'999'999;
/// The instrument's byte count is a signed 32-bit number.
constexpr qint64 MaxFileBytes = std::numeric_limits<qint32>::max();

void note(const QString &text)
{
    Tracer::Trace(Tracer::Information, text);
}

} // namespace

BlockWriter::BlockWriter(VisaSession &session, InstrumentFiles &files, OperationControl &control)
    : m_session(session)
    , m_files(files)
    , m_control(control)
{
}

QString BlockWriter::header(const QString &remotePath, qint64 size)
{
    const QString count = QString::number(size);
    const QString head = size <= MaxDefiniteBytes ? QString("#%1%2").arg(count.size()).arg(count)
                                                  : "#(" + count + ')';
    return ":MMEM:DATA " + commandString(remotePath) + ',' + head;
}

bool BlockWriter::writeFile(const QString &localPath, const QString &remotePath)
{
    const qint64 size = QFileInfo(localPath).size();
    if (size == 0) {
        return Tracer::fail("Local file has zero size.");
    }
    if (size > MaxFileBytes) {
        return Tracer::fail(QString("The local file '%1' has %2 bytes; an instrument takes at most "
                                    "%3.")
                                .arg(localPath)
                                .arg(size)
                                .arg(MaxFileBytes));
    }
    const QString head = header(remotePath, size);
    const std::optional<QByteArray> headBytes = toInstrument(head);
    // A file that can't be read must not cost the one that it was to replace.
    QFile file(localPath);
    if (headBytes && !file.open(QIODevice::ReadOnly)) {
        return Tracer::fail("Error opening local input file.");
    }
    if (!headBytes || !removeOldFile(remotePath)) {
        return false;
    }
    m_control.report(0);
    if (!prepareSession()) {
        return false;
    }
    note(QString("Sending %1 bytes of binary data...").arg(size));
    note("VISA >> '" + head + "...'");
    Transcript::sent(":MMEM:DATA " + commandString(remotePath) + ',' + Transcript::blockText(size));
    quint32 count = 0;
    if (const ViStatus status = m_session.write(*headBytes, count); status != VI_SUCCESS) {
        m_session.reportStatus(status);
        recover(m_session, m_previousEnd, m_interface);
        return false;
    }
    Tracer::Trace(Tracer::Debug, "VISA >> Sending data");
    QElapsedTimer rateTimer;
    rateTimer.start();
    if (!sendFile(file, size)) {
        abandon(remotePath);
        return false;
    }
    const qint64 elapsedMs = std::max<qint64>(rateTimer.elapsed(), 1);
    Tracer::Trace(Tracer::Debug, "VISA >> Setting back VI_ATTR_SEND_END_EN attribute.");
    if (!setSendEnd(m_previousEnd)) {
        return false;
    }
    m_control.report(100);
    if (m_interface == VI_INTF_GPIB && !m_session.send(":SYST:COMM:GPIB:LTER STAN; *OPC?")) {
        return false;
    }
    if (!m_session.checkErrorQueue()) {
        return false;
    }
    note(QString("Transfer rate was %1 bytes/s.").arg(size * 1000 / elapsedMs));
    return true;
}

bool BlockWriter::removeOldFile(const QString &remotePath)
{
    const RemotePath parts = splitPath(remotePath);
    QList<RemoteFileEntry> entries;
    if (!m_files.listDirectory(entries, parts.directory)) {
        return false;
    }
    return std::all_of(entries.cbegin(), entries.cend(), [&](const RemoteFileEntry &entry) {
        return entry.isDirectory() || entry.name != parts.fileName ||
               m_session.send(":MMEM:DEL " + commandString(remotePath) + "; *OPC?");
    });
}

bool BlockWriter::prepareSession()
{
    const std::optional<quint16> interfaceKind = m_session.interfaceType();
    if (!interfaceKind) {
        return false;
    }
    m_interface = *interfaceKind;
    m_buffer.resize(blockBytesOf(m_interface));
    // The instrument then takes only EOI for the end of a message, so that a line feed among the
    // data can't end it.
    if (m_interface == VI_INTF_GPIB && !m_session.send(":SYST:COMM:GPIB:LTER EOI; *OPC?")) {
        return Tracer::fail("Cannot set instrument EOI mode.");
    }
    const ViStatus status = m_session.getAttribute(VI_ATTR_SEND_END_EN, m_previousEnd);
    if (status != VI_SUCCESS) {
        m_session.reportStatus(status);
        return false;
    }
    return setSendEnd(VI_FALSE);
}

bool BlockWriter::setSendEnd(ViAttrState value) const
{
    const ViStatus status = m_session.setAttribute(VI_ATTR_SEND_END_EN, value);
    if (status != VI_SUCCESS) {
        m_session.reportStatus(status);
    }
    return status == VI_SUCCESS;
}

bool BlockWriter::sendFile(QFile &file, qint64 size)
{
    ProgressClock progress(m_control.report, m_control.cancelled);
    for (qint64 remaining = size; remaining > 0;) {
        const qint64 wanted = std::min<qint64>(remaining, m_buffer.size());
        if (remaining <= m_buffer.size()) {
            Tracer::Trace(Tracer::Debug, "VISA >> Sending last data block.");
            if (!setSendEnd(VI_TRUE)) {
                return false;
            }
        }
        const qint64 available = file.read(m_buffer.data(), wanted);
        if (available != wanted) {
            return failOnSource(wanted, available, remaining);
        }
        quint32 count = 0;
        const ViStatus status =
            m_session.write(m_buffer.constData(), static_cast<quint32>(wanted), count);
        if (status != VI_SUCCESS) {
            m_session.reportStatus(status);
            return false;
        }
        if (count != wanted) {
            return Tracer::fail(
                "The number of bytes to send disagrees with the number of bytes sent.");
        }
        remaining -= wanted;
        if (progress.shouldStop(size - remaining, size)) {
            m_wasCancelled = true;
            return false;
        }
    }
    return true;
}

bool BlockWriter::failOnSource(qint64 wanted, qint64 count, qint64 remaining) const
{
    Tracer::Trace(Tracer::Error, QString("Error: %1 bytes required from input file.").arg(wanted));
    Tracer::Trace(Tracer::Error, QString("Error: %1 bytes read from file.").arg(count));
    Tracer::Trace(Tracer::Error, QString("Error: %1 bytes remaining for transfer.").arg(remaining));
    return false;
}

void BlockWriter::recover(VisaSession &session, ViBoolean previousEnd, quint16 interfaceKind)
{
    session.setAttribute(VI_ATTR_SEND_END_EN, VI_TRUE);
    quint32 count = 0;
    (void)session.write(" ", 1, count);
    if (session.clear() == VI_ERROR_CONN_LOST && !session.isSilent() && !session.reopen()) {
        return;
    }
    (void)session.checkErrorQueue();
    (void)session.send("*CLS");
    session.setAttribute(VI_ATTR_SEND_END_EN, previousEnd);
    if (interfaceKind == VI_INTF_GPIB) {
        (void)session.send(":SYST:COMM:GPIB:LTER STAN; *OPC?");
    }
}

/// Leaves no partial file on the instrument.
void BlockWriter::abandon(const QString &remotePath)
{
    recover(m_session, m_previousEnd, m_interface);
    (void)m_files.deleteRemoteFile(remotePath);
    if (m_wasCancelled) {
        note("*** Transfer aborted by user.");
    }
}
