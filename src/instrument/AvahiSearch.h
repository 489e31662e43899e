// SPDX-License-Identifier: Apache-2.0
#pragma once

#include "dnsmessage.h"

#include <QHostAddress>
#include <QStringList>

#include <functional>
#include <memory>

/// Multicast DNS by the daemon of this machine, which has heard of many instruments before they are
/// asked for, and keeps the port to itself on some systems.
class AvahiSearch
{
public:
    /// Told of each instance of a service, as the record that a network would send.
    using Found = std::function<void(const QHostAddress &host, const DnsRecord &record)>;

    /// Begins to look for `services` such as "_lxi._tcp.local". Null where no daemon runs, or the
    /// program was built without its library.
    [[nodiscard]] static std::unique_ptr<AvahiSearch> open(const QStringList &services,
                                                           Found found);

    virtual ~AvahiSearch() = default;

    /// Delivers what has come meanwhile; doesn't wait.
    virtual void takeAnswers() = 0;

protected:
    AvahiSearch() = default;
    AvahiSearch(const AvahiSearch &) = delete;
    AvahiSearch &operator=(const AvahiSearch &) = delete;
};
