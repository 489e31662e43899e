// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <array>
#include <cstddef>
#include <cstdint>
#include <optional>
#include <span>
#include <vector>

namespace visa {

/// Puts the records of an RPC stream together from bytes as they come (record marking standard,
/// RFC 5531 section 11). Memory grows with what arrived, never with what a header announces. A
/// record that comes whole is not copied.
class RpcRecordReader
{
public:
    enum class State {
        Incomplete, ///< more bytes are needed
        Complete,   ///< record() holds one; feed no more before next()
        TooLong     ///< the peer announced more than the limit; the stream is of no use any more
    };

    /// `limit` is the size in bytes of the longest record that is taken.
    explicit RpcRecordReader(std::size_t limit);

    /// Takes bytes up to the end of a record and returns how many it took. They have to stay where
    /// they are until next().
    [[nodiscard]] std::size_t feed(std::span<const std::uint8_t> bytes);

    [[nodiscard]] State state() const { return m_state; }
    [[nodiscard]] std::span<const std::uint8_t> record() const
    {
        return m_whole.empty() ? std::span<const std::uint8_t>(m_record) : m_whole;
    }

    /// Drops the complete record and makes ready for the next.
    void next();

    /// Drops everything, for a new stream.
    void reset();

private:
    void beginFragment();

    std::size_t m_limit;
    State m_state = State::Incomplete;
    std::array<std::uint8_t, 4> m_header{};
    std::size_t m_headerSize = 0;
    std::size_t m_fragmentLeft = 0; // bytes still to come of the current fragment
    bool m_isLastFragment = false;
    std::vector<std::uint8_t> m_record;
    std::span<const std::uint8_t> m_whole; // the record, where it came in one piece
};

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
