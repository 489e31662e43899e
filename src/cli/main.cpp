// SPDX-License-Identifier: Apache-2.0
#include "Console.h"
#include "Presets.h"
#include "commands.h"
#include "hints.h"

#include <CLI/CLI.hpp>
#include <QGuiApplication>

#include <algorithm>
#include <clocale>
#include <cstdio>
#include <exception>
#include <functional>
#include <memory>
#include <sstream>
#include <string>
#include <string_view>
#include <utility>
#include <vector>

namespace {

/// The first argument that is no option: those before a command take no values.
template <typename Iterator>
Iterator findCommand(Iterator begin, Iterator end)
{
    return std::find_if(begin, end,
                        [](std::string_view argument) { return !argument.starts_with('-'); });
}

/// Only pictures need fonts and painters; all else starts without the window system's modules, and
/// nothing needs a display.
std::unique_ptr<QCoreApplication> makeApplication(int &argc, char **argv)
{
    char **const command = findCommand(argv + std::min(argc, 1), argv + argc);
    if (command == argv + argc || *command != std::string_view("plot")) {
        return std::make_unique<QCoreApplication>(argc, argv);
    }
    qputenv("QT_QPA_PLATFORM", "offscreen");
    return std::make_unique<QGuiApplication>(argc, argv);
}

/// The toolkit's own remarks are no lines of ours; they show with the debug messages.
void logToolkitMessage(QtMsgType, const QMessageLogContext &, const QString &text)
{
    Tracer::Trace(Tracer::Debug, text);
}

/// The library writes what a flag stands for behind its negative name, and two empty lines between
/// groups.
class HelpFormatter : public CLI::Formatter
{
public:
    std::string make_help(const CLI::App *app, std::string name,
                          CLI::AppFormatMode mode) const override
    {
        QString help =
            QString::fromStdString(CLI::Formatter::make_help(app, std::move(name), mode));
        return help.replace("\n\n\n", "\n\n").toStdString();
    }

    std::string make_option_name(const CLI::Option *option, bool isPositional) const override
    {
        const QString name =
            QString::fromStdString(CLI::Formatter::make_option_name(option, isPositional));
        return QString(name).remove("{false}").toStdString();
    }
};

/// ": a, b, c", the commands of which one must follow what was typed; empty where one does.
QString missingCommands(const CLI::App &app)
{
    const CLI::App *typed = &app;
    while (!typed->get_subcommands().empty()) {
        typed = typed->get_subcommands().front();
    }
    QStringList names;
    for (const CLI::App *command : typed->get_subcommands([](const CLI::App *) { return true; })) {
        names.append(QString::fromStdString(command->get_name()));
    }
    return names.isEmpty() ? QString() : ": " + names.join(", ");
}

/// A mistyped command or option leaves another one missing; what was typed is the better hint.
QString usageProblem(const CLI::App &app, const CLI::ParseError &problem)
{
    const std::vector<std::string> unknown = app.remaining(true);
    if (unknown.empty()) {
        const QString text = QString::fromLocal8Bit(problem.what());
        return problem.get_name() == "RequiredError" ? text + missingCommands(app) : text;
    }
    const QString typed = QString::fromLocal8Bit(unknown.front());
    const QString nearest = nearestName(app, typed);
    return QString("'%1' is no command, option or argument known here; %2see --help.")
        .arg(typed, nearest.isEmpty() ? QString() : QString("did you mean '%1'? Or ").arg(nearest));
}

/// The arguments, last one first, as the parser takes them. Where several files may stand it takes
/// a name in brackets for a list of names.
std::vector<std::string> argumentsOf(int argc, char **argv)
{
    std::vector<std::string> arguments(argv + std::min(argc, 1), argv + argc);
    const auto command = findCommand(arguments.begin(), arguments.end());
    const auto takesFiles = [&] {
        return *command == "info" || (*command == "instr" && std::find(command, arguments.end(),
                                                                       "put") != arguments.end());
    };
    if (command != arguments.end() && takesFiles()) {
        std::for_each(command, arguments.end(), [](std::string &argument) {
            if (argument.starts_with('[')) {
                argument.insert(0, "./");
            }
        });
    }
    std::reverse(arguments.begin(), arguments.end());
    return arguments;
}

int run(int argc, char **argv)
{
    Console::reserveStandardStreams();
    qInstallMessageHandler(logToolkitMessage);
    const std::unique_ptr<QCoreApplication> application = makeApplication(argc, argv);
    // Numbers are written with a point, whatever the terminal's language.
    std::setlocale(LC_NUMERIC, "C");
    Console console;
    std::function<int()> action;

    CLI::App app("Workbench for the waveforms of arbitrary-waveform signal generators");
    app.name("corvane-cli");
    app.formatter(std::make_shared<HelpFormatter>());
    app.set_version_flag("--version", std::string("corvane-cli ") + CORVANE_VERSION);
    app.require_subcommand(1);
    app.fallthrough();
    bool quiet = false;
    bool verbose = false;
    bool noProgress = false;
    app.add_flag("--quiet", quiet, "No report lines");
    app.add_flag("--verbose", verbose, "The whole log, debug messages included");
    app.add_flag("--no-progress", noProgress, "No progress bar on a terminal");

    Presets presets;
    CommandSet commands{app, console, action, presets};
    addFileCommands(commands);
    addMeasureCommand(commands);
    addPlotCommand(commands);
    addCreateCommands(commands);
    addEditCommands(commands);
    addFilterCommands(commands);
    addMarkerCommands(commands);
    addImportCommands(commands);
    addComposeCommand(commands);
    addCheckCommand(commands);
    addInstrumentCommands(commands);
    addCompletionCommand(commands);
    addExamples(app);
    try {
        app.parse(argumentsOf(argc, argv));
        presets.load();
    } catch (const CLI::ParseError &problem) {
        // The library's own codes tell only help and version, which are no errors, from the rest.
        if (problem.get_exit_code() == static_cast<int>(CLI::ExitCodes::Success)) {
            std::ostringstream text;
            app.exit(problem, text);
            return console.print(QByteArray::fromStdString(text.str())) ? ExitDone
                                                                        : console.failed();
        }
        if (argc < 2) {
            std::fputs(app.help().c_str(), stderr);
        }
        return console.wrongUsage(usageProblem(app, problem));
    }
    console.setQuiet(quiet);
    console.setVerbose(verbose);
    console.setShowProgress(!noProgress);
    const int code = action();
    return code != ExitDone || presets.save() ? code : console.failed();
}

} // namespace

int main(int argc, char **argv)
{
    try {
        return run(argc, argv);
    } catch (const std::exception &problem) {
        // Only memory can run out here: the parser's exceptions end where it is called.
        std::fprintf(stderr, "error: %s\n", problem.what());
    } catch (...) {
        std::fputs("error: unknown failure\n", stderr);
    }
    return ExitFailed;
}
