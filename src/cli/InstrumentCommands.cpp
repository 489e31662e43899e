// SPDX-License-Identifier: Apache-2.0
#include "InstrumentArguments.h"

#include "base/visibletext.h"
#include "instrument/InstrumentSummary.h"
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
        text += (label + ':').leftJustified(16) + visibleText(value) + '\n';
    }
    return text.toLocal8Bit();
}

int runInfo(InstrumentArguments &arguments)
{
    IdentifyJob job({.resource = resourceOf(arguments.resource)});
    const int exitCode = runInstrumentJob(arguments.console, job);
    return printed(arguments.console, exitCode,
                   arguments.json ? QJsonDocument(infoObject(job.summary())).toJson()
                                  : infoLines(job.summary()));
}

int runQuery(InstrumentArguments &arguments)
{
    if (arguments.first.isEmpty()) {
        return arguments.console.wrongUsage("COMMAND: the query is empty");
    }
    QueryJob job({.resource = resourceOf(arguments.resource)}, QueryJob::Kind::Query,
                 arguments.first);
    const int exitCode = runInstrumentJob(arguments.console, job);
    // An answer counts even where the instrument also complained.
    if ((exitCode == ExitDone || !job.answer().isEmpty()) &&
        !arguments.console.print(visibleText(job.answer()).toLocal8Bit() + '\n')) {
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
    const int exitCode = runInstrumentJob(arguments.console, job);
    QJsonArray objects;
    QString text;
    for (const RemoteFileEntry &entry : job.entries()) {
        objects.append(
            QJsonObject{{"name", entry.name}, {"type", entry.type}, {"size", entry.size}});
        text += entry.type.leftJustified(4) + QString::number(entry.size).rightJustified(12) +
                "  " + visibleText(entry.name) + '\n';
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
    return runOn<TransferJob>(arguments,
                              TransferJob::Request{.direction = TransferJob::Direction::Get,
                                                   .locals = {local},
                                                   .remote = remote,
                                                   .existing = existingFile(arguments.force)});
}

int runPut(InstrumentArguments &arguments)
{
    Console &console = arguments.console;
    QStringList locals;
    for (const std::string &path : arguments.paths) {
        locals.append(QString::fromLocal8Bit(path));
    }
    const QString remote = locals.takeLast();
    if (const QString problem = pathProblem(remote); !problem.isEmpty()) {
        return console.wrongUsage("REMOTE: " + problem);
    }
    const bool isFolder = remote.endsWith('/') || remote.endsWith('\\');
    if (locals.size() > 1 && !isFolder) {
        return console.wrongUsage("REMOTE: '" + remote +
                                  "' is no folder for several files; a folder ends in /");
    }
    for (const QString &local : std::as_const(locals)) {
        if (!QFileInfo(local).isFile()) {
            console.error("The local file '" + local + "' does not exist.");
            return console.failed();
        }
    }
    return runOn<TransferJob>(arguments,
                              TransferJob::Request{.direction = TransferJob::Direction::Put,
                                                   .locals = locals,
                                                   .remote = remote,
                                                   .check = arguments.check()});
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
    StartJob job({.resource = resourceOf(arguments.resource)}, path,
                 static_cast<int>(arguments.seconds.value_or(StartJob::DefaultSeconds)));
    job.setCheck(arguments.check());
    return runInstrumentJob(arguments.console, job);
}

} // namespace

void addInstrumentCommands(CommandSet &commands)
{
    CLI::App *instr = commands.app.add_subcommand("instr", "Talk to instruments");
    instr->require_subcommand(1);
    const auto add = [&](const std::string &name, const std::string &help,
                         int (*run)(InstrumentArguments &)) {
        return addInstrumentCommand(*instr, commands, name, help, run);
    };
    const auto addArgument = [](CLI::App &command, const std::string &name, QString &value,
                                const std::string &type, const std::string &help) {
        addText(command, name, value, help)->type_name(type)->required();
    };
    const auto addStrict = [](InstrumentCommand &command) {
        command.app.add_flag("--strict", command.arguments.strict,
                             "Refuse a waveform that the instrument can't play");
    };

    addDiscoveryCommands(*instr, commands);
    auto [info, shown] = add("info", "Show what an instrument is and can", runInfo);
    info.add_flag("--json", shown.json, "Print JSON");
    info.footer("Example: corvane-cli instr info 192.168.1.20 --json");

    auto [query, asked] = add("query", "Send a query and print the answer", runQuery);
    addArgument(query, "command", asked.first, "COMMAND", "Query, such as *IDN?");
    query.footer("Example: corvane-cli instr query 192.168.1.20 '*IDN?'");
    auto [send, sent] = add("send", "Send a command", runSend);
    addArgument(send, "command", sent.first, "COMMAND", "Command, such as *RST");
    send.footer("Example: corvane-cli instr send 192.168.1.20 ':OUTP ON'");

    auto [list, listed] = add("ls", "List a folder", runList);
    addArgument(list, "path", listed.first, "PATH", "Folder on the instrument");
    list.add_flag("--json", listed.json, "Print one JSON array");
    list.add_flag("--recursive", listed.recursive, "With all folders below it");
    list.footer("Example: corvane-cli instr ls 192.168.1.20 /var/user/ --recursive");
    auto [makeFolder, made] = add("mkdir", "Make a folder", runMakeFolder);
    addArgument(makeFolder, "path", made.first, "PATH", "Folder on the instrument");
    makeFolder.footer("Example: corvane-cli instr mkdir 192.168.1.20 /var/user/waves");
    auto [removeFolder, removed] = add("rmdir", "Remove a folder", runRemoveFolder);
    addArgument(removeFolder, "path", removed.first, "PATH", "Folder on the instrument");
    removeFolder.add_flag("--recursive", removed.recursive, "With all it holds");
    removeFolder.footer(
        "Example: corvane-cli instr rmdir 192.168.1.20 /var/user/waves --recursive");
    auto [move, moved] = add("mv", "Rename a file or folder", runMove);
    addArgument(move, "old", moved.first, "OLD", "Full path on the instrument");
    addArgument(move, "new", moved.second, "NEW", "Name in the same folder, or its full path");
    move.footer("Example: corvane-cli instr mv 192.168.1.20 /var/user/a.wv b.wv");
    auto [removeFile, deleted] = add("rm", "Delete a file", runRemoveFile);
    addArgument(removeFile, "path", deleted.first, "PATH", "File on the instrument");
    removeFile.footer("Example: corvane-cli instr rm 192.168.1.20 /var/user/a.wv");

    auto [get, fetched] = add("get", "Copy a file from the instrument", runGet);
    addArgument(get, "remote", fetched.first, "REMOTE", "File on the instrument");
    addArgument(get, "local", fetched.second, "LOCAL", "Local file, or folder for it");
    get.add_flag("--force", fetched.force, "Overwrite an existing file");
    get.footer("Example: corvane-cli instr get 192.168.1.20 /var/user/a.wv a.wv");
    InstrumentCommand put = add("put", "Copy files to the instrument", runPut);
    constexpr int MinPaths = 2;
    put.app
        .add_option("paths", put.arguments.paths,
                    "Local files, and the file on the instrument, which is replaced if it is "
                    "there; a folder ends in /")
        ->type_name("LOCAL... REMOTE")
        ->expected(MinPaths, CLI::detail::expected_max_vector_size)
        ->required();
    addStrict(put);
    put.app.footer("Example: corvane-cli instr put 192.168.1.20 a.wv b.wv /var/user/");
    InstrumentCommand start = add("run", "Play a waveform file of the instrument", runStart);
    addArgument(start.app, "remote", start.arguments.first, "REMOTE",
                "Waveform file (*.wv) on the instrument");
    constexpr double MaxSeconds = 86400;
    addInteger(start.app, "--timeout", start.arguments.seconds, {"s", 1, MaxSeconds},
               "Longest wait for the instrument to load it (default: 100 s)");
    addStrict(start);
    start.app.footer("The RF output stays as it is.\n"
                     "Example: corvane-cli instr run 192.168.1.20 /var/user/a.wv");

    addGeneratorCommands(*instr, commands);
    addCaptureCommand(*instr, commands);
}
