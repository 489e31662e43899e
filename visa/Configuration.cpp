// SPDX-License-Identifier: Apache-2.0
#include "Configuration.h"

#include <algorithm>
#include <charconv>
#include <cstdlib>
#include <fstream>

namespace visa {

namespace {

constexpr std::size_t LargestFile = 1U << 20U; // bytes
constexpr ViUInt32 LongestOpenTimeoutMs = 600'000;
constexpr ViUInt16 LargestPrimaryAddress = 30;

std::string_view trimmed(std::string_view text)
{
    constexpr std::string_view Blank = " \t\r";
    const std::size_t begin = text.find_first_not_of(Blank);
    if (begin == std::string_view::npos) {
        return {};
    }
    return text.substr(begin, text.find_last_not_of(Blank) - begin + 1);
}

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
        const auto first = parseNumber(trimmed(ends.front()), LargestPrimaryAddress);
        const auto last = parseNumber(trimmed(ends.back()), LargestPrimaryAddress);
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

// Reads line by line; each function returns an error sentence, empty when all is well.
class Reader
{
public:
    std::string readLine(std::string_view line)
    {
        line = trimmed(line.substr(0, std::min(line.find(" ;"), line.find("\t;"))));
        if (line.empty() || line.front() == ';' || line.front() == '#') {
            return {};
        }
        if (line.front() == '[') {
            if (line.back() != ']') {
                return quoted(line) + " lacks its closing bracket.";
            }
            return beginSection(trimmed(line.substr(1, line.size() - 2)));
        }
        const std::size_t equals = line.find('=');
        if (equals == std::string_view::npos) {
            return quoted(line) + " is neither a [section] nor a key = value.";
        }
        const std::string key = upperCase(trimmed(line.substr(0, equals)));
        const std::string_view value = trimmed(line.substr(equals + 1));
        switch (m_section) {
        case Section::General:
            return readGeneral(key, value);
        case Section::Gateway:
            return readGateway(key, value);
        case Section::Instrument:
            return readInstrument(key, value);
        case Section::None:
            break;
        }
        return quoted(line) + " stands before the first section.";
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
    enum class Section { None, General, Gateway, Instrument };

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
        if (!name || (name->kind != ResourceKind::Vxi11 && name->kind != ResourceKind::Socket)) {
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
    Section m_section = Section::None;
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
    Reader reader;
    std::size_t lineNumber = 0;
    for (const std::string &line : split(text, "\n")) {
        ++lineNumber;
        error = reader.readLine(line);
        if (!error.empty()) {
            break;
        }
    }
    if (error.empty()) {
        error = reader.endSection();
    }
    if (!error.empty()) {
        error.insert(0, "line " + std::to_string(lineNumber) + ": ");
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

    std::ifstream file(path, std::ios::binary);
    if (!file) {
        if (!isNamed) {
            return Configuration();
        }
        error = "The configuration file '" + path + "' cannot be read.";
        return std::nullopt;
    }
    std::string text;
    text.resize(LargestFile + 1);
    file.read(text.data(), static_cast<std::streamsize>(text.size()));
    text.resize(static_cast<std::size_t>(file.gcount()));
    if (file.bad() || text.size() > LargestFile) {
        error = "The configuration file '" + path + "' cannot be read or is above 1 MiB.";
        return std::nullopt;
    }
    auto configuration = parseConfiguration(text, error);
    if (!configuration) {
        error.insert(0, "The configuration file '" + path + "' has a fault in ");
    }
    return configuration;
}

} // namespace visa
