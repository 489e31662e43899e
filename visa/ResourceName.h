// SPDX-License-Identifier: Apache-2.0
#pragma once

#include "visa.h"

#include <optional>
#include <string>
#include <string_view>
#include <vector>

namespace visa {

enum class ResourceKind {
    Vxi11,  ///< TCPIP[board]::host[::device][::INSTR]
    Hislip, ///< TCPIP[board]::host::hislipN[,port][::INSTR]
    Socket, ///< TCPIP[board]::host::port::SOCKET
    Usb,    ///< USB[board]::vendor::product::serial[::interface][::INSTR]
    Gpib    ///< GPIB[board]::primary[::secondary][::INSTR]
};

/// A resource string, taken apart. Only the members of its kind are set.
struct ResourceName
{
    ResourceKind kind = ResourceKind::Vxi11;
    ViUInt16 board = 0;

    std::string host;
    std::string device; ///< VXI-11 device name, "inst0" unless given, or HiSLIP sub-address
    ViUInt16 port = 0;  ///< of a socket; of HiSLIP only if it isn't the usual one

    ViUInt16 vendorId = 0;
    ViUInt16 productId = 0;
    std::string serial;
    std::optional<ViUInt16> usbInterface;

    ViUInt16 primary = 0; ///< 0 to 30
    std::optional<ViUInt16> secondary;

    [[nodiscard]] bool operator==(const ResourceName &) const = default;
};

/// The parts of `text` between the occurrences of `separator`, empty ones included.
[[nodiscard]] std::vector<std::string> split(std::string_view text, std::string_view separator);

/// Upper case of the ASCII letters, whatever the locale.
[[nodiscard]] std::string upperCase(std::string_view text);

/// Decimal, or hexadecimal behind "0x"; the whole text, at most `largest`.
[[nodiscard]] std::optional<ViUInt16> parseNumber(std::string_view text, ViUInt16 largest = 0xFFFF);

/// Keywords in either case. Nothing for a text that is no resource string of the kinds above.
[[nodiscard]] std::optional<ResourceName> parseResourceName(std::string_view text);

/// The full form, as viFindRsrc reports it: board number, device name and class spelled out,
/// identifiers of USB as "0x" and four upper-case digits.
[[nodiscard]] std::string resourceText(const ResourceName &name);

} // namespace visa
