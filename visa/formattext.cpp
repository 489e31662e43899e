// SPDX-License-Identifier: Apache-2.0
#include "formattext.h"

#include <cstddef>

namespace visa {

namespace {

bool isOctal(char c)
{
    return c >= '0' && c <= '7';
}

// Takes what follows a backslash off `rest` and returns what it stands for.
std::string takeEscape(std::string_view &rest)
{
    if (rest.empty()) {
        return "\\";
    }
    if (isOctal(rest.front())) {
        unsigned value = 0;
        for (int digits = 0; digits < 3 && !rest.empty() && isOctal(rest.front()); ++digits) {
            value = value * 8 + static_cast<unsigned>(rest.front() - '0');
            rest.remove_prefix(1);
        }
        return std::string(1, static_cast<char>(value & 0xFFU));
    }
    const char c = rest.front();
    rest.remove_prefix(1);
    switch (c) {
    case 'n':
        return "\n";
    case 'r':
        return "\r";
    case 't':
        return "\t";
    case '\\':
    case '"':
        return std::string(1, c);
    default:
        return std::string("\\") + c;
    }
}

} // namespace

std::optional<std::vector<std::string>> formatMessages(std::string_view format)
{
    std::vector<std::string> messages;
    std::string message;
    char quote = '\0';
    while (!format.empty()) {
        const char c = format.front();
        format.remove_prefix(1);
        if (c == '%') {
            if (format.empty() || format.front() != '%') {
                return std::nullopt;
            }
            format.remove_prefix(1);
            message += '%';
        } else if (c == '\\' && quote == '\0') {
            message += takeEscape(format);
        } else {
            if (c == quote) {
                quote = '\0';
            } else if (quote == '\0' && (c == '\'' || c == '"') &&
                       format.find(c) != std::string_view::npos) {
                quote = c;
            }
            message += c;
        }
        if (!message.empty() && message.back() == '\n') {
            messages.push_back(std::move(message));
            message.clear();
        }
    }
    if (!message.empty()) {
        messages.push_back(std::move(message));
    }
    return messages;
}

} // namespace visa
