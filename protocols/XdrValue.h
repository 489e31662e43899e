// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <rpc/rpc.h>

#include <cstddef>
#include <cstdint>
#include <limits>
#include <optional>
#include <span>

namespace protocols {

/// A function of rpcgen that codes, decodes and frees a value of type T.
template <typename T>
using XdrCode = bool_t(XDR *, T *);

/// Writes a value and returns its size in bytes, nothing if it does not fit.
template <typename T>
[[nodiscard]] std::optional<std::size_t> encodeXdr(XdrCode<T> *code, T &value,
                                                   std::span<std::uint8_t> buffer)
{
    if (buffer.size() > std::numeric_limits<unsigned>::max()) {
        return std::nullopt;
    }
    XDR stream{};
    xdrmem_create(&stream, reinterpret_cast<char *>(buffer.data()),
                  static_cast<unsigned>(buffer.size()), XDR_ENCODE);
    if (!code(&stream, &value)) {
        return std::nullopt;
    }
    return std::size_t{xdr_getpos(&stream)};
}

/// A decoded value together with the memory that decoding took.
template <typename T>
class XdrValue
{
public:
    /// `initial` is the value before decoding; what it points to stays the caller's.
    explicit XdrValue(XdrCode<T> *code, const T &initial = {})
        : m_code(code)
        , m_initial(initial)
        , m_value(initial)
    {
    }
    ~XdrValue() { release(); }
    XdrValue(const XdrValue &) = delete;
    XdrValue &operator=(const XdrValue &) = delete;

    /// On failure the value is the initial one.
    [[nodiscard]] bool decode(std::span<const std::uint8_t> bytes)
    {
        release();
        if (bytes.size() > std::numeric_limits<unsigned>::max()) {
            return false;
        }
        XDR stream{};
        // Decoding only reads, the signature is shared with encoding.
        auto *begin = const_cast<std::uint8_t *>(bytes.data());
        xdrmem_create(&stream, reinterpret_cast<char *>(begin), static_cast<unsigned>(bytes.size()),
                      XDR_DECODE);
        if (m_code(&stream, &m_value)) {
            return true;
        }
        // Half a value is worse than none: it may have a length without the bytes.
        release();
        return false;
    }

    [[nodiscard]] const T &operator*() const { return m_value; }
    [[nodiscard]] const T *operator->() const { return &m_value; }

private:
    void release()
    {
        XDR stream{};
        stream.x_op = XDR_FREE;
        m_code(&stream, &m_value);
        m_value = m_initial;
    }

    XdrCode<T> *m_code;
    T m_initial;
    T m_value;
};

} // namespace protocols
