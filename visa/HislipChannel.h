// SPDX-License-Identifier: Apache-2.0
#pragma once

#include "TcpSocket.h"

#include <protocols/hislip.h>

#include <cstdint>
#include <span>
#include <vector>

namespace visa {

/// One of the two connections of a HiSLIP session: messages of a head and a payload. Statuses as
/// TcpSocket; VI_ERROR_IO for bytes that are no message. A read that ran out of time goes on where
/// it was; a message that was sent in part leaves the channel useless.
class HislipChannel
{
public:
    using Header = protocols::hislip::Header;

    /// The waker has to outlive the channel.
    explicit HislipChannel(const Waker &waker);

    [[nodiscard]] ViStatus connect(const std::vector<HostAddress> &addresses, std::uint16_t port,
                                   const Deadline &deadline);
    void close() { m_socket.close(); }
    /// False also after a message that couldn't be sent whole.
    [[nodiscard]] bool isUsable() const { return m_socket.isOpen() && !m_isBroken; }

    /// Sends a message; the head's length is set from the payload.
    [[nodiscard]] ViStatus send(Header header, std::span<const std::uint8_t> payload,
                                const Deadline &deadline);

    /// Waits for the head of the next message. What is left of the payload before is skipped.
    [[nodiscard]] ViStatus receive(Header &header, const Deadline &deadline);

    /// Bytes of the payload that were not taken yet.
    [[nodiscard]] std::uint64_t payloadLeft() const { return m_left; }

    /// The bytes of the payload that are there, at least one; they stay until the next call. The
    /// payload has to have some left.
    [[nodiscard]] ViStatus peek(std::span<const std::uint8_t> &bytes, const Deadline &deadline);

    /// Takes bytes that peek() gave.
    void take(std::size_t count);

    /// Takes bytes of the payload straight into a large buffer, at least one.
    [[nodiscard]] ViStatus takeInto(std::span<std::uint8_t> buffer, const Deadline &deadline,
                                    std::size_t &count);

private:
    [[nodiscard]] ViStatus fill(const Deadline &deadline);
    [[nodiscard]] std::size_t held() const { return m_end - m_begin; }

    TcpSocket m_socket;
    bool m_isBroken = false;
    std::uint64_t m_left = 0;
    std::vector<std::uint8_t> m_input; // received bytes from m_begin on are not taken yet
    std::size_t m_begin = 0;
    std::size_t m_end = 0;
};

} // namespace visa
