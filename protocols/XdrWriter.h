// SPDX-License-Identifier: Apache-2.0
#pragma once

#include "XdrValue.h"

#include <cstddef>
#include <cstdint>
#include <span>
#include <vector>

namespace protocols {

/// Writes values in the External Data Representation (RFC 4506) one after the other, by the
/// routines of libtirpc.
class XdrWriter
{
public:
    void clear() { m_size = 0; }

    /// Forgets what was written beyond the given size.
    void truncate(std::size_t size) { m_size = size; }

    void number(std::uint32_t value);

    /// A structure of at most 64 bytes that holds no pointer; `code` is its function of rpcgen.
    template <typename T>
    void value(XdrCode<T> *code, T value)
    {
        reserve(LargestValue);
        const auto room = std::span(m_buffer).subspan(m_size, LargestValue);
        m_size += encodeXdr(code, value, room).value_or(0);
    }

    /// Opens variable-length opaque data of at most `capacity` bytes for writing in place;
    /// `closeOpaque` tells how many there are and pads them. One can be open at a time.
    [[nodiscard]] std::span<std::uint8_t> openOpaque(std::size_t capacity);
    void closeOpaque(std::size_t size);

    /// Replaces a number that was written at the given place.
    void patch(std::size_t place, std::uint32_t value);

    [[nodiscard]] std::size_t size() const { return m_size; }
    [[nodiscard]] std::span<std::uint8_t> bytes() { return std::span(m_buffer).first(m_size); }

private:
    static constexpr std::size_t LargestValue = 64;

    void reserve(std::size_t size);

    std::vector<std::uint8_t> m_buffer; ///< grows only, so that replies need no new memory
    std::size_t m_size = 0;
    std::size_t m_opaque = 0; ///< place of the length of the open data
};

} // namespace protocols
