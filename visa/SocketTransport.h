// SPDX-License-Identifier: Apache-2.0
#pragma once

#include "MessageTracker.h"
#include "TcpSocket.h"
#include "Transport.h"
#include "Waker.h"

#include <memory>
#include <string>
#include <vector>

namespace visa {

/// An instrument behind a plain TCP port that takes SCPI lines. A byte stream has no END, so a line
/// feed stands for it: one is sent behind each message, and the one that ends a response is
/// reported as END (see MessageTracker). Nor has it a device clear: clear() makes a new connection,
/// which leaves whatever was half sent or half read behind.
class SocketTransport : public Transport
{
public:
    /// VI_ERROR_RSRC_NFOUND if the host is not there or nothing listens on the port.
    [[nodiscard]] static ViStatus open(const std::string &host, ViUInt16 port,
                                       const Deadline &deadline,
                                       std::unique_ptr<Transport> &transport);

    [[nodiscard]] ViUInt16 interfaceType() const override { return VI_INTF_TCPIP; }
    [[nodiscard]] ViStatus write(std::span<const std::uint8_t> data, bool end,
                                 const Deadline &deadline, std::size_t &count) override;
    [[nodiscard]] ViStatus read(std::span<std::uint8_t> buffer, const ReadOptions &options,
                                const Deadline &deadline, std::size_t &count) override;
    [[nodiscard]] ViStatus clear(const Deadline &deadline) override;
    [[nodiscard]] ViStatus controlRemote(ViUInt16 mode, const Deadline &deadline) override;
    void interrupt() noexcept override { m_waker.wake(); }

private:
    SocketTransport(std::vector<HostAddress> addresses, ViUInt16 port);

    [[nodiscard]] ViStatus connect(const Deadline &deadline);
    [[nodiscard]] ViStatus takeBuffered(std::span<std::uint8_t> buffer, const ReadOptions &options,
                                        std::size_t &count);

    Waker m_waker;
    std::vector<HostAddress> m_addresses;
    ViUInt16 m_port;
    TcpSocket m_socket;
    bool m_wasUsed = false;      // since the connection was made
    bool m_isMidMessage = false; // the last write left its message open
    MessageTracker m_tracker;
    std::vector<std::uint8_t> m_output;
    std::vector<std::uint8_t> m_input; // received bytes from m_inputBegin on are not yet read
    std::size_t m_inputBegin = 0;
    std::size_t m_inputEnd = 0;
};

} // namespace visa
