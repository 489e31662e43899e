// SPDX-License-Identifier: Apache-2.0
#pragma once

#include "base/OutputFile.h"
#include "jobs/OutputOptions.h"

#include <CLI/CLI.hpp>
#include <QString>
#include <QStringList>

#include <functional>
#include <limits>
#include <memory>
#include <optional>
#include <string>

class Console;

/// A numeric option: its unit, which may be written behind the number, and its permitted range.
struct NumberRange
{
    QString unit;
    double min = std::numeric_limits<double>::lowest();
    double max = std::numeric_limits<double>::max();
};

/// The number in an engineering form, its unit behind it or not; nothing if it isn't one. Fields
/// overlook what stands behind the prefix letter, and letters that are none in this case; a script
/// is told of both.
[[nodiscard]] std::optional<double> numberIn(const QString &text, const QString &unit);

/// A number in the words of the help: with prefix and unit, or plain where it has no unit.
[[nodiscard]] QString numberText(double value, const QString &unit);

/// Adds an option that takes a number in an engineering form: 10k, 1.5M, 1,5M, 10us, -3.
CLI::Option *addNumber(CLI::App &command, const std::string &name, std::optional<double> &value,
                       const NumberRange &range, const std::string &help);

/// As above, for whole numbers.
CLI::Option *addInteger(CLI::App &command, const std::string &name, std::optional<qint64> &value,
                        const NumberRange &range, const std::string &help);

/// The whole number in the text of an option; an error of the parser names the option, the value
/// and what is permitted.
[[nodiscard]] qint64 takeInteger(const std::string &name, const std::string &text,
                                 const NumberRange &range);

/// As above, for a number of which only whole values make sense.
CLI::Option *addInteger(CLI::App &command, const std::string &name, std::optional<double> &value,
                        const NumberRange &range, const std::string &help);

/// Adds a text option or file argument; texts are taken in the encoding of the terminal.
CLI::Option *addText(CLI::App &command, const std::string &name, QString &value,
                     const std::string &help);

/// Adds an option with named values, which fill `index` with their place in the list.
CLI::Option *addChoice(CLI::App &command, const std::string &name, int &index,
                       const QStringList &names, const std::string &help);

/// What "-" stands for as the name of an output.
enum class Dash { Refused, StandardOutput };

/// Adds -o, --output, which takes no empty name; standard output leaves `value` empty.
CLI::Option *addOutputFile(CLI::App &command, QString &value, const std::string &help,
                           Dash dash = Dash::Refused);

/// The options of every command that writes a .wv file.
struct OutputArguments
{
    OutputOptions options;
    bool force = false;
};
void addOutputArguments(CLI::App &command, OutputArguments &arguments);

/// The same without the file name, for commands that name their files otherwise.
void addOutputTexts(CLI::App &command, OutputArguments &arguments);

/// Whether the file may be written: it isn't there, or `force` is set. A folder never may. Logs the
/// reason if not.
[[nodiscard]] bool mayWrite(Console &console, const QString &fileName, bool force);

/// Adds a command and remembers in `action` what to run after parsing. The state of the command's
/// options lives as long as its action.
template <typename State>
CLI::App &addCommand(CLI::App &parent, const std::string &name, const std::string &help,
                     std::function<int()> &action, const std::shared_ptr<State> &state,
                     int (*run)(State &))
{
    CLI::App *command = parent.add_subcommand(name, help);
    command->callback([&action, state, run] { action = [state, run] { return run(*state); }; });
    return *command;
}

/// Whether the output is another file than the source; logs so if it isn't. For results that are
/// no waveforms.
[[nodiscard]] bool isNoSource(Console &console, const QString &output, const QString &source);

/// What `force` lets an output do with a file that appeared under its name meanwhile.
[[nodiscard]] inline OutputFile::Existing existingFile(bool force)
{
    return force ? OutputFile::Existing::Replaced : OutputFile::Existing::Kept;
}
