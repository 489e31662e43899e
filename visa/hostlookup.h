// SPDX-License-Identifier: Apache-2.0
#pragma once

#include "Deadline.h"
#include "visa.h"

#include <sys/socket.h>

#include <string>
#include <vector>

namespace visa {

/// An IP address of a host, without port.
struct HostAddress
{
    sockaddr_storage storage{};
    socklen_t length = 0;
};

/// Resolves a host name or a numeric address. The system's resolver knows no time-out of its own,
/// so a name is looked up in a thread that is left to itself when the deadline comes; VI_ERROR_TMO
/// then, VI_ERROR_RSRC_NFOUND for a host without address.
[[nodiscard]] ViStatus lookUpHost(const std::string &host, const Deadline &deadline,
                                  std::vector<HostAddress> &addresses);

} // namespace visa
