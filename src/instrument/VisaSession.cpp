// SPDX-License-Identifier: Apache-2.0
#include "VisaSession.h"

#include "OperationControl.h"
#include "Transcript.h"
#include "instrumenttext.h"
#include "reachability.h"

#include "log/Tracer.h"

#include <QElapsedTimer>
#include <QMutexLocker>

#include <array>

namespace {

using Outcome = Exchange::Outcome;

constexpr int InitialTimeoutMs = 5000;
constexpr quint32 WriteBufferBytes = 2048;
constexpr quint32 ReadBufferBytes = 4096;
constexpr quint32 ShortAnswerBytes = 1023;
constexpr quint32 LongAnswerBytes = 32767;
constexpr qsizetype MaxAnswerBytes = 64 * 1024 * 1024;
constexpr int MaxErrorsPerCheck = 20;
constexpr qint64 MaxErrorsMs = 10'000;
/// What an instrument that has just let time run out gets to show that it is still there.
constexpr quint32 ClearMs = 200;
constexpr quint32 QueueMs = 500;
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

/// While it lives, an instrument that is late gets no more than a short time, so that one that has
/// gone silent costs one time-out and not one for each step of the clean-up.
class VisaSession::Patience
{
public:
    Patience(const VisaSession &session, quint32 milliseconds, bool isShort)
        : m_session(session)
        , m_isShort(isShort && milliseconds < session.m_timeoutMs)
    {
        if (m_isShort) {
            m_session.setAttribute(VI_ATTR_TMO_VALUE, milliseconds);
        }
    }
    ~Patience()
    {
        if (m_isShort) {
            m_session.setAttribute(VI_ATTR_TMO_VALUE, m_session.m_timeoutMs);
        }
    }
    Patience(const Patience &) = delete;
    Patience &operator=(const Patience &) = delete;

private:
    const VisaSession &m_session;
    bool m_isShort;
};

bool VisaSession::failNotOpen()
{
    return Tracer::fail("Device is not open.");
}

Exchange VisaSession::failWith(ViStatus status) const
{
    reportStatus(status);
    return {Outcome::Failed, status};
}

Exchange VisaSession::failRead(ViStatus status)
{
    const Exchange result = failWith(status);
    clear();
    return result;
}

ViStatus VisaSession::noted(ViStatus status)
{
    m_isLate = m_isLate || status == VI_ERROR_TMO;
    return status;
}

void VisaSession::fallSilent()
{
    m_isSilent = true;
    Tracer::Trace(Tracer::Error,
                  "The instrument has fallen silent. Open it again once it answers.");
}

ViStatus VisaSession::read(char *buffer, quint32 size, quint32 &count)
{
    count = 0;
    if (m_isSilent) {
        return VI_ERROR_CONN_LOST;
    }
    ViUInt32 received = 0;
    const ViStatus status =
        visa().viRead(m_handle, reinterpret_cast<ViByte *>(buffer), size, &received);
    count = std::min<quint32>(received, size);
    m_isLate = m_isLate && status < VI_SUCCESS;
    return noted(status);
}

ViStatus VisaSession::write(const char *bytes, quint32 size, quint32 &count)
{
    count = 0;
    if (m_isSilent) {
        return VI_ERROR_CONN_LOST;
    }
    const Patience patience(*this, ClearMs, m_isLate);
    return noted(visa().viWrite(m_handle, reinterpret_cast<const ViByte *>(bytes), size, &count));
}

ViStatus VisaSession::clear()
{
    if (m_isSilent) {
        return VI_ERROR_CONN_LOST;
    }
    const Patience patience(*this, ClearMs, m_isLate);
    const ViStatus status = visa().viClear(m_handle);
    if (m_isLate && status < VI_SUCCESS) {
        fallSilent();
    }
    return status;
}

Exchange VisaSession::open(const QString &resource, const OperationControl &control)
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
    if (!name ||
        (resource.contains("TCPIP", Qt::CaseInsensitive) && !isHostReachable(resource, control))) {
        return {Outcome::Unsendable};
    }
    m_name = *name;
    m_isStream = resource.endsWith("::SOCKET", Qt::CaseInsensitive);
    ViStatus status = openHandle();
    if (status != VI_SUCCESS) {
        Tracer::Trace(Tracer::Error, "viOpen(): Cannot open instrument connection.");
        reportStatus(status);
        Tracer::Trace(Tracer::Error, "Check resource string or VISA installation.");
        m_handle = VI_NULL;
        return {Outcome::Failed, status};
    }
    note("Device opened. Configuring interface...");
    status = configure();
    return status == VI_SUCCESS ? Exchange{} : failWith(status);
}

ViStatus VisaSession::openHandle()
{
    ViStatus status = VI_ERROR_INV_OBJECT;
    const QMutexLocker locker(&library().mutex);
    if (library().manager != VI_NULL) {
        status = visa().viOpen(library().manager, m_name.constData(), VI_NO_LOCK, 0, &m_handle);
    }
    m_isOpen = status == VI_SUCCESS;
    m_isLate = false;
    m_isSilent = false;
    return status;
}

Exchange VisaSession::reopen()
{
    visa().viClose(m_handle);
    ViStatus status = openHandle();
    if (!m_isOpen) {
        m_handle = VI_NULL;
        return failWith(status);
    }
    const quint32 timeoutMs = m_timeoutMs;
    status = configure();
    if (status != VI_SUCCESS) {
        return failWith(status);
    }
    note("The connection to the instrument was lost and has been made anew.");
    return setTimeoutMs(timeoutMs);
}

