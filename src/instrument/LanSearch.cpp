// SPDX-License-Identifier: Apache-2.0
#include "LanSearch.h"

#include "remotepaths.h"

#include "AvahiSearch.h"
#include "OperationControl.h"
#include "portmapmessage.h"

#include "base/ProgressClock.h"
#include "log/Tracer.h"

#include <QCoreApplication>
#include <QElapsedTimer>
#include <QNetworkDatagram>
#include <QNetworkInterface>
#include <QRandomGenerator>
#include <QThread>
#include <QUdpSocket>

#include <algorithm>

namespace {

constexpr quint16 PortMapperPort = 111;
constexpr quint16 DnsPort = 5353;
constexpr quint16 HislipPort = 4880;
constexpr unsigned long TickMs = 10;

const QHostAddress &dnsGroup()
{
    static const QHostAddress group("224.0.0.251");
    return group;
}

/// The kind of service in the name of one, or of an instance of it.
bool isOf(const QString &name, const char *service)
{
    const QString suffix = service + QString("._tcp.local");
    return name.compare(suffix, Qt::CaseInsensitive) == 0 ||
           name.endsWith('.' + suffix, Qt::CaseInsensitive);
}

/// The order in which roads are tried: with device clear and END first.
int rankOf(const QString &resource)
{
    return resource.contains("::hislip") ? 1 : resource.endsWith("::SOCKET") ? 2 : 0;
}

} // namespace

/// One address of an interface.
struct LanSearch::Network
{
    QHostAddress broadcast;
    QUdpSocket socket;
};

LanSearch::LanSearch()
    : m_id(QRandomGenerator::global()->generate())
{
}

LanSearch::~LanSearch() = default;

QStringList LanSearch::services()
{
    return {"_lxi._tcp.local", "_hislip._tcp.local", "_vxi-11._tcp.local", "_scpi-raw._tcp.local"};
}

bool LanSearch::run(int milliseconds, OperationControl &control)
{
    Tracer::Trace(Tracer::Information, "Scanning the local networks for devices...");
    if (!openNetworks()) {
        return Tracer::fail("There is no network on which instruments could be looked for.");
    }
    m_daemon =
        AvahiSearch::open(services(), [this](const QHostAddress &host, const DnsRecord &record) {
            addRecords(host, {record});
        });
    if (m_daemon) {
        Tracer::Trace(Tracer::Debug, "The Avahi daemon looks for instruments by multicast DNS.");
    }
    ProgressClock clock(control.report, control.cancelled);
    QElapsedTimer time;
    time.start();
    // Datagrams get lost, so that everybody is asked twice.
    for (int asked = 0; !time.hasExpired(milliseconds);) {
        if (asked < 2 && time.elapsed() >= asked * milliseconds / 2) {
            ask();
            ++asked;
        }
        QCoreApplication::processEvents(QEventLoop::ExcludeUserInputEvents);
        takeAnswers();
        if (clock.shouldStop(time.elapsed(), milliseconds) || control.cancelled) {
            return Tracer::fail("*** User break.");
        }
        QThread::msleep(TickMs);
    }
    for (LanFinding &finding : m_found) {
        if (finding.resources.isEmpty()) {
            finding.resources.append("TCPIP::" + finding.address.toString() + "::INSTR");
        }
        std::stable_sort(finding.resources.begin(), finding.resources.end(),
                         [](const QString &a, const QString &b) { return rankOf(a) < rankOf(b); });
    }
    Tracer::Trace(Tracer::Information, QString("%1 address(es) answered.").arg(m_found.size()));
    return true;
}

