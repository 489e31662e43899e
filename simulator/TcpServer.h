// SPDX-License-Identifier: Apache-2.0
#pragma once

#include "UniqueFd.h"

#include <atomic>
#include <cstddef>
#include <cstdint>
#include <functional>
#include <list>
#include <mutex>
#include <string>
#include <thread>

namespace simulator {

/// Accepts TCP connections and serves each in a thread of its own, so that a slow or silent client
/// holds up nobody else.
class TcpServer
{
public:
    /// Serves one connection until it ends; it must not close the socket. It returns soon after the
    /// socket was shut down.
    using Session = std::function<void(int fd)>;

    /// Further ones take the place of idle ones, or are closed at once if there is none.
    static constexpr std::size_t MaxConnections = 256;

    TcpServer() = default;
    ~TcpServer();
    TcpServer(const TcpServer &) = delete;
    TcpServer &operator=(const TcpServer &) = delete;

    /// Opens the port, 0 for one of the system's choice. False with the reason in `error`.
    [[nodiscard]] bool open(const std::string &address, std::uint16_t port, std::string &error);
    [[nodiscard]] std::uint16_t port() const;

    /// Begins to accept.
    void start(Session session);

    /// Ends all connections and waits for their threads; a second call does nothing.
    void stop();

private:
    struct Connection
    {
        UniqueFd fd;
        std::thread thread;
        bool finished = false;
        bool isLeaving = false; ///< told to end
    };

    void accept();
    void wake();
    void serve(Connection &connection);
    void join(bool all);
    /// Ends the connection that has been idle for longest, if that was long. The list is locked.
    [[nodiscard]] bool endIdlest();

    UniqueFd m_listener;
    UniqueFd m_wake; ///< an event: a connection ended, or all is to end
    std::atomic<bool> m_stopping{false};
    Session m_session;
    std::thread m_thread;
    std::mutex m_mutex; ///< of the list
    std::list<Connection> m_connections;
};

} // namespace simulator
