// SPDX-License-Identifier: Apache-2.0
#include "VisaSession.h"

#include "instrumenttext.h"
#include "reachability.h"

#include "log/Tracer.h"

#include <QMutexLocker>

#include <array>

namespace {

using Outcome = Exchange::Outcome;

constexpr int InitialTimeoutMs = 5000;
constexpr quint32 WriteBufferBytes = 2048;
constexpr quint32 ReadBufferBytes = 4096;
constexpr quint32 ShortAnswerBytes = 1023;
constexpr quint32 LongAnswerBytes = 32767;
constexpr int MaxErrorsPerCheck = 20;
constexpr int MaxLoggedAnswer = 200;

VisaLibrary &library()
{
    return VisaLibrary::instance();
}

Exchange notOpen()
{
    (void)VisaSession::failNotOpen();
    return {Outcome::NotOpen};
}

void note(const QString &text)
{
    Tracer::Trace(Tracer::Information, text);
}

} // namespace

bool VisaSession::failNotOpen()
{
    return Tracer::fail("Device is not open.");
}

Exchange VisaSession::failWith(ViStatus status) const
{
    reportStatus(status);
    return {Outcome::Failed, status};
}

Exchange VisaSession::open(const QString &resource)
{
    if (m_isOpen) {
        (void)Tracer::fail("Device is already open.");
        return {Outcome::NotOpen};
    }
    note("Opening VISA device '" + resource + "'");
    if (library().functions(&VisaFunctions::viOpen, &VisaFunctions::viClear,
                            &VisaFunctions::viSetAttribute, &VisaFunctions::viSetBuf) == nullptr) {
        return {Outcome::NoLibrary};
    }
    m_errors.clear();
    const std::optional<QByteArray> name = toInstrument(resource);
    if (!name || (resource.contains("TCPIP", Qt::CaseInsensitive) && !isHostReachable(resource))) {
        return {Outcome::Unsendable};
    }
    ViStatus status = VI_ERROR_INV_OBJECT;
    {
        const QMutexLocker locker(&library().mutex);
        if (library().manager != VI_NULL) {
            status = visa().viOpen(library().manager, name->constData(), VI_NO_LOCK, 0, &m_handle);
        }
    }
    if (status != VI_SUCCESS) {
        Tracer::Trace(Tracer::Error, "viOpen(): Cannot open instrument connection.");
        reportStatus(status);
        Tracer::Trace(Tracer::Error, "Check resource string or VISA installation.");
        m_handle = VI_NULL;
        return {Outcome::Failed, status};
    }
    m_isOpen = true;
    note("Device opened. Configuring interface...");
    status = configure();
    return status == VI_SUCCESS ? Exchange{} : failWith(status);
}

ViStatus VisaSession::configure() const
{
    ViStatus status = clear();
    if (status == VI_SUCCESS) {
        status = setAttribute(VI_ATTR_TMO_VALUE, InitialTimeoutMs);
    }
    if (status == VI_SUCCESS) {
        status = visa().viSetBuf(m_handle, VI_WRITE_BUF, WriteBufferBytes);
    }
    if (status == VI_SUCCESS) {
        status = visa().viSetBuf(m_handle, VI_READ_BUF, ReadBufferBytes);
    }
    if (status == VI_SUCCESS) {
        status = setAttribute(VI_ATTR_WR_BUF_OPER_MODE, VI_FLUSH_ON_ACCESS);
    }
    if (status == VI_SUCCESS) {
        status = setAttribute(VI_ATTR_RD_BUF_OPER_MODE, VI_FLUSH_ON_ACCESS);
    }
    return status;
}

Exchange VisaSession::close()
{
    if (!m_isOpen) {
        return {};
    }
    if (library().functions(&VisaFunctions::viGpibControlREN, &VisaFunctions::viClear,
                            &VisaFunctions::viClose) == nullptr) {
        return {Outcome::NoLibrary};
    }
    visa().viGpibControlREN(m_handle, VI_GPIB_REN_DEASSERT_GTL);
    clear();
    visa().viClose(m_handle);
    m_handle = VI_NULL;
    m_isOpen = false;
    return {};
}

Exchange VisaSession::send(const QString &command)
{
    if (!m_isOpen) {
        return notOpen();
    }
    note("VISA >> '" + command + "'");
    if (library().functions(&VisaFunctions::viRead, &VisaFunctions::viWrite) == nullptr) {
        return {Outcome::NoLibrary};
    }
    const std::optional<QByteArray> bytes = toInstrument(command);
    if (!bytes) {
        return {Outcome::Unsendable};
    }
    quint32 count = 0;
    if (!bytes->isEmpty()) {
        const ViStatus status = write(*bytes, count);
        if (status != VI_SUCCESS) {
            return failWith(status);
        }
    }
    if (!command.contains("*OPC?")) {
        return {};
    }
    std::array<char, ShortAnswerBytes> buffer{};
    const ViStatus status = read(buffer.data(), ShortAnswerBytes, count);
    if (status < VI_SUCCESS) {
        return failWith(status);
    }
    const QString answer = fromInstrument(buffer.data(), count);
    const bool isDone = answer.toInt() == 1;
    if (!isDone) {
        Tracer::Trace(Tracer::Error, "ERROR : R Unexpected Result from *OPC?");
    }
    Tracer::Trace(isDone ? Tracer::Information : Tracer::Error, "VISA << '" + answer + "'");
    return {isDone ? Outcome::Done : Outcome::Refused};
}

