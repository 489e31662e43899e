// SPDX-License-Identifier: Apache-2.0
#include "sockets.h"

#include <arpa/inet.h>
#include <netinet/in.h>
#include <netinet/tcp.h>
#include <poll.h>
#include <sys/socket.h>

#include <cerrno>
#include <system_error>

namespace simulator {
namespace {

constexpr int Backlog = 64;

enum class Sharing { Alone, Shared };

UniqueFd bindSocket(const std::string &address, std::uint16_t port, int type, Sharing sharing,
                    std::string &error)
{
    sockaddr_in name{};
    name.sin_family = AF_INET;
    name.sin_port = htons(port);
    if (::inet_pton(AF_INET, address.c_str(), &name.sin_addr) != 1) {
        error = "'" + address + "' is no IPv4 address";
        return {};
    }
    UniqueFd fd(::socket(AF_INET, type | SOCK_CLOEXEC, 0));
    const int on = 1;
    // A restarted instrument gets its ports back although old connections linger.
    if (!fd.isValid() ||
        ((type == SOCK_STREAM || sharing == Sharing::Shared) &&
         ::setsockopt(fd.get(), SOL_SOCKET, SO_REUSEADDR, &on, sizeof(on)) != 0) ||
        ::bind(fd.get(), reinterpret_cast<const sockaddr *>(&name), sizeof(name)) != 0 ||
        (type == SOCK_STREAM && ::listen(fd.get(), Backlog) != 0)) {
        error = std::generic_category().message(errno);
        return {};
    }
    return fd;
}

} // namespace

UniqueFd listenTcp(const std::string &address, std::uint16_t port, std::string &error)
{
    return bindSocket(address, port, SOCK_STREAM, Sharing::Alone, error);
}

UniqueFd bindUdp(const std::string &address, std::uint16_t port, std::string &error)
{
    return bindSocket(address, port, SOCK_DGRAM, Sharing::Shared, error);
}

UniqueFd bindSharedUdp(std::uint16_t port, std::string &error)
{
    return bindSocket("0.0.0.0", port, SOCK_DGRAM, Sharing::Shared, error);
}

std::uint16_t localPort(int fd)
{
    sockaddr_in name{};
    socklen_t length = sizeof(name);
    if (::getsockname(fd, reinterpret_cast<sockaddr *>(&name), &length) != 0) {
        return 0;
    }
    return ntohs(name.sin_port);
}

bool sendAll(int fd, std::span<const std::byte> bytes)
{
    while (!bytes.empty()) {
        const ssize_t count = ::send(fd, bytes.data(), bytes.size(), MSG_NOSIGNAL);
        if (count > 0) {
            bytes = bytes.subspan(static_cast<std::size_t>(count));
        } else if (count == 0 || errno != EINTR) {
            return false;
        }
    }
    return true;
}

bool isPeerGone(int fd)
{
    pollfd entry{fd, POLLRDHUP, 0};
    return ::poll(&entry, 1, 0) > 0 && (entry.revents & (POLLRDHUP | POLLHUP | POLLERR)) != 0;
}

} // namespace simulator
