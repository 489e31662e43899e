// SPDX-License-Identifier: Apache-2.0
#include "RpcReply.h"

#include "protocols/XdrReader.h"

namespace visa {

RpcReply parseRpcReply(std::span<const std::uint8_t> record, std::uint32_t transaction)
{
    constexpr RpcReply Malformed{RpcReplyKind::Malformed, {}};
    protocols::XdrReader reader(record);
    const std::uint32_t number = reader.number();
    if (reader.number() != REPLY || !reader.isGood()) {
        return Malformed;
    }
    if (number != transaction) {
        return {RpcReplyKind::OtherCall, {}};
    }
    const std::uint32_t replyStatus = reader.number();
    if (reader.isGood() && replyStatus == MSG_DENIED) {
        return {RpcReplyKind::Refused, {}};
    }
    if (!reader.isGood() || replyStatus != MSG_ACCEPTED) {
        return Malformed;
    }
    (void)reader.number(); // the flavor of the verifier, which nobody looks at
    const std::size_t verifierSize = reader.opaque().size();
    const std::uint32_t acceptStatus = reader.number();
    if (!reader.isGood() || verifierSize > MAX_AUTH_BYTES || acceptStatus > SYSTEM_ERR) {
        return Malformed;
    }
    switch (acceptStatus) {
    case SUCCESS:
        return {RpcReplyKind::Accepted, reader.rest()};
    case PROG_UNAVAIL:
    case PROG_MISMATCH:
    case PROC_UNAVAIL:
        return {RpcReplyKind::Unavailable, {}};
    default:
        return {RpcReplyKind::Refused, {}};
    }
}

} // namespace visa
