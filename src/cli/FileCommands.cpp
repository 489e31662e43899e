// SPDX-License-Identifier: Apache-2.0
#include "CliOptions.h"
#include "Console.h"
#include "RangeArguments.h"
#include "commands.h"

#include "base/OutputFile.h"
#include "jobs/DumpJob.h"
#include "jobs/InfoReport.h"
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
}
