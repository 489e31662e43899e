// SPDX-License-Identifier: Apache-2.0
#pragma once

#include "CliOptions.h"
#include "Console.h"
#include "commands.h"

#include "instrument/remotepaths.h"
#include "jobs/instrument/InstrumentJob.h"

#include <memory>
#include <utility>

/// The arguments of the commands on instruments; each uses some of them.
struct InstrumentArguments
{
    Console &console;
    QString resource{};
    QString first{};                  ///< path, or command for the instrument
    QString second{};                 ///< the other path
    std::vector<std::string> paths{}; ///< several local files and the remote path
    QString transcript{};
    int scanKind = 0;
    std::optional<qint64> seconds{};
    std::optional<double> listenSeconds{};
    std::optional<double> frequencyHz{};
    std::optional<double> levelDbm{};
    bool on = false;
    bool off = false;
    bool json = false;
    bool recursive = false;
    bool force = false;
    bool strict = false;
    bool needsInstrument = false;
    int (*run)(InstrumentArguments &) = nullptr;

    [[nodiscard]] WaveformCheck check() const
    {
        return strict ? WaveformCheck::Strict : WaveformCheck::Warned;
    }
};

/// A command below "instr"; its options live as long as it.
struct InstrumentCommand
{
    CLI::App &app;
    InstrumentArguments &arguments;
};

/// Adds a command; `onInstrument` gives it the argument RES.
InstrumentCommand addInstrumentCommand(CLI::App &instr, CommandSet &commands,
                                       const std::string &name, const std::string &help,
                                       int (*run)(InstrumentArguments &), bool onInstrument = true);

/// Adds --transcript, for commands with arguments of their own.
void addTranscript(CLI::App &command, QString &fileName);

/// Begins the transcript, if one is asked for. False, with the reason logged, if it can't be
/// written.
[[nodiscard]] bool startTranscript(const QString &fileName);

/// Runs a job; behind the reason that the program saw goes what the instrument reported, as that
/// tells more.
[[nodiscard]] int runInstrumentJob(Console &console, InstrumentJob &job);

/// Makes a job for the instrument of the arguments and runs it.
template <typename Job, typename... Request>
int runOn(const InstrumentArguments &arguments, const Request &...request)
{
    Job job({.resource = resourceOf(arguments.resource)}, request...);
    return runInstrumentJob(arguments.console, job);
}

/// Ends a command with its result on standard output.
[[nodiscard]] int printed(Console &console, int exitCode, const QByteArray &text);

void addGeneratorCommands(CLI::App &instr, CommandSet &commands);
void addDiscoveryCommands(CLI::App &instr, CommandSet &commands);
