// SPDX-License-Identifier: Apache-2.0
#include "CliOptions.h"
#include "Console.h"
#include "commands.h"

#include "instrument/InstrumentSummary.h"
#include "instrument/VisaDevice.h"
#include "instrument/remotepaths.h"
#include "jobs/ToolJob.h"

#include <QCoreApplication>
#include <QDir>
#include <QFileInfo>
#include <QJsonArray>
#include <QJsonDocument>
#include <QJsonObject>

#include <algorithm>

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
};

using Work = std::function<bool(VisaDevice &)>;

/// Runs some work on a device of its own, which SIGINT cancels through the job.
class DeviceJob final : public ToolJob
{
public:
    /// With a resource, the work finds the device open.
    DeviceJob(Console &console, QString resource, QString label, Work work)
        : m_console(console)
        , m_resource(std::move(resource))
        , m_label(std::move(label))
        , m_work(std::move(work))
    {
    }

    /// The instrument's own words on a failure that has another reason besides.
    [[nodiscard]] const QString &instrumentWords() const { return m_instrumentWords; }

private:
    [[nodiscard]] bool work() override
    {
        VisaDevice device;
        const JobStep step(*this, m_label, device);
        if (const QString problem = device.takeLastError(); !problem.isEmpty()) {
            m_console.error(problem);
        }
        const bool isReady = m_resource.isEmpty() || device.openResource(m_resource);
        // A SIGINT from while the instrument was being opened.
        QCoreApplication::processEvents();
        if (isCancelled()) {
            return false;
        }
        if (!isReady && m_console.lastReason().isEmpty()) {
            m_console.error("The instrument '" + m_resource + "' cannot be reached.");
        }
        const bool done = isReady && m_work(device);
        if (!done && !isCancelled()) {
            explain(device);
        }
        return done;
    }

    void explain(VisaDevice &device)
    {
        if (device.isOpen()) {
            device.checkErrorQueue();
        }
        const QString reported = device.takeLastError().trimmed().replace('\n', "; ");
        if (!reported.isEmpty()) {
            m_instrumentWords = "The instrument reports: " + reported;
        }
        if (m_console.lastReason().isEmpty()) {
            m_console.error(reported.isEmpty() ? "The instrument did not do as it was told."
                                               : m_instrumentWords);
            m_instrumentWords.clear();
        }
    }

    Console &m_console;
    QString m_resource;
    QString m_label;
    Work m_work;
    QString m_instrumentWords;
};

int runSession(const InstrumentArguments &arguments, const QString &label, const Work &work)
{
    const QString resource = resourceOf(arguments.resource);
    if (resource.isEmpty()) {
        return arguments.console.wrongUsage("RES: the name of the instrument is empty");
    }
    DeviceJob job(arguments.console, resource, label, work);
    const int exitCode = arguments.console.run(job);
    // Behind the reason that the program saw, as they tell more.
    if (exitCode == ExitFailed && !job.instrumentWords().isEmpty()) {
        arguments.console.error(job.instrumentWords());
    }
    return exitCode;
}

/// Ends a command with its result on standard output.
int printed(Console &console, int exitCode, const QByteArray &text)
{
    return exitCode != ExitDone || console.print(text) ? exitCode : console.failed();
}

/// What an instrument refuses without an answer of its own stands in its error queue.
Work checked(const Work &work)
{
    return [work](VisaDevice &device) { return work(device) && device.checkErrorQueue(); };
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
    InstrumentSummary summary;
    const int exitCode = runSession(arguments, "Reading...", [&](VisaDevice &device) {
        summary = summaryOf(device);
        return true;
    });
    return printed(arguments.console, exitCode,
                   arguments.json ? QJsonDocument(infoObject(summary)).toJson()
                                  : infoLines(summary));
}

int runScan(InstrumentArguments &arguments)
{
    QJsonArray objects;
    QString text;
    const Work scan = [&](VisaDevice &device) {
        // The scan lets no events through by itself.
        QObject::connect(&device, &VisaDevice::ProgressUpdate, &device,
                         [] { QCoreApplication::processEvents(); });
        QList<VisaDevice *> found;
        const bool done = device.scanResources(found, arguments.scanKind);
        for (const VisaDevice *instrument : std::as_const(found)) {
            objects.append(QJsonObject{{"resource", instrument->resource()},
                                       {"model", instrument->model()},
                                       {"serial", instrument->serial()},
                                       {"interface", instrument->interfaceName()}});
            text += QStringList{instrument->resource(), instrument->model(), instrument->serial(),
                                instrument->interfaceName()}
                        .join('\t') +
                    '\n';
        }
        qDeleteAll(found);
        return done;
    };
    DeviceJob job(arguments.console, {}, "Scanning...", scan);
    const int exitCode = arguments.console.run(job);
    return printed(arguments.console, exitCode,
                   arguments.json ? QJsonDocument(objects).toJson() : text.toLocal8Bit());
}

int runQuery(InstrumentArguments &arguments)
{
    if (arguments.first.isEmpty()) {
        return arguments.console.wrongUsage("COMMAND: the query is empty");
    }
    QString answer;
    const int exitCode = runSession(arguments, "Reading...", [&](VisaDevice &device) {
        return device.queryText(arguments.first, answer);
    });
    // An answer counts even where the instrument also complained.
    if ((exitCode == ExitDone || !answer.isEmpty()) &&
        !arguments.console.print(answer.toLocal8Bit() + '\n')) {
        return arguments.console.failed();
    }
    return exitCode;
}

