// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <cstddef>
#include <cstdint>
#include <span>

namespace visa {

/// Finds the ends of response messages in a byte stream that carries no END: a message ends at its
/// line feed (IEEE 488.2 section 8.5), but not inside a definite length block (section 8.7.9) that
/// stands at its start, where any byte is data.
class MessageTracker
{
public:
    /// Goes through `bytes` up to the end of the current message or of the bytes. Returns how many
    /// it went through; endedMessage() tells which of the two it was.
    [[nodiscard]] std::size_t advance(std::span<const std::uint8_t> bytes);

    [[nodiscard]] bool endedMessage() const { return m_state == State::Start; }

    void reset();

private:
    enum class State { Start, Sign, Length, Block, Text };

    void advance(std::uint8_t byte);

    State m_state = State::Start;
    unsigned m_digitsLeft = 0;
    std::uint64_t m_blockLeft = 0; // bytes; nine digits at most
};

} // namespace visa
