// SPDX-License-Identifier: Apache-2.0
#include "DoctorJob.h"

#include "instrument/InstrumentIdentity.h"
#include "instrument/OperationControl.h"
#include "instrument/VisaDevice.h"
#include "instrument/portmapmessage.h"
#include "instrument/reachability.h"
#include "instrument/remotepaths.h"
#include "log/Tracer.h"

#include <QCoreApplication>
#include <QDir>
#include <QFileInfo>
#include <QTcpSocket>
#include <QUdpSocket>
#include <QtEndian>

#include <array>
#include <utility>

namespace {

struct Port
{
    quint16 number;
    const char *use;
};

constexpr std::array<Port, 3> Ports{
    {{111, "RPC port mapper"}, {4880, "HiSLIP"}, {5025, "plain SCPI"}}};
enum PortPlace { PortMapper, Hislip, PlainScpi };

QString joined(const QList<QHostAddress> &addresses)
{
    QStringList texts;
    for (const QHostAddress &address : addresses) {
        texts.append(address.toString());
    }
    return texts.join(", ");
}

} // namespace

DoctorJob::DoctorJob(QString host, QObject *parent)
    : ToolJob(parent)
    , m_host(std::move(host))
{
}

void DoctorJob::note(const QString &step, bool ok, const QString &text, const QString &advice)
{
    m_steps.append({.step = step, .ok = ok, .text = text, .advice = advice});
    QCoreApplication::processEvents();
}

bool DoctorJob::work()
{
    emit stepStarted(QString("Examining %1...").arg(m_host));
    OperationControl control;
    control.report = [](int) {};
    control.takesInput = true;
    connect(this, &ToolJob::cancelRequested, this, [&control] { control.cancelled = true; });
    QString problem;
    const QList<QHostAddress> addresses = addressesOf(m_host, control, problem);
    bool isReached = false;
    if (addresses.isEmpty()) {
        note("name", false, QString("No address for '%1': %2").arg(m_host, problem),
             "Check the spelling, or use the address that the instrument shows in its network "
             "settings.");
    } else {
        note("name", true, QString("%1 is %2.").arg(m_host, joined(addresses)));
        findRoute(addresses.first());
        QList<quint16> numbers;
        for (const Port &port : Ports) {
            numbers.append(port.number);
        }
        const QList<bool> areOpen = openPorts(addresses, numbers, control);
        for (size_t i = 0; i < Ports.size() && !isCancelled(); ++i) {
            const bool isOpen = areOpen.at(static_cast<qsizetype>(i));
            const QString name = QString("port %1 (%2)").arg(Ports[i].number).arg(Ports[i].use);
            note(QString("tcp %1").arg(Ports[i].number), isOpen,
                 isOpen ? "The " + name + " takes connections."
                        : "The " + name + " takes no connection.",
                 isOpen ? QString()
                        : QString("Switch the service on in the instrument's network settings, and "
                                  "let the firewall pass it."));
        }
        if (areOpen.at(PortMapper) && !isCancelled()) {
            askPortMapper(addresses.first());
        }
        isReached = !isCancelled() && talk(roads(areOpen));
    }
    findUsbRights();
    if (isCancelled()) {
        return false;
    }
    return isReached ||
           Tracer::fail(QString("No way to an instrument at '%1' was found.").arg(m_host));
}

void DoctorJob::findRoute(const QHostAddress &address)
{
    // Nothing is sent: to connect a datagram socket only chooses the way.
    constexpr quint16 AnyPort = 9;
    constexpr int ChoiceMs = 1000;
    QUdpSocket socket;
    socket.connectToHost(address, AnyPort);
    const bool isKnown = socket.waitForConnected(ChoiceMs);
    note("route", isKnown,
         isKnown ? QString("%1 is reached from %2.")
                       .arg(address.toString(), socket.localAddress().toString())
                 : QString("No way to %1: %2").arg(address.toString(), socket.errorString()),
         isKnown ? QString() : QString("Check the cable and this computer's network settings."));
}

