// SPDX-License-Identifier: Apache-2.0
#include "XdrWriter.h"

#include <algorithm>

namespace protocols {
namespace {

constexpr std::size_t Unit = 4;

} // namespace

void XdrWriter::number(std::uint32_t value)
{
    reserve(Unit);
    m_size += Unit;
    patch(m_size - Unit, value);
}

std::span<std::uint8_t> XdrWriter::openOpaque(std::size_t capacity)
{
    m_opaque = m_size;
    number(0);
    reserve(capacity + Unit);
    return std::span(m_buffer).subspan(m_size, capacity);
}

void XdrWriter::closeOpaque(std::size_t size)
{
    patch(m_opaque, static_cast<std::uint32_t>(size));
    m_size += size;
    const std::size_t padding = (Unit - size % Unit) % Unit;
    std::fill_n(m_buffer.begin() + static_cast<std::ptrdiff_t>(m_size), padding, std::uint8_t{0});
    m_size += padding;
}

void XdrWriter::patch(std::size_t place, std::uint32_t value)
{
    unsigned number = value;
    (void)encodeXdr<unsigned>(xdr_u_int, number, std::span(m_buffer).subspan(place, Unit));
}

void XdrWriter::reserve(std::size_t size)
{
    if (m_buffer.size() - m_size < size) {
        m_buffer.resize(std::max(m_size + size, 2 * m_buffer.size()));
    }
}

} // namespace protocols
