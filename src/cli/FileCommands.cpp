// SPDX-License-Identifier: Apache-2.0
#include "CliOptions.h"
#include "Console.h"
#include "RangeArguments.h"
#include "commands.h"

#include "base/OutputFile.h"
#include "jobs/CheckJob.h"
#include "jobs/DumpJob.h"
#include "jobs/ExportJob.h"
#include "jobs/InfoReport.h"

#include <QJsonArray>
#include <QJsonDocument>

namespace {

struct InfoArguments
{
    Console &console;
    std::vector<std::string> files;
    bool json = false;
    bool check = false;
};

/// Scans, and checks if wanted, one file into the two forms of the listing.
int listFile(InfoArguments &arguments, const QString &fileName, QJsonArray &objects,
             QByteArray &text)
{
    WvFileSummary summary;
    if (!scanWaveform(fileName, summary)) {
        return ExitFailed;
    }
    QJsonObject object = infoJson(summary);
    std::optional<SampleCheck> check;
    if (arguments.check) {
        CheckJob job(fileName);
        if (const int code = arguments.console.run(job); code != ExitDone) {
            return code;
        }
        check = job.result();
        object["check"] = checkJson(*check);
    }
    objects.append(object);
    text +=
        (text.isEmpty() ? "" : "\n") + infoText(summary, check ? &*check : nullptr).toLocal8Bit();
    return ExitDone;
}

int runInfo(InfoArguments &arguments)
{
    bool allScanned = true;
    QJsonArray objects;
    QByteArray text;
    for (const std::string &name : arguments.files) {
        const QString fileName = QString::fromLocal8Bit(name);
        const int code = listFile(arguments, fileName, objects, text);
        if (code == ExitCancelled) {
            return code;
        }
        if (code != ExitDone) {
            // The reason in the log doesn't name the file, of which there may be many.
            arguments.console.error(fileName + ": " + arguments.console.lastReason());
            allScanned = false;
        }
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

struct ExportArguments
{
    Console &console;
    ExportRequest request;
    int type = 0;
    CLI::Option *typeOption = nullptr;
    bool force = false;
};

int runExport(ExportArguments &arguments)
{
    Console &console = arguments.console;
    ExportRequest &request = arguments.request;
    if (*arguments.typeOption) {
        request.type = static_cast<ExportType>(arguments.type);
    }
    request.overwrite = arguments.force;
    if (const QString problem = exportProblem(request); !problem.isEmpty()) {
        return console.wrongUsage(problem);
    }
    int exitCode = ExitDone;
    if (!rangeFits(console, request.range, exitCode)) {
        return exitCode;
    }
    for (const QString &file : exportedFiles(request.outputFile)) {
        if (!mayWrite(console, file, arguments.force) ||
            !isNoSource(console, file, request.range.fileName)) {
            return console.failed();
        }
    }
    ExportJob job(request);
    return console.run(job);
}

void addExport(CommandSet &commands)
{
    auto exported =
        std::make_shared<ExportArguments>(ExportArguments{commands.console, {}, 0, nullptr, false});
    CLI::App &command =
        addCommand<ExportArguments>(commands.app, "export", "Write a waveform for other programs",
                                    commands.action, exported, runExport);
    addRange(command, exported->request.range);
    addOutputFile(command, exported->request.outputFile,
                  "File to write; its suffix tells the format: .wav, .cf32, .cs16, .csv, .mat, or "
                  ".sigmf-meta with .sigmf-data beside it")
        ->required();
    exported->typeOption = addChoice(
        command, "--type", exported->type, exportTypeNames(),
        "Form of a value: 32-bit float, 16 or 24 bits, for .wav and .sigmf-meta (default: "
        "s16)");
    command.add_flag("--force", exported->force, "Overwrite existing files");
}

} // namespace

void addFileCommands(CommandSet &commands)
{
    auto info = std::make_shared<InfoArguments>(InfoArguments{commands.console, {}});
    CLI::App &infoCommand = addCommand<InfoArguments>(
        commands.app, "info", "Show the tags of waveform files", commands.action, info, runInfo);
    infoCommand.add_option("files", info->files, "Waveform files")->required()->type_name("FILE");
    infoCommand.add_flag("--json", info->json, "Print one JSON array");
    infoCommand.add_flag("--check", info->check,
                         "Read the samples, too: complete, levels as measured, loop point");

    auto dump = std::make_shared<DumpArguments>(DumpArguments{commands.console, {}, 0, {}});
    CLI::App &dumpCommand = addCommand<DumpArguments>(commands.app, "dump", "Write out samples",
                                                      commands.action, dump, runDump);
    addRange(dumpCommand, dump->range);
    addChoice(dumpCommand, "--format", dump->format, {"csv", "cf32", "ci16"},
              "Form of the samples (default: csv)");
    addOutputFile(dumpCommand, dump->output, "File to write (default: standard output)",
                  Dash::StandardOutput);
    dumpCommand.add_flag("--force", dump->force, "Overwrite an existing file");
    addExport(commands);
}
