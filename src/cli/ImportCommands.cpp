// SPDX-License-Identifier: Apache-2.0
#include "CliOptions.h"
#include "Console.h"
#include "commands.h"

#include "base/EngineeringNumber.h"
#include "jobs/WavImportJob.h"

#include <QJsonDocument>
#include <QJsonObject>

namespace {

struct WavArguments
{
    Console &console;
    QString inputFile;
    std::optional<double> clockHz;
    int scaling = static_cast<int>(ImportScaling::Down);
    bool list = false;
    bool json = false;
    OutputArguments output;
};

int listWav(WavArguments &arguments)
{
    WavFileAccess file;
    const std::optional<WavHeader> header = WavImportJob::readHeader(file, arguments.inputFile);
    if (!header) {
        return arguments.console.failed();
    }
    QByteArray text;
    if (arguments.json) {
        text = QJsonDocument(QJsonObject{{"sampleRate", header->sampleRate},
                                         {"samples", header->samples()},
                                         {"playTime", header->playTime()}})
                   .toJson();
    } else {
        text = QString("Sample Rate: %1\nSamples:     %2\nPlay Time:   %3\n")
                   .arg(engineeringText(header->sampleRate, "Hz"))
                   .arg(header->samples())
                   .arg(engineeringText(header->playTime(), "s"))
                   .toLocal8Bit();
    }
    return arguments.console.print(text) ? ExitDone : arguments.console.failed();
}

int runWav(WavArguments &arguments)
{
    if (arguments.list) {
        return listWav(arguments);
    }
    if (arguments.output.options.fileName.isEmpty()) {
        return arguments.console.wrongUsage("--output is required");
    }
    if (!mayWrite(arguments.console, arguments.output.options.fileName, arguments.output.force)) {
        return arguments.console.failed();
    }
    WavImportRequest request;
    request.inputFile = arguments.inputFile;
    request.target.output = arguments.output.options;
    request.target.scaling = static_cast<ImportScaling>(arguments.scaling);
    request.clockFromFile = !arguments.clockHz.has_value();
    request.target.clockHz = arguments.clockHz.value_or(request.target.clockHz);
    WavImportJob job(request);
    return arguments.console.run(job);
}

} // namespace

void addImportCommands(CommandSet &commands)
{
    CLI::App *import = commands.app.add_subcommand("import", "Make a waveform from other data");
    import->require_subcommand(1);
    auto wav = std::make_shared<WavArguments>(
        WavArguments{.console = commands.console, .inputFile = {}, .clockHz = {}, .output = {}});
    CLI::App &command = addCommand<WavArguments>(
        *import, "wav", "Import a stereo WAVE file, I on the left and Q on the right channel",
        commands.action, wav, runWav);
    addText(command, "file", wav->inputFile, "WAVE file to read")->required();
    addNumber(command, "--clock", wav->clockHz,
              {"Hz", ImportTarget::MinClockHz, ImportTarget::MaxClockHz},
              "Clock of the waveform (default: the file's sample rate)");
    addChoice(command, "--scaling", wav->scaling, {"none", "down", "auto"},
              "Level scaling (default: down)");
    command.add_flag("--list", wav->list, "Show what the file holds instead of importing it");
    command.add_flag("--json", wav->json, "With --list: print JSON");
    addOutputArguments(command, wav->output);
    // A listing writes nothing.
    command.get_option("--output")->required(false);
}
