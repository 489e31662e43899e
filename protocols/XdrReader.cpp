// SPDX-License-Identifier: Apache-2.0
#include "XdrReader.h"

#include <algorithm>

namespace protocols {

XdrReader::XdrReader(std::span<const std::uint8_t> bytes)
    : m_bytes(bytes)
{
    // Decoding only reads, the signature is shared with encoding.
    auto *begin = const_cast<std::uint8_t *>(bytes.data());
    xdrmem_create(&m_stream, reinterpret_cast<char *>(begin), static_cast<unsigned>(bytes.size()),
                  XDR_DECODE);
}

std::uint32_t XdrReader::number()
{
    return value<unsigned>(xdr_u_int);
}

std::span<const std::uint8_t> XdrReader::opaque()
{
    const std::size_t size = number();
    const std::span<const std::uint8_t> left = rest();
    if (!m_good || size > left.size()) {
        m_good = false;
        return {};
    }
    // Some clients leave the padding of a last field out.
    const std::size_t padded = std::min((size + 3) / 4 * 4, left.size());
    m_good = xdr_setpos(&m_stream, static_cast<unsigned>(m_bytes.size() - left.size() + padded));
    return left.first(size);
}

std::string_view XdrReader::text()
{
    const std::span<const std::uint8_t> data = opaque();
    return {reinterpret_cast<const char *>(data.data()), data.size()};
}

std::span<const std::uint8_t> XdrReader::rest()
{
    return m_good ? m_bytes.subspan(xdr_getpos(&m_stream)) : std::span<const std::uint8_t>();
}

} // namespace protocols
