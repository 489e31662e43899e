// SPDX-License-Identifier: Apache-2.0
#include "reachability.h"

#include "log/Tracer.h"

#include <QAbstractEventDispatcher>
#include <QCoreApplication>
#include <QDeadlineTimer>
#include <QEventLoop>
#include <QHostAddress>
#include <QHostInfo>
#include <QNetworkProxy>
#include <QTcpSocket>
#include <QTimer>

#include <array>

namespace {

constexpr int ConnectTimeoutMs = 5000;

/// Whether the socket gets connected in time. Windows are painted meanwhile; what the user does
/// waits, so that nothing is started on a device that is being opened.
bool waitForConnection(QTcpSocket &socket, const QDeadlineTimer &deadline)
{
    if (QAbstractEventDispatcher::instance() == nullptr) {
        return socket.waitForConnected(static_cast<int>(deadline.remainingTime()));
    }
    // Wakes the wait below when nothing else happens.
    QTimer wake;
    wake.setSingleShot(true);
    wake.start(static_cast<int>(deadline.remainingTime()));
    while (socket.state() != QAbstractSocket::ConnectedState &&
           socket.state() != QAbstractSocket::UnconnectedState && !deadline.hasExpired()) {
        QCoreApplication::processEvents(QEventLoop::ExcludeUserInputEvents |
                                        QEventLoop::WaitForMoreEvents);
    }
    return socket.state() == QAbstractSocket::ConnectedState;
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

bool isHostReachable(const QString &resource)
{
    const QString host = resource.section("::", 1, 1);
    Tracer::Trace(Tracer::Information, QString("Trying to access device '%1'").arg(host));
    QHostAddress address;
    // For an address the resolver would ask the name servers for its name, which may take long.
    if (!address.setAddress(host)) {
        const QHostInfo info = QHostInfo::fromName(host);
        if (info.addresses().isEmpty()) {
            return Tracer::fail(QString("No host address found. %1").arg(info.errorString()));
        }
        address = info.addresses().first();
    }
    // Both at once: a host that is switched off costs the time of one.
    constexpr std::array<quint16, 2> Ports{111, 5025};
    std::array<QTcpSocket, Ports.size()> sockets;
    for (std::size_t i = 0; i < Ports.size(); ++i) {
        // The test is about this very machine, which no proxy may stand for.
        sockets.at(i).setProxy(QNetworkProxy::NoProxy);
        sockets.at(i).connectToHost(address, Ports.at(i), QIODevice::ReadWrite);
    }
    const QDeadlineTimer deadline(ConnectTimeoutMs);
    bool areOpen = true;
    for (std::size_t i = 0; i < Ports.size(); ++i) {
        const bool isOpen = waitForConnection(sockets.at(i), deadline);
        report(Ports.at(i), isOpen);
        areOpen = areOpen && isOpen;
        sockets.at(i).abort();
    }
    return areOpen;
}
