// SPDX-License-Identifier: Apache-2.0
#include "PortMapper.h"

#include "protocols/RpcRecord.h"
#include "sockets.h"

#include <netinet/in.h>
#include <poll.h>
#include <rpc/pmap_prot.h>
#include <sys/eventfd.h>
#include <sys/socket.h>

#include <array>
#include <cerrno>
#include <utility>

namespace simulator {
namespace {

using protocols::XdrReader;
using protocols::XdrWriter;

constexpr std::size_t MaxCallSize = 4096;

void putMapping(XdrWriter &results, std::uint32_t program, std::uint32_t version,
                std::uint32_t protocol, std::uint32_t port)
{
    results.number(1); // one more follows
    results.value(xdr_pmap, pmap{program, version, protocol, port});
}

} // namespace

PortMapper::~PortMapper()
{
    stop();
}

bool PortMapper::open(const std::string &address, std::string &error)
{
    if (!m_tcp.open(address, Port, error)) {
        error = "TCP: " + error;
        return false;
    }
    m_udp = bindUdp(address, Port, error);
    if (!m_udp.isValid()) {
        error = "UDP: " + error;
    }
    return m_udp.isValid();
}

bool PortMapper::openForBroadcasts(std::string &error)
{
    m_broadcasts = bindSharedUdp(Port, error);
    return m_broadcasts.isValid();
}

void PortMapper::start(std::vector<Mapping> mappings)
{
    m_mappings = std::move(mappings);
    m_tcp.start([this](int fd) { serveTcp(fd); });
    m_wake = UniqueFd(::eventfd(0, EFD_CLOEXEC));
    m_thread = std::thread([this] { serveUdp(); });
}

void PortMapper::stop()
{
    m_tcp.stop();
    if (m_thread.joinable()) {
        const std::uint64_t one = 1;
        (void)!::write(m_wake.get(), &one, sizeof(one));
        m_thread.join();
    }
    m_udp.reset();
    m_broadcasts.reset();
}

RpcStatus PortMapper::call(std::uint32_t procedure, XdrReader &arguments, XdrWriter &results) const
{
    switch (procedure) {
    case PMAPPROC_SET:
    case PMAPPROC_UNSET:
        // Nobody else may register anything on an instrument.
        results.number(0);
        return RpcStatus::Success;
    case PMAPPROC_GETPORT: {
        const auto wanted = arguments.value(xdr_pmap);
        if (!arguments.isGood()) {
            return RpcStatus::GarbageArguments;
        }
        std::uint32_t port = 0;
        for (const Mapping &mapping : m_mappings) {
            if (mapping.program == wanted.pm_prog && mapping.version == wanted.pm_vers &&
                wanted.pm_prot == IPPROTO_TCP) {
                port = mapping.port;
            }
        }
        if (wanted.pm_prog == PMAPPROG) {
            port = Port;
        }
        results.number(port);
        return RpcStatus::Success;
    }
    case PMAPPROC_DUMP:
        putMapping(results, PMAPPROG, PMAPVERS, IPPROTO_TCP, Port);
        putMapping(results, PMAPPROG, PMAPVERS, IPPROTO_UDP, Port);
        for (const Mapping &mapping : m_mappings) {
            putMapping(results, mapping.program, mapping.version, IPPROTO_TCP, mapping.port);
        }
        results.number(0);
        return RpcStatus::Success;
    default:
        return RpcStatus::ProcedureUnavailable;
    }
}

RpcProgram PortMapper::program() const
{
    return {PMAPPROG, PMAPVERS,
            [this](std::uint32_t procedure, XdrReader &arguments, XdrWriter &results) {
                return call(procedure, arguments, results);
            }};
}

void PortMapper::serveTcp(int fd) const
{
    const std::array programs{program()};
    serveRpcStream(fd, MaxCallSize, programs, [] { return false; });
}

void PortMapper::serveUdp() const
{
    for (;;) {
        // A descriptor of -1 is passed over.
        std::array<pollfd, 3> events{
            {{m_wake.get(), POLLIN, 0}, {m_udp.get(), POLLIN, 0}, {m_broadcasts.get(), POLLIN, 0}}};
        if (::poll(events.data(), events.size(), -1) < 0 && errno != EINTR) {
            return;
        }
        if (events[0].revents != 0) {
            return;
        }
        for (const pollfd &event : std::span(events).subspan(1)) {
            if (event.revents != 0) {
                answerDatagram(event.fd);
            }
        }
    }
}

/// The answer leaves by the socket of the own address, so that the caller learns it.
void PortMapper::answerDatagram(int fd) const
{
    const std::array programs{program()};
    std::array<std::uint8_t, MaxCallSize> buffer{};
    XdrWriter reply;
    sockaddr_in peer{};
    socklen_t length = sizeof(peer);
    const ssize_t count = ::recvfrom(fd, buffer.data(), buffer.size(), MSG_DONTWAIT,
                                     reinterpret_cast<sockaddr *>(&peer), &length);
    if (count <= 0) {
        return;
    }
    const std::span<const std::uint8_t> call =
        std::span(buffer).first(static_cast<std::size_t>(count));
    if (answerRpcCall(call, programs, reply)) {
        // A datagram goes without the mark of a record.
        const auto bytes = reply.bytes().subspan(protocols::RecordMarkSize);
        (void)::sendto(m_udp.get(), bytes.data(), bytes.size(), MSG_NOSIGNAL,
                       reinterpret_cast<const sockaddr *>(&peer), length);
    }
}

} // namespace simulator
