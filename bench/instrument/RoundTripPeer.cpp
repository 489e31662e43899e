// SPDX-License-Identifier: Apache-2.0
#include "RoundTripPeer.h"

#include <netinet/in.h>
#include <netinet/tcp.h>
#include <sched.h>
#include <sys/socket.h>
#include <unistd.h>

namespace {

void sendAtOnce(int socket)
{
    const int on = 1;
    setsockopt(socket, IPPROTO_TCP, TCP_NODELAY, &on, sizeof on);
}

} // namespace

bool sendAll(int socket, const std::vector<char> &bytes)
{
    std::size_t sent = 0;
    while (sent < bytes.size()) {
        const ssize_t count = send(socket, bytes.data() + sent, bytes.size() - sent, MSG_NOSIGNAL);
        if (count <= 0) {
            return false;
        }
        sent += static_cast<std::size_t>(count);
    }
    return true;
}

bool receiveAll(int socket, std::vector<char> &bytes)
{
    std::size_t received = 0;
    while (received < bytes.size()) {
        const ssize_t count = recv(socket, bytes.data() + received, bytes.size() - received, 0);
        if (count <= 0) {
            return false;
        }
        received += static_cast<std::size_t>(count);
    }
    return true;
}

LoopbackPair connectLoopback()
{
    LoopbackPair pair;
    const int listener = socket(AF_INET, SOCK_STREAM | SOCK_CLOEXEC, 0);
    sockaddr_in address{};
    address.sin_family = AF_INET;
    address.sin_addr.s_addr = htonl(INADDR_LOOPBACK);
    socklen_t length = sizeof address;
    auto *generic = reinterpret_cast<sockaddr *>(&address);
    if (bind(listener, generic, length) == 0 && listen(listener, 1) == 0 &&
        getsockname(listener, generic, &length) == 0) {
        pair.client = socket(AF_INET, SOCK_STREAM | SOCK_CLOEXEC, 0);
        sendAtOnce(pair.client);
        if (connect(pair.client, generic, length) == 0) {
            pair.server = accept4(listener, nullptr, nullptr, SOCK_CLOEXEC);
            sendAtOnce(pair.server);
        } else {
            close(pair.client);
            pair.client = -1;
        }
    }
    close(listener);
    return pair;
}

void runOnProcessor(Side side)
{
    cpu_set_t one;
    CPU_ZERO(&one);
    CPU_SET(side == Side::Instrument ? 1 : 0, &one);
    sched_setaffinity(0, sizeof one, &one);
}

RoundTripPeer::RoundTripPeer(std::size_t requestBytes, std::size_t replyBytes,
                             std::chrono::microseconds delay)
    : m_request(requestBytes)
    , m_reply(replyBytes)
    , m_delay(delay)
{
    const LoopbackPair pair = connectLoopback();
    m_socket = pair.client;
    if (pair.server >= 0) {
        m_server = std::thread([this, pair] { serve(pair.server); });
    }
}

RoundTripPeer::~RoundTripPeer()
{
    if (m_socket >= 0) {
        close(m_socket);
    }
    if (m_server.joinable()) {
        m_server.join();
    }
}

void RoundTripPeer::serve(int peer) const
{
    runOnProcessor(Side::Instrument);
    std::vector<char> request(m_request.size());
    while (receiveAll(peer, request)) {
        if (m_delay.count() > 0) {
            std::this_thread::sleep_for(m_delay);
        }
        if (!sendAll(peer, m_reply)) {
            break;
        }
    }
    close(peer);
}

bool RoundTripPeer::exchange()
{
    return sendAll(m_socket, m_request) && receiveAll(m_socket, m_reply);
}
