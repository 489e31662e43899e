// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <chrono>
#include <cstddef>
#include <thread>
#include <vector>

enum class Side { Controller, Instrument };

/// Binds the calling thread, and what it starts from now on, to a processor of its side. The
/// scheduler else puts both sides on one processor or on two as it likes, which changes a round
/// trip many times over.
void runOnProcessor(Side side);

/// Both ends of a TCP connection over loopback, -1 where it couldn't be made; small pieces are sent
/// at once. The caller closes them.
struct LoopbackPair
{
    int client = -1;
    int server = -1;
};
[[nodiscard]] LoopbackPair connectLoopback();

[[nodiscard]] bool sendAll(int socket, const std::vector<char> &bytes);
[[nodiscard]] bool receiveAll(int socket, std::vector<char> &bytes);

/// The least that a request and its reply over loopback can cost: a thread at the other end of a
/// TCP connection takes a request of a fixed size and sends a reply of a fixed size, and neither
/// side looks at a byte of them.
class RoundTripPeer
{
public:
    /// Replies so long after the request.
    RoundTripPeer(std::size_t requestBytes, std::size_t replyBytes,
                  std::chrono::microseconds delay = {});
    ~RoundTripPeer();
    RoundTripPeer(const RoundTripPeer &) = delete;
    RoundTripPeer &operator=(const RoundTripPeer &) = delete;

    [[nodiscard]] bool isConnected() const { return m_socket >= 0; }

    /// One request and its reply.
    [[nodiscard]] bool exchange();

private:
    void serve(int peer) const;

    std::vector<char> m_request;
    std::vector<char> m_reply;
    std::chrono::microseconds m_delay;
    int m_socket = -1;
    std::thread m_server;
};
