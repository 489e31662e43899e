// SPDX-License-Identifier: Apache-2.0
#include "DelayedRoad.h"

#include "RoundTripPeer.h"

#include <arpa/inet.h>
#include <netinet/in.h>
#include <netinet/tcp.h>
#include <sys/socket.h>
#include <unistd.h>

namespace {

sockaddr_in addressOf(const char *text, std::uint16_t port)
{
    sockaddr_in address{};
    address.sin_family = AF_INET;
    address.sin_port = htons(port);
    inet_pton(AF_INET, text, &address.sin_addr);
    return address;
}

void sendAtOnce(int socket)
{
    const int on = 1;
    setsockopt(socket, IPPROTO_TCP, TCP_NODELAY, &on, sizeof on);
}

/// Until one side closes, which closes the other.
void pump(int from, int to, std::chrono::microseconds delay)
{
    constexpr std::size_t BufferBytes = 256 * 1024;
    std::vector<char> buffer(BufferBytes);
    for (;;) {
        const ssize_t count = recv(from, buffer.data(), buffer.size(), 0);
        if (count <= 0) {
            break;
        }
        if (delay.count() > 0) {
            std::this_thread::sleep_for(delay);
        }
        ssize_t sent = 0;
        while (sent < count) {
            const ssize_t part = send(to, buffer.data() + sent,
                                      static_cast<std::size_t>(count - sent), MSG_NOSIGNAL);
            if (part <= 0) {
                break;
            }
            sent += part;
        }
    }
    shutdown(from, SHUT_RDWR);
    shutdown(to, SHUT_RDWR);
}

} // namespace

int listenOn(const char *address, std::uint16_t port)
{
    const int listener = socket(AF_INET, SOCK_STREAM | SOCK_CLOEXEC, 0);
    const int on = 1;
    setsockopt(listener, SOL_SOCKET, SO_REUSEADDR, &on, sizeof on);
    const sockaddr_in name = addressOf(address, port);
    constexpr int Backlog = 64;
    if (bind(listener, reinterpret_cast<const sockaddr *>(&name), sizeof name) == 0 &&
        listen(listener, Backlog) == 0) {
        return listener;
    }
    close(listener);
    return -1;
}

DelayedRoad::DelayedRoad(const char *address, std::uint16_t target, std::chrono::microseconds delay)
    : m_listener(listenOn(address, 0))
    , m_target(target)
    , m_delay(delay)
{
    sockaddr_in name{};
    socklen_t length = sizeof name;
    if (m_listener >= 0 &&
        getsockname(m_listener, reinterpret_cast<sockaddr *>(&name), &length) == 0) {
        m_port = ntohs(name.sin_port);
        m_thread = std::thread([this] { serve(); });
    }
}

DelayedRoad::~DelayedRoad()
{
    shutdown(m_listener, SHUT_RDWR);
    if (m_thread.joinable()) {
        m_thread.join();
    }
    close(m_listener);
}

void DelayedRoad::serve() const
{
    runOnProcessor(Side::Instrument);
    for (;;) {
        const int client = accept4(m_listener, nullptr, nullptr, SOCK_CLOEXEC);
        if (client < 0) {
            return;
        }
        carry(client);
        close(client);
    }
}

void DelayedRoad::carry(int client) const
{
    const int target = socket(AF_INET, SOCK_STREAM | SOCK_CLOEXEC, 0);
    const sockaddr_in name = addressOf("127.0.0.1", m_target);
    sendAtOnce(client);
    sendAtOnce(target);
    if (connect(target, reinterpret_cast<const sockaddr *>(&name), sizeof name) == 0) {
        std::thread there([client, target] { pump(client, target, {}); });
        pump(target, client, m_delay);
        there.join();
    }
    close(target);
}
