// SPDX-License-Identifier: Apache-2.0
#include "TcpServer.h"

#include "sockets.h"

#include <netinet/in.h>
#include <netinet/tcp.h>
#include <poll.h>
#include <sys/eventfd.h>
#include <sys/socket.h>

#include <algorithm>
#include <array>
#include <cerrno>
#include <system_error>
#include <utility>

namespace simulator {

TcpServer::~TcpServer()
{
    stop();
}

bool TcpServer::open(const std::string &address, std::uint16_t port, std::string &error)
{
    m_listener = listenTcp(address, port, error);
    return m_listener.isValid();
}

std::uint16_t TcpServer::port() const
{
    return localPort(m_listener.get());
}

void TcpServer::start(Session session)
{
    m_session = std::move(session);
    m_wake = UniqueFd(::eventfd(0, EFD_CLOEXEC));
    m_thread = std::thread([this] { accept(); });
}

void TcpServer::stop()
{
    if (m_thread.joinable()) {
        m_stopping = true;
        wake();
        m_thread.join();
    }
    m_listener.reset();
    {
        const std::lock_guard lock(m_mutex);
        for (const Connection &connection : m_connections) {
            ::shutdown(connection.fd.get(), SHUT_RDWR);
        }
    }
    join(true);
}

void TcpServer::wake()
{
    const std::uint64_t one = 1;
    (void)!::write(m_wake.get(), &one, sizeof(one));
}

void TcpServer::accept()
{
    constexpr int RetryMilliseconds = 50;
    for (;;) {
        std::array<pollfd, 2> events{{{m_wake.get(), POLLIN, 0}, {m_listener.get(), POLLIN, 0}}};
        if (::poll(events.data(), events.size(), -1) < 0 && errno != EINTR) {
            return;
        }
        if (m_stopping) {
            return;
        }
        if (events[0].revents != 0) {
            std::uint64_t count = 0;
            (void)!::read(m_wake.get(), &count, sizeof(count));
            join(false);
        }
        if (events[1].revents == 0) {
            continue;
        }
        UniqueFd fd(::accept4(m_listener.get(), nullptr, nullptr, SOCK_CLOEXEC));
        if (!fd.isValid()) {
            // Out of descriptors: the waiting connection would keep poll awake all the time.
            if (errno == EMFILE || errno == ENFILE || errno == ENOMEM || errno == ENOBUFS) {
                (void)::poll(events.data(), 1, RetryMilliseconds);
            }
            continue;
        }
        const int on = 1;
        (void)::setsockopt(fd.get(), IPPROTO_TCP, TCP_NODELAY, &on, sizeof(on));
        (void)::setsockopt(fd.get(), SOL_SOCKET, SO_KEEPALIVE, &on, sizeof(on));
        const std::lock_guard lock(m_mutex);
        if (m_connections.size() >= MaxConnections && !endIdlest()) {
            continue;
        }
        Connection &connection = m_connections.emplace_back();
        connection.fd = std::move(fd);
        try {
            connection.thread = std::thread([this, &connection] { serve(connection); });
        } catch (const std::system_error &) {
            m_connections.pop_back();
        }
    }
}

bool TcpServer::endIdlest()
{
    // In milliseconds: whoever has said something within that time stays.
    constexpr std::uint32_t LongIdle = 60'000;
    Connection *idlest = nullptr;
    std::uint32_t longest = LongIdle;
    for (Connection &connection : m_connections) {
        tcp_info info{};
        socklen_t size = sizeof(info);
        if (!connection.isLeaving &&
            ::getsockopt(connection.fd.get(), IPPROTO_TCP, TCP_INFO, &info, &size) == 0 &&
            info.tcpi_last_data_recv >= longest) {
            longest = info.tcpi_last_data_recv;
            idlest = &connection;
        }
    }
    if (idlest == nullptr) {
        return false;
    }
    idlest->isLeaving = true;
    ::shutdown(idlest->fd.get(), SHUT_RDWR);
    return true;
}

void TcpServer::serve(Connection &connection)
{
    m_session(connection.fd.get());
    // The peer is told now; the descriptor itself is closed when the thread is joined, so that its
    // number cannot be taken by another connection before.
    ::shutdown(connection.fd.get(), SHUT_RDWR);
    const std::lock_guard lock(m_mutex);
    connection.finished = true;
    wake();
}

void TcpServer::join(bool all)
{
    std::list<Connection> ended;
    {
        const std::lock_guard lock(m_mutex);
        for (auto it = m_connections.begin(); it != m_connections.end();) {
            const auto next = std::next(it);
            if (all || it->finished) {
                ended.splice(ended.end(), m_connections, it);
            }
            it = next;
        }
    }
    for (Connection &connection : ended) {
        connection.thread.join();
    }
}

} // namespace simulator
