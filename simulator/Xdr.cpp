// SPDX-License-Identifier: Apache-2.0
#include "Xdr.h"

#include <algorithm>
#include <cstring>

namespace simulator {
namespace {

constexpr std::size_t Unit = 4;

std::size_t padding(std::size_t size)
{
    return (Unit - size % Unit) % Unit;
}

} // namespace

std::uint32_t XdrReader::number()
{
    if (m_bytes.size() < Unit) {
        m_good = false;
        m_bytes = {};
        return 0;
    }
    std::uint32_t value = 0;
    for (const char byte : m_bytes.first(Unit)) {
        value = value << 8U | static_cast<unsigned char>(byte);
    }
    m_bytes = m_bytes.subspan(Unit);
    return value;
}

std::span<const char> XdrReader::opaque()
{
    const std::size_t size = number();
    if (size > m_bytes.size()) {
        m_good = false;
        m_bytes = {};
        return {};
    }
    const std::span<const char> data = m_bytes.first(size);
    // Some clients leave the padding of a last field out.
    m_bytes = m_bytes.subspan(std::min(size + padding(size), m_bytes.size()));
    return data;
}

std::string_view XdrReader::text()
{
    const std::span<const char> data = opaque();
    return {data.data(), data.size()};
}

void XdrWriter::number(std::uint32_t value)
{
    reserve(Unit);
    m_size += Unit;
    patch(m_size - Unit, value);
}

std::span<char> XdrWriter::openOpaque(std::size_t capacity)
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
    const std::size_t pad = padding(size);
    std::fill_n(m_buffer.begin() + static_cast<std::ptrdiff_t>(m_size), pad, '\0');
    m_size += pad;
}

void XdrWriter::patch(std::size_t place, std::uint32_t value)
{
    for (std::size_t i = 0; i < Unit; ++i) {
        m_buffer[place + i] = static_cast<char>(value >> (8U * (Unit - 1 - i)) & 0xFFU);
    }
}

void XdrWriter::reserve(std::size_t size)
{
    if (m_buffer.size() - m_size < size) {
        m_buffer.resize(std::max(m_size + size, 2 * m_buffer.size()));
    }
}

} // namespace simulator
