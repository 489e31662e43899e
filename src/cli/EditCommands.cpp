// SPDX-License-Identifier: Apache-2.0
#include "CliOptions.h"
#include "Console.h"
#include "commands.h"

#include "jobs/LevelJob.h"

namespace {

struct LevelArguments
{
    Console &console;
    LevelRequest request;
    OutputArguments output;
};

int runLevel(LevelArguments &arguments)
{
    if (!mayWrite(arguments.console, arguments.output.options.fileName, arguments.output.force)) {
        return arguments.console.failed();
    }
    arguments.request.output = arguments.output.options;
    LevelJob job(arguments.request);
    return arguments.console.run(job);
}

} // namespace

void addEditCommands(CommandSet &commands)
{
    auto level = std::make_shared<LevelArguments>(LevelArguments{commands.console, {}, {}});
    CLI::App &command = addCommand<LevelArguments>(
        commands.app, "level", "Copy a waveform with new level tags, its samples untouched",
        commands.action, level, runLevel);
    addText(command, "file", level->request.inputFile, "Waveform file to read")->required();
    const NumberRange range{"dB", LevelRequest::MinDb, LevelRequest::MaxDb};
    addNumber(command, "--peak", level->request.peakDb, range,
              "Peak level; negative values decrease the level");
    addNumber(command, "--pkrms", level->request.peakToRmsDb, range, "Peak to RMS ratio");
    addOutputArguments(command, level->output);
}
