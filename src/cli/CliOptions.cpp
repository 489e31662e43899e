// SPDX-License-Identifier: Apache-2.0
#include "CliOptions.h"

#include "Console.h"

#include "base/EngineeringNumber.h"

#include <QFileInfo>

#include <cmath>

namespace {

double parse(const std::string &name, const std::string &text, const NumberRange &range)
{
    const auto number = parseNumber(QString::fromLocal8Bit(text), range.unit, true);
    const bool valid = number && number->trailing.isEmpty();
    if (!valid || number->value < range.min || number->value > range.max) {
        const QString permitted = range.max == std::numeric_limits<double>::max()
                                      ? "at least " + engineeringText(range.min, range.unit)
                                      : engineeringText(range.min, range.unit) + " to " +
                                            engineeringText(range.max, range.unit);
        const QString problem = QString("%1: %2 is %3; permitted: %4")
                                    .arg(QString::fromStdString(name), QString::fromLocal8Bit(text),
                                         valid ? "out of range" : "not a number", permitted);
        throw CLI::ValidationError(problem.toStdString());
    }
    return number->value;
}

} // namespace

CLI::Option *addNumber(CLI::App &command, const std::string &name, std::optional<double> &value,
                       const NumberRange &range, const std::string &help)
{
    return command
        .add_option_function<std::string>(
            name,
            [&value, name, range](const std::string &text) { value = parse(name, text, range); },
            help)
        ->type_name("NUMBER");
}

CLI::Option *addInteger(CLI::App &command, const std::string &name, std::optional<qint64> &value,
                        const NumberRange &range, const std::string &help)
{
    const auto take = [&value, name, range](const std::string &text) {
        const double number = parse(name, text, range);
        if (number != std::floor(number)) {
            throw CLI::ValidationError(name + ": " + text + " is not a whole number");
        }
        value = static_cast<qint64>(number);
    };
    return command.add_option_function<std::string>(name, take, help)->type_name("COUNT");
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
            throw CLI::ValidationError(name + ": " + text +
                                       " is unknown; permitted: " + names.join(", ").toStdString());
        }
        index = static_cast<int>(found);
    };
    return command.add_option_function<std::string>(name, take, help)
        ->type_name(names.join('|').toStdString());
}

void addOutputArguments(CLI::App &command, OutputArguments &arguments)
{
    OutputOptions &options = arguments.options;
    addText(command, "-o,--output", options.fileName, "Waveform file to write")
        ->type_name("FILE")
        ->required();
    const auto addTag = [&](const std::string &name, std::optional<QString> &tag,
                            const std::string &help) {
        command
            .add_option_function<std::string>(
                name, [&tag](const std::string &text) { tag = QString::fromLocal8Bit(text); }, help)
            ->type_name("TEXT");
    };
    addTag("--comment", options.comment, "Comment of the new file");
    addTag("--copyright", options.copyright, "Copyright note of the new file");
    command.add_flag("--force", arguments.force, "Overwrite an existing file");
}

bool mayWrite(Console &console, const QString &fileName, bool force)
{
    if (force || !QFileInfo::exists(fileName)) {
        return true;
    }
    console.error("The output file '" + fileName + "' already exists; --force overwrites it.");
    return false;
}
