// SPDX-License-Identifier: Apache-2.0
#include "ResourceName.h"

#include <protocols/hislip.h>

#include <algorithm>
#include <array>
#include <charconv>
#include <cstdio>

namespace visa {

namespace {

constexpr ViUInt16 LargestPrimaryAddress = 30;
constexpr ViUInt16 LargestSecondaryAddress = 126;

bool isPlain(std::string_view text)
{
    return !text.empty() &&
           std::all_of(text.begin(), text.end(), [](char c) { return c > ' ' && c < 0x7F; });
}

// "TCPIP2" with the word "TCPIP" is 2, without digits 0.
std::optional<ViUInt16> boardNumber(std::string_view section, std::string_view word)
{
    if (!section.starts_with(word)) {
        return std::nullopt;
    }
    section.remove_prefix(word.size());
    if (section.empty()) {
        return ViUInt16{0};
    }
    if (section.starts_with("0X")) {
        return std::nullopt;
    }
    return parseNumber(section);
}

using Sections = std::vector<std::string>;

// Takes a trailing "INSTR" off, which every instrument name may go without.
void dropClass(Sections &sections)
{
    if (upperCase(sections.back()) == "INSTR") {
        sections.pop_back();
    }
}

// "hislip0" and "hislip0,4880" name a device of that protocol. False for a port that is none.
bool takeHislip(ResourceName &name)
{
    if (!upperCase(name.device).starts_with("HISLIP")) {
        return true;
    }
    name.kind = ResourceKind::Hislip;
    const std::size_t comma = name.device.find(',');
    if (comma == std::string::npos) {
        return true;
    }
    const auto port = parseNumber(std::string_view(name.device).substr(comma + 1));
    if (!port || *port == 0) {
        return false;
    }
    name.port = *port == protocols::hislip::Port ? ViUInt16{0} : *port;
    name.device.resize(comma);
    return true;
}

// An address of IPv6 stands in brackets, which keep its colons from separating sections.
std::string withoutBrackets(const std::string &host)
{
    return host.starts_with('[') && host.ends_with(']') ? host.substr(1, host.size() - 2) : host;
}

std::string hostText(const std::string &host)
{
    return host.find(':') == std::string::npos ? host : '[' + host + ']';
}

// The sections of a resource string; nothing for one with a lonely colon or bracket.
Sections sectionsOf(std::string_view text)
{
    const std::size_t open = text.find('[');
    const std::size_t close = text.find(']');
    Sections sections = split(text.substr(0, open), "::");
    if (open != std::string_view::npos) {
        if (close == std::string_view::npos || close < open || sections.size() != 2 ||
            !sections.back().empty()) {
            return {};
        }
        const Sections rest = split(text.substr(close + 1), "::");
        if (!rest.front().empty()) {
            return {};
        }
        sections.back() = text.substr(open, close - open + 1);
        sections.insert(sections.end(), rest.begin() + 1, rest.end());
    }
    // A colon of a section would merge with the separator behind it.
    const auto hasColon = [](const std::string &section) {
        return !section.starts_with('[') && section.find(':') != std::string::npos;
    };
    return std::any_of(sections.begin(), sections.end(), hasColon) ? Sections() : sections;
}

std::optional<ResourceName> parseTcpip(Sections sections, ViUInt16 board)
{
    ResourceName name;
    name.board = board;
    if (sections.size() == 4 && upperCase(sections[3]) == "SOCKET") {
        const auto port = parseNumber(sections[2]);
        if (!port || *port == 0) {
            return std::nullopt;
        }
        name.kind = ResourceKind::Socket;
        name.port = *port;
    } else {
        dropClass(sections);
        if (sections.size() < 2 || sections.size() > 3) {
            return std::nullopt;
        }
        name.kind = ResourceKind::Vxi11;
        name.device = sections.size() == 3 ? sections[2] : "inst0";
        if (!isPlain(name.device) || !takeHislip(name)) {
            return std::nullopt;
        }
    }
    name.host = withoutBrackets(sections[1]);
    if (!isPlain(name.host)) {
        return std::nullopt;
    }
    return name;
}

std::optional<ResourceName> parseUsb(Sections sections, ViUInt16 board)
{
    dropClass(sections);
    if (sections.size() < 4 || sections.size() > 5) {
        return std::nullopt;
    }
    const auto vendor = parseNumber(sections[1]);
    const auto product = parseNumber(sections[2]);
    if (!vendor || !product || sections[3].empty()) {
        return std::nullopt;
    }
    ResourceName name;
    name.kind = ResourceKind::Usb;
    name.board = board;
    name.vendorId = *vendor;
    name.productId = *product;
    name.serial = sections[3];
    if (sections.size() == 5) {
        name.usbInterface = parseNumber(sections[4], 0xFF);
        if (!name.usbInterface) {
            return std::nullopt;
        }
    }
    return name;
}

std::optional<ResourceName> parseGpib(Sections sections, ViUInt16 board)
{
    dropClass(sections);
    if (sections.size() < 2 || sections.size() > 3) {
        return std::nullopt;
    }
    const auto primary = parseNumber(sections[1], LargestPrimaryAddress);
    if (!primary) {
        return std::nullopt;
    }
    ResourceName name;
    name.kind = ResourceKind::Gpib;
    name.board = board;
    name.primary = *primary;
    if (sections.size() == 3) {
        name.secondary = parseNumber(sections[2], LargestSecondaryAddress);
        if (!name.secondary) {
            return std::nullopt;
        }
    }
    return name;
}

} // namespace

std::vector<std::string> split(std::string_view text, std::string_view separator)
{
    std::vector<std::string> parts;
    for (;;) {
        const std::size_t end = text.find(separator);
        parts.emplace_back(text.substr(0, end));
        if (end == std::string_view::npos) {
            return parts;
        }
        text.remove_prefix(end + separator.size());
    }
}

std::string upperCase(std::string_view text)
{
    std::string result(text);
    for (char &c : result) {
        if (c >= 'a' && c <= 'z') {
            c = static_cast<char>(c - 'a' + 'A');
        }
    }
    return result;
}

std::optional<ViUInt16> parseNumber(std::string_view text, ViUInt16 largest)
{
    int base = 10;
    if (text.starts_with("0x") || text.starts_with("0X")) {
        text.remove_prefix(2);
        base = 16;
    }
    unsigned value = 0;
    const auto [end, error] = std::from_chars(text.data(), text.data() + text.size(), value, base);
    if (error != std::errc() || end != text.data() + text.size() || value > largest) {
        return std::nullopt;
    }
    return static_cast<ViUInt16>(value);
}

std::optional<ResourceName> parseResourceName(std::string_view text)
{
    Sections sections = sectionsOf(text);
    if (sections.size() < 2) {
        return std::nullopt;
    }
    const std::string interface = upperCase(sections.front());
    std::optional<ResourceName> name;
    if (const auto tcpip = boardNumber(interface, "TCPIP")) {
        name = parseTcpip(std::move(sections), *tcpip);
    } else if (const auto usb = boardNumber(interface, "USB")) {
        name = parseUsb(std::move(sections), *usb);
    } else if (const auto gpib = boardNumber(interface, "GPIB")) {
        name = parseGpib(std::move(sections), *gpib);
    }
    // A longer one would not fit the buffers that callers hand in for it.
    if (name && resourceText(*name).size() >= VI_FIND_BUFLEN) {
        return std::nullopt;
    }
    return name;
}

std::string resourceText(const ResourceName &name)
{
    const std::string board = std::to_string(name.board) + "::";
    switch (name.kind) {
    case ResourceKind::Vxi11:
        return "TCPIP" + board + hostText(name.host) + "::" + name.device + "::INSTR";
    case ResourceKind::Hislip:
        return "TCPIP" + board + hostText(name.host) + "::" + name.device +
               (name.port == 0 ? std::string() : "," + std::to_string(name.port)) + "::INSTR";
    case ResourceKind::Socket:
        return "TCPIP" + board + hostText(name.host) + "::" + std::to_string(name.port) +
               "::SOCKET";
    case ResourceKind::Usb: {
        std::array<char, 32> ids{};
        std::snprintf(ids.data(), ids.size(), "0x%04X::0x%04X::", unsigned{name.vendorId},
                      unsigned{name.productId});
        std::string text = "USB" + board + ids.data() + name.serial;
        if (name.usbInterface) {
            text.append("::").append(std::to_string(*name.usbInterface));
        }
        return text + "::INSTR";
    }
    case ResourceKind::Gpib: {
        std::string text = "GPIB" + board + std::to_string(name.primary);
        if (name.secondary) {
            text.append("::").append(std::to_string(*name.secondary));
        }
        return text + "::INSTR";
    }
    }
    return {};
}

} // namespace visa
