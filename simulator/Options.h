// SPDX-License-Identifier: Apache-2.0
#pragma once

#include "Instrument.h"

#include <cstdint>
#include <optional>
#include <string>
#include <vector>

namespace simulator {

/// One instrument and where it can be reached.
struct InstrumentPlace
{
    InstrumentSetup instrument;
    std::string address;                  ///< of its own; empty behind a gateway
    std::optional<std::uint16_t> gateway; ///< port; 0 lets the system choose
    unsigned gpib = 0;                    ///< address behind the gateway, 0 to 30
    bool hislip = true;                   ///< serves this protocol too, at an own address
    bool announce = false;                ///< can be found on its network
};

/// What the program was asked for.
struct Options
{
    std::string text; ///< to be printed instead of running: help or version
    bool verbose = false;
    std::vector<InstrumentPlace> instruments;
};

/// Reads the command line without the program's name, and the configuration file it names.
/// Nothing, with the reason in `error`, when there is anything wrong with it.
[[nodiscard]] std::optional<Options> parseOptions(std::vector<std::string> arguments,
                                                  std::string &error);

/// The values of one instrument as they were written, to be checked together.
struct RawInstrument
{
    std::string label; ///< names it in messages
    std::optional<std::string> model{};
    std::optional<std::string> serial{};
    std::optional<std::string> firmware{};
    std::optional<std::string> options{};
    std::optional<std::string> root{};
    std::optional<std::string> address{};
    std::optional<std::string> gateway{};
    std::optional<std::string> gpib{};
    std::optional<std::string> seed{};
    std::vector<std::string> faults{};
    bool announce = false; ///< the address may be any of this machine then
};

/// Checks the values and fills in what is missing. Nothing, with the reason in `error`, when one of
/// them is not allowed.
[[nodiscard]] std::optional<InstrumentPlace> checkInstrument(const RawInstrument &raw,
                                                             std::string &error);

} // namespace simulator