void DoctorJob::askPortMapper(const QHostAddress &address)
{
    constexpr quint32 Id = 0x48560001;
    constexpr int AnswerMs = 3000;
    constexpr qsizetype ReplyBytes = 28;
    constexpr qsizetype MarkBytes = 4;
    constexpr quint32 LastFragment = 0x80000000;
    const QByteArray call = coreChannelCall(Id);
    QByteArray record(MarkBytes, '\0');
    qToBigEndian(LastFragment | static_cast<quint32>(call.size()), record.data());
    QTcpSocket socket;
    socket.connectToHost(address, Ports[PortMapper].number);
    std::optional<quint16> port;
    if (socket.waitForConnected(AnswerMs)) {
        socket.write(record + call);
        while (socket.bytesAvailable() < MarkBytes + ReplyBytes &&
               socket.waitForReadyRead(AnswerMs)) {
        }
        port = coreChannelPort(socket.readAll().mid(MarkBytes), Id);
    }
    const bool isThere = port.value_or(0) != 0;
    note("port mapper", isThere,
         !port     ? QString("The port mapper gives no answer.")
         : isThere ? QString("The VXI-11 core channel is on port %1.").arg(*port)
                   : QString("The host serves no VXI-11."),
         isThere
             ? QString()
             : QString("Switch VXI-11 on in the instrument's network settings, or use HiSLIP."));
}

QStringList DoctorJob::roads(const QList<bool> &areOpen) const
{
    QStringList resources;
    if (areOpen.at(PortMapper) && areOpen.at(PlainScpi)) {
        resources.append(networkHead(m_host) + "INSTR");
    }
    if (areOpen.at(Hislip)) {
        resources.append(networkHead(m_host) + "hislip0::INSTR");
    }
    return resources;
}

bool DoctorJob::talk(const QStringList &resources)
{
    if (resources.isEmpty()) {
        note("link", false, "No road is open on which a session could be opened.",
             "HiSLIP needs port 4880; VXI-11 and plain SCPI need the ports 111 and 5025 both.");
        return false;
    }
    bool isReached = false;
    for (const QString &resource : resources) {
        VisaDevice device;
        device.setTakesInput(true);
        const auto stop = connect(this, &ToolJob::cancelRequested, &device, &VisaDevice::cancel);
        const QString problem = device.takeLastError();
        const bool isOpen = device.openResource(resource);
        disconnect(stop);
        const InstrumentIdentity &identity = device.identity();
        const bool isAnswered = !identity.idn.isEmpty();
        note("link", isOpen || isAnswered,
             isOpen || isAnswered ? QString("A session with %1 could be opened.").arg(resource)
                                  : QString("No session with %1 could be opened. %2")
                                        .arg(resource, problem)
                                        .trimmed(),
             isOpen || isAnswered
                 ? QString()
                 : QString(
                       "Close other programs that use the instrument, or switch it off and on."));
        if (!isAnswered) {
            continue;
        }
        note("idn", isOpen, "The instrument says it is '" + identity.idn + "'.",
             isOpen ? QString() : QString("This program works with supported models alone."));
        if (isOpen) {
            isReached = true;
            const bool isClean = device.checkErrorQueue();
            const QString errors = device.takeLastError().trimmed().replace('\n', "; ");
            note("errors", isClean,
                 isClean ? QString("The error queue is empty.") : "The error queue held " + errors,
                 isClean ? QString() : QString("The queue is empty now; look for what caused it."));
        }
        device.closeResource();
    }
    return isReached;
}

void DoctorJob::findUsbRights()
{
    const QStringList names =
        QDir("/dev").entryList({"usbtmc*"}, QDir::System | QDir::Files, QDir::Name);
    if (names.isEmpty()) {
        note("usbtmc", true, "No instrument is connected by USB.");
        return;
    }
    QStringList closed;
    for (const QString &name : names) {
        const QFileInfo file("/dev/" + name);
        if (!file.isReadable() || !file.isWritable()) {
            closed.append(file.filePath());
        }
    }
    note("usbtmc", closed.isEmpty(),
         closed.isEmpty() ? QString("The USB instruments may be used: %1.").arg(names.join(", "))
                          : QString("The user may not access %1.").arg(closed.join(", ")),
         closed.isEmpty()
             ? QString()
             : QString("Install the udev rule 70-corvane-usbtmc.rules, and connect the "
                       "instrument anew."));
}