Exchange VisaSession::query(const QString &command, QString &answer)
{
    answer.clear();
    if (!m_isOpen) {
        return notOpen();
    }
    if (library().functions(&VisaFunctions::viRead, &VisaFunctions::viWrite) == nullptr) {
        return {Outcome::NoLibrary};
    }
    const std::optional<QByteArray> bytes = toInstrument(command);
    if (!bytes) {
        return {Outcome::Unsendable};
    }
    quint32 count = 0;
    if (!bytes->isEmpty()) {
        note("VISA >> '" + command + "'");
        // Not by viPrintf, which would take a "%" or a backslash in a path for its own.
        const ViStatus status = write(*bytes, count);
        if (status < VI_SUCCESS) {
            return failWith(status);
        }
    }
    QByteArray buffer(LongAnswerBytes, '\0');
    const ViStatus status = read(buffer.data(), LongAnswerBytes, count);
    if (status < VI_SUCCESS) {
        return failWith(status);
    }
    answer = fromInstrument(buffer.constData(), count);
    note("VISA << '" +
         (answer.size() <= MaxLoggedAnswer ? answer : answer.left(MaxLoggedAnswer) + "..."));
    return checkErrorQueue();
}

Exchange VisaSession::checkErrorQueue()
{
    if (!m_isOpen) {
        return notOpen();
    }
    if (library().functions(&VisaFunctions::viPrintf, &VisaFunctions::viRead) == nullptr) {
        return {Outcome::NoLibrary};
    }
    Exchange result;
    for (int i = 0; i < MaxErrorsPerCheck; ++i) {
        ViStatus status = visa().viPrintf(m_handle, ":SYST:ERR?");
        if (status != VI_SUCCESS) {
            Tracer::Trace(Tracer::Error, ":SYST:ERR? Command failed.");
            return failWith(status);
        }
        std::array<char, ShortAnswerBytes + 1> buffer{};
        quint32 count = 0;
        status = read(buffer.data(), ShortAnswerBytes, count);
        // A remark such as "buffer full" counts as well: it would leave the rest of this answer to
        // the next query.
        if (status != VI_SUCCESS) {
            Tracer::Trace(Tracer::Error, "No response from :SYST:ERR?");
            return failWith(status);
        }
        const QString answer = fromInstrument(buffer.data(), count);
        bool isNumber = false;
        const int number = answer.section(',', 0, 0).toInt(&isNumber);
        if (!isNumber || number == 0) {
            break;
        }
        m_errors += answer + '\n';
        note("Instrument reports '" + answer + "'");
        result.outcome = Outcome::Refused;
    }
    return result;
}

Exchange VisaSession::setTimeoutMs(quint32 milliseconds)
{
    if (library().functions(&VisaFunctions::viSetAttribute) == nullptr) {
        return {Outcome::NoLibrary};
    }
    if (!m_isOpen) {
        return notOpen();
    }
    const ViStatus status = setAttribute(VI_ATTR_TMO_VALUE, milliseconds);
    return {status == VI_SUCCESS ? Outcome::Done : Outcome::Failed, status};
}

std::optional<quint32> VisaSession::timeoutMs() const
{
    ViUInt32 milliseconds = 0;
    if (library().functions(&VisaFunctions::viGetAttribute) == nullptr ||
        getAttribute(VI_ATTR_TMO_VALUE, milliseconds) < VI_SUCCESS) {
        return std::nullopt;
    }
    return milliseconds;
}

std::optional<quint16> VisaSession::interfaceType() const
{
    if (!m_isOpen) {
        (void)failNotOpen();
        return std::nullopt;
    }
    if (library().functions(&VisaFunctions::viGetAttribute) == nullptr) {
        return std::nullopt;
    }
    ViUInt16 value = 0;
    const ViStatus status = getAttribute(VI_ATTR_INTF_TYPE, value);
    if (status != VI_SUCCESS) {
        reportStatus(status);
        return std::nullopt;
    }
    return value;
}

void VisaSession::reportStatus(ViStatus status) const
{
    const QString text =
        library().statusText(m_handle != VI_NULL ? m_handle : library().manager, status);
    if (!text.isEmpty()) {
        Tracer::Trace(Tracer::Error, "ERROR: " + text);
    }
}
