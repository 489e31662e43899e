// SPDX-License-Identifier: Apache-2.0
#pragma once

#include "ResourceName.h"

#include <map>
#include <optional>
#include <string>
#include <string_view>
#include <vector>

namespace visa {

/// A LAN/GPIB gateway: one GPIB board whose devices are reached over VXI-11.
struct Gateway
{
    std::string host;
    ViUInt16 port = 0; ///< TCP port of the VXI-11 core channel; 0 asks the port mapper
    std::string interface = "gpib0"; ///< what the gateway calls this board
    std::vector<ViUInt16> addresses; ///< primary addresses that viFindRsrc reports, ascending
};

/// An instrument on the network that viFindRsrc reports.
struct NetworkInstrument
{
    ResourceName name;
    ViUInt16 port = 0; ///< as of Gateway; of no meaning to a socket
};

/// The content of the configuration file.
struct Configuration
{
    ViUInt32 openTimeoutMs = 5000;        ///< for viOpen with an open time-out of 0
    std::map<ViUInt16, Gateway> gateways; ///< by number of the GPIB board
    std::vector<NetworkInstrument> instruments;

    /// The fixed port of a VXI-11 instrument, 0 if it has none.
    [[nodiscard]] ViUInt16 fixedPort(const ResourceName &name) const;
};

/// Reads the text of a configuration file. On failure `error` holds one sentence with the line, the
/// value and what is allowed, and the result is empty.
[[nodiscard]] std::optional<Configuration> parseConfiguration(std::string_view text,
                                                              std::string &error);

/// Finds and reads the file: CORVANE_VISA_CONFIG, else corvane-visa.ini in the folder
/// XDG_CONFIG_HOME, else in ~/.config. Only the named file has to exist.
[[nodiscard]] std::optional<Configuration> loadConfiguration(std::string &error);

} // namespace visa
