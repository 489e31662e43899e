// SPDX-License-Identifier: Apache-2.0
#include "SocketTransport.h"

#include <algorithm>
#include <cstring>

namespace visa {

namespace {

constexpr std::size_t InputSize = std::size_t{64} * 1024;
constexpr std::uint8_t LineFeed = '\n';

// takeBuffered() has used up all bytes and the read has to go on. No status of VISA has this value.
constexpr ViStatus NeedsMore = 1;

} // namespace

SocketTransport::SocketTransport(std::vector<HostAddress> addresses, ViUInt16 port)
    : m_addresses(std::move(addresses))
    , m_port(port)
    , m_socket(m_waker)
    , m_input(InputSize)
{
}

ViStatus SocketTransport::open(const std::string &host, ViUInt16 port, const Deadline &deadline,
                               std::unique_ptr<Transport> &transport)
{
    std::vector<HostAddress> addresses;
    if (const ViStatus status = lookUpHost(host, deadline, addresses); status != VI_SUCCESS) {
        return status;
    }
    std::unique_ptr<SocketTransport> opened(new SocketTransport(std::move(addresses), port));
    if (const ViStatus status = opened->connect(deadline); status != VI_SUCCESS) {
        return status;
    }
    transport = std::move(opened);
    return VI_SUCCESS;
}

ViStatus SocketTransport::connect(const Deadline &deadline)
{
    m_wasUsed = false;
    m_isMidMessage = false;
    m_tracker.reset();
    m_inputBegin = m_inputEnd = 0;
    return m_socket.connect(m_addresses, m_port, deadline);
}

ViStatus SocketTransport::write(std::span<const std::uint8_t> data, bool end,
                                const Deadline &deadline, std::size_t &count)
{
    // A last byte of 0x0A ends a message of plain text, but may as well be the data of a block,
    // behind which the line feed is still due. One too many is an empty message and does no harm.
    const bool mayHoldBlock =
        m_isMidMessage || std::find(data.begin(), data.end(), std::uint8_t{'#'}) != data.end();
    const bool needsLineFeed = end && (mayHoldBlock || data.back() != LineFeed);
    m_output.assign(data.begin(), data.end());
    if (needsLineFeed) {
        m_output.push_back(LineFeed);
    }
    m_wasUsed = true;
    m_isMidMessage = !end;
    const ViStatus status = m_socket.send(m_output, deadline, count);
    count = std::min(count, data.size());
    return status;
}

ViStatus SocketTransport::read(std::span<std::uint8_t> buffer, const ReadOptions &options,
                               const Deadline &deadline, std::size_t &count)
{
    count = 0;
    for (;;) {
        if (const ViStatus status = takeBuffered(buffer, options, count); status != NeedsMore) {
            return status;
        }
        if (count > 0 && deadline.isOver()) {
            return VI_ERROR_TMO;
        }
        m_inputBegin = m_inputEnd = 0;
        if (const ViStatus status = m_socket.receive(m_input, deadline, m_inputEnd);
            status != VI_SUCCESS) {
            return status;
        }
        m_wasUsed = true;
    }
}

ViStatus SocketTransport::takeBuffered(std::span<std::uint8_t> buffer, const ReadOptions &options,
                                       std::size_t &count)
{
    while (m_inputBegin < m_inputEnd && count < buffer.size()) {
        auto part = std::span(m_input).subspan(
            m_inputBegin, std::min(m_inputEnd - m_inputBegin, buffer.size() - count));
        bool isTerminated = false;
        if (options.terminator) {
            const auto found = std::find(part.begin(), part.end(), *options.terminator);
            isTerminated = found != part.end();
            if (isTerminated) {
                part = part.first(static_cast<std::size_t>(found - part.begin()) + 1);
            }
        }
        const std::size_t size = m_tracker.advance(part);
        std::memcpy(buffer.data() + count, part.data(), size);
        count += size;
        m_inputBegin += size;
        // No END came over this wire, so the terminator that was asked for goes first.
        if (isTerminated && size == part.size()) {
            return VI_SUCCESS_TERM_CHAR;
        }
        if (m_tracker.endedMessage() && options.stopsAtEnd) {
            return VI_SUCCESS;
        }
    }
    return count == buffer.size() ? VI_SUCCESS_MAX_CNT : NeedsMore;
}

ViStatus SocketTransport::clear(const Deadline &deadline)
{
    if (m_socket.isOpen() && !m_wasUsed) {
        return VI_SUCCESS;
    }
    m_socket.close();
    const ViStatus status = connect(deadline);
    return status == VI_ERROR_RSRC_NFOUND ? VI_ERROR_CONN_LOST : status;
}

ViStatus SocketTransport::controlRemote(ViUInt16 mode, const Deadline &deadline)
{
    (void)mode;
    (void)deadline;
    return VI_ERROR_NSUP_OPER;
}

} // namespace visa
