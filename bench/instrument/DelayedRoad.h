// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <chrono>
#include <cstdint>
#include <thread>
#include <vector>

/// A TCP port that leads to another one of this machine, with all that comes back delayed, as by a
/// network with that round trip. Serves one connection after the other.
class DelayedRoad
{
public:
    /// Listens on a free port of `address`, which is one of 127.0.0.0/8.
    DelayedRoad(const char *address, std::uint16_t target, std::chrono::microseconds delay);
    ~DelayedRoad();
    DelayedRoad(const DelayedRoad &) = delete;
    DelayedRoad &operator=(const DelayedRoad &) = delete;

    /// 0 if it couldn't be opened.
    [[nodiscard]] std::uint16_t port() const { return m_port; }

private:
    void serve() const;
    void carry(int client) const;

    int m_listener = -1;
    std::uint16_t m_port = 0;
    std::uint16_t m_target;
    std::chrono::microseconds m_delay;
    std::thread m_thread;
};

/// A listener on a port of `address`, which nobody answers; -1 if it can't be opened.
[[nodiscard]] int listenOn(const char *address, std::uint16_t port);
