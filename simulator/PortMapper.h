// SPDX-License-Identifier: Apache-2.0
#pragma once

#include "TcpServer.h"
#include "UniqueFd.h"
#include "rpcserver.h"

#include <cstdint>
#include <span>
#include <string>
#include <thread>
#include <vector>

namespace simulator {

/// The RPC port mapper, RFC 1833, version 2, on TCP and UDP: it tells clients where the VXI-11
/// channels are.
class PortMapper
{
public:
    static constexpr std::uint16_t Port = 111;

    /// One registered program; all of them are served over TCP.
    struct Mapping
    {
        std::uint32_t program = 0;
        std::uint32_t version = 0;
        std::uint16_t port = 0;
    };

    PortMapper() = default;
    ~PortMapper();
    PortMapper(const PortMapper &) = delete;
    PortMapper &operator=(const PortMapper &) = delete;

    /// Opens both sockets. False with the protocol and the reason in `error`.
    [[nodiscard]] bool open(const std::string &address, std::string &error);

    /// Answers calls to all hosts of the network as well; after open(). Same failures.
    [[nodiscard]] bool openForBroadcasts(std::string &error);
    void start(std::vector<Mapping> mappings);
    void stop();

private:
    [[nodiscard]] RpcStatus call(std::uint32_t procedure, protocols::XdrReader &arguments,
                                 protocols::XdrWriter &results) const;
    [[nodiscard]] RpcProgram program() const;
    void serveTcp(int fd) const;
    void serveUdp() const;
    void answerDatagram(int fd) const;

    TcpServer m_tcp;
    UniqueFd m_udp;
    UniqueFd m_broadcasts; ///< may be none
    UniqueFd m_wake;       ///< an event that ends the UDP thread
    std::thread m_thread;
    std::vector<Mapping> m_mappings;
};

} // namespace simulator
