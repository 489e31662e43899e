// SPDX-License-Identifier: Apache-2.0
#include "Configuration.h"

#include "protocols/ini.h"

#include <unistd.h>

#include <algorithm>
#include <charconv>
#include <cstdlib>

namespace visa {

namespace {

constexpr ViUInt32 LongestOpenTimeoutMs = 600'000;
constexpr ViUInt16 LargestPrimaryAddress = 30;

std::string quoted(std::string_view text)
{
    std::string result(1, '\'');
    result += text;
    return result += '\'';
}

// "5, 20-22" as 5, 20, 21, 22.
std::optional<std::vector<ViUInt16>> parseAddresses(std::string_view text)
{
    std::vector<ViUInt16> addresses;
    for (const std::string &part : split(text, ",")) {
        const std::vector<std::string> ends = split(part, "-");
        const auto first = parseNumber(protocols::trimmed(ends.front()), LargestPrimaryAddress);
        const auto last = parseNumber(protocols::trimmed(ends.back()), LargestPrimaryAddress);
        if (ends.size() > 2 || !first || !last || *first > *last) {
            return std::nullopt;
        }
        for (ViUInt16 address = *first; address <= *last; ++address) {
            addresses.push_back(address);
        }
    }
    std::sort(addresses.begin(), addresses.end());
    addresses.erase(std::unique(addresses.begin(), addresses.end()), addresses.end());
    return addresses;
}

// Takes entry by entry; each function returns an error sentence, empty when all is well.
class Reader
{
public:
    std::string take(const protocols::IniEntry &entry)
    {
        if (entry.key.empty()) {
            return beginSection(entry.section);
        }
        const std::string key = upperCase(entry.key);
        switch (m_section) {
        case Section::General:
            return readGeneral(key, entry.value);
        case Section::Gateway:
            return readGateway(key, entry.value);
        case Section::Instrument:
            return readInstrument(key, entry.value);
        }
        return {};
    }

    // What can only be seen once the section is complete.
    [[nodiscard]] std::string endSection() const
    {
        if (m_section == Section::Gateway && m_gateway->host.empty()) {
            return "section " + quoted(m_title) + " names no host.";
        }
        return {};
    }

    [[nodiscard]] Configuration takeResult() { return std::move(m_result); }

private:
    enum class Section { General, Gateway, Instrument };

    std::string beginSection(std::string_view title)
    {
        if (std::string error = endSection(); !error.empty()) {
            return error;
        }
        m_title = title;
        const std::string word = upperCase(title);
        if (word == "GENERAL") {
            m_section = Section::General;
            return {};
        }
        if (word.starts_with("GPIB") && word.find(':') == std::string::npos) {
            const auto board = word.size() == 4 ? std::optional<ViUInt16>(ViUInt16{0})
                                                : parseNumber(std::string_view(word).substr(4));
            if (!board) {
                return quoted(title) + " is no GPIB board such as 'GPIB0'.";
            }
            const auto [entry, isNew] = m_result.gateways.try_emplace(*board);
            if (!isNew) {
                return "section " + quoted(title) + " stands twice.";
            }
            m_gateway = &entry->second;
            m_section = Section::Gateway;
            return {};
        }
        const auto name = parseResourceName(title);
        if (!name || (name->kind != ResourceKind::Vxi11 && name->kind != ResourceKind::Hislip &&
                      name->kind != ResourceKind::Socket)) {
            return "section " + quoted(title) +
                   " is none of 'general', a GPIB board such as 'GPIB0' or a TCPIP resource.";
        }
        const auto isSame = [&](const NetworkInstrument &other) { return other.name == *name; };
        if (std::any_of(m_result.instruments.begin(), m_result.instruments.end(), isSame)) {
            return "section " + quoted(title) + " stands twice.";
        }
        m_result.instruments.push_back({*name, 0});
        m_section = Section::Instrument;
        return {};
    }

