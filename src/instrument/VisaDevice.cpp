// SPDX-License-Identifier: Apache-2.0
#include "VisaDevice.h"

#include "VisaSession.h"
#include "instrumentmodels.h"
#include "instrumenttext.h"
#include "reachability.h"

#include "log/Tracer.h"

#include <QMutexLocker>

#include <algorithm>
#include <array>
#include <optional>

namespace {

constexpr int initialTimeoutMs = 5000;
constexpr quint32 writeBufferBytes = 2048;
constexpr quint32 readBufferBytes = 4096;
constexpr quint32 shortAnswerBytes = 1023;
constexpr quint32 longAnswerBytes = 32767;
constexpr int maxErrorsPerCheck = 20;
constexpr int maxLoggedAnswer = 200;

VisaLibrary &library()
{
    return VisaLibrary::instance();
}

bool notOpen()
{
    return Tracer::fail("Device is not open.");
}

} // namespace

VisaDevice::VisaDevice(bool noVisa, QObject *parent)
    : QObject(parent)
{
    reset();
    VisaLibrary &visa = library();
    const QMutexLocker locker(&visa.mutex);
    if (visa.devices.isEmpty() && !noVisa) {
        visa.manager = VI_NULL;
        const VisaFunctions &functions = visa.all();
        if (!visa.load()) {
            m_errorText = "The VISA library cannot be loaded.";
        } else if (functions.viOpenDefaultRM == nullptr || functions.viStatusDesc == nullptr) {
            m_errorText = "Cannot resolve functions in VISA Library.";
        } else {
            const ViStatus status = functions.viOpenDefaultRM(&visa.manager);
            if (status < VI_SUCCESS) {
                m_errorText = "The viOpenDefaultRM() failed: " + visa.statusText(VI_NULL, status);
                visa.manager = VI_NULL;
            }
        }
    }
    visa.devices.append(this);
}

VisaDevice::~VisaDevice()
{
    closeResource();
    VisaLibrary &visa = library();
    const QMutexLocker locker(&visa.mutex);
    visa.devices.removeOne(this);
    if (visa.devices.isEmpty() && visa.isLoaded()) {
        if (visa.manager != VI_NULL && visa.all().viClose != nullptr) {
            visa.all().viClose(visa.manager);
        }
        visa.manager = VI_NULL;
    }
}

void VisaDevice::reset()
{
    m_session = VI_NULL;
    m_isOpen = false;
    m_modelIndex = NoModel;
    for (QString *text :
         {&m_resource, &m_idn, &m_opt, &m_vendor, &m_model, &m_serial, &m_firmware, &m_errorText}) {
        text->clear();
    }
}

void VisaDevice::cancel()
{
    m_cancelRequested = true;
}

bool VisaDevice::openResource(const QString &resource)
{
    if (m_isOpen) {
        return Tracer::fail("Device is already open.");
    }
    Tracer::Trace(Tracer::Information, "Opening VISA device '" + resource + "'");
    const VisaFunctions *visa =
        library().functions(&VisaFunctions::viOpen, &VisaFunctions::viClear,
                            &VisaFunctions::viSetAttribute, &VisaFunctions::viSetBuf);
    if (visa == nullptr) {
        return false;
    }
    reset();
    const std::optional<QByteArray> name = toInstrument(resource);
    if (!name || (resource.contains("TCPIP", Qt::CaseInsensitive) && !isHostReachable(resource))) {
        return false;
    }
    ViStatus status = VI_ERROR_INV_OBJECT;
    {
        const QMutexLocker locker(&library().mutex);
        if (library().manager != VI_NULL) {
            status = visa->viOpen(library().manager, name->constData(), VI_NO_LOCK, 0, &m_session);
        }
    }
    if (status != VI_SUCCESS) {
        Tracer::Trace(Tracer::Error, "viOpen(): Cannot open instrument connection.");
        reportStatus(status);
        Tracer::Trace(Tracer::Error, "Check resource string or VISA installation.");
        m_session = VI_NULL;
        return false;
    }
    m_isOpen = true;
    Tracer::Trace(Tracer::Information, "Device opened. Configuring interface...");
    if (!configure()) {
        closeResource();
        return false;
    }
    m_resource = resource;
    if (!sendCommand("*CLS") || !queryText("*IDN?", m_idn) || !queryText("*OPT?", m_opt) ||
        !identify()) {
        closeResource();
        return false;
    }
    return true;
}

