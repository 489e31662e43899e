// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <QByteArray>
#include <QList>
#include <QString>
#include <QStringList>

#include <optional>

// Messages of multicast DNS (RFC 6762), as far as the search for services needs them.

/// One record of an answer.
struct DnsRecord
{
    enum Type : quint16 { Pointer = 12, Service = 33 };

    QString name;
    quint16 type = 0; ///< a Type, or another that isn't looked into
    QString target;   ///< of Pointer and Service: the name that it leads to
    quint16 port = 0; ///< of Service
};

/// A query for the pointers of services such as "_hislip._tcp.local", to be answered to its sender.
[[nodiscard]] QByteArray dnsQuery(const QStringList &services);

/// All records of an answer; nothing if it is none, or is broken.
[[nodiscard]] std::optional<QList<DnsRecord>> dnsRecords(const QByteArray &message);
