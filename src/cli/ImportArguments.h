// SPDX-License-Identifier: Apache-2.0
#pragma once

#include "CliOptions.h"
#include "commands.h"

#include "jobs/ImportJob.h"

#include <QJsonDocument>

/// What all imports take.
struct ImportArguments
{
    explicit ImportArguments(Console &theConsole)
        : console(theConsole)
    {
    }

    Console &console;
    QString inputFile;
    std::optional<double> clockHz;
    int scaling = static_cast<int>(ImportScaling::Down);
    CLI::Option *scalingOption = nullptr;
    bool list = false;
    bool json = false;
    OutputArguments output;

    [[nodiscard]] ImportTarget target() const
    {
        ImportTarget target;
        target.output = output.options;
        target.scaling = static_cast<ImportScaling>(scaling);
        target.clockHz = clockHz.value_or(target.clockHz);
        return target;
    }
};

/// Adds the options of all imports; `clockHelp` tells the default of the clock.
void addImportOptions(CLI::App &command, ImportArguments &arguments, const std::string &fileHelp,
                      const std::string &clockHelp);

/// Adds --list and --json, with which no output is needed.
void addListOptions(CLI::App &command, ImportArguments &arguments);

/// Adds the presets of an import whose dialog keeps its fields in `group`.
void addImportPresets(CLI::App &command, CommandSet &commands, const QString &group);

/// Whether the output may be written; if not, `exitCode` tells how to end.
[[nodiscard]] bool outputStands(ImportArguments &arguments, int &exitCode);

/// Prints a listing in the form that was asked for; returns how to end.
[[nodiscard]] int printList(ImportArguments &arguments, const QJsonDocument &json,
                            const QString &text);
