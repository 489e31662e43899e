// SPDX-License-Identifier: Apache-2.0
#pragma once

#include "XdrValue.h"

#include <cstddef>
#include <cstdint>
#include <span>
#include <string_view>

namespace protocols {

/// Reads values in the External Data Representation (RFC 4506) from a finished record, by the
/// routines of libtirpc. After the first value that the record does not hold, everything reads as 0
/// or empty.
class XdrReader
{
public:
    explicit XdrReader(std::span<const std::uint8_t> bytes);
    XdrReader(const XdrReader &) = delete;
    XdrReader &operator=(const XdrReader &) = delete;

    [[nodiscard]] std::uint32_t number();

    /// Variable-length opaque data, as a view into the record.
    [[nodiscard]] std::span<const std::uint8_t> opaque();
    [[nodiscard]] std::string_view text();

    /// A structure that holds no pointer; `code` is its function of rpcgen.
    template <typename T>
    [[nodiscard]] T value(XdrCode<T> *code)
    {
        T result{};
        if (m_good && code(&m_stream, &result)) {
            return result;
        }
        m_good = false;
        return {};
    }

    /// Whether all that was read was there.
    [[nodiscard]] bool isGood() const { return m_good; }

    /// What has not been read.
    [[nodiscard]] std::span<const std::uint8_t> rest();

private:
    std::span<const std::uint8_t> m_bytes;
    XDR m_stream{};
    bool m_good = true;
};

} // namespace protocols
