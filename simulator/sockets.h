// SPDX-License-Identifier: Apache-2.0
#pragma once

#include "UniqueFd.h"

#include <cstddef>
#include <cstdint>
#include <span>
#include <string>

namespace simulator {

/// Opens a listening TCP socket on an IPv4 address; port 0 lets the system choose. Invalid, with
/// the system's reason in `error`, when that fails.
[[nodiscard]] UniqueFd listenTcp(const std::string &address, std::uint16_t port,
                                 std::string &error);

/// As above, a bound UDP socket.
[[nodiscard]] UniqueFd bindUdp(const std::string &address, std::uint16_t port, std::string &error);

/// A UDP socket that gets what is sent to all hosts of a network, beside those that are bound to
/// one address.
[[nodiscard]] UniqueFd bindSharedUdp(std::uint16_t port, std::string &error);

/// The port that a socket is bound to; 0 when it is not.
[[nodiscard]] std::uint16_t localPort(int fd);

/// Sends all bytes, waiting as long as it takes; false when the connection ended.
[[nodiscard]] bool sendAll(int fd, std::span<const std::byte> bytes);

/// Whether the peer closed its end of a connection. Bytes that wait to be read are left alone.
[[nodiscard]] bool isPeerGone(int fd);

} // namespace simulator
