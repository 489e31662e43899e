// SPDX-License-Identifier: Apache-2.0
#pragma once

#include "Deadline.h"
#include "visa.h"

#include <cstddef>
#include <cstdint>
#include <optional>
#include <span>

namespace visa {

/// What ends a read besides the count.
struct ReadOptions
{
    std::optional<std::uint8_t> terminator; ///< VI_ATTR_TERMCHAR while VI_ATTR_TERMCHAR_EN is on
    bool stopsAtEnd = true;                 ///< false while VI_ATTR_SUPPRESS_END_EN is on
};

/// One open connection to an instrument. One thread at a time calls it, but for interrupt(). Each
/// call is over by its deadline, give or take some tenths of a second.
class Transport
{
public:
    Transport() = default;
    virtual ~Transport() = default;
    Transport(const Transport &) = delete;
    Transport &operator=(const Transport &) = delete;

    /// VI_INTF_GPIB, VI_INTF_TCPIP or VI_INTF_USB.
    [[nodiscard]] virtual ViUInt16 interfaceType() const = 0;

    /// Sends all of `data`, or fails. `end` closes the message with it. `count` is what the
    /// instrument took, also on failure.
    [[nodiscard]] virtual ViStatus write(std::span<const std::uint8_t> data, bool end,
                                         const Deadline &deadline, std::size_t &count) = 0;

    /// Reads until END (VI_SUCCESS), the terminator (VI_SUCCESS_TERM_CHAR) or the full buffer
    /// (VI_SUCCESS_MAX_CNT), in this order of precedence. `count` is also valid on failure.
    [[nodiscard]] virtual ViStatus read(std::span<std::uint8_t> buffer, const ReadOptions &options,
                                        const Deadline &deadline, std::size_t &count) = 0;

    /// Device clear: both directions empty, the instrument ready for a command.
    [[nodiscard]] virtual ViStatus clear(const Deadline &deadline) = 0;

    /// One of the VI_GPIB_REN modes.
    [[nodiscard]] virtual ViStatus controlRemote(ViUInt16 mode, const Deadline &deadline) = 0;

    /// Any thread: the call that runs and all later ones end with VI_ERROR_ABORT.
    virtual void interrupt() noexcept {}
};

} // namespace visa
