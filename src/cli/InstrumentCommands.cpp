// SPDX-License-Identifier: Apache-2.0
#include "CliOptions.h"
#include "Console.h"
#include "commands.h"

#include "instrument/InstrumentSummary.h"
#include "instrument/VisaDevice.h"
#include "instrument/remotepaths.h"
#include "jobs/instrument/EntryJob.h"
#include "jobs/instrument/ListJob.h"
#include "jobs/instrument/QueryJob.h"
#include "jobs/instrument/ScanJob.h"
#include "jobs/instrument/StartJob.h"
#include "jobs/instrument/TransferJob.h"

#include <QDir>
#include <QFileInfo>
#include <QJsonArray>
#include <QJsonDocument>
#include <QJsonObject>

namespace {

/// The arguments of all commands; each uses some of them.
struct InstrumentArguments
{
    Console &console;
    QString resource{};
    QString first{};  ///< path, or command for the instrument
    QString second{}; ///< the other path
    int scanKind = VisaDevice::ScanGpib;
    std::optional<qint64> seconds{};
    bool json = false;
    bool recursive = false;
    bool force = false;
    bool needsInstrument = false;
    int (*run)(InstrumentArguments &) = nullptr;
};

int runNamed(InstrumentArguments &arguments)
{
    if (arguments.needsInstrument && resourceOf(arguments.resource).isEmpty()) {
        return arguments.console.wrongUsage("RES: the name of the instrument is empty");
    }
    return arguments.run(arguments);
}

/// Runs a job; behind the reason that the program saw goes what the instrument reported, as that
/// tells more.
int runJob(Console &console, InstrumentJob &job)
{
    const int exitCode = console.run(job);
    const QString words = "The instrument reports: " + job.reported();
    if (exitCode == ExitFailed && !job.reported().isEmpty() && console.lastReason() != words) {
        console.error(words);
    }
    return exitCode;
}

/// Makes a job for the instrument of the arguments and runs it.
template <typename Job, typename... Request>
int runOn(const InstrumentArguments &arguments, const Request &...request)
{
    Job job({.resource = resourceOf(arguments.resource)}, request...);
    return runJob(arguments.console, job);
}

/// Ends a command with its result on standard output.
int printed(Console &console, int exitCode, const QByteArray &text)
{
    return exitCode != ExitDone || console.print(text) ? exitCode : console.failed();
}

QJsonObject infoObject(const InstrumentSummary &summary)
{
    QJsonArray rf;
    for (const auto &range : summary.rf) {
        if (range) {
            rf.append(QJsonObject{{"lower", range->lower}, {"upper", range->upper}});
        }
    }
    QJsonArray baseband;
    for (const auto &limits : summary.baseband) {
        if (limits) {
            baseband.append(QJsonObject{{"size", limits->size},
                                        {"clock", limits->clock},
                                        {"bandwidth", limits->bandwidth}});
        }
    }
    return {{"vendor", summary.vendor},
            {"model", summary.model},
            {"serial", summary.serial},
            {"firmware", summary.firmware},
            {"options", summary.options},
            {"interface", summary.interfaceName},
            {"resource", summary.resource},
            {"analyzer", summary.analyzer},
            {"roots", QJsonArray::fromStringList(summary.roots)},
            {"rf", rf},
            {"baseband", baseband}};
}

QByteArray infoLines(const InstrumentSummary &summary)
{
    QList<QPair<QString, QString>> rows{
        {"Vendor", summary.vendor},           {"Model", summary.model},
        {"Serial", summary.serial},           {"Options", summary.options},
        {"Interface", summary.interfaceName}, {"Analyzer", summary.analyzer ? "yes" : "no"}};
    rows += summaryRows(summary);
    QString text;
    for (const auto &[label, value] : std::as_const(rows)) {
        text += (label + ':').leftJustified(16) + value + '\n';
    }
    return text.toLocal8Bit();
}

int runInfo(InstrumentArguments &arguments)
{
    IdentifyJob job({.resource = resourceOf(arguments.resource)});
    const int exitCode = runJob(arguments.console, job);
    return printed(arguments.console, exitCode,
                   arguments.json ? QJsonDocument(infoObject(job.summary())).toJson()
                                  : infoLines(job.summary()));
}

int runScan(InstrumentArguments &arguments)
{
    ScanJob job(arguments.scanKind);
    const int exitCode = arguments.console.run(job);
    QJsonArray objects;
    QString text;
    for (const InstrumentSummary &found : job.found()) {
        objects.append(QJsonObject{{"resource", found.resource},
                                   {"model", found.model},
                                   {"serial", found.serial},
                                   {"interface", found.interfaceName}});
        text +=
            QStringList{found.resource, found.model, found.serial, found.interfaceName}.join('\t') +
            '\n';
    }
    return printed(arguments.console, exitCode,
                   arguments.json ? QJsonDocument(objects).toJson() : text.toLocal8Bit());
}

int runQuery(InstrumentArguments &arguments)
{
    if (arguments.first.isEmpty()) {
        return arguments.console.wrongUsage("COMMAND: the query is empty");
    }
    QueryJob job({.resource = resourceOf(arguments.resource)}, QueryJob::Kind::Query,
                 arguments.first);
    const int exitCode = runJob(arguments.console, job);
    // An answer counts even where the instrument also complained.
    if ((exitCode == ExitDone || !job.answer().isEmpty()) &&
        !arguments.console.print(job.answer().toLocal8Bit() + '\n')) {
        return arguments.console.failed();
    }
    return exitCode;
}

int runSend(InstrumentArguments &arguments)
{
    if (arguments.first.isEmpty()) {
        return arguments.console.wrongUsage("COMMAND: the command is empty");
    }
    return runOn<QueryJob>(arguments, QueryJob::Kind::Command, arguments.first);
}

int runList(InstrumentArguments &arguments)
{
    if (const QString problem = pathProblem(arguments.first); !problem.isEmpty()) {
        return arguments.console.wrongUsage("PATH: " + problem);
    }
    ListJob job({.resource = resourceOf(arguments.resource)}, arguments.first, arguments.recursive);
    const int exitCode = runJob(arguments.console, job);
    QJsonArray objects;
    QString text;
    for (const RemoteFileEntry &entry : job.entries()) {
        objects.append(
            QJsonObject{{"name", entry.name}, {"type", entry.type}, {"size", entry.size}});
        text += entry.type.leftJustified(4) + QString::number(entry.size).rightJustified(12) +
                "  " + entry.name + '\n';
    }
    return printed(arguments.console, exitCode,
                   arguments.json ? QJsonDocument(objects).toJson() : text.toLocal8Bit());
}

/// For the commands that take a path apart into a folder and a name.
int badFullPath(const InstrumentArguments &arguments, const char *name, const QString &path)
{
    const QString problem = fullPathProblem(withoutEndSlash(path));
    return problem.isEmpty() ? ExitDone : arguments.console.wrongUsage(name + problem);
}

int runMakeFolder(InstrumentArguments &arguments)
{
    const int bad = badFullPath(arguments, "PATH: ", arguments.first);
    return bad != ExitDone
               ? bad
               : runOn<EntryJob>(arguments, EntryJob::Operation::MakeFolder, arguments.first);
}

int runRemoveFolder(InstrumentArguments &arguments)
{
    const int bad = badFullPath(arguments, "PATH: ", arguments.first);
    if (bad != ExitDone) {
        return bad;
    }
    return arguments.recursive
               ? runOn<RemoveTreeJob>(arguments, arguments.first)
               : runOn<EntryJob>(arguments, EntryJob::Operation::RemoveFolder, arguments.first);
}

int runMove(InstrumentArguments &arguments)
{
    const int bad = badFullPath(arguments, "OLD: ", arguments.first);
    if (bad != ExitDone) {
        return bad;
    }
    const QString newPath = withoutEndSlash(arguments.second);
    if (const QString problem = pathProblem(newPath); !problem.isEmpty()) {
        return arguments.console.wrongUsage("NEW: " + problem);
    }
    const RemotePath oldParts = splitPath(withoutEndSlash(arguments.first));
    const RemotePath newParts = splitPath(newPath);
    const auto isSameFolder = [](const QString &a, const QString &b) {
        return slashPath(a, '\\') == slashPath(b, '\\');
    };
    if (newParts.fileName.isEmpty() ||
        (!newParts.directory.isEmpty() && !isSameFolder(oldParts.directory, newParts.directory))) {
        return arguments.console.wrongUsage("NEW: '" + newPath + "' is no name in the folder '" +
                                            oldParts.directory + "'");
    }
    return runOn<EntryJob>(arguments, EntryJob::Operation::Rename, arguments.first,
                           newParts.fileName);
}

int runRemoveFile(InstrumentArguments &arguments)
{
    if (const QString problem = pathProblem(arguments.first); !problem.isEmpty()) {
        return arguments.console.wrongUsage("PATH: " + problem);
    }
    return runOn<EntryJob>(arguments, EntryJob::Operation::RemoveFile, arguments.first);
}

int runGet(InstrumentArguments &arguments)
{
    const QString remote = arguments.first;
    QString local = arguments.second;
    if (const QString problem = pathProblem(remote); !problem.isEmpty()) {
        return arguments.console.wrongUsage("REMOTE: " + problem);
    }
    if (local.isEmpty()) {
        return arguments.console.wrongUsage("LOCAL: the file name is empty");
    }
    if (QFileInfo(local).isDir()) {
        local = QDir(local).filePath(splitPath(remote).fileName);
    }
    if (!mayWrite(arguments.console, local, arguments.force)) {
        return arguments.console.failed();
    }
    return runOn<TransferJob>(arguments, TransferJob::Direction::Get, local, remote);
}

int runPut(InstrumentArguments &arguments)
{
    const QString local = arguments.first;
    QString remote = arguments.second;
    if (const QString problem = pathProblem(remote); !problem.isEmpty()) {
        return arguments.console.wrongUsage("REMOTE: " + problem);
    }
    if (!QFileInfo(local).isFile()) {
        arguments.console.error("The local file '" + local + "' does not exist.");
        return arguments.console.failed();
    }
    if (remote.endsWith('/') || remote.endsWith('\\')) {
        remote += QFileInfo(local).fileName();
    }
    return runOn<TransferJob>(arguments, TransferJob::Direction::Put, local, remote);
}

int runStart(InstrumentArguments &arguments)
{
    const QString &path = arguments.first;
    if (const QString problem = pathProblem(path); !problem.isEmpty()) {
        return arguments.console.wrongUsage("REMOTE: " + problem);
    }
    if (!path.endsWith(".wv", Qt::CaseInsensitive)) {
        return arguments.console.wrongUsage("REMOTE: '" + path + "' is no waveform file (*.wv)");
    }
    return runOn<StartJob>(arguments, path,
                           static_cast<int>(arguments.seconds.value_or(StartJob::DefaultSeconds)));
}

} // namespace

