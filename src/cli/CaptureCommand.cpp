// SPDX-License-Identifier: Apache-2.0
#include "InstrumentArguments.h"
#include "Presets.h"

#include "jobs/instrument/CaptureJob.h"
#include "jobs/instrument/CaptureSaveJob.h"

#include <memory>

namespace {

struct CaptureArguments
{
    Console &console;
    QString resource{};
    QString transcript{};
    int input = 0;
    int trigger = 0;
    int slope = 0;
    int scaling = static_cast<int>(ImportScaling::Auto);
    std::optional<double> rateHz{};
    std::optional<qint64> samples{};
    std::optional<double> rbwHz{};
    std::optional<qint64> pretrigger{};
    std::optional<double> levelDbm{};
    OutputArguments output{};
};

int runCapture(CaptureArguments &arguments)
{
    CaptureRequest request;
    request.resource = resourceOf(arguments.resource);
    if (request.resource.isEmpty()) {
        return arguments.console.wrongUsage("RES: the name of the instrument is empty");
    }
    if (!mayWrite(arguments.console, arguments.output.options.fileName, arguments.output.force)) {
        return arguments.console.failed();
    }
    request.input = static_cast<CaptureRequest::Input>(arguments.input);
    request.trigger = static_cast<CaptureRequest::Trigger>(arguments.trigger);
    request.slope = static_cast<CaptureRequest::Slope>(arguments.slope);
    request.sampleRateHz = arguments.rateHz.value_or(request.sampleRateHz);
    request.samples = static_cast<int>(arguments.samples.value_or(request.samples));
    request.rbwHz = arguments.rbwHz.value_or(request.rbwHz);
    request.pretriggerSamples =
        static_cast<int>(arguments.pretrigger.value_or(request.pretriggerSamples));
    request.triggerLevelDbm = arguments.levelDbm.value_or(request.triggerLevelDbm);
    if (!startTranscript(arguments.transcript)) {
        return arguments.console.failed();
    }
    CaptureJob job(request);
    const int exitCode = arguments.console.run(job);
    if (exitCode != ExitDone) {
        return exitCode;
    }
    const std::unique_ptr<Capture> capture = job.takeCapture();
    CaptureSaveJob save(*capture, arguments.output.options, capture->clockHz,
                        static_cast<ImportScaling>(arguments.scaling));
    return arguments.console.run(save);
}

} // namespace

void addCaptureCommand(CLI::App &instr, CommandSet &commands)
{
    using R = CaptureRequest;
    const auto state =
        std::make_shared<CaptureArguments>(CaptureArguments{.console = commands.console});
    CLI::App &command = addCommand<CaptureArguments>(
        instr, "capture", "Record a signal by an analyzer", commands.action, state, runCapture);
    addText(command, "resource", state->resource, "VISA resource string, host name or address")
        ->type_name("RES")
        ->required();
    addTranscript(command, state->transcript);
    addChoice(command, "--input", state->input, {"rf", "aiq", "diq"}, "Input (default: rf)");
    addNumber(command, "--rate", state->rateHz, {"Hz", R::MinRateHz, R::MaxRateHz},
              "Sample rate; the analyzer takes the nearest that it has (default: 1 MHz)");
    addInteger(command, "--samples", state->samples, {{}, R::MinSamples, R::MaxSamples},
               "Samples to record (default: 32768)");
    addNumber(command, "--rbw", state->rbwHz, {"Hz", R::MinRbwHz, R::MaxRbwHz},
              "Resolution bandwidth (default: 10 MHz)");
    addInteger(command, "--pretrigger", state->pretrigger, {{}, R::MinPretrigger, R::MaxPretrigger},
               "Samples before the trigger (default: 0)");
    addChoice(command, "--trigger", state->trigger, {"imm", "ext", "ifp"},
              "Start at once, by the trigger input or by the IF power (default: imm)");
    addChoice(command, "--slope", state->slope, {"pos", "neg"}, "Trigger slope (default: pos)");
    addNumber(command, "--level", state->levelDbm, {"dBm", R::MinLevelDbm, R::MaxLevelDbm},
              "Level of the IF power trigger (default: -20 dBm)");
    addChoice(command, "--scaling", state->scaling, {"none", "down", "auto"},
              "Level scaling (default: auto)");
    addOutputArguments(command, state->output);
    // The dialog keeps the scaling as one bit of three.
    commands.presets.add(
        command, "SpaImport",
        QList<PresetField>{
            {.option = "--input", .key = "input", .names = {"rf", "aiq", "diq"}},
            {.option = "--rate", .key = "samplerate", .unit = "Hz"},
            {.option = "--samples", .key = "samples"},
            {.option = "--rbw", .key = "rbw", .unit = "Hz"},
            {.option = "--pretrigger", .key = "pretrigger"},
            {.option = "--trigger", .key = "trgsrc", .names = {"imm", "ext", "ifp"}},
            {.option = "--slope", .key = "trgslope", .names = {"pos", "neg"}},
            {.option = "--level", .key = "trglevel", .unit = "dBm"},
            {.option = "--scaling", .key = "scaling", .names = {"", "none", "down", "", "auto"}}} +
            presetTexts());
    command.footer(
        "Example: corvane-cli instr capture 192.168.1.30 -o a.wv --rate 2M --samples 20000");
}
