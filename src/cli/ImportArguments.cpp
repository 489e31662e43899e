// SPDX-License-Identifier: Apache-2.0
#include "ImportArguments.h"

#include "Console.h"
#include "Presets.h"

void addImportOptions(CLI::App &command, ImportArguments &arguments, const std::string &fileHelp,
                      const std::string &clockHelp)
{
    addText(command, "file", arguments.inputFile, fileHelp)->required();
    addNumber(command, "--clock", arguments.clockHz,
              {"Hz", ImportTarget::MinClockHz, ImportTarget::MaxClockHz},
              "Clock of the waveform" + clockHelp);
    arguments.scalingOption = addChoice(command, "--scaling", arguments.scaling,
                                        {"none", "down", "auto"}, "Level scaling (default: down)");
    addOutputArguments(command, arguments.output);
}

void addListOptions(CLI::App &command, ImportArguments &arguments)
{
    command.add_flag("--list", arguments.list, "Show what the file holds instead of importing it");
    command.add_flag("--json", arguments.json, "With --list: print JSON");
    // A listing writes nothing.
    command.get_option("--output")->required(false);
}

void addImportPresets(CLI::App &command, CommandSet &commands, const QString &group)
{
    commands.presets.add(
        command, group,
        QList<PresetField>{
            {.option = "--scaling", .key = "scaling", .names = {"none", "down", "auto"}},
            {.option = "--clock", .key = "clock", .unit = "Hz"}} +
            presetTexts());
}

bool outputStands(ImportArguments &arguments, int &exitCode)
{
    if (arguments.output.options.fileName.isEmpty()) {
        exitCode = arguments.console.wrongUsage("--output is required");
        return false;
    }
    if (!mayWrite(arguments.console, arguments.output.options.fileName, arguments.output.force)) {
        exitCode = arguments.console.failed();
        return false;
    }
    return true;
}

int printList(ImportArguments &arguments, const QJsonDocument &json, const QString &text)
{
    return arguments.console.print(arguments.json ? json.toJson() : text.toLocal8Bit())
               ? ExitDone
               : arguments.console.failed();
}
