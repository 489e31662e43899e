// SPDX-License-Identifier: Apache-2.0
#include "CliOptions.h"
#include "Console.h"
#include "RangeArguments.h"
#include "commands.h"

#include "base/OutputFile.h"
#include "jobs/DumpJob.h"
#include "jobs/InfoReport.h"
#include "jobs/MeasureJob.h"
#include "jobs/ReportText.h"
#include "wvfile/HvFileIO.h"

#include <QJsonArray>
#include <QJsonDocument>

namespace {

struct InfoArguments
{
    Console &console;
    std::vector<std::string> files;
    bool json = false;
};

int runInfo(InfoArguments &arguments)
{
    bool allScanned = true;
    QJsonArray objects;
    QByteArray text;
    for (const std::string &name : arguments.files) {
        WvFileSummary summary;
        const QString fileName = QString::fromLocal8Bit(name);
        if (!HvFileIO().readWaveformInfo(fileName, &summary)) {
            // The scan's own words don't name the file, of which there may be many.
            arguments.console.error(fileName + ": " + arguments.console.lastReason());
            allScanned = false;
            continue;
        }
        objects.append(infoJson(summary));
        text += (text.isEmpty() ? "" : "\n") + infoText(summary).toLocal8Bit();
    }
    const bool printed =
        arguments.console.print(arguments.json ? QJsonDocument(objects).toJson() : text);
    return printed && allScanned ? ExitDone : arguments.console.failed();
}

struct DumpArguments
{
    Console &console;
    SampleRange range;
    int format = 0;
    QString output;
    bool force = false;
};

int runDump(DumpArguments &arguments)
{
    Console &console = arguments.console;
    int exitCode = ExitDone;
    if (!rangeFits(console, arguments.range, exitCode)) {
        return exitCode;
    }
    DumpJob::Sink sink = [&console](const QByteArray &bytes) { return console.print(bytes); };
    // Nothing in a dump tells a cut one from a whole one.
    OutputFile file(arguments.output, existingFile(arguments.force));
    const auto cannotWrite = [&](const char *what) {
        return Tracer::fail(
            QString("Cannot %1 '%2': %3").arg(what, arguments.output, file.errorString()));
    };
    if (!arguments.output.isEmpty()) {
        if (!mayWrite(console, arguments.output, arguments.force) ||
            !isNoSource(console, arguments.output, arguments.range.fileName)) {
            return console.failed();
        }
        // Opened with the first bytes, so that a source that can't be read touches nothing.
        sink = [&](const QByteArray &bytes) {
            if (!file.isOpen() && !file.open()) {
                return cannotWrite("open");
            }
            return file.write(bytes) || cannotWrite("write");
        };
    }
    DumpJob job(arguments.range, static_cast<DumpFormat>(arguments.format), sink);
    job.setFinish([&] { return !file.isOpen() || file.commit() || cannotWrite("write"); });
    return console.run(job);
}

struct MeasureArguments
{
    Console &console;
    SampleRange range;
    bool json = false;
};

int runMeasure(MeasureArguments &arguments)
{
    Console &console = arguments.console;
    int exitCode = ExitDone;
    if (!rangeFits(console, arguments.range, exitCode)) {
        return exitCode;
    }
    MeasureJob job(arguments.range);
    exitCode = console.run(job);
    if (exitCode != ExitDone) {
        return exitCode;
    }
    const LevelMeasurement &levels = job.result();
    QByteArray text;
    if (arguments.json) {
        text = QJsonDocument(QJsonObject{{"samples", levels.samples},
                                         {"peakOffset", levels.peakOffset},
                                         {"rmsOffset", levels.rmsOffset},
                                         {"crest", levels.crest()}})
                   .toJson();
    } else {
        text = QString::asprintf("Samples:     %lld\nPeak Offset: %.6f dB\nRMS Offset:  %.6f dB\n"
                                 "Peak / RMS:  %.6f dB\n",
                                 levels.samples, writtenDb(levels.peakOffset),
                                 writtenDb(levels.rmsOffset), writtenDb(levels.crest()))
                   .toLatin1();
    }
    return console.print(text) ? ExitDone : console.failed();
}

} // namespace

void addFileCommands(CommandSet &commands)
{
    auto info = std::make_shared<InfoArguments>(InfoArguments{commands.console, {}});
    CLI::App &infoCommand = addCommand<InfoArguments>(
        commands.app, "info", "Show the tags of waveform files", commands.action, info, runInfo);
    infoCommand.add_option("files", info->files, "Waveform files")->required()->type_name("FILE");
    infoCommand.add_flag("--json", info->json, "Print one JSON array");

    auto dump = std::make_shared<DumpArguments>(DumpArguments{commands.console, {}, 0, {}});
    CLI::App &dumpCommand = addCommand<DumpArguments>(commands.app, "dump", "Write out samples",
                                                      commands.action, dump, runDump);
    addRange(dumpCommand, dump->range);
    addChoice(dumpCommand, "--format", dump->format, {"csv", "cf32", "ci16"},
              "Form of the samples (default: csv)");
    addOutputFile(dumpCommand, dump->output, "File to write (default: standard output)");
    dumpCommand.add_flag("--force", dump->force, "Overwrite an existing file");

    auto measure = std::make_shared<MeasureArguments>(MeasureArguments{commands.console, {}});
    CLI::App &measureCommand =
        addCommand<MeasureArguments>(commands.app, "measure", "Measure peak and RMS of the samples",
                                     commands.action, measure, runMeasure);
    addRange(measureCommand, measure->range);
    measureCommand.add_flag("--json", measure->json, "Print JSON");
}
