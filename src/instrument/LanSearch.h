// SPDX-License-Identifier: Apache-2.0
#pragma once

#include "dnsmessage.h"

#include <QHostAddress>
#include <QList>
#include <QStringList>

#include <memory>
#include <vector>

class AvahiSearch;
class QUdpSocket;
struct OperationControl;

/// What answered at one address.
struct LanFinding
{
    QHostAddress address;
    bool byVxi11 = false;  ///< by the broadcast of VXI-11
    bool byMdns = false;   ///< by multicast DNS
    QStringList resources; ///< VISA resource strings, the best known road first
};

/// Asks all networks of this machine at once for instruments: the port mappers by a broadcast for
/// the VXI-11 core channel, and multicast DNS for the services that instruments announce, by the
/// daemon of this machine where one runs. Sends two datagrams of each kind on each network and
/// listens; nothing else is touched.
class LanSearch
{
public:
    LanSearch();
    ~LanSearch();
    LanSearch(const LanSearch &) = delete;
    LanSearch &operator=(const LanSearch &) = delete;

    /// Listens for that time and lets events through; a cancel ends it. False, with the reason
    /// logged, if there is no network to ask, or at a cancel.
    [[nodiscard]] bool run(int milliseconds, OperationControl &control);

    [[nodiscard]] const QList<LanFinding> &found() const { return m_found; }

    /// The services that are asked for.
    [[nodiscard]] static QStringList services();

    /// Takes an answer of multicast DNS into account.
    void addRecords(const QHostAddress &sender, const QList<DnsRecord> &records);

private:
    struct Network;

    [[nodiscard]] bool openNetworks();
    void ask();
    void takeAnswers();
    void addVxi11(const QHostAddress &sender);
    LanFinding &findingAt(const QHostAddress &address);

    std::vector<std::unique_ptr<Network>> m_networks;
    std::unique_ptr<AvahiSearch> m_daemon; ///< null: this search asks by itself
    QList<LanFinding> m_found;
    quint32 m_id;
};
