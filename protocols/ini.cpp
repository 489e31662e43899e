// SPDX-License-Identifier: Apache-2.0
#include "ini.h"

#include <algorithm>
#include <fstream>

namespace protocols {
namespace {

constexpr std::size_t MaxFileSize = 1U << 20U;

// The value of a key = value line, and whether it was quoted.
void setValue(std::string_view text, IniEntry &entry)
{
    const std::size_t close = text.empty() || text.front() != '"' ? 0 : text.rfind('"');
    const std::string_view after = trimmed(text.substr(std::min(close + 1, text.size())));
    if (close > 0 && (after.empty() || after.front() == ';')) {
        entry.value = text.substr(1, close - 1);
        entry.isQuoted = true;
        return;
    }
    entry.value = trimmed(text.substr(0, std::min(text.find(" ;"), text.find("\t;"))));
}

} // namespace

std::string_view trimmed(std::string_view text)
{
    constexpr std::string_view Blank = " \t\r";
    const std::size_t begin = text.find_first_not_of(Blank);
    if (begin == std::string_view::npos) {
        return {};
    }
    return text.substr(begin, text.find_last_not_of(Blank) - begin + 1);
}

std::string atLine(unsigned line, std::string_view text)
{
    return "line " + std::to_string(line) + ": " + std::string(text);
}

std::optional<std::vector<IniEntry>> parseIni(std::string_view text, std::string &error)
{
    std::vector<IniEntry> entries;
    unsigned number = 0;
    while (!text.empty()) {
        const std::size_t length = std::min(text.find('\n'), text.size());
        std::string_view line = trimmed(text.substr(0, length));
        text.remove_prefix(std::min(length + 1, text.size()));
        ++number;
        if (line.empty() || line.front() == ';' || line.front() == '#') {
            continue;
        }
        if (line.front() == '[') {
            line = trimmed(line.substr(0, std::min(line.find(" ;"), line.find("\t;"))));
            if (line.back() != ']') {
                error = atLine(number, "'" + std::string(line) + "' lacks its closing bracket.");
                return std::nullopt;
            }
            entries.push_back(
                {std::string(trimmed(line.substr(1, line.size() - 2))), {}, {}, number});
            continue;
        }
        const std::size_t equals = line.find('=');
        const std::string_view key = trimmed(line.substr(0, std::min(equals, line.size())));
        if (equals == std::string_view::npos || key.empty()) {
            error = atLine(number,
                           "'" + std::string(line) + "' is neither a [section] nor a key = value.");
            return std::nullopt;
        }
        if (entries.empty()) {
            error = atLine(number, "'" + std::string(line) + "' stands before the first section.");
            return std::nullopt;
        }
        IniEntry entry{entries.back().section, std::string(key), {}, number};
        setValue(trimmed(line.substr(equals + 1)), entry);
        entries.push_back(std::move(entry));
    }
    return entries;
}

std::optional<std::string> readTextFile(const std::string &name)
{
    std::ifstream file(name, std::ios::binary);
    std::string text(MaxFileSize + 1, '\0');
    file.read(text.data(), static_cast<std::streamsize>(text.size()));
    text.resize(static_cast<std::size_t>(file.gcount()));
    if (file.bad() || (text.empty() && !file.eof()) || text.size() > MaxFileSize) {
        return std::nullopt;
    }
    return text;
}

} // namespace protocols
