// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <QString>

#include <thread>

/// What is left of a transfer when nobody speaks a protocol: a file is read, sent over a TCP
/// connection of loopback in blocks of 64 KiB and written by a thread at the other end.
class SocketCopy
{
public:
    /// The other end has its file under `farName`.
    explicit SocketCopy(QString farName);
    ~SocketCopy();
    SocketCopy(const SocketCopy &) = delete;
    SocketCopy &operator=(const SocketCopy &) = delete;

    /// From `name` to the other end; over once that has written the last byte.
    [[nodiscard]] bool put(const QString &name);
    /// From the other end to `name`.
    [[nodiscard]] bool get(const QString &name);

private:
    void serve(int peer) const;

    QString m_farName;
    int m_socket = -1;
    std::thread m_server;
};
