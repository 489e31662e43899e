// SPDX-License-Identifier: Apache-2.0
#include "MessageTracker.h"

#include <algorithm>
#include <cstring>

namespace visa {

namespace {

constexpr std::uint8_t LineFeed = '\n';

bool isDigit(std::uint8_t byte)
{
    return byte >= '0' && byte <= '9';
}

} // namespace

void MessageTracker::reset()
{
    *this = MessageTracker();
}

std::size_t MessageTracker::advance(std::span<const std::uint8_t> bytes)
{
    std::size_t done = 0;
    while (done < bytes.size()) {
        const auto rest = bytes.subspan(done);
        if (m_state == State::Block) {
            const auto skipped =
                static_cast<std::size_t>(std::min<std::uint64_t>(rest.size(), m_blockLeft));
            m_blockLeft -= skipped;
            done += skipped;
            if (m_blockLeft == 0) {
                m_state = State::Text;
            }
        } else if (m_state == State::Text) {
            const void *end = std::memchr(rest.data(), LineFeed, rest.size());
            if (end == nullptr) {
                return bytes.size();
            }
            m_state = State::Start;
            return done +
                   static_cast<std::size_t>(static_cast<const std::uint8_t *>(end) - rest.data()) +
                   1;
        } else {
            advance(rest.front());
            ++done;
            if (m_state == State::Start) {
                return done;
            }
        }
    }
    return done;
}

// One byte of the states in which each byte counts.
void MessageTracker::advance(std::uint8_t byte)
{
    if (byte == LineFeed) {
        m_state = State::Start;
    } else if (m_state == State::Start) {
        m_state = byte == '#' ? State::Sign : State::Text;
    } else if (m_state == State::Sign && byte > '0' && byte <= '9') {
        m_state = State::Length;
        m_digitsLeft = byte - unsigned{'0'};
        m_blockLeft = 0;
    } else if (m_state == State::Length && isDigit(byte)) {
        m_blockLeft = m_blockLeft * 10 + (byte - unsigned{'0'});
        if (--m_digitsLeft == 0) {
            m_state = m_blockLeft > 0 ? State::Block : State::Text;
        }
    } else {
        m_state = State::Text;
    }
}

} // namespace visa
