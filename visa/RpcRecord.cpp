// SPDX-License-Identifier: Apache-2.0
#include "RpcRecord.h"

#include <algorithm>

namespace visa {

namespace {

constexpr std::uint32_t LastFragmentBit = 0x8000'0000U;

constexpr std::uint32_t MessageReply = 1;
constexpr std::uint32_t ReplyAccepted = 0;
constexpr std::uint32_t ReplyDenied = 1;
constexpr std::uint32_t AcceptSuccess = 0;
constexpr std::uint32_t AcceptProgramUnavailable = 1;
constexpr std::uint32_t AcceptProgramMismatch = 2;
constexpr std::uint32_t AcceptProcedureUnavailable = 3;
constexpr std::uint32_t AcceptSystemError = 5;
constexpr std::uint32_t LargestVerifier = 400;

std::uint32_t bigEndian(std::span<const std::uint8_t, 4> bytes)
{
    return std::uint32_t{bytes[0]} << 24U | std::uint32_t{bytes[1]} << 16U |
           std::uint32_t{bytes[2]} << 8U | std::uint32_t{bytes[3]};
}

std::optional<std::uint32_t> takeWord(std::span<const std::uint8_t> &rest)
{
    if (rest.size() < 4) {
        return std::nullopt;
    }
    const std::uint32_t word = bigEndian(rest.first<4>());
    rest = rest.subspan(4);
    return word;
}

} // namespace

RpcRecordReader::RpcRecordReader(std::size_t limit)
    : m_limit(limit)
{
}

std::size_t RpcRecordReader::feed(std::span<const std::uint8_t> bytes)
{
    std::size_t taken = 0;
    while (m_state == State::Incomplete && taken < bytes.size()) {
        if (m_headerSize < m_header.size()) {
            m_header[m_headerSize++] = bytes[taken++];
            if (m_headerSize == m_header.size()) {
                beginFragment();
            }
        } else {
            const auto part = bytes.subspan(taken, std::min(bytes.size() - taken, m_fragmentLeft));
            if (m_isLastFragment && m_record.empty() && part.size() == m_fragmentLeft) {
                m_whole = part;
            } else {
                m_record.insert(m_record.end(), part.begin(), part.end());
            }
            m_fragmentLeft -= part.size();
            taken += part.size();
        }
        if (m_state == State::Incomplete && m_headerSize == m_header.size() &&
            m_fragmentLeft == 0) {
            m_headerSize = 0;
            if (m_isLastFragment) {
                m_state = State::Complete;
            }
        }
    }
    return taken;
}

void RpcRecordReader::beginFragment()
{
    const std::uint32_t word = bigEndian(m_header);
    m_isLastFragment = (word & LastFragmentBit) != 0;
    m_fragmentLeft = word & ~LastFragmentBit;
    if (m_fragmentLeft > m_limit - m_record.size()) {
        m_state = State::TooLong;
    }
}

void RpcRecordReader::next()
{
    m_record.clear();
    m_whole = {};
    m_state = State::Incomplete;
}

void RpcRecordReader::reset()
{
    next();
    m_headerSize = 0;
    m_fragmentLeft = 0;
    m_isLastFragment = false;
}

RpcReply parseRpcReply(std::span<const std::uint8_t> record, std::uint32_t transaction)
{
    constexpr RpcReply Malformed{RpcReplyKind::Malformed, {}};
    const auto number = takeWord(record);
    const auto direction = takeWord(record);
    if (direction != MessageReply) {
        return Malformed;
    }
    if (number != transaction) {
        return {RpcReplyKind::OtherCall, {}};
    }

    const auto replyStatus = takeWord(record);
    if (replyStatus == ReplyDenied) {
        return {RpcReplyKind::Refused, {}};
    }
    if (replyStatus != ReplyAccepted) {
        return Malformed;
    }

    const auto verifierFlavor = takeWord(record);
    const auto verifierSize = takeWord(record);
    if (!verifierFlavor || !verifierSize || *verifierSize > LargestVerifier) {
        return Malformed;
    }
    const std::size_t padded = (std::size_t{*verifierSize} + 3) / 4 * 4;
    if (record.size() < padded) {
        return Malformed;
    }
    record = record.subspan(padded);

    const auto acceptStatus = takeWord(record);
    if (!acceptStatus || *acceptStatus > AcceptSystemError) {
        return Malformed;
    }
    switch (*acceptStatus) {
    case AcceptSuccess:
        return {RpcReplyKind::Accepted, record};
    case AcceptProgramUnavailable:
    case AcceptProgramMismatch:
    case AcceptProcedureUnavailable:
        return {RpcReplyKind::Unavailable, {}};
    default:
        return {RpcReplyKind::Refused, {}};
    }
}

} // namespace visa
