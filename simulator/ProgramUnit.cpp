// SPDX-License-Identifier: Apache-2.0
#include "ProgramUnit.h"

#include "ErrorQueue.h"

#include <algorithm>
#include <charconv>
#include <cmath>
#include <cstdint>
#include <optional>

namespace simulator {
namespace {

// The C library's own tests depend on the locale and are undefined for negative bytes.
bool isLetter(char byte)
{
    return (byte >= 'a' && byte <= 'z') || (byte >= 'A' && byte <= 'Z');
}

bool isDigit(char byte)
{
    return byte >= '0' && byte <= '9';
}

bool isWhite(char byte)
{
    return static_cast<unsigned char>(byte) <= ' ';
}

char upper(char byte)
{
    return byte >= 'a' && byte <= 'z' ? static_cast<char>(byte - 'a' + 'A') : byte;
}

void skipWhite(std::string_view &text)
{
    while (!text.empty() && isWhite(text.front())) {
        text.remove_prefix(1);
    }
}

std::string_view takeWord(std::string_view &text)
{
    std::size_t length = 0;
    while (length < text.size() &&
           (isLetter(text[length]) || isDigit(text[length]) || text[length] == '_')) {
        ++length;
    }
    const std::string_view word = text.substr(0, length);
    text.remove_prefix(length);
    return word;
}

int takeHeader(std::string_view &text, ProgramUnit &unit)
{
    // IEEE 488.2, 7.6.1.4.1.
    constexpr std::size_t MaxMnemonicLength = 12;

    if (text.starts_with('*') || text.starts_with(':')) {
        unit.common = text.front() == '*';
        unit.absolute = text.front() == ':';
        text.remove_prefix(1);
    }
    for (;;) {
        const std::string_view word = takeWord(text);
        if (word.empty()) {
            return text.empty() || isWhite(text.front()) ? CommandHeaderError : InvalidCharacter;
        }
        if (!isLetter(word.front())) {
            return CommandHeaderError;
        }
        if (word.size() > MaxMnemonicLength) {
            return MnemonicTooLong;
        }
        unit.nodes.push_back(upperCase(word));
        if (!text.starts_with(':') || unit.common) {
            break;
        }
        text.remove_prefix(1);
    }
    if (text.starts_with('?')) {
        unit.query = true;
        text.remove_prefix(1);
    }
    if (!text.empty() && !isWhite(text.front())) {
        return InvalidCharacter;
    }
    return NoError;
}

int takeString(std::string_view &text, Parameter &parameter)
{
    const char quote = text.front();
    text.remove_prefix(1);
    parameter.kind = Parameter::Kind::String;
    while (!text.empty()) {
        const char byte = text.front();
        text.remove_prefix(1);
        if (byte == quote) {
            // A doubled quote stands for one within the string.
            if (!text.starts_with(quote)) {
                return NoError;
            }
            text.remove_prefix(1);
        }
        parameter.text.push_back(byte);
    }
    return InvalidString;
}

int takeNonDecimal(std::string_view &text, Parameter &parameter)
{
    text.remove_prefix(1);
    const char letter = text.empty() ? ' ' : upper(text.front());
    const int base = letter == 'H' ? 16 : letter == 'Q' ? 8 : letter == 'B' ? 2 : 0;
    if (base == 0) {
        return InvalidNumber;
    }
    text.remove_prefix(1);
    std::uint64_t value = 0;
    const auto result = std::from_chars(text.data(), text.data() + text.size(), value, base);
    if (result.ec != std::errc()) {
        return InvalidNumber;
    }
    text.remove_prefix(static_cast<std::size_t>(result.ptr - text.data()));
    parameter.kind = Parameter::Kind::Number;
    parameter.value = static_cast<double>(value);
    return NoError;
}

int takeNumber(std::string_view &text, Parameter &parameter)
{
    const std::string_view start = text;
    if (text.front() == '+') {
        text.remove_prefix(1);
    }
    const auto result = std::from_chars(text.data(), text.data() + text.size(), parameter.value);
    // "+-1" is no number, nor are the words that the library reads as one.
    if (result.ec != std::errc() || !std::isfinite(parameter.value) ||
        (start.front() == '+' && text.starts_with('-'))) {
        return InvalidNumber;
    }
    text.remove_prefix(static_cast<std::size_t>(result.ptr - text.data()));
    skipWhite(text);
    parameter.kind = Parameter::Kind::Number;
    if (!text.empty() && isLetter(text.front())) {
        parameter.suffix = upperCase(takeWord(text));
    }
    return NoError;
}

int takeParameter(std::string_view &text, Parameter &parameter)
{
    const char first = text.front();
    if (first == '"' || first == '\'') {
        return takeString(text, parameter);
    }
    if (first == '#') {
        if (text.size() > 1 && isLetter(text[1])) {
            return takeNonDecimal(text, parameter);
        }
        text.remove_prefix(1);
        parameter.kind = Parameter::Kind::Block;
        return NoError;
    }
    if (isDigit(first) || first == '+' || first == '-' || first == '.') {
        return takeNumber(text, parameter);
    }
    if (isLetter(first)) {
        parameter.text = std::string(takeWord(text));
        return NoError;
    }
    return first == ',' ? SyntaxError : InvalidCharacter;
}

std::optional<double> prefixFactor(std::string_view prefix, bool upperM)
{
    if (prefix.empty()) {
        return 1;
    }
    if (prefix == "G") {
        return 1e9;
    }
    if (prefix == "MA" || (prefix == "M" && upperM)) {
        return 1e6;
    }
    if (prefix == "K") {
        return 1e3;
    }
    if (prefix == "M") {
        return 1e-3;
    }
    if (prefix == "U") {
        return 1e-6;
    }
    if (prefix == "N") {
        return 1e-9;
    }
    return std::nullopt;
}

} // namespace

int ProgramUnit::parse(std::string_view text)
{
    *this = {};
    skipWhite(text);
    if (const int error = takeHeader(text, *this); error != NoError) {
        return error;
    }
    skipWhite(text);
    while (!text.empty()) {
        Parameter parameter;
        if (const int error = takeParameter(text, parameter); error != NoError) {
            return error;
        }
        parameters.push_back(std::move(parameter));
        skipWhite(text);
        if (text.empty()) {
            break;
        }
        if (text.front() != ',') {
            return InvalidSeparator;
        }
        text.remove_prefix(1);
        skipWhite(text);
        if (text.empty()) {
            return SyntaxError;
        }
    }
    return NoError;
}

double suffixFactor(std::string_view suffix, std::string_view unit)
{
    if (suffix.empty()) {
        return 1;
    }
    if (!suffix.ends_with(unit) || unit.empty()) {
        return 0;
    }
    suffix.remove_suffix(unit.size());
    return prefixFactor(suffix, unit == "HZ").value_or(0);
}

bool matchesMnemonic(std::string_view typed, std::string_view mnemonic)
{
    std::size_t shortLength = 0;
    while (shortLength < mnemonic.size() &&
           !(mnemonic[shortLength] >= 'a' && mnemonic[shortLength] <= 'z')) {
        ++shortLength;
    }
    if (typed.size() != shortLength && typed.size() != mnemonic.size()) {
        return false;
    }
    return std::equal(typed.begin(), typed.end(), mnemonic.begin(),
                      [](char a, char b) { return upper(a) == upper(b); });
}

std::string upperCase(std::string_view text)
{
    std::string result(text);
    std::transform(result.begin(), result.end(), result.begin(), upper);
    return result;
}

} // namespace simulator
