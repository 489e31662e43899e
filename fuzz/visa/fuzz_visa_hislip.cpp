// SPDX-License-Identifier: Apache-2.0
// An instrument that answers over HiSLIP as the input says, whatever it is asked: the first two
// bytes tell how much of the rest comes over the second connection.
#include "support/require.h"
#include "visa/HislipTransport.h"

#include <netinet/in.h>
#include <sys/socket.h>
#include <unistd.h>

#include <algorithm>
#include <array>
#include <thread>

using namespace visa;

namespace {

constexpr ViUInt32 TimeoutMs = 500;

sockaddr_in loopback(std::uint32_t host, ViUInt16 port)
{
    sockaddr_in address{};
    address.sin_family = AF_INET;
    address.sin_port = htons(port);
    address.sin_addr.s_addr = htonl(INADDR_LOOPBACK + host);
    return address;
}

/// Where the instrument waits: each thousand inputs another address, since the connections of the
/// former ones keep their ports for a minute.
class Listener
{
public:
    Listener() = default;
    ~Listener() { ::close(fd); }
    Listener(const Listener &) = delete;
    Listener &operator=(const Listener &) = delete;

    void prepare()
    {
        if (m_runs++ % 1000 != 0) {
            return;
        }
        constexpr std::uint32_t Hosts = 10'000;
        host = (host + 1) % Hosts;
        ::close(fd);
        fd = ::socket(AF_INET, SOCK_STREAM, 0);
        sockaddr_in address = loopback(host, 0);
        socklen_t length = sizeof(address);
        auto *generic = reinterpret_cast<sockaddr *>(&address);
        require(::bind(fd, generic, length) == 0 && ::listen(fd, 8) == 0 &&
                ::getsockname(fd, generic, &length) == 0);
        port = ntohs(address.sin_port);
    }

    [[nodiscard]] HislipAddress address() const
    {
        constexpr std::uint32_t Net = 256;
        return {"127.0." + std::to_string((host + 1) / Net) + '.' +
                    std::to_string((host + 1) % Net),
                port, "hislip0"};
    }

    int fd = -1;
    std::uint32_t host = 0;
    ViUInt16 port = 0;

private:
    std::uint64_t m_runs = 0;
};

/// Two connections and what they say; a third one, after a clear, is closed at once.
void answer(int listener, std::array<std::span<const std::uint8_t>, 2> streams)
{
    std::vector<int> connections;
    for (std::size_t k = 0;; ++k) {
        const int fd = ::accept(listener, nullptr, nullptr);
        std::uint8_t mark = 0;
        // The last connection says by one byte of its own that all is over.
        if (fd >= 0 && ::recv(fd, &mark, 1, MSG_PEEK) == 1 && mark == 0xFF) {
            connections.push_back(fd);
            break;
        }
        if (k < streams.size()) {
            (void)::send(fd, streams.at(k).data(), streams.at(k).size(), MSG_NOSIGNAL);
        }
        ::shutdown(fd, SHUT_WR);
        connections.push_back(fd);
    }
    for (const int fd : connections) {
        ::close(fd);
    }
}

void endAnswers(const Listener &listener)
{
    const sockaddr_in address = loopback(listener.host, listener.port);
    const int fd = ::socket(AF_INET, SOCK_STREAM, 0);
    require(::connect(fd, reinterpret_cast<const sockaddr *>(&address), sizeof(address)) == 0);
    const std::uint8_t mark = 0xFF;
    require(::send(fd, &mark, 1, 0) == 1);
    ::close(fd);
}

void useTransport(Transport &transport)
{
    const std::array<std::uint8_t, 5> query{'*', 'I', 'D', 'N', '?'};
    std::size_t count = 0;
    (void)transport.write(query, true, Deadline::after(TimeoutMs), count);
    require(count <= query.size());
    // Exactly as large as what is asked for, so that the sanitizer sees a byte behind it.
    std::vector<std::uint8_t> buffer(100);
    for (int k = 0; k < 4; ++k) {
        ReadOptions options;
        if (k % 2 == 1) {
            options.terminator = '\n';
        }
        (void)transport.read(buffer, options, Deadline::after(TimeoutMs), count);
        require(count <= buffer.size());
    }
    (void)transport.controlRemote(0, Deadline::after(TimeoutMs));
    (void)transport.clear(Deadline::after(TimeoutMs));
}

} // namespace

extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t *data, std::size_t size)
{
    if (size < 2) {
        return 0;
    }
    static Listener listener;
    listener.prepare();
    const std::span<const std::uint8_t> bytes(data + 2, size - 2);
    const std::size_t second = std::min<std::size_t>(bytes.size(), data[0] * 256U + data[1]);
    std::thread instrument(answer, listener.fd,
                           std::array{bytes.first(bytes.size() - second), bytes.last(second)});
    {
        std::unique_ptr<Transport> transport;
        if (HislipTransport::open(listener.address(), Deadline::after(TimeoutMs), transport) ==
            VI_SUCCESS) {
            useTransport(*transport);
        }
    }
    endAnswers(listener);
    instrument.join();
    return 0;
}