bool VisaDevice::configure()
{
    const VisaFunctions &visa = library().all();
    const VisaSession session(visa, m_session);
    ViStatus status = session.clear();
    if (status == VI_SUCCESS) {
        status = session.setAttribute(VI_ATTR_TMO_VALUE, initialTimeoutMs);
    }
    if (status == VI_SUCCESS) {
        status = visa.viSetBuf(m_session, VI_WRITE_BUF, writeBufferBytes);
    }
    if (status == VI_SUCCESS) {
        status = visa.viSetBuf(m_session, VI_READ_BUF, readBufferBytes);
    }
    if (status == VI_SUCCESS) {
        status = session.setAttribute(VI_ATTR_WR_BUF_OPER_MODE, VI_FLUSH_ON_ACCESS);
    }
    if (status == VI_SUCCESS) {
        status = session.setAttribute(VI_ATTR_RD_BUF_OPER_MODE, VI_FLUSH_ON_ACCESS);
    }
    if (status != VI_SUCCESS) {
        reportStatus(status);
    }
    return status == VI_SUCCESS;
}

bool VisaDevice::identify()
{
    m_vendor = m_idn.section(',', 0, 0);
    m_model = m_idn.section(',', 1, 1);
    m_firmware = m_idn.section(',', 3, 3);
    if (!m_vendor.toUpper().contains("HALVORN")) {
        return Tracer::fail("This device is not a Halvorn instrument.");
    }
    m_modelIndex = findModel(m_model);
    if (m_modelIndex == NoModel) {
        return Tracer::fail(QString("The device '%1' is not supported.").arg(m_model));
    }
    m_serial = serialOf(m_modelIndex, m_idn.section(',', 2, 2));
    return true;
}

bool VisaDevice::closeResource()
{
    if (!m_isOpen) {
        return true;
    }
    const VisaFunctions *visa = library().functions(
        &VisaFunctions::viGpibControlREN, &VisaFunctions::viClear, &VisaFunctions::viClose);
    if (visa == nullptr) {
        return false;
    }
    visa->viGpibControlREN(m_session, VI_GPIB_REN_DEASSERT_GTL);
    visa->viClear(m_session);
    visa->viClose(m_session);
    m_session = VI_NULL;
    m_isOpen = false;
    Tracer::Trace(Tracer::Information, "Device " + m_model + ", " + m_serial + " closed.");
    return true;
}

bool VisaDevice::sendCommand(const QString &command)
{
    if (!m_isOpen) {
        return notOpen();
    }
    Tracer::Trace(Tracer::Information, "VISA >> '" + command + "'");
    const VisaFunctions *visa =
        library().functions(&VisaFunctions::viRead, &VisaFunctions::viWrite);
    const std::optional<QByteArray> bytes = toInstrument(command);
    if (visa == nullptr || !bytes) {
        return false;
    }
    const VisaSession session(*visa, m_session);
    quint32 count = 0;
    if (!bytes->isEmpty()) {
        const ViStatus status = session.write(*bytes, count);
        if (status != VI_SUCCESS) {
            reportStatus(status);
            return false;
        }
    }
    if (!command.contains("*OPC?")) {
        return true;
    }
    std::array<char, shortAnswerBytes> buffer{};
    const ViStatus status = session.read(buffer.data(), shortAnswerBytes, count);
    if (status < VI_SUCCESS) {
        reportStatus(status);
        return false;
    }
    const QString answer = fromInstrument(buffer.data(), count);
    const bool isDone = answer.toInt() == 1;
    if (!isDone) {
        Tracer::Trace(Tracer::Error, "ERROR : R Unexpected Result from *OPC?");
    }
    Tracer::Trace(isDone ? Tracer::Information : Tracer::Error, "VISA << '" + answer + "'");
    return isDone;
}

