// SPDX-License-Identifier: Apache-2.0
#include "ScpiParser.h"

#include "ErrorQueue.h"

#include <algorithm>

namespace simulator {
namespace {

bool isDigit(char byte)
{
    return byte >= '0' && byte <= '9';
}

bool isWhite(char byte)
{
    return static_cast<unsigned char>(byte) <= ' ';
}

} // namespace

std::size_t ScpiParser::feed(std::span<const char> bytes, bool end)
{
    std::size_t used = 0;
    while (used < bytes.size()) {
        const std::span<const char> rest = bytes.subspan(used);
        m_started = true;
        switch (m_state) {
        case State::Block:
            used += takeBlock(rest);
            break;
        case State::IndefiniteBlock: {
            const std::size_t taken = takeIndefinite(rest, end);
            used += taken;
            if (m_state == State::Text) {
                return used;
            }
            break;
        }
        default:
            ++used;
            if (takeTextByte(rest.front())) {
                return used;
            }
        }
    }
    if (end && m_started) {
        endMessage();
    }
    return used;
}

// Takes one byte outside of a block's data; true when it ended the message.
bool ScpiParser::takeTextByte(char byte)
{
    if (byte == '\n' && (m_lineFeedEnds || m_state == State::Skip)) {
        endMessage();
        return true;
    }
    switch (m_state) {
    case State::Text:
        if (byte == ';') {
            endUnit();
        } else if (byte == '#' && m_inParameters) {
            m_state = State::Hash;
        } else {
            if (byte == '"' || byte == '\'') {
                m_quote = byte;
                m_state = State::Quoted;
            }
            append(byte);
        }
        break;
    case State::Quoted:
        append(byte);
        if (byte == m_quote && m_state == State::Quoted) {
            m_state = State::Text;
        }
        break;
    case State::Hash:
        takeHashByte(byte);
        break;
    case State::LengthDigits:
    case State::LengthBracket:
        takeLengthByte(byte);
        break;
    default:
        break;
    }
    return false;
}

void ScpiParser::takeHashByte(char byte)
{
    if (byte == '0') {
        if (m_transportHasEnd) {
            beginBlock(std::nullopt);
        } else {
            fail(InvalidBlock);
        }
    } else if (isDigit(byte)) {
        m_lengthDigits = static_cast<unsigned>(byte - '0');
        m_blockSize = 0;
        m_state = State::LengthDigits;
    } else if (byte == '(') {
        m_bracketDigits = 0;
        m_blockSize = 0;
        m_state = State::LengthBracket;
    } else {
        // #H, #Q and #B are numbers, not blocks.
        m_state = State::Text;
        append('#');
        append(byte);
    }
}

void ScpiParser::takeLengthByte(char byte)
{
    // 18 digits stay within 64 bits; no file comes near.
    constexpr unsigned MaxBracketDigits = 18;
    const bool bracket = m_state == State::LengthBracket;
    if (isDigit(byte)) {
        m_blockSize = m_blockSize * 10 + static_cast<unsigned>(byte - '0');
        if (bracket && ++m_bracketDigits > MaxBracketDigits) {
            fail(InvalidBlock);
        } else if (!bracket && --m_lengthDigits == 0) {
            beginBlock(m_blockSize);
        }
    } else if (bracket && byte == ')' && m_bracketDigits > 0) {
        beginBlock(m_blockSize);
    } else {
        fail(InvalidBlock);
    }
}

std::size_t ScpiParser::takeBlock(std::span<const char> bytes)
{
    const auto taken = static_cast<std::size_t>(std::min<std::uint64_t>(m_blockSize, bytes.size()));
    m_handler.onBlockData(bytes.first(taken));
    m_blockSize -= taken;
    if (m_blockSize == 0) {
        endBlock(true);
    }
    return taken;
}

// A block of unknown length lasts until END; a line feed right before END is the terminator that
// IEEE 488.2 puts there, and no data.
std::size_t ScpiParser::takeIndefinite(std::span<const char> bytes, bool end)
{
    if (m_heldLineFeed) {
        m_handler.onBlockData(std::span<const char>("\n", 1));
    }
    m_heldLineFeed = bytes.back() == '\n';
    m_handler.onBlockData(bytes.first(bytes.size() - (m_heldLineFeed ? 1 : 0)));
    if (end) {
        endMessage();
    }
    return bytes.size();
}

void ScpiParser::append(char byte)
{
    if (m_unit.size() >= MaxUnitLength) {
        fail(InputBufferOverrun);
        return;
    }
    if (m_unit.empty() && isWhite(byte)) {
        return;
    }
    if (isWhite(byte) && m_state == State::Text) {
        m_inParameters = true;
    }
    m_unit.push_back(byte);
}

void ScpiParser::fail(int number)
{
    m_handler.onError(number);
    m_unit.clear();
    m_hasBlock = false;
    m_state = State::Skip;
}

void ScpiParser::beginBlock(std::optional<std::uint64_t> size)
{
    m_handler.onBlockBegin(m_unit, size);
    m_unit.push_back('#');
    m_hasBlock = true;
    m_blockOpen = true;
    m_heldLineFeed = false;
    m_blockSize = size.value_or(0);
    m_state = size ? State::Block : State::IndefiniteBlock;
    if (size && *size == 0) {
        endBlock(true);
    }
}

void ScpiParser::endBlock(bool complete)
{
    m_blockOpen = false;
    m_state = State::Text;
    m_handler.onBlockEnd(complete);
}

void ScpiParser::endUnit()
{
    if (!m_unit.empty()) {
        m_handler.onUnit(m_unit, m_hasBlock);
    }
    m_unit.clear();
    m_hasBlock = false;
    m_inParameters = false;
}

void ScpiParser::endMessage()
{
    switch (m_state) {
    case State::Text:
        break;
    case State::IndefiniteBlock:
        endBlock(true);
        break;
    case State::Quoted:
        fail(InvalidString);
        break;
    case State::Hash:
    case State::LengthDigits:
    case State::LengthBracket:
        fail(InvalidBlock);
        break;
    case State::Block:
        endBlock(false);
        fail(InvalidBlock);
        break;
    case State::Skip:
        break;
    }
    if (m_state == State::Text) {
        endUnit();
    }
    m_state = State::Text;
    m_started = false;
    m_inParameters = false;
    m_handler.onMessageEnd();
}

void ScpiParser::clear()
{
    if (m_blockOpen) {
        endBlock(false);
    }
    m_unit.clear();
    m_state = State::Text;
    m_hasBlock = false;
    m_started = false;
    m_inParameters = false;
    m_heldLineFeed = false;
}

} // namespace simulator
