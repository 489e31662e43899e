// SPDX-License-Identifier: Apache-2.0
#include "TcpSocket.h"

#include <netinet/in.h>
#include <netinet/tcp.h>
#include <poll.h>
#include <sys/socket.h>
#include <unistd.h>

#include <array>
#include <cerrno>
#include <cstring>

namespace visa {

namespace {

// A session with an infinite time-out still has to notice a peer that lost its power.
constexpr int KeepAliveIdleSeconds = 10;
constexpr int KeepAliveIntervalSeconds = 5;
constexpr int KeepAliveProbes = 3;
// Nor is a peer there that takes no byte for so long.
constexpr int UnacknowledgedMs = 20'000;

void setOption(int descriptor, int level, int option, int value)
{
    // Refused options cost comfort, not correctness.
    (void)setsockopt(descriptor, level, option, &value, sizeof value);
}

void setPort(HostAddress &address, std::uint16_t port)
{
    if (address.storage.ss_family == AF_INET6) {
        sockaddr_in6 endpoint{};
        std::memcpy(&endpoint, &address.storage, sizeof endpoint);
        endpoint.sin6_port = htons(port);
        std::memcpy(&address.storage, &endpoint, sizeof endpoint);
    } else {
        sockaddr_in endpoint{};
        std::memcpy(&endpoint, &address.storage, sizeof endpoint);
        endpoint.sin_port = htons(port);
        std::memcpy(&address.storage, &endpoint, sizeof endpoint);
    }
}

bool isTransient(int error)
{
    return error == EAGAIN || error == EWOULDBLOCK || error == EINTR;
}

} // namespace

TcpSocket::TcpSocket(const Waker &waker)
    : m_waker(waker)
{
}

TcpSocket::~TcpSocket()
{
    close();
}

void TcpSocket::close()
{
    if (m_descriptor >= 0) {
        ::close(m_descriptor);
    }
    m_descriptor = -1;
}

ViStatus TcpSocket::connect(const std::vector<HostAddress> &addresses, std::uint16_t port,
                            const Deadline &deadline)
{
    ViStatus status = VI_ERROR_RSRC_NFOUND;
    for (std::size_t i = 0; i < addresses.size(); ++i) {
        const auto attemptsLeft = static_cast<ViUInt32>(addresses.size() - i);
        const Deadline share =
            attemptsLeft > 1 ? deadline.atMost(deadline.remainingMs() / attemptsLeft) : deadline;
        status = connectTo(addresses[i], port, share);
        if (status == VI_SUCCESS || status == VI_ERROR_ABORT) {
            return status;
        }
        close();
    }
    return status;
}

ViStatus TcpSocket::connectTo(HostAddress address, std::uint16_t port, const Deadline &deadline)
{
    close();
    m_descriptor = ::socket(address.storage.ss_family, SOCK_STREAM | SOCK_NONBLOCK | SOCK_CLOEXEC,
                            IPPROTO_TCP);
    if (m_descriptor < 0) {
        return VI_ERROR_ALLOC;
    }
    // Commands are short and waited for, so holding them back to fill a packet only delays.
    setOption(m_descriptor, IPPROTO_TCP, TCP_NODELAY, 1);
    setOption(m_descriptor, SOL_SOCKET, SO_KEEPALIVE, 1);
    setOption(m_descriptor, IPPROTO_TCP, TCP_KEEPIDLE, KeepAliveIdleSeconds);
    setOption(m_descriptor, IPPROTO_TCP, TCP_KEEPINTVL, KeepAliveIntervalSeconds);
    setOption(m_descriptor, IPPROTO_TCP, TCP_KEEPCNT, KeepAliveProbes);
    setOption(m_descriptor, IPPROTO_TCP, TCP_USER_TIMEOUT, UnacknowledgedMs);

    setPort(address, port);
    if (::connect(m_descriptor, reinterpret_cast<const sockaddr *>(&address.storage),
                  address.length) == 0) {
        return VI_SUCCESS;
    }
    if (errno != EINPROGRESS && errno != EINTR) {
        return VI_ERROR_RSRC_NFOUND;
    }
    if (const ViStatus status = waitFor(POLLOUT, deadline); status != VI_SUCCESS) {
        return status;
    }
    int error = 0;
    socklen_t length = sizeof error;
    if (getsockopt(m_descriptor, SOL_SOCKET, SO_ERROR, &error, &length) != 0 || error != 0) {
        return VI_ERROR_RSRC_NFOUND;
    }
    return VI_SUCCESS;
}

ViStatus TcpSocket::waitFor(short events, const Deadline &deadline) const
{
    for (;;) {
        std::array<pollfd, 2> entries{
            {{m_descriptor, events, 0}, {m_waker.descriptor(), POLLIN, 0}}};
        const int ready = ::poll(entries.data(), entries.size(), deadline.pollMs());
        if (ready < 0 && errno != EINTR) {
            return VI_ERROR_CONN_LOST;
        }
        if (ready > 0 && (entries[1].revents & POLLIN) != 0) {
            return VI_ERROR_ABORT;
        }
        if (ready > 0 && entries[0].revents != 0) {
            return VI_SUCCESS;
        }
        if (deadline.isOver()) {
            return VI_ERROR_TMO;
        }
    }
}

ViStatus TcpSocket::send(std::span<const std::uint8_t> data, const Deadline &deadline,
                         std::size_t &sent)
{
    sent = 0;
    if (!isOpen()) {
        return VI_ERROR_CONN_LOST;
    }
    while (sent < data.size()) {
        const ssize_t count = ::send(m_descriptor, data.data() + sent, data.size() - sent,
                                     MSG_NOSIGNAL | MSG_DONTWAIT);
        if (count >= 0) {
            sent += static_cast<std::size_t>(count);
            // A peer that takes a byte now and then must not hold the call for ever.
            if (sent < data.size() && deadline.isOver()) {
                return VI_ERROR_TMO;
            }
            continue;
        }
        if (!isTransient(errno)) {
            return VI_ERROR_CONN_LOST;
        }
        if (const ViStatus status = waitFor(POLLOUT, deadline); status != VI_SUCCESS) {
            return status;
        }
    }
    return VI_SUCCESS;
}

ViStatus TcpSocket::receive(std::span<std::uint8_t> buffer, const Deadline &deadline,
                            std::size_t &received)
{
    received = 0;
    if (!isOpen()) {
        return VI_ERROR_CONN_LOST;
    }
    for (;;) {
        const ssize_t count = ::recv(m_descriptor, buffer.data(), buffer.size(), MSG_DONTWAIT);
        if (count > 0) {
            received = static_cast<std::size_t>(count);
            return VI_SUCCESS;
        }
        if (count == 0 || !isTransient(errno)) {
            return VI_ERROR_CONN_LOST;
        }
        if (const ViStatus status = waitFor(POLLIN, deadline); status != VI_SUCCESS) {
            return status;
        }
    }
}

} // namespace visa