bool VisaDevice::queryText(const QString &command, QString &answer)
{
    answer.clear();
    if (!m_isOpen) {
        return notOpen();
    }
    const VisaFunctions *visa =
        library().functions(&VisaFunctions::viRead, &VisaFunctions::viPrintf);
    const std::optional<QByteArray> bytes = toInstrument(command);
    if (visa == nullptr || !bytes) {
        return false;
    }
    if (!bytes->isEmpty()) {
        Tracer::Trace(Tracer::Information, "VISA >> '" + command + "'");
        const ViStatus status = visa->viPrintf(m_session, bytes->constData());
        if (status < VI_SUCCESS) {
            reportStatus(status);
            return false;
        }
    }
    QByteArray buffer(longAnswerBytes, '\0');
    quint32 count = 0;
    const ViStatus status =
        VisaSession(*visa, m_session).read(buffer.data(), longAnswerBytes, count);
    if (status < VI_SUCCESS) {
        reportStatus(status);
        return false;
    }
    answer = fromInstrument(buffer.constData(), count);
    Tracer::Trace(Tracer::Information, "VISA << '" + (answer.size() <= maxLoggedAnswer
                                                          ? answer
                                                          : answer.left(maxLoggedAnswer) + "..."));
    return checkErrorQueue();
}

bool VisaDevice::checkErrorQueue()
{
    if (!m_isOpen) {
        return notOpen();
    }
    const VisaFunctions *visa =
        library().functions(&VisaFunctions::viPrintf, &VisaFunctions::viRead);
    if (visa == nullptr) {
        return false;
    }
    bool hasErrors = false;
    for (int i = 0; i < maxErrorsPerCheck; ++i) {
        ViStatus status = visa->viPrintf(m_session, ":SYST:ERR?");
        if (status != VI_SUCCESS) {
            Tracer::Trace(Tracer::Error, ":SYST:ERR? Command failed.");
            reportStatus(status);
            return false;
        }
        std::array<char, shortAnswerBytes + 1> buffer{};
        quint32 count = 0;
        status = VisaSession(*visa, m_session).read(buffer.data(), shortAnswerBytes, count);
        // A remark such as "buffer full" counts as well: it would leave the rest of this answer to
        // the next query.
        if (status != VI_SUCCESS) {
            Tracer::Trace(Tracer::Error, "No response from :SYST:ERR?");
            reportStatus(status);
            return false;
        }
        const QString answer = fromInstrument(buffer.data(), count);
        bool isNumber = false;
        const int number = answer.section(',', 0, 0).toInt(&isNumber);
        if (!isNumber || number == 0) {
            break;
        }
        m_errorText += answer + '\n';
        Tracer::Trace(Tracer::Information, "Instrument reports '" + answer + "'");
        hasErrors = true;
    }
    return !hasErrors;
}

QString VisaDevice::takeLastError()
{
    return std::exchange(m_errorText, QString());
}

bool VisaDevice::setTimeoutMs(quint32 milliseconds)
{
    const VisaFunctions *visa = library().functions(&VisaFunctions::viSetAttribute);
    if (visa == nullptr) {
        return false;
    }
    if (!m_isOpen) {
        return notOpen();
    }
    return VisaSession(*visa, m_session).setAttribute(VI_ATTR_TMO_VALUE, milliseconds) ==
           VI_SUCCESS;
}

quint32 VisaDevice::timeoutMs() const
{
    const VisaFunctions *visa = library().functions(&VisaFunctions::viGetAttribute);
    ViUInt32 milliseconds = 0;
    if (visa == nullptr ||
        VisaSession(*visa, m_session).getAttribute(VI_ATTR_TMO_VALUE, milliseconds) < VI_SUCCESS) {
        return 0;
    }
    return milliseconds;
}

bool VisaDevice::interfaceType(quint16 &type) const
{
    if (!m_isOpen) {
        return notOpen();
    }
    const VisaFunctions *visa = library().functions(&VisaFunctions::viGetAttribute);
    if (visa == nullptr) {
        return false;
    }
    ViUInt16 value = 0;
    const ViStatus status = VisaSession(*visa, m_session).getAttribute(VI_ATTR_INTF_TYPE, value);
    if (status != VI_SUCCESS) {
        reportStatus(status);
        return false;
    }
    type = value;
    return true;
}

void VisaDevice::reportStatus(qint32 status) const
{
    const QString text =
        library().statusText(m_session != VI_NULL ? m_session : library().manager, status);
    if (!text.isEmpty()) {
        Tracer::Trace(Tracer::Error, "ERROR: " + text);
    }
}

bool VisaDevice::isOpenElsewhere(const QString &model, const QString &serial) const
{
    if (model.isEmpty() || serial.isEmpty()) {
        return false;
    }
    const QMutexLocker locker(&library().mutex);
    return std::any_of(library().devices.cbegin(), library().devices.cend(),
                       [&](const VisaDevice *other) {
                           return other != this && other->m_isOpen && other->m_model == model &&
                                  other->m_serial == serial;
                       });
}
