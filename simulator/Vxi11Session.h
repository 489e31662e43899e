// SPDX-License-Identifier: Apache-2.0
#pragma once

#include "Instrument.h"
#include "Vxi11Server.h"
#include "rpcserver.h"

#include <vxi11.h>

#include <cstdint>
#include <map>
#include <memory>

namespace simulator {

/// One connection of the core channel with the links that were created on it. They end with it.
class Vxi11Session
{
public:
    using XdrReader = protocols::XdrReader;
    using XdrWriter = protocols::XdrWriter;

    Vxi11Session(Vxi11Server &server, int fd)
        : m_server(server)
        , m_fd(fd)
    {
    }
    ~Vxi11Session();
    Vxi11Session(const Vxi11Session &) = delete;
    Vxi11Session &operator=(const Vxi11Session &) = delete;

    /// Carries out one procedure of the core channel.
    [[nodiscard]] RpcStatus call(std::uint32_t procedure, XdrReader &arguments, XdrWriter &results);

    /// A fault wants the connection closed.
    [[nodiscard]] bool isDropped() const { return m_dropped; }

private:
    struct Device
    {
        std::shared_ptr<Link> link;
        Instrument *instrument = nullptr;
    };

    [[nodiscard]] RpcStatus createLink(XdrReader &arguments, XdrWriter &results);
    [[nodiscard]] RpcStatus write(XdrReader &arguments, XdrWriter &results);
    [[nodiscard]] RpcStatus read(XdrReader &arguments, XdrWriter &results);
    [[nodiscard]] RpcStatus generic(std::uint32_t procedure, XdrReader &arguments,
                                    XdrWriter &results);
    [[nodiscard]] RpcStatus lock(XdrReader &arguments, XdrWriter &results);
    [[nodiscard]] RpcStatus unlock(XdrReader &arguments, XdrWriter &results);
    [[nodiscard]] RpcStatus destroyLink(XdrReader &arguments, XdrWriter &results);

    [[nodiscard]] Device *find(std::uint32_t link);
    [[nodiscard]] Device_ErrorCode access(std::unique_lock<std::mutex> &lock, Device &device,
                                          Device_Flags flags, std::uint32_t timeoutMs);
    void release(const Device &device, std::uint32_t id);

    Vxi11Server &m_server;
    int m_fd;
    bool m_dropped = false;
    std::map<std::uint32_t, Device> m_devices;
};

} // namespace simulator
