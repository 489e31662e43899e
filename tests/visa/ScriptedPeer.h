// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <atomic>
#include <cstdint>
#include <functional>
#include <mutex>
#include <string>
#include <string_view>
#include <thread>
#include <vector>

/// One accepted connection of a ScriptedPeer, with blocking calls for the script's thread.
class PeerConnection
{
public:
    explicit PeerConnection(int descriptor)
        : m_descriptor(descriptor)
    {
    }

    bool send(std::string_view bytes);
    /// Exactly so many bytes; less when the other side closed.
    std::string receive(std::size_t size);
    /// What comes next, at most so many bytes; nothing when the other side closed.
    std::string receiveSome(std::size_t most);
    /// Up to and with the byte; without it when the other side closed.
    std::string receiveUntil(char last);
    /// Returns when the other side has closed; throws what it sends away.
    void waitForClose();
    /// The other side sees the end; what was sent still arrives.
    void shutDown();
    /// The other side sees a reset; what was sent may be lost.
    void reset();

private:
    int m_descriptor;
};

/// A server on an ephemeral port of this machine that runs a script for each connection, each in a
/// thread of its own. The destructor closes all connections and waits for the scripts.
class ScriptedPeer
{
public:
    using Script = std::function<void(PeerConnection &)>;

    /// `address` and `port` may name another loopback address and a fixed port.
    explicit ScriptedPeer(Script script, const std::string &address = "127.0.0.1",
                          std::uint16_t port = 0);
    ~ScriptedPeer();
    ScriptedPeer(const ScriptedPeer &) = delete;
    ScriptedPeer &operator=(const ScriptedPeer &) = delete;

    /// 0 if the port could not be opened.
    std::uint16_t port() const { return m_port; }
    int connectionCount() const { return m_connectionCount; }

private:
    void accept();

    Script m_script;
    int m_listener = -1;
    std::uint16_t m_port = 0;
    std::atomic<int> m_connectionCount{0};
    std::atomic<bool> m_isStopping{false};
    std::mutex m_mutex;
    std::vector<int> m_descriptors;
    std::vector<std::thread> m_threads;
    std::thread m_acceptor;
};
