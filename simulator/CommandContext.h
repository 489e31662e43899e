// SPDX-License-Identifier: Apache-2.0
#pragma once

#include "CommandTable.h"
#include "ErrorQueue.h"
#include "OutputQueue.h"

#include <cstddef>
#include <cstdint>
#include <initializer_list>
#include <optional>
#include <span>
#include <string>
#include <string_view>

namespace simulator {

class Instrument;
class Link;
struct ProgramUnit;

/// A numeric parameter: its unit ("HZ", "S", "DBM", "DB", "V" or empty), and its range, which
/// the words MINimum and MAXimum stand for.
struct NumberRange
{
    std::string_view unit;
    double minimum = 0;
    double maximum = 0;
    double preset = 0; ///< DEFault
};

/// What a command's handler works with. The functions that read a parameter put the fitting error
/// into the queue when it is not what they want, and return nothing.
struct CommandContext
{
    Instrument &instrument;
    Link &link;
    const ProgramUnit &unit;
    const Command &command;
    TimePoint now;

    [[nodiscard]] std::size_t parameterCount() const;
    [[nodiscard]] std::optional<std::string> string(std::size_t index);
    [[nodiscard]] std::optional<double> number(std::size_t index, const NumberRange &range);
    [[nodiscard]] std::optional<std::int64_t> integer(std::size_t index, std::int64_t minimum,
                                                      std::int64_t maximum);
    [[nodiscard]] std::optional<bool> boolean(std::size_t index);

    /// The place of the word in the list of mnemonics.
    [[nodiscard]] std::optional<std::size_t> choice(std::size_t index,
                                                    std::initializer_list<std::string_view> words);

    void error(int number, std::string_view detail = {});
    void respond(std::string text);
    void respond(double value);
};

/// A number as instruments print it: whole ones without a point, others with up to 12 digits.
[[nodiscard]] std::string numberText(double value);

/// Text as a SCPI string with its quotes.
[[nodiscard]] std::string quoted(std::string_view text);

/// The commands, by field.
[[nodiscard]] std::span<const Command> commonCommands();
[[nodiscard]] std::span<const Command> systemCommands();
[[nodiscard]] std::span<const Command> memoryCommands();
[[nodiscard]] std::span<const Command> generatorCommands();
[[nodiscard]] std::span<const Command> analyzerCommands();
[[nodiscard]] std::span<const Command> settingCommands();

/// The value of a plain numeric setting, by the pattern of its command.
[[nodiscard]] double settingValue(const Instrument &instrument, std::string_view pattern);

/// The pattern of the command that takes a file's content as a block.
inline constexpr std::string_view FileDataPattern = "MMEMory:DATA";

} // namespace simulator
