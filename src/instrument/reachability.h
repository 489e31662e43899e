// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <QHostAddress>
#include <QList>
#include <QString>

struct OperationControl;

/// Whether the host of a TCPIP resource string answers on the ports of the RPC port mapper (111)
/// and of plain SCPI (5025), or of a HiSLIP resource on the port of HiSLIP alone. All of them must:
/// a host that answers on one of two is seldom an instrument, and the VISA library would wait long
/// for it. Blocks for at most 5 s for the name and as long for the ports, which are tried at the
/// same time on all addresses of the name; a cancel ends it. Each step is logged.
[[nodiscard]] bool isHostReachable(const QString &resource, const OperationControl &control);

/// The addresses of a name; none, with the reason in `problem`, if it has none or nobody knows.
[[nodiscard]] QList<QHostAddress> addressesOf(const QString &host, const OperationControl &control,
                                              QString &problem);

/// How long a port may take to accept a connection.
constexpr int ConnectTimeoutMs = 5000;

/// Which of the ports take a connection at one of the addresses within the time, one flag a port.
[[nodiscard]] QList<bool> openPorts(const QList<QHostAddress> &addresses,
                                    const QList<quint16> &ports, const OperationControl &control,
                                    int timeoutMs = ConnectTimeoutMs);

/// The ports on which the instrument of a TCPIP resource string must answer.
[[nodiscard]] QList<quint16> portsOf(const QString &resource);