void addInstrumentCommands(CommandSet &commands)
{
    CLI::App *instr = commands.app.add_subcommand("instr", "Talk to instruments");
    instr->require_subcommand(1);
    const auto add = [&](const std::string &name, const std::string &help,
                         int (*run)(InstrumentArguments &)) {
        auto arguments = std::make_shared<InstrumentArguments>(
            InstrumentArguments{.console = commands.console, .run = run});
        CLI::App &command = addCommand(*instr, name, help, commands.action, arguments, runNamed);
        return std::pair<CLI::App &, InstrumentArguments &>(command, *arguments);
    };
    const auto addOnDevice = [&](const std::string &name, const std::string &help,
                                 int (*run)(InstrumentArguments &)) {
        auto result = add(name, help, run);
        result.second.needsInstrument = true;
        addText(result.first, "resource", result.second.resource,
                "VISA resource string, host name or address")
            ->type_name("RES")
            ->required();
        return result;
    };
    const auto addArgument = [](CLI::App &command, const std::string &name, QString &value,
                                const std::string &type, const std::string &help) {
        addText(command, name, value, help)->type_name(type)->required();
    };

    auto [scan, scanned] = add("scan", "Find the instruments of an interface", runScan);
    addChoice(scan, "interface", scanned.scanKind, {"gpib", "usb"}, "Interface to look at")
        ->required();
    scan.add_flag("--json", scanned.json, "Print one JSON array");

    auto [info, shown] = addOnDevice("info", "Show what an instrument is and can", runInfo);
    info.add_flag("--json", shown.json, "Print JSON");

    auto [query, asked] = addOnDevice("query", "Send a query and print the answer", runQuery);
    addArgument(query, "command", asked.first, "COMMAND", "Query, such as *IDN?");
    auto [send, sent] = addOnDevice("send", "Send a command", runSend);
    addArgument(send, "command", sent.first, "COMMAND", "Command, such as *RST");

    auto [list, listed] = addOnDevice("ls", "List a folder", runList);
    addArgument(list, "path", listed.first, "PATH", "Folder on the instrument");
    list.add_flag("--json", listed.json, "Print one JSON array");
    list.add_flag("--recursive", listed.recursive, "With all folders below it");
    auto [makeFolder, made] = addOnDevice("mkdir", "Make a folder", runMakeFolder);
    addArgument(makeFolder, "path", made.first, "PATH", "Folder on the instrument");
    auto [removeFolder, removed] = addOnDevice("rmdir", "Remove a folder", runRemoveFolder);
    addArgument(removeFolder, "path", removed.first, "PATH", "Folder on the instrument");
    removeFolder.add_flag("--recursive", removed.recursive, "With all it holds");
    auto [move, moved] = addOnDevice("mv", "Rename a file or folder", runMove);
    addArgument(move, "old", moved.first, "OLD", "Full path on the instrument");
    addArgument(move, "new", moved.second, "NEW", "Name in the same folder, or its full path");
    auto [removeFile, deleted] = addOnDevice("rm", "Delete a file", runRemoveFile);
    addArgument(removeFile, "path", deleted.first, "PATH", "File on the instrument");

    auto [get, fetched] = addOnDevice("get", "Copy a file from the instrument", runGet);
    addArgument(get, "remote", fetched.first, "REMOTE", "File on the instrument");
    addArgument(get, "local", fetched.second, "LOCAL", "Local file, or folder for it");
    get.add_flag("--force", fetched.force, "Overwrite an existing file");
    auto [put, stored] = addOnDevice("put", "Copy a file to the instrument", runPut);
    addArgument(put, "local", stored.first, "LOCAL", "Local file");
    addArgument(put, "remote", stored.second, "REMOTE",
                "File on the instrument, which is replaced if it is there; a folder ends in /");
    auto [start, started] = addOnDevice("run", "Play a waveform file of the instrument", runStart);
    addArgument(start, "remote", started.first, "REMOTE", "Waveform file on the instrument");
    constexpr double MaxSeconds = 86400;
    addInteger(start, "--timeout", started.seconds, {"s", 1, MaxSeconds},
               "Longest wait for the instrument to load it (default: 100 s)");

    addCaptureCommand(*instr, commands);
}
