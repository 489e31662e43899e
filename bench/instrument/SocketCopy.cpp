// SPDX-License-Identifier: Apache-2.0
#include "SocketCopy.h"

#include "RoundTripPeer.h"

#include <QFile>

#include <algorithm>
#include <array>
#include <cstring>
#include <vector>

#include <sys/socket.h>
#include <unistd.h>

namespace {

constexpr qint64 BlockBytes = 64 * 1024;
/// What goes ahead of a copy: its direction and its length, 0 when the other end knows it.
using Order = std::array<qint64, 2>;
enum Direction : qint64 { Put, Get };

bool sendOrder(int socket, const Order &order)
{
    std::vector<char> bytes(sizeof order);
    std::memcpy(bytes.data(), order.data(), sizeof order);
    return sendAll(socket, bytes);
}

bool receiveOrder(int socket, Order &order)
{
    std::vector<char> bytes(sizeof order);
    const bool isReceived = receiveAll(socket, bytes);
    std::memcpy(order.data(), bytes.data(), sizeof order);
    return isReceived;
}

/// The file goes out behind an order that tells its length.
bool sendFile(int socket, const QString &name, Direction direction)
{
    QFile file(name);
    if (!file.open(QIODevice::ReadOnly | QIODevice::Unbuffered) ||
        !sendOrder(socket, {direction, file.size()})) {
        return false;
    }
    std::vector<char> block(BlockBytes);
    for (qint64 count = 0; (count = file.read(block.data(), BlockBytes)) > 0;) {
        block.resize(static_cast<std::size_t>(count));
        if (!sendAll(socket, block)) {
            return false;
        }
    }
    return true;
}

/// With `isDurable` the bytes are on the disk at the end, as those of a fetched waveform.
bool receiveFile(int socket, const QString &name, qint64 length, bool isDurable)
{
    QFile file(name);
    bool done = file.open(QIODevice::WriteOnly | QIODevice::Unbuffered);
    std::vector<char> block(BlockBytes);
    while (done && length > 0) {
        const ssize_t count =
            recv(socket, block.data(), static_cast<std::size_t>(std::min(length, BlockBytes)), 0);
        done = count > 0 && file.write(block.data(), count) == count;
        length -= count;
    }
    return done && (!isDurable || fdatasync(file.handle()) == 0);
}

} // namespace

SocketCopy::SocketCopy(QString farName)
    : m_farName(std::move(farName))
{
    const LoopbackPair pair = connectLoopback();
    m_socket = pair.client;
    if (pair.server >= 0) {
        m_server = std::thread([this, pair] { serve(pair.server); });
    }
}

SocketCopy::~SocketCopy()
{
    if (m_socket >= 0) {
        close(m_socket);
    }
    if (m_server.joinable()) {
        m_server.join();
    }
}

void SocketCopy::serve(int peer) const
{
    runOnProcessor(Side::Instrument);
    Order order{};
    bool done = true;
    while (done && receiveOrder(peer, order)) {
        done = order[0] == Put
                   ? receiveFile(peer, m_farName, order[1], false) && sendOrder(peer, order)
                   : sendFile(peer, m_farName, Get);
    }
    close(peer);
}

bool SocketCopy::put(const QString &name)
{
    Order answer{};
    return sendFile(m_socket, name, Put) && receiveOrder(m_socket, answer);
}

bool SocketCopy::get(const QString &name)
{
    Order answer{};
    return sendOrder(m_socket, {Get, 0}) && receiveOrder(m_socket, answer) &&
           receiveFile(m_socket, name, answer[1], true);
}
