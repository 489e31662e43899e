// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <cstddef>
#include <cstdint>
#include <span>
#include <string_view>
#include <vector>

namespace simulator {

/// Reads values in the External Data Representation, RFC 4506, from a finished record. After the
/// first value that the record does not hold, everything reads as 0 or empty.
class XdrReader
{
public:
    explicit XdrReader(std::span<const char> bytes)
        : m_bytes(bytes)
    {
    }

    [[nodiscard]] std::uint32_t number();
    [[nodiscard]] bool boolean() { return number() != 0; }

    /// Variable-length opaque data or a string, as a view into the record.
    [[nodiscard]] std::span<const char> opaque();
    [[nodiscard]] std::string_view text();

    /// Whether all that was read was there.
    [[nodiscard]] bool isGood() const { return m_good; }

private:
    std::span<const char> m_bytes;
    bool m_good = true;
};

/// Writes values in the External Data Representation.
class XdrWriter
{
public:
    void clear() { m_size = 0; }

    /// Forgets what was written beyond the given size.
    void truncate(std::size_t size) { m_size = size; }
    void number(std::uint32_t value);

    /// Opens variable-length opaque data of at most `capacity` bytes for writing in place;
    /// `closeOpaque` tells how many there are and pads them. One can be open at a time.
    [[nodiscard]] std::span<char> openOpaque(std::size_t capacity);
    void closeOpaque(std::size_t size);

    /// Replaces a number that was written at the given place.
    void patch(std::size_t place, std::uint32_t value);

    [[nodiscard]] std::size_t size() const { return m_size; }
    [[nodiscard]] std::span<const char> bytes() const { return std::span(m_buffer).first(m_size); }

private:
    void reserve(std::size_t size);

    std::vector<char> m_buffer; ///< grows only, so that a link's replies need no new memory
    std::size_t m_size = 0;
    std::size_t m_opaque = 0; ///< place of the length of the open data
};

} // namespace simulator
