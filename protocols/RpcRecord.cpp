// SPDX-License-Identifier: Apache-2.0
#include "RpcRecord.h"

#include <algorithm>

namespace protocols {
namespace {

constexpr std::uint32_t LastFragmentBit = 0x8000'0000U;

std::uint32_t bigEndian(std::span<const std::uint8_t, 4> bytes)
{
    return std::uint32_t{bytes[0]} << 24U | std::uint32_t{bytes[1]} << 16U |
           std::uint32_t{bytes[2]} << 8U | std::uint32_t{bytes[3]};
}

} // namespace

void markRecord(std::span<std::uint8_t> record)
{
    const auto mark = static_cast<std::uint32_t>(record.size() - RecordMarkSize) | LastFragmentBit;
    for (unsigned i = 0; i < RecordMarkSize; ++i) {
        record[i] = static_cast<std::uint8_t>(mark >> (24 - 8 * i));
    }
}

RpcRecordReader::RpcRecordReader(std::size_t limit, EmptyFragment emptyFragment)
    : m_limit(limit)
    , m_emptyFragment(emptyFragment)
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
    const bool isUseless = m_fragmentLeft == 0 && !m_isLastFragment;
    if (m_fragmentLeft > m_limit - m_record.size() ||
        (isUseless && m_emptyFragment == EmptyFragment::Refused)) {
        m_state = State::Broken;
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

} // namespace protocols