int runSend(InstrumentArguments &arguments)
{
    const QString &command = arguments.first;
    if (command.isEmpty()) {
        return arguments.console.wrongUsage("COMMAND: the command is empty");
    }
    return runSession(arguments, "Sending...", [&](VisaDevice &device) {
        // After a query that nobody reads, the answer to the next one would be that of this one.
        const bool leavesAnswer = command.contains('?') && !command.contains("*OPC?");
        return device.sendCommand(command) && (leavesAnswer || device.checkErrorQueue());
    });
}

int runList(InstrumentArguments &arguments)
{
    if (const QString problem = pathProblem(arguments.first); !problem.isEmpty()) {
        return arguments.console.wrongUsage("PATH: " + problem);
    }
    QList<RemoteFileEntry> entries;
    const int exitCode = runSession(arguments, "Reading...", [&](VisaDevice &device) {
        return arguments.recursive
                   ? device.listTreeEntries(entries, withoutEndSlash(arguments.first))
                   : device.listDirectory(entries, arguments.first);
    });
    QJsonArray objects;
    QString text;
    for (const RemoteFileEntry &entry : std::as_const(entries)) {
        objects.append(
            QJsonObject{{"name", entry.name}, {"type", entry.type}, {"size", entry.size}});
        text += entry.type.leftJustified(4) + QString::number(entry.size).rightJustified(12) +
                "  " + entry.name + '\n';
    }
    return printed(arguments.console, exitCode,
                   arguments.json ? QJsonDocument(objects).toJson() : text.toLocal8Bit());
}

/// For the commands that take one folder apart into its parent and its name.
int runOnFolder(InstrumentArguments &arguments, const QString &label,
                bool (VisaDevice::*operation)(const QString &, const QString &))
{
    const QString path = withoutEndSlash(arguments.first);
    if (const QString problem = fullPathProblem(path); !problem.isEmpty()) {
        return arguments.console.wrongUsage("PATH: " + problem);
    }
    const RemotePath parts = splitPath(path);
    return runSession(arguments, label, checked([&](VisaDevice &device) {
                          return (device.*operation)(parts.directory, parts.fileName);
                      }));
}

int runMakeFolder(InstrumentArguments &arguments)
{
    return runOnFolder(arguments, "Creating folder...", &VisaDevice::makeDirectory);
}

int runRemoveFolder(InstrumentArguments &arguments)
{
    return runOnFolder(arguments, "Deleting Files...",
                       arguments.recursive ? &VisaDevice::removeTree
                                           : &VisaDevice::removeDirectory);
}

int runMove(InstrumentArguments &arguments)
{
    const QString oldPath = withoutEndSlash(arguments.first);
    const QString newPath = withoutEndSlash(arguments.second);
    if (const QString problem = fullPathProblem(oldPath); !problem.isEmpty()) {
        return arguments.console.wrongUsage("OLD: " + problem);
    }
    if (const QString problem = pathProblem(newPath); !problem.isEmpty()) {
        return arguments.console.wrongUsage("NEW: " + problem);
    }
    const RemotePath oldParts = splitPath(oldPath);
    const RemotePath newParts = splitPath(newPath);
    const auto isSameFolder = [](const QString &a, const QString &b) {
        return slashPath(a, '\\') == slashPath(b, '\\');
    };
    if (newParts.fileName.isEmpty() ||
        (!newParts.directory.isEmpty() && !isSameFolder(oldParts.directory, newParts.directory))) {
        return arguments.console.wrongUsage("NEW: '" + newPath + "' is no name in the folder '" +
                                            oldParts.directory + "'");
    }
    return runSession(arguments, "Renaming...", checked([&](VisaDevice &device) {
                          return device.renameEntry(oldParts.directory, oldParts.fileName,
                                                    newParts.fileName);
                      }));
}

int runRemoveFile(InstrumentArguments &arguments)
{
    if (const QString problem = pathProblem(arguments.first); !problem.isEmpty()) {
        return arguments.console.wrongUsage("PATH: " + problem);
    }
    return runSession(arguments, "Deleting...", [&](VisaDevice &device) {
        return device.deleteRemoteFile(arguments.first, false);
    });
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
    return runSession(arguments, "Reading file...", [&](VisaDevice &device) {
        return device.readRemoteFile(remote, local, OutputFile::Unfinished::Vanishes);
    });
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
    return runSession(arguments, "Sending file...",
                      [&](VisaDevice &device) { return device.writeRemoteFile(local, remote); });
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
    return runSession(arguments, "Starting ARB...", [&](VisaDevice &device) {
        const auto seconds =
            static_cast<int>(arguments.seconds.value_or(VisaDevice::DefaultArbSeconds));
        return device.startArb(path, seconds);
    });
}

} // namespace

void addInstrumentCommands(CommandSet &commands)
{
    CLI::App *instr = commands.app.add_subcommand("instr", "Talk to instruments");
    instr->require_subcommand(1);
    const auto add = [&](const std::string &name, const std::string &help,
                         int (*run)(InstrumentArguments &)) {
        auto arguments =
            std::make_shared<InstrumentArguments>(InstrumentArguments{.console = commands.console});
        CLI::App &command = addCommand(*instr, name, help, commands.action, arguments, run);
        return std::pair<CLI::App &, InstrumentArguments &>(command, *arguments);
    };
    const auto addOnDevice = [&](const std::string &name, const std::string &help,
                                 int (*run)(InstrumentArguments &)) {
        auto result = add(name, help, run);
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
    constexpr double maxSeconds = 86400;
    addInteger(start, "--timeout", started.seconds, {"s", 1, maxSeconds},
               "Longest wait for the instrument to load it (default: 100 s)");
}
