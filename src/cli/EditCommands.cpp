// SPDX-License-Identifier: Apache-2.0
#include "CliOptions.h"
#include "Console.h"
#include "Presets.h"
#include "RangeArguments.h"
#include "commands.h"

#include "jobs/CropJob.h"
#include "jobs/LevelJob.h"
#include "jobs/ResampleJob.h"

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

struct ResampleArguments
{
    Console &console;
    QString inputFile;
    std::optional<double> clockHz;
    std::optional<qint64> samples;
    OutputArguments output;
};

int runResample(ResampleArguments &arguments)
{
    if (arguments.clockHz.has_value() == arguments.samples.has_value()) {
        return arguments.console.wrongUsage("one of --clock and --samples is required");
    }
    if (!mayWrite(arguments.console, arguments.output.options.fileName, arguments.output.force)) {
        return arguments.console.failed();
    }
    ResampleRequest request;
    request.inputFile = arguments.inputFile;
    request.output = arguments.output.options;
    request.target.clockDecides = arguments.clockHz.has_value();
    request.target.clockHz = arguments.clockHz.value_or(request.target.clockHz);
    request.target.samples = arguments.samples.value_or(request.target.samples);
    ResampleJob job(request);
    return arguments.console.run(job);
}

void addResample(CommandSet &commands)
{
    auto resample = std::make_shared<ResampleArguments>(ResampleArguments{
        .console = commands.console, .inputFile = {}, .clockHz = {}, .samples = {}, .output = {}});
    CLI::App &command = addCommand<ResampleArguments>(
        commands.app, "resample", "Convert a waveform to another clock or number of samples",
        commands.action, resample, runResample);
    addText(command, "file", resample->inputFile, "Waveform file to read")->required();
    CLI::Option *clock =
        addNumber(command, "--clock", resample->clockHz,
                  {"Hz", ResampleTarget::MinClockHz, ResampleTarget::MaxClockHz}, "Target clock");
    addInteger(command, "--samples", resample->samples,
               {"", 1, static_cast<double>(ResampleTarget::MaxSamples)}, "Target sample count")
        ->excludes(clock);
    addOutputArguments(command, resample->output);
    commands.presets.add(command, "Resample",
                         {{.option = "--clock",
                           .key = "clock",
                           .unit = "Hz",
                           .condition = {"clkmode", 1},
                           .unless = "--samples"},
                          {.option = "--samples",
                           .key = "samples",
                           .condition = {"clkmode", 0},
                           .unless = "--clock"}});
}

struct CropArguments
{
    Console &console;
    CropRequest request;
    OutputArguments output;
};

int runCrop(CropArguments &arguments)
{
    int exitCode = ExitDone;
    if (!rangeFits(arguments.console, arguments.request.range, exitCode)) {
        return exitCode;
    }
    if (!mayWrite(arguments.console, arguments.output.options.fileName, arguments.output.force)) {
        return arguments.console.failed();
    }
    arguments.request.output = arguments.output.options;
    CropJob job(arguments.request);
    return arguments.console.run(job);
}

void addCrop(CommandSet &commands)
{
    auto crop = std::make_shared<CropArguments>(CropArguments{commands.console, {}, {}});
    CLI::App &command = addCommand<CropArguments>(commands.app, "crop",
                                                  "Cut a piece out of a waveform as it stands",
                                                  commands.action, crop, runCrop);
    addRange(command, crop->request.range);
    addOutputArguments(command, crop->output);
}

} // namespace

void addEditCommands(CommandSet &commands)
{
    addResample(commands);
    addCrop(commands);
    auto level = std::make_shared<LevelArguments>(LevelArguments{commands.console, {}, {}});
    CLI::App &command = addCommand<LevelArguments>(
        commands.app, "level", "Copy a waveform with new level tags, its samples untouched",
        commands.action, level, runLevel);
    addText(command, "file", level->request.inputFile, "Waveform file to read")->required();
    const NumberRange range{"dB", LevelRequest::MinDb, LevelRequest::MaxDb};
    addNumber(command, "--peak", level->request.peakDb, range,
              "Peak level; negative values decrease the level (default: as measured)");
    addNumber(command, "--pkrms", level->request.peakToRmsDb, range,
              "Peak to RMS ratio (default: as measured)");
    addNumber(command, "--clock", level->request.clockHz, {"Hz", MinClockHz, MaxClockHz},
              "Clock of the result (default: that of the source)");
    addOutputArguments(command, level->output);
    commands.presets.add(command, "Rescale",
                         {{.option = "--peak", .key = "peak", .unit = "dB"},
                          {.option = "--pkrms", .key = "pkrms", .unit = "dB"}});
}
