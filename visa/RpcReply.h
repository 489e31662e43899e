// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <cstdint>
#include <span>

namespace visa {

enum class RpcReplyKind {
    Accepted,    ///< results follow
    OtherCall,   ///< the answer to a call that was given up
    Unavailable, ///< the server knows no such program, version or procedure
    Refused,     ///< denied, or the server could not decode the arguments or failed
    Malformed    ///< no RPC reply at all
};

struct RpcReply
{
    RpcReplyKind kind = RpcReplyKind::Malformed;
    std::span<const std::uint8_t> results; ///< XDR coded, part of the record
};

/// Reads the header of a reply to the call with this transaction number (RFC 5531 section 9).
[[nodiscard]] RpcReply parseRpcReply(std::span<const std::uint8_t> record,
                                     std::uint32_t transaction);

} // namespace visa
