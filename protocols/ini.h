// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <optional>
#include <string>
#include <string_view>
#include <vector>

namespace protocols {

/// One line of an INI file that says something.
struct IniEntry
{
    std::string section;
    std::string key; ///< empty: the section's heading
    std::string value;
    unsigned line = 0;
    bool isQuoted = false; ///< the value stood in double quotes, which are gone
};

/// Reads the lines of an INI file: [section], key = value; a comment begins a line with ; or #, or
/// follows a value that is not quoted with a blank and ;. Nothing, with the line and the reason in
/// `error`, when a line is malformed.
[[nodiscard]] std::optional<std::vector<IniEntry>> parseIni(std::string_view text,
                                                            std::string &error);

/// The content of a text file of at most 1 MiB; nothing when it is larger or cannot be read.
[[nodiscard]] std::optional<std::string> readTextFile(const std::string &name);

/// Without blanks, tabs and carriage returns at both ends.
[[nodiscard]] std::string_view trimmed(std::string_view text);

/// "line 7: text".
[[nodiscard]] std::string atLine(unsigned line, std::string_view text);

} // namespace protocols
