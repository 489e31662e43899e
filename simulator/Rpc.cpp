// SPDX-License-Identifier: Apache-2.0
#include "Rpc.h"

#include "sockets.h"

#include <poll.h>
#include <sys/socket.h>

#include <algorithm>
#include <cerrno>
#include <cstring>

namespace simulator {
namespace {

constexpr std::uint32_t Call = 0;
constexpr std::uint32_t Reply = 1;
constexpr std::uint32_t RpcVersion = 2;
constexpr std::uint32_t Accepted = 0;
constexpr std::uint32_t Denied = 1;
constexpr std::uint32_t RpcMismatch = 0;
constexpr std::uint32_t LastFragment = 0x80000000U;
constexpr std::uint32_t NullProcedure = 0;

// RFC 5531, 8.2: the body of a credential is at most this long.
constexpr std::size_t MaxCredentialSize = 400;

constexpr int RecordTimeoutMilliseconds = 30'000;
constexpr std::size_t ReceiveSize = 65'536;

void beginReply(XdrWriter &reply, std::uint32_t transaction)
{
    reply.clear();
    reply.number(0); // the record mark
    reply.number(transaction);
    reply.number(Reply);
}

void finishReply(XdrWriter &reply)
{
    const auto size = static_cast<std::uint32_t>(reply.size() - RecordMarkSize);
    reply.patch(0, LastFragment | size);
}

} // namespace

bool answerRpcCall(std::span<const char> call, std::span<const RpcProgram> programs,
                   XdrWriter &reply)
{
    XdrReader reader(call);
    const std::uint32_t transaction = reader.number();
    if (reader.number() != Call || !reader.isGood()) {
        return false;
    }
    beginReply(reply, transaction);
    if (reader.number() != RpcVersion) {
        reply.number(Denied);
        reply.number(RpcMismatch);
        reply.number(RpcVersion);
        reply.number(RpcVersion);
        finishReply(reply);
        return reader.isGood();
    }
    const std::uint32_t number = reader.number();
    const std::uint32_t version = reader.number();
    const std::uint32_t procedure = reader.number();
    // Credential and verifier: any are welcome, none are looked at.
    for (int i = 0; i < 2; ++i) {
        (void)reader.number();
        if (reader.opaque().size() > MaxCredentialSize) {
            return false;
        }
    }
    if (!reader.isGood()) {
        return false;
    }

    reply.number(Accepted);
    reply.number(0); // verifier AUTH_NONE
    reply.number(0);
    const std::size_t statusPlace = reply.size();
    reply.number(0);

    const auto found = std::find_if(programs.begin(), programs.end(), [&](const RpcProgram &p) {
        return p.number == number && p.version == version;
    });
    RpcStatus status = RpcStatus::Success;
    if (found != programs.end()) {
        if (procedure != NullProcedure) {
            status = found->handler(procedure, reader, reply);
        }
    } else {
        const auto other = std::find_if(programs.begin(), programs.end(),
                                        [&](const RpcProgram &p) { return p.number == number; });
        status =
            other == programs.end() ? RpcStatus::ProgramUnavailable : RpcStatus::ProgramMismatch;
        if (other != programs.end()) {
            reply.number(other->version);
            reply.number(other->version);
        }
    }
    if (status == RpcStatus::ProcedureUnavailable || status == RpcStatus::GarbageArguments ||
        status == RpcStatus::SystemError) {
        reply.truncate(statusPlace + RecordMarkSize);
    }
    reply.patch(statusPlace, static_cast<std::uint32_t>(status));
    finishReply(reply);
    return true;
}

RecordReader::RecordReader(int fd, std::size_t maxRecord)
    : m_fd(fd)
    , m_maxRecord(maxRecord)
    , m_buffer(ReceiveSize)
{
}

std::optional<std::span<const char>> RecordReader::next()
{
    m_record.clear();
    m_inRecord = false;
    for (;;) {
        if (!fill(RecordMarkSize)) {
            return std::nullopt;
        }
        m_inRecord = true;
        const std::span<const char> head = std::span(m_buffer).subspan(m_begin, RecordMarkSize);
        const std::uint32_t mark = XdrReader(head).number();
        const bool last = (mark & LastFragment) != 0;
        const std::size_t size = mark & ~LastFragment;
        // An empty fragment that is not the last would let a peer keep a record open for ever.
        if (size > m_maxRecord - m_record.size() || (size == 0 && !last)) {
            return std::nullopt;
        }
        m_begin += RecordMarkSize;
        if (!fill(size)) {
            return std::nullopt;
        }
        const std::span<const char> fragment = std::span(m_buffer).subspan(m_begin, size);
        m_begin += size;
        if (last && m_record.empty()) {
            return fragment;
        }
        m_record.insert(m_record.end(), fragment.begin(), fragment.end());
        if (last) {
            return m_record;
        }
    }
}

// Makes that many bytes available behind m_begin.
bool RecordReader::fill(std::size_t size)
{
    if (m_begin == m_end) {
        m_begin = m_end = 0;
    }
    while (m_end - m_begin < size) {
        if (m_buffer.size() - m_begin < size) {
            std::memmove(m_buffer.data(), m_buffer.data() + m_begin, m_end - m_begin);
            m_end -= m_begin;
            m_begin = 0;
            // Grows with what really came, not with what the peer announces.
            if (m_buffer.size() < size && m_end == m_buffer.size()) {
                m_buffer.resize(std::min(size, 2 * m_buffer.size()));
            }
        }
        const bool started = m_inRecord || m_end > m_begin;
        if (started) {
            pollfd event{m_fd, POLLIN, 0};
            const int ready = ::poll(&event, 1, RecordTimeoutMilliseconds);
            if (ready < 0 && errno == EINTR) {
                continue;
            }
            if (ready <= 0) {
                return false;
            }
        }
        const ssize_t count = ::recv(m_fd, m_buffer.data() + m_end, m_buffer.size() - m_end, 0);
        if (count < 0 && errno == EINTR) {
            continue;
        }
        if (count <= 0) {
            return false;
        }
        m_end += static_cast<std::size_t>(count);
    }
    return true;
}

void serveRpcStream(int fd, std::size_t maxRecord, std::span<const RpcProgram> programs,
                    const std::function<bool()> &isDropped)
{
    RecordReader reader(fd, maxRecord);
    XdrWriter reply;
    while (const std::optional<std::span<const char>> call = reader.next()) {
        if (!answerRpcCall(*call, programs, reply) || isDropped()) {
            return;
        }
        if (!sendAll(fd, reply.bytes())) {
            return;
        }
    }
}

} // namespace simulator
