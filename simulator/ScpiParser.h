// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <cstddef>
#include <cstdint>
#include <optional>
#include <span>
#include <string>
#include <string_view>

namespace simulator {

/// Cuts a stream of bytes into SCPI program messages, their units and their binary blocks.
///
/// Bytes may come in pieces of any size. Units are handed on as soon as they are complete; block
/// data are handed on as they come and never gathered, so a file of any size costs no memory. A
/// message ends at a line feed outside of a block, or with the END mark of the transport.
class ScpiParser
{
public:
    class Handler
    {
    public:
        virtual ~Handler() = default;

        /// A unit is complete. `text` is its header and parameters; a binary block stands in it as
        /// a single `#`, and then `hasBlock` is set.
        virtual void onUnit(std::string_view text, bool hasBlock) = 0;

        /// A block of `size` bytes begins (none: its length is not known before its end) behind
        /// the given part of a unit.
        virtual void onBlockBegin(std::string_view text, std::optional<std::uint64_t> size) = 0;
        virtual void onBlockData(std::span<const char> bytes) = 0;

        /// The block's last byte came, or its message ended before that.
        virtual void onBlockEnd(bool complete) = 0;

        /// The message is malformed; the rest of it is skipped.
        virtual void onError(int number) = 0;
        virtual void onMessageEnd() = 0;
    };

    /// A unit's text beyond this is an input buffer overrun.
    static constexpr std::size_t MaxUnitLength = 65536;

    /// `transportHasEnd`: the transport can mark the last byte of a message. Without such a mark a
    /// block of unknown length would never end and is refused.
    ScpiParser(Handler &handler, bool transportHasEnd)
        : m_handler(handler)
        , m_transportHasEnd(transportHasEnd)
    {
    }

    /// Takes bytes up to the end of one message, or all; returns how many. `end` tells that the
    /// transport marks the last of the given bytes as the end of a message.
    std::size_t feed(std::span<const char> bytes, bool end);

    /// Forgets what came of an unfinished message; an open block ends incomplete.
    void clear();

    /// No byte of a message is waiting for its rest.
    [[nodiscard]] bool isIdle() const { return m_state == State::Text && !m_started; }

    /// Whether a line feed ends a message (the default), or END alone does.
    void setLineFeedEndsMessage(bool ends) { m_lineFeedEnds = ends; }

private:
    enum class State {
        Text,            ///< header and parameters
        Quoted,          ///< inside of a string
        Hash,            ///< behind a `#` in the parameters
        LengthDigits,    ///< in the count of #<n><count>
        LengthBracket,   ///< in the count of #(<count>)
        Block,           ///< in a block of known size
        IndefiniteBlock, ///< in a block that the end of the message ends
        Skip,            ///< in the rest of a malformed message
    };

    bool takeTextByte(char byte);
    void takeHashByte(char byte);
    void takeLengthByte(char byte);
    std::size_t takeBlock(std::span<const char> bytes);
    std::size_t takeIndefinite(std::span<const char> bytes, bool end);
    void append(char byte);
    void fail(int number);
    void beginBlock(std::optional<std::uint64_t> size);
    void endBlock(bool complete);
    void endUnit();
    void endMessage();

    Handler &m_handler;
    bool m_transportHasEnd;
    State m_state = State::Text;
    std::string m_unit;
    char m_quote = 0;
    unsigned m_lengthDigits = 0;   ///< digits of the count still to come
    unsigned m_bracketDigits = 0;  ///< digits of a count in brackets so far
    std::uint64_t m_blockSize = 0; ///< bytes of the block still to come
    bool m_blockOpen = false;
    bool m_hasBlock = false;     ///< the unit holds a block
    bool m_started = false;      ///< a byte of a message came
    bool m_inParameters = false; ///< the unit's header is complete
    bool m_heldLineFeed = false; ///< an indefinite block's possible last byte
    bool m_lineFeedEnds = true;
};

} // namespace simulator