ViStatus VisaSession::configure()
{
    m_timeoutMs = InitialTimeoutMs;
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
    if (!m_isSilent) {
        const Patience patience(*this, ClearMs, true);
        const ViStatus status = visa().viGpibControlREN(m_handle, VI_GPIB_REN_DEASSERT_GTL);
        // Of a stream a clear makes a new connection, which would only be closed.
        if (status != VI_ERROR_TMO && !m_isStream) {
            visa().viClear(m_handle);
        }
    }
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
    Transcript::sent(command);
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
        return failRead(status);
    }
    const QString answer = fromInstrument(buffer.data(), count);
    Transcript::received(answer);
    const bool isDone = answer.toInt() == 1;
    if (!isDone && status == VI_SUCCESS_MAX_CNT) {
        clear();
    }
    if (!isDone) {
        Tracer::Trace(Tracer::Error, "ERROR : R Unexpected Result from *OPC?");
    }
    Tracer::Trace(isDone ? Tracer::Information : Tracer::Error, "VISA << '" + answer + "'");
    return {isDone ? Outcome::Done : Outcome::Refused};
}

ViStatus VisaSession::readAll(QByteArray &bytes)
{
    // An instrument answers a list of its files as one message, however long.
    for (quint32 room = LongAnswerBytes;; room = 2 * LongAnswerBytes) {
        const qsizetype size = bytes.size();
        bytes.resize(size + room);
        quint32 count = 0;
        const ViStatus status = read(bytes.data() + size, room, count);
        bytes.truncate(size + count);
        if (status != VI_SUCCESS_MAX_CNT) {
            return status;
        }
        if (bytes.size() > MaxAnswerBytes) {
            Tracer::Trace(Tracer::Error,
                          QString("The answer of the instrument is longer than %1 bytes.")
                              .arg(MaxAnswerBytes));
            return VI_ERROR_ALLOC;
        }
    }
}

Exchange VisaSession::query(const QString &command, QString &answer, Blanks blanks)
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
        Transcript::sent(command);
        // Not by viPrintf, which would take a "%" or a backslash in a path for its own.
        const ViStatus status = write(*bytes, count);
        if (status < VI_SUCCESS) {
            return failWith(status);
        }
    }
    QByteArray buffer;
    const ViStatus status = readAll(buffer);
    if (status < VI_SUCCESS) {
        return failRead(status);
    }
    answer = blanks == Blanks::Kept ? wholeTextOf(buffer) : fromInstrument(buffer);
    Transcript::received(answer);
    note("VISA << '" +
         (answer.size() <= MaxLoggedAnswer ? answer : answer.left(MaxLoggedAnswer) + "..."));
    return checkErrorQueue();
}

std::optional<QString> VisaSession::ask(const QString &query, quint32 milliseconds)
{
    const std::optional<QByteArray> bytes = toInstrument(query);
    if (!m_isOpen || !bytes) {
        return std::nullopt;
    }
    const Patience patience(*this, milliseconds, true);
    Transcript::sent(query);
    quint32 count = 0;
    std::array<char, ShortAnswerBytes> buffer{};
    ViStatus status = write(*bytes, count);
    if (status == VI_SUCCESS) {
        status = read(buffer.data(), ShortAnswerBytes, count);
    }
    if (status >= VI_SUCCESS && status != VI_SUCCESS_MAX_CNT) {
        const QString answer = fromInstrument(buffer.data(), count);
        Transcript::received(answer);
        return answer;
    }
    clear();
    // What it said about a query that it doesn't know is no error of anybody's.
    const QString errors = m_errors;
    (void)checkErrorQueue();
    m_errors = errors;
    return std::nullopt;
}

ViStatus VisaSession::readError(QString &answer)
{
    const Patience patience(*this, QueueMs, m_isLate && !m_isSilent);
    Transcript::sent(":SYST:ERR?");
    ViStatus status =
        m_isSilent ? VI_ERROR_CONN_LOST : noted(visa().viPrintf(m_handle, ":SYST:ERR?"));
    if (status != VI_SUCCESS) {
        Tracer::Trace(Tracer::Error, ":SYST:ERR? Command failed.");
        return status;
    }
    const bool wasLate = m_isLate;
    std::array<char, ShortAnswerBytes + 1> buffer{};
    quint32 count = 0;
    status = read(buffer.data(), ShortAnswerBytes, count);
    // A remark such as "buffer full" counts as well: it would leave the rest of this answer to the
    // next query.
    if (status != VI_SUCCESS) {
        Tracer::Trace(Tracer::Error, "No response from :SYST:ERR?");
        if (wasLate && status == VI_ERROR_TMO) {
            fallSilent();
        }
        clear();
    }
    answer = fromInstrument(buffer.data(), count);
    if (status == VI_SUCCESS) {
        Transcript::received(answer);
    }
    return status;
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
    QElapsedTimer time;
    time.start();
    for (int i = 0; i < MaxErrorsPerCheck && !time.hasExpired(MaxErrorsMs); ++i) {
        QString answer;
        const ViStatus status = readError(answer);
        if (status != VI_SUCCESS) {
            return failWith(status);
        }
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
    if (status == VI_SUCCESS) {
        m_timeoutMs = milliseconds;
    }
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
