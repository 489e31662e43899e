// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <QString>

/// Whether the host of a TCPIP resource string answers on the ports of the RPC port mapper (111)
/// and of plain SCPI (5025). Both must: a host that answers on one alone is seldom an instrument,
/// and the VISA library would wait long for it. Blocks for the name look-up and at most 5 s a port.
/// Each step is logged.
[[nodiscard]] bool isHostReachable(const QString &resource);
