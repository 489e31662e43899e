// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <CLI/CLI.hpp>

#include <functional>

class Console;
class Presets;

/// Each group of commands adds itself to the parser; the chosen command leaves in `action` what is
/// to be run. The console and the action outlive the parser's callbacks.
struct CommandSet
{
    CLI::App &app;
    Console &console;
    std::function<int()> &action;
    Presets &presets;
};

void addFileCommands(CommandSet &commands);
void addMeasureCommand(CommandSet &commands);
void addPlotCommand(CommandSet &commands);
void addCreateCommands(CommandSet &commands);
void addEditCommands(CommandSet &commands);
void addFilterCommands(CommandSet &commands);
void addMarkerCommands(CommandSet &commands);
void addImportCommands(CommandSet &commands);
void addComposeCommand(CommandSet &commands);
void addCheckCommand(CommandSet &commands);
void addCompletionCommand(CommandSet &commands);
void addInstrumentCommands(CommandSet &commands);
void addSigmfCommand(CLI::App &import, CommandSet &commands);
void addCaptureCommand(CLI::App &instr, CommandSet &commands);
