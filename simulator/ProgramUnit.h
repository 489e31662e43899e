// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <string>
#include <string_view>
#include <vector>

namespace simulator {

/// One parameter of a command.
struct Parameter
{
    enum class Kind { Character, Number, String, Block };

    Kind kind = Kind::Character;
    std::string text;   ///< the word, or the string without its quotes
    double value = 0;   ///< of a number, without its suffix
    std::string suffix; ///< of a number, in upper case; may be empty
};

/// One program message unit of IEEE 488.2: a header with its parameters.
struct ProgramUnit
{
    bool common = false;            ///< begins with an asterisk
    bool absolute = false;          ///< begins with a colon
    bool query = false;             ///< the header ends in a question mark
    std::vector<std::string> nodes; ///< the header's mnemonics in upper case
    std::vector<Parameter> parameters;

    /// Reads a unit's text, in which a binary block stands as a single `#`. Returns the SCPI error
    /// number, 0 for none; after an error the unit's content is of no use.
    [[nodiscard]] int parse(std::string_view text);
};

/// The factor of a suffix in the base unit: `unit` is "HZ", "S", "DBM", "DB" or "V", and "MHZ" is
/// mega as SCPI has it while "MS" and "MV" are milli. An empty suffix is 1, an unknown one 0.
[[nodiscard]] double suffixFactor(std::string_view suffix, std::string_view unit);

/// Whether a typed word is the long or the short form of a mnemonic such as "STATe", whose capital
/// letters are the short form. Case does not matter.
[[nodiscard]] bool matchesMnemonic(std::string_view typed, std::string_view mnemonic);

[[nodiscard]] std::string upperCase(std::string_view text);

} // namespace simulator
