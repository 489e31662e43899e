// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <array>
#include <cstddef>
#include <cstdint>
#include <span>
#include <vector>

namespace protocols {

/// Bytes of the mark in front of a record that goes in one fragment.
inline constexpr std::size_t RecordMarkSize = 4;

/// Writes the mark of a whole record into its first four bytes.
void markRecord(std::span<std::uint8_t> record);

/// Puts the records of an RPC stream together from bytes as they come (record marking standard,
/// RFC 5531 section 11). Memory grows with what arrived, never with what a header announces. A
/// record that comes whole is not copied.
class RpcRecordReader
{
public:
    enum class State {
        Incomplete, ///< more bytes are needed
        Complete,   ///< record() holds one; feed no more before next()
        Broken      ///< an announced length is not allowed; the stream is of no use any more
    };

    /// What a fragment without bytes means that is not the last of its record.
    enum class EmptyFragment { Allowed, Refused };

    /// `limit` is the size in bytes of the longest record that is taken.
    explicit RpcRecordReader(std::size_t limit,
                             EmptyFragment emptyFragment = EmptyFragment::Allowed);

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

    /// A record or the head of one has begun and is not complete.
    [[nodiscard]] bool isInside() const
    {
        return m_state == State::Incomplete &&
               (m_headerSize > 0 || m_fragmentLeft > 0 || !m_record.empty());
    }

    /// Drops everything, for a new stream.
    void reset();

private:
    void beginFragment();

    std::size_t m_limit;
    EmptyFragment m_emptyFragment;
    State m_state = State::Incomplete;
    std::array<std::uint8_t, 4> m_header{};
    std::size_t m_headerSize = 0;
    std::size_t m_fragmentLeft = 0; // bytes still to come of the current fragment
    bool m_isLastFragment = false;
    std::vector<std::uint8_t> m_record;
    std::span<const std::uint8_t> m_whole; // the record, where it came in one piece
};

} // namespace protocols