    std::string readGeneral(const std::string &key, std::string_view value)
    {
        if (key != "OPEN_TIMEOUT_MS") {
            return unknownKey(key, "'open_timeout_ms'");
        }
        ViUInt32 timeout = 0;
        const auto [end, error] =
            std::from_chars(value.data(), value.data() + value.size(), timeout);
        if (error != std::errc() || end != value.data() + value.size() || timeout == 0 ||
            timeout > LongestOpenTimeoutMs) {
            return "open time-out " + quoted(value) + " is not 1 to 600000 ms.";
        }
        m_result.openTimeoutMs = timeout;
        return {};
    }

    std::string readGateway(const std::string &key, std::string_view value)
    {
        if (key == "HOST") {
            m_gateway->host = value;
        } else if (key == "PORT") {
            return readPort(value, m_gateway->port);
        } else if (key == "INTERFACE") {
            if (value.empty()) {
                return "the interface has no name.";
            }
            m_gateway->interface = value;
        } else if (key == "ADDRESSES") {
            auto addresses = parseAddresses(value);
            if (!addresses) {
                return "addresses " + quoted(value) + " are no list of 0 to 30 such as '5, 20-22'.";
            }
            m_gateway->addresses = std::move(*addresses);
        } else {
            return unknownKey(key, "'host', 'port', 'interface', 'addresses'");
        }
        return {};
    }

    std::string readInstrument(const std::string &key, std::string_view value)
    {
        NetworkInstrument &instrument = m_result.instruments.back();
        if (key != "PORT" || instrument.name.kind != ResourceKind::Vxi11) {
            return unknownKey(key, "'port' of an INSTR resource");
        }
        return readPort(value, instrument.port);
    }

    static std::string readPort(std::string_view value, ViUInt16 &port)
    {
        const auto number = parseNumber(value);
        if (!number || *number == 0) {
            return "port " + quoted(value) + " is not 1 to 65535.";
        }
        port = *number;
        return {};
    }

    [[nodiscard]] std::string unknownKey(const std::string &key, std::string_view allowed) const
    {
        return "key " + quoted(key) + " of section " + quoted(m_title) + " is not allowed; " +
               std::string(allowed) + " would be.";
    }

    Configuration m_result;
    Section m_section = Section::General;
    std::string m_title;
    Gateway *m_gateway = nullptr; // into m_result, whose map does not move its entries
};

} // namespace

ViUInt16 Configuration::fixedPort(const ResourceName &name) const
{
    for (const NetworkInstrument &instrument : instruments) {
        if (instrument.name == name) {
            return instrument.port;
        }
    }
    return 0;
}

std::optional<Configuration> parseConfiguration(std::string_view text, std::string &error)
{
    const auto entries = protocols::parseIni(text, error);
    if (!entries) {
        return std::nullopt;
    }
    Reader reader;
    unsigned line = 1;
    error.clear();
    for (const protocols::IniEntry &entry : *entries) {
        line = entry.line;
        error = reader.take(entry);
        if (!error.empty()) {
            break;
        }
    }
    if (error.empty()) {
        error = reader.endSection();
    }
    if (!error.empty()) {
        error = protocols::atLine(line, error);
        return std::nullopt;
    }
    return reader.takeResult();
}

std::optional<Configuration> loadConfiguration(std::string &error)
{
    std::string path;
    const char *named = std::getenv("CORVANE_VISA_CONFIG");
    const bool isNamed = named != nullptr && *named != '\0';
    if (isNamed) {
        path = named;
    } else if (const char *folder = std::getenv("XDG_CONFIG_HOME"); folder && *folder != '\0') {
        path = std::string(folder) + "/corvane-visa.ini";
    } else if (const char *home = std::getenv("HOME")) {
        path = std::string(home) + "/.config/corvane-visa.ini";
    }

    if (::access(path.c_str(), R_OK) != 0) {
        if (!isNamed) {
            return Configuration();
        }
        error = "The configuration file '" + path + "' cannot be read.";
        return std::nullopt;
    }
    const std::optional<std::string> text = protocols::readTextFile(path);
    if (!text) {
        error = "The configuration file '" + path + "' cannot be read or is above 1 MiB.";
        return std::nullopt;
    }
    auto configuration = parseConfiguration(*text, error);
    if (!configuration) {
        error.insert(0, "The configuration file '" + path + "' has a fault in ");
    }
    return configuration;
}

} // namespace visa
