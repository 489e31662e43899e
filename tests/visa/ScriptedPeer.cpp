// SPDX-License-Identifier: Apache-2.0
#include "ScriptedPeer.h"

#include <arpa/inet.h>
#include <netinet/in.h>
#include <sys/socket.h>
#include <unistd.h>

#include <algorithm>

bool PeerConnection::send(std::string_view bytes)
{
    while (!bytes.empty()) {
        const ssize_t count = ::send(m_descriptor, bytes.data(), bytes.size(), MSG_NOSIGNAL);
        if (count <= 0) {
            return false;
        }
        bytes.remove_prefix(static_cast<std::size_t>(count));
    }
    return true;
}

std::string PeerConnection::receive(std::size_t size)
{
    std::string bytes(size, '\0');
    std::size_t received = 0;
    while (received < size) {
        const ssize_t count = ::recv(m_descriptor, bytes.data() + received, size - received, 0);
        if (count <= 0) {
            break;
        }
        received += static_cast<std::size_t>(count);
    }
    bytes.resize(received);
    return bytes;
}

std::string PeerConnection::receiveSome(std::size_t most)
{
    std::string bytes(most, '\0');
    const ssize_t count = ::recv(m_descriptor, bytes.data(), most, 0);
    bytes.resize(static_cast<std::size_t>(std::max<ssize_t>(count, 0)));
    return bytes;
}

std::string PeerConnection::receiveUntil(char last)
{
    std::string bytes;
    do {
        const std::string byte = receive(1);
        if (byte.empty()) {
            break;
        }
        bytes += byte;
    } while (bytes.back() != last);
    return bytes;
}

void PeerConnection::waitForClose()
{
    while (!receive(1).empty()) {
    }
}

void PeerConnection::shutDown()
{
    ::shutdown(m_descriptor, SHUT_RDWR);
}

void PeerConnection::reset()
{
    // To be connected to nobody ends a connection by a reset.
    sockaddr nobody{};
    nobody.sa_family = AF_UNSPEC;
    ::connect(m_descriptor, &nobody, sizeof nobody);
}

ScriptedPeer::ScriptedPeer(Script script, const std::string &address, std::uint16_t port)
    : m_script(std::move(script))
    , m_listener(::socket(AF_INET, SOCK_STREAM | SOCK_CLOEXEC, 0))
{
    const int enabled = 1;
    setsockopt(m_listener, SOL_SOCKET, SO_REUSEADDR, &enabled, sizeof enabled);
    sockaddr_in endpoint{};
    endpoint.sin_family = AF_INET;
    endpoint.sin_port = htons(port);
    inet_pton(AF_INET, address.c_str(), &endpoint.sin_addr);
    auto *generic = reinterpret_cast<sockaddr *>(&endpoint);
    socklen_t length = sizeof endpoint;
    if (::bind(m_listener, generic, length) != 0 || ::listen(m_listener, 8) != 0 ||
        ::getsockname(m_listener, generic, &length) != 0) {
        return;
    }
    m_port = ntohs(endpoint.sin_port);
    m_acceptor = std::thread([this] { accept(); });
}

void ScriptedPeer::accept()
{
    for (;;) {
        const int descriptor = ::accept4(m_listener, nullptr, nullptr, SOCK_CLOEXEC);
        const std::lock_guard lock(m_mutex);
        if (descriptor < 0 || m_isStopping) {
            if (descriptor >= 0) {
                ::close(descriptor);
            }
            return;
        }
        ++m_connectionCount;
        m_descriptors.push_back(descriptor);
        m_threads.emplace_back([this, descriptor] {
            PeerConnection connection(descriptor);
            m_script(connection);
            // The descriptor itself stays, so that its number is not used anew.
            connection.shutDown();
        });
    }
}

ScriptedPeer::~ScriptedPeer()
{
    m_isStopping = true;
    ::shutdown(m_listener, SHUT_RDWR);
    if (m_acceptor.joinable()) {
        m_acceptor.join();
    }
    for (const int descriptor : m_descriptors) {
        ::shutdown(descriptor, SHUT_RDWR);
    }
    for (std::thread &thread : m_threads) {
        thread.join();
    }
    for (const int descriptor : m_descriptors) {
        ::close(descriptor);
    }
    ::close(m_listener);
}
