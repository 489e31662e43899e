// SPDX-License-Identifier: Apache-2.0
#include "simulator/configfile.h"
#include "support/require.h"

#include <algorithm>

using namespace protocols;
using namespace simulator;

/// The text of a configuration file.
extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t *data, std::size_t size)
{
    const std::string_view text(reinterpret_cast<const char *>(data), size);
    std::string error;
    const auto entries = parseIni(text, error);
    require(entries.has_value() == error.empty());
    if (!entries) {
        return 0;
    }
    require(entries->empty() || entries->front().key.empty());
    const auto places = instrumentsOf(*entries, "/nowhere", error);
    require(places.has_value() == error.empty());
    if (!places) {
        return 0;
    }
    const auto groups = std::count_if(entries->begin(), entries->end(),
                                      [](const IniEntry &entry) { return entry.key.empty(); });
    require(places->size() == static_cast<std::size_t>(groups));
    for (const InstrumentPlace &place : *places) {
        // What was accepted has a model, one kind of place, and addresses that the protocol has.
        require(place.instrument.model != nullptr &&
                place.address.empty() == place.gateway.has_value() && place.gpib <= 30);
    }
    return 0;
}
