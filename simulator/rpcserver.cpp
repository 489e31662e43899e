// SPDX-License-Identifier: Apache-2.0
#include "rpcserver.h"

#include "protocols/RpcRecord.h"
#include "sockets.h"

#include <poll.h>
#include <sys/socket.h>

#include <algorithm>
#include <cerrno>
#include <vector>

namespace simulator {
namespace {

using protocols::XdrReader;
using protocols::XdrWriter;

constexpr int RecordTimeoutMilliseconds = 30'000;
constexpr std::size_t ReceiveSize = 262'144;

void beginReply(XdrWriter &reply, std::uint32_t transaction)
{
    reply.clear();
    reply.number(0); // the record mark
    reply.number(transaction);
    reply.number(REPLY);
}

// Waits for bytes of a record that has begun; false when the peer leaves it there.
bool waitForRest(int fd)
{
    for (;;) {
        pollfd event{fd, POLLIN, 0};
        const int ready = ::poll(&event, 1, RecordTimeoutMilliseconds);
        if (ready >= 0 || errno != EINTR) {
            return ready > 0;
        }
    }
}

} // namespace

bool answerRpcCall(std::span<const std::uint8_t> call, std::span<const RpcProgram> programs,
                   XdrWriter &reply)
{
    XdrReader reader(call);
    const std::uint32_t transaction = reader.number();
    if (reader.number() != CALL || !reader.isGood()) {
        return false;
    }
    beginReply(reply, transaction);
    if (reader.number() != RPC_MSG_VERSION) {
        reply.number(MSG_DENIED);
        reply.number(RPC_MISMATCH);
        reply.number(RPC_MSG_VERSION);
        reply.number(RPC_MSG_VERSION);
        protocols::markRecord(reply.bytes());
        return reader.isGood();
    }
    const std::uint32_t number = reader.number();
    const std::uint32_t version = reader.number();
    const std::uint32_t procedure = reader.number();
    // Credential and verifier: any are welcome, none are looked at.
    for (int i = 0; i < 2; ++i) {
        (void)reader.number();
        if (reader.opaque().size() > MAX_AUTH_BYTES) {
            return false;
        }
    }
    if (!reader.isGood()) {
        return false;
    }

    reply.number(MSG_ACCEPTED);
    reply.number(0); // verifier AUTH_NONE
    reply.number(0);
    const std::size_t statusPlace = reply.size();
    reply.number(0);

    const auto found = std::find_if(programs.begin(), programs.end(), [&](const RpcProgram &p) {
        return p.number == number && p.version == version;
    });
    RpcStatus status = RpcStatus::Success;
    if (found != programs.end()) {
        if (procedure != NULLPROC) {
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
        reply.truncate(statusPlace + protocols::RecordMarkSize);
    }
    reply.patch(statusPlace, static_cast<std::uint32_t>(status));
    protocols::markRecord(reply.bytes());
    return true;
}

void serveRpcStream(int fd, std::size_t maxRecord, std::span<const RpcProgram> programs,
                    const std::function<bool()> &isDropped)
{
    // A peer that sends empty fragments could keep a record open for ever.
    protocols::RpcRecordReader reader(maxRecord,
                                      protocols::RpcRecordReader::EmptyFragment::Refused);
    std::vector<std::uint8_t> buffer(ReceiveSize);
    XdrWriter reply;
    for (;;) {
        if (reader.isInside() && !waitForRest(fd)) {
            return;
        }
        const ssize_t count = ::recv(fd, buffer.data(), buffer.size(), 0);
        if (count < 0 && errno == EINTR) {
            continue;
        }
        if (count <= 0) {
            return;
        }
        auto input = std::span<const std::uint8_t>(buffer).first(static_cast<std::size_t>(count));
        while (!input.empty()) {
            input = input.subspan(reader.feed(input));
            if (reader.state() == protocols::RpcRecordReader::State::Broken) {
                return;
            }
            if (reader.state() != protocols::RpcRecordReader::State::Complete) {
                continue;
            }
            if (!answerRpcCall(reader.record(), programs, reply) || isDropped() ||
                !sendAll(fd, std::as_bytes(reply.bytes()))) {
                return;
            }
            reader.next();
        }
    }
}

} // namespace simulator
