// SPDX-License-Identifier: Apache-2.0
#include "reachability.h"

#include "log/Tracer.h"

#include <QHostAddress>
#include <QHostInfo>
#include <QNetworkProxy>
#include <QTcpSocket>

namespace {

constexpr int connectTimeoutMs = 5000;

bool isPortOpen(const QHostAddress &address, quint16 port)
{
    QTcpSocket socket;
    // The test is about this very machine, which no proxy may stand for.
    socket.setProxy(QNetworkProxy::NoProxy);
    socket.connectToHost(address, port, QIODevice::ReadWrite);
    const bool connected = socket.waitForConnected(connectTimeoutMs);
    socket.abort();
    if (connected) {
        Tracer::Trace(Tracer::Information, QString("Port %1 is accessible.").arg(port));
    } else {
        Tracer::Trace(
            Tracer::Warning,
            QString("Port %1 is not accessible. Check your firewall settings.").arg(port));
    }
    return connected;
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
    const bool hasPortMapper = isPortOpen(address, 111);
    const bool hasPlainScpi = isPortOpen(address, 5025);
    return hasPortMapper && hasPlainScpi;
}
