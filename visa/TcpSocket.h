// SPDX-License-Identifier: Apache-2.0
#pragma once

#include "Deadline.h"
#include "Waker.h"
#include "hostlookup.h"
#include "visa.h"

#include <cstddef>
#include <cstdint>
#include <span>
#include <vector>

namespace visa {

/// One TCP connection, never blocking beyond a deadline. Each operation returns VI_SUCCESS,
/// VI_ERROR_TMO, VI_ERROR_ABORT (woken), VI_ERROR_CONN_LOST or VI_ERROR_ALLOC.
class TcpSocket
{
public:
    /// The waker has to outlive the socket.
    explicit TcpSocket(const Waker &waker);
    ~TcpSocket();
    TcpSocket(const TcpSocket &) = delete;
    TcpSocket &operator=(const TcpSocket &) = delete;

    /// Tries one address after the other, sharing the time among them. VI_ERROR_RSRC_NFOUND if
    /// all refuse.
    [[nodiscard]] ViStatus connect(const std::vector<HostAddress> &addresses, std::uint16_t port,
                                   const Deadline &deadline);
    void close();
    [[nodiscard]] bool isOpen() const { return m_descriptor >= 0; }

    /// Sends all bytes or fails; `sent` counts what the system took, also on failure.
    [[nodiscard]] ViStatus send(std::span<const std::uint8_t> data, const Deadline &deadline,
                                std::size_t &sent);

    /// Waits for at least one byte and takes what is there.
    [[nodiscard]] ViStatus receive(std::span<std::uint8_t> buffer, const Deadline &deadline,
                                   std::size_t &received);

private:
    [[nodiscard]] ViStatus connectTo(HostAddress address, std::uint16_t port,
                                     const Deadline &deadline);
    [[nodiscard]] ViStatus waitFor(short events, const Deadline &deadline) const;

    const Waker &m_waker;
    int m_descriptor = -1;
};

} // namespace visa
