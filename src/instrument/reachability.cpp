// SPDX-License-Identifier: Apache-2.0
#include "reachability.h"

#include "remotepaths.h"

#include "OperationControl.h"

#include "log/Tracer.h"

#include <QAbstractEventDispatcher>
#include <QCoreApplication>
#include <QDeadlineTimer>
#include <QEventLoop>
#include <QHostInfo>
#include <QNetworkProxy>
#include <QTcpSocket>
#include <QTimer>

#include <memory>
#include <vector>

namespace {

constexpr int LookUpTimeoutMs = 5000;
constexpr quint16 HislipPort = 4880;
/// A name of many addresses is tried at the first ones.
constexpr qsizetype MaxAddresses = 4;

/// Lets events through until `isDone`, the deadline or a cancel. Windows are painted meanwhile;
/// what the user does waits unless the control lets it through, so that nothing is started on a
/// device that is being opened.
template <typename Predicate>
void wait(const QDeadlineTimer &deadline, const OperationControl &control, const Predicate &isDone)
{
    // Wakes the wait when nothing else happens, and for a cancel by another thread.
    constexpr int WakeMs = 50;
    QTimer wake;
    wake.setTimerType(Qt::PreciseTimer);
    wake.start(WakeMs);
    const QEventLoop::ProcessEventsFlags flags =
        control.takesInput ? QEventLoop::AllEvents : QEventLoop::ExcludeUserInputEvents;
    while (!isDone() && !deadline.hasExpired() && !control.cancelled) {
        QCoreApplication::processEvents(flags | QEventLoop::WaitForMoreEvents);
    }
}

bool isSettled(const QTcpSocket &socket)
{
    return socket.state() == QAbstractSocket::ConnectedState ||
           socket.state() == QAbstractSocket::UnconnectedState;
}

void report(quint16 port, bool isOpen)
{
    if (isOpen) {
        Tracer::Trace(Tracer::Information, QString("Port %1 is accessible.").arg(port));
    } else {
        Tracer::Trace(
            Tracer::Warning,
            QString("Port %1 is not accessible. Check your firewall settings.").arg(port));
    }
}

} // namespace

QList<quint16> portsOf(const QString &resource)
{
    const QString device = resourceSections(resource).value(2);
    if (!device.startsWith("hislip", Qt::CaseInsensitive)) {
        return {111, 5025};
    }
    const ushort port = device.section(',', 1, 1).toUShort();
    return {port == 0 ? HislipPort : port};
}

QList<QHostAddress> addressesOf(const QString &host, const OperationControl &control,
                                QString &problem)
{
    // For an address the resolver would ask the name servers for its name, which may take long.
    QHostAddress address;
    if (address.setAddress(host)) {
        return {address};
    }
    QHostInfo info;
    if (QAbstractEventDispatcher::instance() == nullptr) {
        info = QHostInfo::fromName(host);
    } else {
        bool isDone = false;
        QObject context;
        const int id = QHostInfo::lookupHost(host, &context, [&](const QHostInfo &found) {
            info = found;
            isDone = true;
        });
        wait(QDeadlineTimer(LookUpTimeoutMs), control, [&isDone] { return isDone; });
        if (!isDone) {
            QHostInfo::abortHostLookup(id);
            problem = control.cancelled ? QString("*** User break.")
                                        : QString("The name servers don't answer.");
            return {};
        }
    }
    problem = info.errorString();
    return info.addresses().mid(0, MaxAddresses);
}

QList<bool> openPorts(const QList<QHostAddress> &addresses, const QList<quint16> &ports,
                      const OperationControl &control, int timeoutMs)
{
    // All at once: a host that is switched off costs the time of one.
    std::vector<std::unique_ptr<QTcpSocket>> sockets;
    for (const QHostAddress &address : addresses) {
        for (const quint16 port : ports) {
            sockets.push_back(std::make_unique<QTcpSocket>());
            // The test is about this very machine, which no proxy may stand for.
            sockets.back()->setProxy(QNetworkProxy::NoProxy);
            sockets.back()->connectToHost(address, port, QIODevice::ReadWrite);
        }
    }
    const QDeadlineTimer deadline(timeoutMs);
    const auto socketOf = [&](qsizetype address, qsizetype port) -> QTcpSocket & {
        return *sockets.at(static_cast<size_t>(address * ports.size() + port));
    };
    const auto isConnected = [&](qsizetype address, qsizetype port) {
        return socketOf(address, port).state() == QAbstractSocket::ConnectedState;
    };
    if (QAbstractEventDispatcher::instance() == nullptr) {
        for (const auto &socket : sockets) {
            socket->waitForConnected(static_cast<int>(deadline.remainingTime()));
        }
    }
    // One address that takes all is enough; the others may be of no use on this network.
    wait(deadline, control, [&] {
        bool areSettled = true;
        for (qsizetype i = 0; i < addresses.size(); ++i) {
            bool areConnected = true;
            for (qsizetype k = 0; k < ports.size(); ++k) {
                areConnected = areConnected && isConnected(i, k);
                areSettled = areSettled && isSettled(socketOf(i, k));
            }
            if (areConnected) {
                return true;
            }
        }
        return areSettled;
    });
    QList<bool> areOpen(ports.size(), false);
    for (qsizetype k = 0; k < ports.size(); ++k) {
        for (qsizetype i = 0; i < addresses.size(); ++i) {
            areOpen[k] = areOpen[k] || isConnected(i, k);
        }
    }
    for (const auto &socket : sockets) {
        socket->abort();
    }
    return areOpen;
}

bool isHostReachable(const QString &resource, const OperationControl &control)
{
    const QString host = hostOf(resource);
    Tracer::Trace(Tracer::Information, QString("Trying to access device '%1'").arg(host));
    QString problem;
    const QList<QHostAddress> addresses = addressesOf(host, control, problem);
    if (addresses.isEmpty()) {
        return Tracer::fail(control.cancelled ? problem
                                              : QString("No host address found. %1").arg(problem));
    }
    const QList<quint16> ports = portsOf(resource);
    const QList<bool> areOpen = openPorts(addresses, ports, control);
    if (control.cancelled) {
        return Tracer::fail("*** User break.");
    }
    for (qsizetype i = 0; i < ports.size(); ++i) {
        report(ports.at(i), areOpen.at(i));
    }
    return !areOpen.contains(false);
}