bool LanSearch::openNetworks()
{
    const QList<QNetworkInterface> interfaces = QNetworkInterface::allInterfaces();
    for (const QNetworkInterface &interface : interfaces) {
        const QNetworkInterface::InterfaceFlags flags = interface.flags();
        if (!flags.testFlag(QNetworkInterface::IsUp) ||
            !flags.testFlag(QNetworkInterface::IsRunning)) {
            continue;
        }
        const QList<QNetworkAddressEntry> entries = interface.addressEntries();
        for (const QNetworkAddressEntry &entry : entries) {
            auto network = std::make_unique<Network>();
            if (entry.ip().protocol() != QAbstractSocket::IPv4Protocol ||
                !network->socket.bind(entry.ip(), 0)) {
                continue;
            }
            network->broadcast = flags.testFlag(QNetworkInterface::IsLoopBack)
                                     ? QHostAddress("127.255.255.255")
                                     : entry.broadcast();
            network->socket.setMulticastInterface(interface);
            m_networks.push_back(std::move(network));
        }
    }
    return !m_networks.empty();
}

void LanSearch::ask()
{
    const QByteArray call = coreChannelCall(m_id);
    const QByteArray query = dnsQuery(services());
    for (const auto &network : m_networks) {
        // A network that takes no broadcast or multicast has others beside it.
        if (!network->broadcast.isNull()) {
            network->socket.writeDatagram(call, network->broadcast, PortMapperPort);
        }
        if (!m_daemon) {
            network->socket.writeDatagram(query, dnsGroup(), DnsPort);
        }
    }
}

void LanSearch::takeAnswers()
{
    if (m_daemon) {
        m_daemon->takeAnswers();
    }
    for (const auto &network : m_networks) {
        while (network->socket.hasPendingDatagrams()) {
            const QNetworkDatagram datagram = network->socket.receiveDatagram();
            const QHostAddress sender = datagram.senderAddress();
            if (datagram.senderPort() == DnsPort) {
                if (const auto records = dnsRecords(datagram.data())) {
                    addRecords(sender, *records);
                }
            } else if (coreChannelPort(datagram.data(), m_id).value_or(0) != 0) {
                addVxi11(sender);
            }
        }
    }
}

LanFinding &LanSearch::findingAt(const QHostAddress &address)
{
    const auto found = std::find_if(m_found.begin(), m_found.end(), [&](const LanFinding &finding) {
        return finding.address == address;
    });
    if (found != m_found.end()) {
        return *found;
    }
    m_found.append({.address = address, .resources = {}});
    return m_found.last();
}

void LanSearch::addVxi11(const QHostAddress &sender)
{
    LanFinding &finding = findingAt(sender);
    finding.byVxi11 = true;
    const QString resource = networkHead(sender.toString()) + "INSTR";
    if (!finding.resources.contains(resource)) {
        finding.resources.append(resource);
    }
}

void LanSearch::addRecords(const QHostAddress &sender, const QList<DnsRecord> &records)
{
    const QString head = networkHead(sender.toString());
    QStringList resources;
    bool isInstrument = false;
    for (const DnsRecord &record : records) {
        const bool isService = record.type == DnsRecord::Service;
        if (!isService && record.type != DnsRecord::Pointer) {
            continue;
        }
        if (isOf(record.name, "_vxi-11")) {
            resources.append(head + "INSTR");
        } else if (isOf(record.name, "_hislip") && isService) {
            const QString port =
                record.port == HislipPort ? QString() : QString(",%1").arg(record.port);
            resources.append(head + "hislip0" + port + "::INSTR");
        } else if (isOf(record.name, "_scpi-raw") && isService) {
            resources.append(head + QString("%1::SOCKET").arg(record.port));
        }
        isInstrument = isInstrument || isOf(record.name, "_lxi") || isOf(record.name, "_hislip") ||
                       isOf(record.name, "_scpi-raw") || isOf(record.name, "_vxi-11");
    }
    if (!isInstrument) {
        return;
    }
    LanFinding &finding = findingAt(sender);
    finding.byMdns = true;
    for (const QString &resource : std::as_const(resources)) {
        if (!finding.resources.contains(resource)) {
            finding.resources.append(resource);
        }
    }
}
