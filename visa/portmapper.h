// SPDX-License-Identifier: Apache-2.0
#pragma once

#include "Deadline.h"
#include "Waker.h"
#include "hostlookup.h"

#include <cstdint>
#include <vector>

namespace visa {

/// Asks the port mapper of a host (TCP port 111, RFC 1833 section 3) for the TCP port of an RPC
/// program. VI_ERROR_RSRC_NFOUND if there is no port mapper or the program is not registered.
[[nodiscard]] ViStatus findRpcPort(const std::vector<HostAddress> &addresses, std::uint32_t program,
                                   std::uint32_t version, const Waker &waker,
                                   const Deadline &deadline, std::uint16_t &port);

} // namespace visa
