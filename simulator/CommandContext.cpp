// SPDX-License-Identifier: Apache-2.0
#include "CommandContext.h"

#include "Instrument.h"
#include "Link.h"
#include "ProgramUnit.h"

#include <array>
#include <cmath>
#include <cstdio>

namespace simulator {

std::size_t CommandContext::parameterCount() const
{
    return unit.parameters.size();
}

std::optional<std::string> CommandContext::string(std::size_t index)
{
    const Parameter &parameter = unit.parameters.at(index);
    if (parameter.kind == Parameter::Kind::String) {
        return parameter.text;
    }
    error(DataTypeError);
    return std::nullopt;
}

std::optional<double> CommandContext::number(std::size_t index, const NumberRange &range)
{
    const Parameter &parameter = unit.parameters.at(index);
    if (parameter.kind == Parameter::Kind::Character) {
        if (matchesMnemonic(parameter.text, "MINimum")) {
            return range.minimum;
        }
        if (matchesMnemonic(parameter.text, "MAXimum")) {
            return range.maximum;
        }
        if (matchesMnemonic(parameter.text, "DEFault")) {
            return range.preset;
        }
        error(InvalidCharacterData);
        return std::nullopt;
    }
    if (parameter.kind != Parameter::Kind::Number) {
        error(DataTypeError);
        return std::nullopt;
    }
    const double factor = suffixFactor(parameter.suffix, range.unit);
    if (factor == 0) {
        error(InvalidSuffix);
        return std::nullopt;
    }
    const double value = parameter.value * factor;
    if (!(value >= range.minimum && value <= range.maximum)) {
        error(DataOutOfRange);
        return std::nullopt;
    }
    return value;
}

std::optional<std::int64_t> CommandContext::integer(std::size_t index, std::int64_t minimum,
                                                    std::int64_t maximum)
{
    const NumberRange range{"", static_cast<double>(minimum), static_cast<double>(maximum),
                            static_cast<double>(minimum)};
    const std::optional<double> value = number(index, range);
    if (!value) {
        return std::nullopt;
    }
    return std::llround(*value);
}

std::optional<bool> CommandContext::boolean(std::size_t index)
{
    const Parameter &parameter = unit.parameters.at(index);
    if (parameter.kind == Parameter::Kind::Number && parameter.suffix.empty()) {
        return std::llround(std::clamp(parameter.value, -1e9, 1e9)) != 0;
    }
    const std::optional<std::size_t> word = choice(index, {"OFF", "ON"});
    if (!word) {
        return std::nullopt;
    }
    return *word == 1;
}

std::optional<std::size_t> CommandContext::choice(std::size_t index,
                                                  std::initializer_list<std::string_view> words)
{
    const Parameter &parameter = unit.parameters.at(index);
    if (parameter.kind != Parameter::Kind::Character) {
        error(DataTypeError);
        return std::nullopt;
    }
    std::size_t place = 0;
    for (const std::string_view word : words) {
        if (matchesMnemonic(parameter.text, word)) {
            return place;
        }
        ++place;
    }
    error(IllegalParameterValue);
    return std::nullopt;
}

void CommandContext::error(int number, std::string_view detail)
{
    instrument.reportError(number, detail);
}

void CommandContext::respond(std::string text)
{
    link.respond(std::move(text));
}

void CommandContext::respond(double value)
{
    link.respond(numberText(value));
}

std::string numberText(double value)
{
    std::array<char, 40> buffer{};
    const int length = std::snprintf(buffer.data(), buffer.size(), "%.12g", value);
    return {buffer.data(), static_cast<std::size_t>(length)};
}

std::string quoted(std::string_view text)
{
    std::string result = "\"";
    for (const char byte : text) {
        if (byte == '"') {
            result += '"';
        }
        result += byte;
    }
    return result + '"';
}

} // namespace simulator
