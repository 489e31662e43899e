// SPDX-License-Identifier: Apache-2.0
#include "RpcConnection.h"

#include <algorithm>
#include <atomic>

namespace visa {

namespace {

// Largest reply: what one device_read asks for, and its frame.
constexpr std::size_t LargestRecord = (1U << 20U) + 4096;
constexpr std::size_t InputSize = std::size_t{64} * 1024;

// Different numbers in each connection, so that no stray reply fits by chance.
std::uint32_t firstTransaction()
{
    static std::atomic<std::uint32_t> next{0x1000};
    return next.fetch_add(0x01'0000);
}

} // namespace

RpcConnection::RpcConnection(const Waker &waker)
    : m_socket(waker)
    , m_reader(LargestRecord)
    , m_transaction(firstTransaction())
    , m_input(InputSize)
{
}

ViStatus RpcConnection::connect(const std::vector<HostAddress> &addresses, std::uint16_t port,
                                const Deadline &deadline)
{
    m_reader.reset();
    m_inputBegin = m_inputEnd = 0;
    return m_socket.connect(addresses, port, deadline);
}

std::size_t RpcConnection::beginCall(const RpcProcedure &procedure)
{
    ++m_transaction;
    m_head.clear();
    m_head.number(0); // the record mark, once the size is known
    for (const std::uint32_t word :
         {m_transaction, std::uint32_t{CALL}, std::uint32_t{RPC_MSG_VERSION}, procedure.program,
          procedure.version, procedure.number}) {
        m_head.number(word);
    }
    // Credential and verifier: no authentication, no bytes.
    for (int i = 0; i < 4; ++i) {
        m_head.number(0);
    }
    m_call.assign(m_head.bytes().begin(), m_head.bytes().end());
    return m_call.size();
}

ViStatus RpcConnection::exchange(const Deadline &deadline)
{
    protocols::markRecord(m_call);
    std::size_t sent = 0;
    if (const ViStatus status = m_socket.send(m_call, deadline, sent); status != VI_SUCCESS) {
        // The peer would take the next call for the rest of this one.
        if (sent > 0 || status == VI_ERROR_CONN_LOST) {
            close();
        }
        return status;
    }
    for (;;) {
        if (const ViStatus status = receiveRecord(deadline); status != VI_SUCCESS) {
            return status;
        }
        const RpcReply reply = parseRpcReply(m_reader.record(), m_transaction);
        switch (reply.kind) {
        case RpcReplyKind::Accepted:
            m_results = reply.results;
            return VI_SUCCESS;
        case RpcReplyKind::OtherCall:
            // Even a peer that floods us with stale replies must not hold the call.
            if (deadline.isOver()) {
                return VI_ERROR_TMO;
            }
            break;
        case RpcReplyKind::Unavailable:
            return VI_ERROR_NSUP_OPER;
        case RpcReplyKind::Refused:
            return VI_ERROR_IO;
        case RpcReplyKind::Malformed:
            close();
            return VI_ERROR_IO;
        }
    }
}

ViStatus RpcConnection::receiveRecord(const Deadline &deadline)
{
    if (m_reader.state() == protocols::RpcRecordReader::State::Complete) {
        m_reader.next();
    }
    for (;;) {
        m_inputBegin +=
            m_reader.feed(std::span(m_input).subspan(m_inputBegin, m_inputEnd - m_inputBegin));
        if (m_reader.state() == protocols::RpcRecordReader::State::Complete) {
            return VI_SUCCESS;
        }
        if (m_reader.state() == protocols::RpcRecordReader::State::Broken) {
            close();
            return VI_ERROR_IO;
        }
        // A peer that trickles, or sends empty fragments for ever, never leaves receive() waiting.
        if (deadline.isOver()) {
            return VI_ERROR_TMO;
        }
        m_inputBegin = m_inputEnd = 0;
        if (const ViStatus status = m_socket.receive(m_input, deadline, m_inputEnd);
            status != VI_SUCCESS) {
            if (status == VI_ERROR_CONN_LOST) {
                close();
            }
            return status;
        }
    }
}

} // namespace visa
