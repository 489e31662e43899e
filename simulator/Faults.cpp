// SPDX-License-Identifier: Apache-2.0
#include "Faults.h"

#include <algorithm>
#include <array>
#include <charconv>

namespace simulator {
namespace {

enum class Value { None, Optional, Required, Text };

struct Spec
{
    std::string_view name;
    Value value = Value::None;
    std::int64_t minimum = 0;
    std::int64_t maximum = 0;
    std::string_view form;
    std::string_view meaning;
};

constexpr std::int64_t MaxBytes = std::int64_t{1} << 40;

constexpr std::array<Spec, 15> Specs{{
    {"busy", Value::Required, 0, 86400, "busy=SECONDS",
     "loading a waveform keeps the instrument busy that long"},
    {"drop-after", Value::Required, 0, MaxBytes, "drop-after=BYTES",
     "closes the connection after so many bytes of a binary block"},
    {"empty-dir-469", Value::None, 0, 0, "empty-dir-469",
     "an empty or missing folder gives an error with the number 469"},
    {"error-after-transfer", Value::Optional, -999, 32767, "error-after-transfer[=NUMBER]",
     "an error (-310) waits in the queue after each file transfer"},
    {"idn", Value::Text, 0, 0, "idn=TEXT", "another answer to *IDN?"},
    {"long-block", Value::Optional, 1, 1'000'000, "long-block[=BYTES]",
     "a binary block holds so many bytes, or 8, more than were asked for"},
    {"no-portmapper", Value::None, 0, 0, "no-portmapper", "port 111 stays closed"},
    {"no-raw", Value::None, 0, 0, "no-raw", "port 5025 stays closed"},
    {"no-terminator", Value::None, 0, 0, "no-terminator",
     "the line feed behind a binary block is missing"},
    {"opc-zero", Value::None, 0, 0, "opc-zero", "*OPC? answers 0"},
    {"queue", Value::Required, 0, 1000, "queue=N", "N entries stand in the error queue"},
    {"short-block", Value::Optional, 1, MaxBytes, "short-block[=BYTES]",
     "so many bytes, or half of it, are missing at the end of a binary block"},
    {"small-block", Value::Optional, 1, MaxBytes, "small-block[=BYTES]",
     "a binary block is whole, but holds so many bytes, or 8, less than were asked for"},
    {"slow-answer", Value::Required, 0, 86400000, "slow-answer=MS",
     "each answer comes that many milliseconds late"},
    {"slow-sweep", Value::Required, 0, 86400000, "slow-sweep=MS",
     "each sweep takes that much longer than its samples last"},
}};

std::optional<std::int64_t> parseNumber(std::string_view text)
{
    std::int64_t value = 0;
    const auto result = std::from_chars(text.data(), text.data() + text.size(), value);
    if (result.ec != std::errc() || result.ptr != text.data() + text.size()) {
        return std::nullopt;
    }
    return value;
}

std::string names()
{
    std::string text;
    for (const Spec &spec : Specs) {
        if (!text.empty()) {
            text += ", ";
        }
        text += spec.name;
    }
    return text;
}

} // namespace

bool Faults::set(std::string_view name, std::string_view value, std::string &error)
{
    const auto *spec = std::find_if(Specs.begin(), Specs.end(),
                                    [name](const Spec &entry) { return entry.name == name; });
    const std::string label = "fault '" + std::string(name) + "'";
    if (spec == Specs.end()) {
        error = label + " is unknown; there are " + names();
        return false;
    }
    const bool needed = spec->value == Value::Required || spec->value == Value::Text;
    if (value.empty() && needed) {
        error = label + " needs a value: " + std::string(spec->form);
        return false;
    }
    if (!value.empty() && spec->value == Value::None) {
        error = label + " takes no value";
        return false;
    }
    if (!value.empty() && spec->value != Value::Text) {
        const std::optional<std::int64_t> number = parseNumber(value);
        if (!number || *number < spec->minimum || *number > spec->maximum) {
            error = label + " has the value '" + std::string(value) + "'; a whole number from " +
                    std::to_string(spec->minimum) + " to " + std::to_string(spec->maximum) +
                    " is needed";
            return false;
        }
    }
    m_values.insert_or_assign(std::string(name), std::string(value));
    return true;
}

bool Faults::set(std::string_view text, std::string &error)
{
    const std::size_t equals = text.find('=');
    if (equals == std::string_view::npos) {
        return set(text, {}, error);
    }
    return set(text.substr(0, equals), text.substr(equals + 1), error);
}

bool Faults::has(std::string_view name) const
{
    return m_values.find(name) != m_values.end();
}

std::optional<std::int64_t> Faults::number(std::string_view name) const
{
    const auto found = m_values.find(name);
    return found == m_values.end() ? std::nullopt : parseNumber(found->second);
}

std::string Faults::text(std::string_view name) const
{
    const auto found = m_values.find(name);
    return found == m_values.end() ? std::string() : found->second;
}

std::string Faults::list() const
{
    std::string text;
    for (const auto &[name, value] : m_values) {
        if (!text.empty()) {
            text += ',';
        }
        text += name;
        if (!value.empty()) {
            text += '=' + value;
        }
    }
    return text;
}

std::string Faults::help()
{
    constexpr std::size_t Column = 32;
    std::string text;
    for (const Spec &spec : Specs) {
        std::string line = "  " + std::string(spec.form);
        line.resize(std::max(line.size() + 1, Column), ' ');
        text += line + std::string(spec.meaning) + '\n';
    }
    return text;
}

} // namespace simulator
