// SPDX-License-Identifier: Apache-2.0
#include "CliOptions.h"
#include "Console.h"
#include "Presets.h"
#include "RangeArguments.h"
#include "commands.h"

#include "base/EngineeringNumber.h"
#include "dsp/windows.h"
#include "jobs/FilterJob.h"
#include "jobs/PolarJob.h"

#include <array>

namespace {

/// In the order of their names in the option's help.
constexpr std::array FilterKinds{FilterKind::Rectangular, FilterKind::Cosine,
                                 FilterKind::RootCosine, FilterKind::Gauss};

/// In the order of their numbers.
QStringList windowNames()
{
    return {"none", "rife-vincent", "hann", "hanning", "blackmann", "bl-harris", "flat-top"};
}

struct FilterArguments
{
    Console &console;
    FilterRequest request;
    int kind = 0;
    std::optional<qint64> length;
    std::optional<double> parameter;
    OutputArguments output;
};

/// Why the options don't fit each other or the file, naming the option; empty if they do.
QString filterProblem(const FilterArguments &arguments)
{
    const FilterRequest &request = arguments.request;
    const auto range = parameterRange(request.kind);
    if (range && arguments.parameter &&
        !(*arguments.parameter >= range->min && *arguments.parameter <= range->max)) {
        return QString("--param: %1 is out of range; permitted: %2 to %3")
            .arg(*arguments.parameter)
            .arg(range->min)
            .arg(range->max);
    }
    const std::optional<WvFileSummary> summary = scanned(request.inputFile);
    const double clock = summary ? summary->clock : 0;
    if (clock > 0 && request.bandwidthHz && *request.bandwidthHz > 0.5 * clock) {
        return QString("--bandwidth: %1 is out of range; permitted: at most %2")
            .arg(engineeringText(*request.bandwidthHz, "Hz"), engineeringText(0.5 * clock, "Hz"));
    }
    return {};
}

int runFilter(FilterArguments &arguments)
{
    FilterRequest &request = arguments.request;
    request.kind = FilterKinds.at(static_cast<std::size_t>(arguments.kind));
    request.length = static_cast<int>(arguments.length.value_or(request.length));
    request.parameter = arguments.parameter.value_or(request.parameter);
    if (const QString problem = filterProblem(arguments); !problem.isEmpty()) {
        return arguments.console.wrongUsage(problem);
    }
    if (!mayWrite(arguments.console, arguments.output.options.fileName, arguments.output.force)) {
        return arguments.console.failed();
    }
    request.output = arguments.output.options;
    FilterJob job(request);
    return arguments.console.run(job);
}

void addFilter(CommandSet &commands)
{
    auto filter = std::make_shared<FilterArguments>(FilterArguments{
        .console = commands.console, .request = {}, .length = {}, .parameter = {}, .output = {}});
    CLI::App &command = addCommand<FilterArguments>(
        commands.app, "filter", "Filter a waveform as a loop, at the same length and peak level",
        commands.action, filter, runFilter);
    addText(command, "file", filter->request.inputFile, "Waveform file to read")->required();
    addChoice(command, "--type", filter->kind, {"rectangular", "cosine", "root-cosine", "gauss"},
              "Shape of the filter (default: rectangular)");
    addNumber(command, "--bandwidth", filter->request.bandwidthHz,
              {"Hz", FilterRequest::MinBandwidthHz, MaxClockHz / 2},
              "One-sided bandwidth (default: 0.4 of the clock)");
    addChoice(command, "--window", filter->request.window, windowNames(),
              "Window over the filter (default: none)");
    addInteger(command, "--length", filter->length,
               {"", FilterRequest::MinLength, FilterRequest::MaxLength},
               "Length in samples (default: 150)");
    addNumber(command, "--param", filter->parameter, {"", 0.001, 2.5},
              "Roll-off of the cosine filters, 0.05 to 0.99, or B*T of gauss (default: 0.22)");
    addNumber(command, "--clock", filter->request.clockHz, {"Hz", MinClockHz, MaxClockHz},
              "Clock written to the file (default: that of the source)");
    addOutputArguments(command, filter->output);
    commands.presets.add(command, "Filter",
                         {{.option = "--type",
                           .key = "filtertype",
                           .names = {"rectangular", "root-cosine", "cosine", "gauss"}},
                          {.option = "--bandwidth", .key = "filterfreq", .unit = "Hz"},
                          {.option = "--window", .key = "windowtype", .names = windowNames()},
                          {.option = "--length", .key = "filterlength"},
                          {.option = "--param", .key = "filterparam"}});
}

struct PolarArguments
{
    Console &console;
    PolarRequest request;
    std::optional<double> offset;
    std::optional<double> gain;
    OutputArguments output;
};

int runPolar(PolarArguments &arguments)
{
    PolarRequest &request = arguments.request;
    if (request.phase.fileName == request.amplitude.fileName) {
        return arguments.console.wrongUsage("--phase and --amplitude name the same file");
    }
    for (const QString &name : {request.phase.fileName, request.amplitude.fileName}) {
        if (!mayWrite(arguments.console, name, arguments.output.force)) {
            return arguments.console.failed();
        }
    }
    request.offset = arguments.offset.value_or(request.offset);
    request.gain = arguments.gain.value_or(request.gain);
    for (OutputOptions *part : {&request.phase, &request.amplitude}) {
        part->overwrite = arguments.output.force;
        part->comment = arguments.output.options.comment;
        part->copyright = arguments.output.options.copyright;
    }
    PolarJob job(request);
    return arguments.console.run(job);
}

void addPolar(CommandSet &commands)
{
    auto polar = std::make_shared<PolarArguments>(PolarArguments{
        .console = commands.console, .request = {}, .offset = {}, .gain = {}, .output = {}});
    CLI::App &command = addCommand<PolarArguments>(
        commands.app, "polar", "Split a waveform into one of its phase and one of its amplitude",
        commands.action, polar, runPolar);
    addText(command, "file", polar->request.inputFile, "Waveform file to read")->required();
    addText(command, "--phase", polar->request.phase.fileName, "Phase file to write")
        ->required()
        ->type_name("FILE");
    addText(command, "--amplitude", polar->request.amplitude.fileName, "Amplitude file to write")
        ->required()
        ->type_name("FILE");
    addNumber(command, "--offset", polar->offset, {"", -1, 1},
              "Offset of the amplitude (default: 0)");
    addNumber(command, "--gain", polar->gain, {"", -1, 1}, "Gain of the amplitude (default: 1)");
    addNumber(command, "--clock", polar->request.clockHz, {"Hz", MinClockHz, MaxClockHz},
              "Clock written to the files (default: that of the source)");
    addOutputTexts(command, polar->output);
    commands.presets.add(
        command, "Polar",
        {{.option = "--offset", .key = "offset"}, {.option = "--gain", .key = "gain"}});
}

} // namespace

void addFilterCommands(CommandSet &commands)
{
    addFilter(commands);
    addPolar(commands);
}
