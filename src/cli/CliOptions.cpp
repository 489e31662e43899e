// SPDX-License-Identifier: Apache-2.0
#include "CliOptions.h"

#include "Console.h"

#include "base/EngineeringNumber.h"

#include <QFileInfo>
#include <QRegularExpression>

#include <cmath>

namespace {

/// Heads the options that all commands have which write a waveform, in the help behind those of the
/// command itself.
constexpr const char *OutputGroup = "The new file";

/// The permitted range as text. Whole numbers are told to the last digit.
QString rangeText(const NumberRange &range, bool whole)
{
    const auto text = [&](double value) {
        return whole ? QString::number(value, 'f', 0) : numberText(value, range.unit);
    };
    if (range.max == std::numeric_limits<double>::max()) {
        return "at least " + text(range.min);
    }
    return text(range.min) + " to " + text(range.max);
}

double parse(const std::string &name, const std::string &text, const NumberRange &range, bool whole)
{
    const std::optional<double> number = numberIn(QString::fromLocal8Bit(text), range.unit);
    const char *problem = nullptr;
    if (!number) {
        problem = "not a number";
    } else if (*number < range.min || *number > range.max) {
        problem = "out of range";
    } else if (whole && *number != std::floor(*number)) {
        problem = "not a whole number";
    } else {
        return *number;
    }
    throw CLI::ValidationError(QString("%1: '%2' is %3; permitted: %4")
                                   .arg(QString::fromStdString(name), QString::fromLocal8Bit(text),
                                        problem, rangeText(range, whole))
                                   .toStdString());
}

/// The range behind a help text; a range without an end says nothing.
std::string withRange(const std::string &help, const NumberRange &range, bool whole)
{
    const bool isOpen = range.min == std::numeric_limits<double>::lowest();
    return isOpen ? help : help + " [" + rangeText(range, whole).toStdString() + ']';
}

/// An option whose number goes to `take`.
template <typename Take>
CLI::Option *addParsed(CLI::App &command, const std::string &name, const NumberRange &range,
                       bool whole, const std::string &help, Take take)
{
    return command
        .add_option_function<std::string>(
            name,
            [name, range, whole, take](const std::string &text) {
                take(parse(name, text, range, whole));
            },
            withRange(help, range, whole))
        ->type_name(whole ? "COUNT" : "NUMBER");
}

} // namespace

QString numberText(double value, const QString &unit)
{
    // A bare prefix letter would be taken for a unit.
    return unit.isEmpty() ? QString::number(value) : engineeringText(value, unit);
}

std::optional<double> numberIn(const QString &text, const QString &unit)
{
    const auto number = parseNumber(text, unit, true);
    // Two words of a shell's line that fell into one are no number.
    static const QRegularExpression twoNumbers("[0-9.,][ \\t\\r\\n]+[0-9.,]");
    if (!number || !number->trailing.isEmpty() || text.contains(twoNumbers)) {
        return std::nullopt;
    }
    QString prefix = text.simplified();
    if (!unit.isEmpty() && prefix.endsWith(unit, Qt::CaseInsensitive)) {
        prefix.chop(unit.size());
    }
    static const QRegularExpression unknownPrefix("[UNPF] *$");
    return prefix.contains(unknownPrefix) ? std::nullopt : std::optional(number->value);
}

CLI::Option *addNumber(CLI::App &command, const std::string &name, std::optional<double> &value,
                       const NumberRange &range, const std::string &help)
{
    return addParsed(command, name, range, false, help, [&value](double v) { value = v; });
}

qint64 takeInteger(const std::string &name, const std::string &text, const NumberRange &range)
{
    return static_cast<qint64>(parse(name, text, range, true));
}

CLI::Option *addInteger(CLI::App &command, const std::string &name, std::optional<qint64> &value,
                        const NumberRange &range, const std::string &help)
{
    return addParsed(command, name, range, true, help,
                     [&value](double v) { value = static_cast<qint64>(v); });
}

CLI::Option *addInteger(CLI::App &command, const std::string &name, std::optional<double> &value,
                        const NumberRange &range, const std::string &help)
{
    return addParsed(command, name, range, true, help, [&value](double v) { value = v; });
}

CLI::Option *addText(CLI::App &command, const std::string &name, QString &value,
                     const std::string &help)
{
    return command
        .add_option_function<std::string>(
            name, [&value](const std::string &text) { value = QString::fromLocal8Bit(text); }, help)
        ->type_name(name.front() == '-' ? "TEXT" : "FILE");
}

CLI::Option *addChoice(CLI::App &command, const std::string &name, int &index,
                       const QStringList &names, const std::string &help)
{
    const auto take = [&index, name, names](const std::string &text) {
        const auto found = names.indexOf(QString::fromLocal8Bit(text));
        if (found < 0) {
            throw CLI::ValidationError(
                name + ": '" + text + "' is unknown; permitted: " + names.join(", ").toStdString());
        }
        index = static_cast<int>(found);
    };
    return command.add_option_function<std::string>(name, take, help)
        ->type_name(names.join('|').toStdString());
}

CLI::Option *addOutputFile(CLI::App &command, QString &value, const std::string &help, Dash dash)
{
    const auto take = [&value, dash](const std::string &text) {
        if (text.empty()) {
            throw CLI::ValidationError("--output: the file name is empty");
        }
        if (text == "-" && dash == Dash::Refused) {
            throw CLI::ValidationError("--output: '-' is no file, and only a dump can go to "
                                       "standard output; permitted: a file name, also ./-");
        }
        value = text == "-" ? QString() : QString::fromLocal8Bit(text);
    };
    return command.add_option_function<std::string>("-o,--output", take, help)->type_name("FILE");
}

void addOutputArguments(CLI::App &command, OutputArguments &arguments)
{
    addOutputFile(command, arguments.options.fileName, "Waveform file to write")
        ->required()
        ->group(OutputGroup);
    addOutputTexts(command, arguments);
}

void addOutputTexts(CLI::App &command, OutputArguments &arguments)
{
    OutputOptions &options = arguments.options;
    const auto addTag = [&](const std::string &name, std::optional<QString> &tag,
                            const std::string &help) {
        command
            .add_option_function<std::string>(
                name, [&tag](const std::string &text) { tag = QString::fromLocal8Bit(text); }, help)
            ->type_name("TEXT")
            ->group(OutputGroup);
    };
    addTag("--comment", options.comment, "Comment of the new file");
    addTag("--copyright", options.copyright, "Copyright note of the new file");
    options.overwrite = false;
    const auto force = [&arguments] { arguments.force = arguments.options.overwrite = true; };
    command.add_flag_callback("--force", force, "Overwrite an existing file")->group(OutputGroup);
}

bool mayWrite(Console &console, const QString &fileName, bool force)
{
    if (QFileInfo(fileName).isDir()) {
        console.error("The output file '" + fileName + "' is a folder.");
        return false;
    }
    if (force || !QFileInfo::exists(fileName)) {
        return true;
    }
    console.error("The output file '" + fileName + "' already exists; --force overwrites it.");
    return false;
}

bool isNoSource(Console &console, const QString &output, const QString &source)
{
    if (!isSameFile(output, source)) {
        return true;
    }
    console.error("The output file '" + output + "' is the source; give it another name.");
    return false;
}
