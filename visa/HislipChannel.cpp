// SPDX-License-Identifier: Apache-2.0
#include "HislipChannel.h"

#include <algorithm>
#include <cstring>

namespace visa {

namespace {

namespace hislip = protocols::hislip;

constexpr std::size_t InputSize = std::size_t{64} * 1024;

} // namespace

HislipChannel::HislipChannel(const Waker &waker)
    : m_socket(waker)
    , m_input(InputSize)
{
}

ViStatus HislipChannel::connect(const std::vector<HostAddress> &addresses, std::uint16_t port,
                                const Deadline &deadline)
{
    m_isBroken = false;
    m_left = 0;
    m_begin = m_end = 0;
    return m_socket.connect(addresses, port, deadline);
}

ViStatus HislipChannel::send(Header header, std::span<const std::uint8_t> payload,
                             const Deadline &deadline)
{
    if (!isUsable()) {
        return VI_ERROR_CONN_LOST;
    }
    header.length = payload.size();
    const auto head = hislip::encode(header);
    // Together in one packet where they are short.
    std::vector<std::uint8_t> first(head.begin(), head.end());
    const std::size_t joined = std::min(payload.size(), InputSize);
    first.insert(first.end(), payload.begin(),
                 payload.begin() + static_cast<std::ptrdiff_t>(joined));
    std::size_t sent = 0;
    ViStatus status = m_socket.send(first, deadline, sent);
    bool isUntouched = sent == 0;
    if (status == VI_SUCCESS && joined < payload.size()) {
        status = m_socket.send(payload.subspan(joined), deadline, sent);
        isUntouched = false;
    }
    m_isBroken = status != VI_SUCCESS && !isUntouched;
    return status;
}

ViStatus HislipChannel::fill(const Deadline &deadline)
{
    if (m_begin > 0) {
        std::memmove(m_input.data(), m_input.data() + m_begin, held());
        m_end -= m_begin;
        m_begin = 0;
    }
    std::size_t received = 0;
    const ViStatus status = m_socket.receive(std::span(m_input).subspan(m_end), deadline, received);
    m_end += received;
    return status;
}

ViStatus HislipChannel::receive(Header &header, const Deadline &deadline)
{
    while (m_left > 0) {
        std::span<const std::uint8_t> bytes;
        if (const ViStatus status = peek(bytes, deadline); status != VI_SUCCESS) {
            return status;
        }
        take(bytes.size());
    }
    while (held() < hislip::HeaderSize) {
        if (const ViStatus status = fill(deadline); status != VI_SUCCESS) {
            return status;
        }
    }
    const std::span<const std::uint8_t, hislip::HeaderSize> head(m_input.data() + m_begin,
                                                                 hislip::HeaderSize);
    if (!hislip::decode(head, header)) {
        m_isBroken = true;
        return VI_ERROR_IO;
    }
    m_begin += hislip::HeaderSize;
    m_left = header.length;
    return VI_SUCCESS;
}

ViStatus HislipChannel::peek(std::span<const std::uint8_t> &bytes, const Deadline &deadline)
{
    if (held() == 0) {
        if (const ViStatus status = fill(deadline); status != VI_SUCCESS) {
            return status;
        }
    }
    const auto count = static_cast<std::size_t>(std::min<std::uint64_t>(held(), m_left));
    bytes = std::span(m_input).subspan(m_begin, count);
    return VI_SUCCESS;
}

void HislipChannel::take(std::size_t count)
{
    m_begin += count;
    m_left -= count;
}

ViStatus HislipChannel::takeInto(std::span<std::uint8_t> buffer, const Deadline &deadline,
                                 std::size_t &count)
{
    const auto wanted = static_cast<std::size_t>(std::min<std::uint64_t>(buffer.size(), m_left));
    if (held() > 0) {
        count = std::min(wanted, held());
        std::memcpy(buffer.data(), m_input.data() + m_begin, count);
        take(count);
        return VI_SUCCESS;
    }
    const ViStatus status = m_socket.receive(buffer.first(wanted), deadline, count);
    m_left -= count;
    return status;
}

} // namespace visa
