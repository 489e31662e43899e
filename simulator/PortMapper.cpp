// SPDX-License-Identifier: Apache-2.0
#include "PortMapper.h"

#include "Rpc.h"
#include "sockets.h"

#include <netinet/in.h>
#include <poll.h>
#include <sys/eventfd.h>
#include <sys/socket.h>

#include <array>
#include <cerrno>
#include <utility>

namespace simulator {
namespace {

constexpr std::uint32_t Program = 100000;
constexpr std::uint32_t Version = 2;
constexpr std::size_t MaxCallSize = 4096;
constexpr std::uint32_t ProtocolTcp = IPPROTO_TCP;
constexpr std::uint32_t ProtocolUdp = IPPROTO_UDP;

enum Procedure : std::uint32_t { Set = 1, Unset = 2, GetPort = 3, Dump = 4 };

void putMapping(XdrWriter &results, std::uint32_t program, std::uint32_t version,
                std::uint32_t protocol, std::uint32_t port)
{
    results.number(1); // one more follows
    results.number(program);
    results.number(version);
    results.number(protocol);
    results.number(port);
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
}

RpcStatus PortMapper::call(std::uint32_t procedure, XdrReader &arguments, XdrWriter &results) const
{
    switch (procedure) {
    case Set:
    case Unset:
        // Nobody else may register anything on an instrument.
        results.number(0);
        return RpcStatus::Success;
    case GetPort: {
        const std::uint32_t program = arguments.number();
        const std::uint32_t version = arguments.number();
        const std::uint32_t protocol = arguments.number();
        (void)arguments.number();
        if (!arguments.isGood()) {
            return RpcStatus::GarbageArguments;
        }
        std::uint32_t port = 0;
        for (const Mapping &mapping : m_mappings) {
            if (mapping.program == program && mapping.version == version &&
                protocol == ProtocolTcp) {
                port = mapping.port;
            }
        }
        if (program == Program) {
            port = Port;
        }
        results.number(port);
        return RpcStatus::Success;
    }
    case Dump:
        putMapping(results, Program, Version, ProtocolTcp, Port);
        putMapping(results, Program, Version, ProtocolUdp, Port);
        for (const Mapping &mapping : m_mappings) {
            putMapping(results, mapping.program, mapping.version, ProtocolTcp, mapping.port);
        }
        results.number(0);
        return RpcStatus::Success;
    default:
        return RpcStatus::ProcedureUnavailable;
    }
}

void PortMapper::serveTcp(int fd) const
{
    const std::array programs{
        RpcProgram{Program, Version,
                   [this](std::uint32_t procedure, XdrReader &arguments, XdrWriter &results) {
                       return call(procedure, arguments, results);
                   }}};
    serveRpcStream(fd, MaxCallSize, programs, [] { return false; });
}

void PortMapper::serveUdp() const
{
    const std::array programs{
        RpcProgram{Program, Version,
                   [this](std::uint32_t procedure, XdrReader &arguments, XdrWriter &results) {
                       return call(procedure, arguments, results);
                   }}};
    std::array<char, MaxCallSize> buffer{};
    XdrWriter reply;
    for (;;) {
        std::array<pollfd, 2> events{{{m_wake.get(), POLLIN, 0}, {m_udp.get(), POLLIN, 0}}};
        if (::poll(events.data(), events.size(), -1) < 0 && errno != EINTR) {
            return;
        }
        if (events[0].revents != 0) {
            return;
        }
        sockaddr_in peer{};
        socklen_t length = sizeof(peer);
        const ssize_t count = ::recvfrom(m_udp.get(), buffer.data(), buffer.size(), MSG_DONTWAIT,
                                         reinterpret_cast<sockaddr *>(&peer), &length);
        if (count <= 0) {
            continue;
        }
        const std::span<const char> call = std::span(buffer).first(static_cast<std::size_t>(count));
        if (answerRpcCall(call, programs, reply)) {
            const std::span<const char> bytes = reply.bytes().subspan(RecordMarkSize);
            (void)::sendto(m_udp.get(), bytes.data(), bytes.size(), MSG_NOSIGNAL,
                           reinterpret_cast<const sockaddr *>(&peer), length);
        }
    }
}

} // namespace simulator
