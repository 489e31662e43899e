// SPDX-License-Identifier: Apache-2.0
#include "configfile.h"

#include <algorithm>
#include <filesystem>
#include <map>
#include <set>
#include <utility>

namespace simulator {
namespace {

using protocols::atLine;
using protocols::IniEntry;
using protocols::trimmed;

constexpr std::size_t FirstSerial = 100001;

// Several faults stand in one value with commas between; quotes keep a comma within one of them.
void addFaults(const IniEntry &entry, std::vector<std::string> &faults)
{
    if (entry.isQuoted) {
        faults.push_back(entry.value);
        return;
    }
    std::string_view rest = entry.value;
    while (!rest.empty()) {
        const std::size_t length = std::min(rest.find(','), rest.size());
        const std::string_view fault = trimmed(rest.substr(0, length));
        if (!fault.empty()) {
            faults.emplace_back(fault);
        }
        rest.remove_prefix(std::min(length + 1, rest.size()));
    }
}

bool setValue(RawInstrument &raw, const IniEntry &entry, std::string &error)
{
    const std::map<std::string_view, std::optional<std::string> *> keys{
        {"model", &raw.model},     {"serial", &raw.serial}, {"firmware", &raw.firmware},
        {"options", &raw.options}, {"root", &raw.root},     {"address", &raw.address},
        {"gateway", &raw.gateway}, {"gpib", &raw.gpib},     {"seed", &raw.seed},
    };
    if (entry.key == "fault") {
        addFaults(entry, raw.faults);
        return true;
    }
    const auto found = keys.find(entry.key);
    if (found == keys.end()) {
        std::string names = "fault";
        for (const auto &[name, target] : keys) {
            names.append(", ").append(name);
        }
        error = atLine(entry.line, "unknown key '" + entry.key + "'; there are " + names);
        return false;
    }
    if (found->second->has_value()) {
        error = atLine(entry.line, "the key '" + entry.key + "' stands twice in its group");
        return false;
    }
    *found->second = entry.value;
    return true;
}

// Two instruments at one place could not be told apart.
bool arePlacesDistinct(std::span<const InstrumentPlace> places, std::string &error)
{
    std::set<std::string> taken;
    for (const InstrumentPlace &place : places) {
        const std::string name = place.gateway ? "gateway " + std::to_string(*place.gateway) +
                                                     ", gpib " + std::to_string(place.gpib)
                                               : "address " + place.address;
        if (!taken.insert(name).second) {
            error = "two instruments have the " + name;
            return false;
        }
    }
    return true;
}

} // namespace

std::optional<std::vector<InstrumentPlace>>
instrumentsOf(std::span<const protocols::IniEntry> entries, const std::string &folder,
              std::string &error)
{
    std::vector<RawInstrument> raws;
    for (const IniEntry &entry : entries) {
        if (entry.key.empty()) {
            raws.push_back({.label = "[" + entry.section + "] "});
        } else if (!setValue(raws.back(), entry, error)) {
            return std::nullopt;
        }
    }
    if (raws.empty()) {
        error = "it holds no group, so no instrument";
        return std::nullopt;
    }
    std::vector<InstrumentPlace> places;
    for (RawInstrument &raw : raws) {
        if (!raw.address && !raw.gateway) {
            error = raw.label + "needs either an address, or a gateway and gpib";
            return std::nullopt;
        }
        // Two of one model are told apart by their serial numbers.
        if (!raw.serial) {
            raw.serial = std::to_string(FirstSerial + places.size());
        }
        // A name that stands in a file is meant from that file's place on.
        if (raw.root && !raw.root->empty()) {
            raw.root = (std::filesystem::path(folder) / *raw.root).string();
        }
        std::optional<InstrumentPlace> place = checkInstrument(raw, error);
        if (!place) {
            return std::nullopt;
        }
        places.push_back(std::move(*place));
    }
    if (!arePlacesDistinct(places, error)) {
        return std::nullopt;
    }
    return places;
}

} // namespace simulator
