// SPDX-License-Identifier: Apache-2.0
#include "InstrumentArguments.h"

#include "instrument/Transcript.h"

namespace {

int runNamed(InstrumentArguments &arguments)
{
    if (arguments.needsInstrument && resourceOf(arguments.resource).isEmpty()) {
        return arguments.console.wrongUsage("RES: the name of the instrument is empty");
    }
    return startTranscript(arguments.transcript) ? arguments.run(arguments)
                                                 : arguments.console.failed();
}

} // namespace

InstrumentCommand addInstrumentCommand(CLI::App &instr, CommandSet &commands,
                                       const std::string &name, const std::string &help,
                                       int (*run)(InstrumentArguments &), bool onInstrument)
{
    auto arguments = std::make_shared<InstrumentArguments>(InstrumentArguments{
        .console = commands.console, .needsInstrument = onInstrument, .run = run});
    CLI::App &command = addCommand(instr, name, help, commands.action, arguments, runNamed);
    if (onInstrument) {
        addText(command, "resource", arguments->resource,
                "VISA resource string, host name or address")
            ->type_name("RES")
            ->required();
    }
    addTranscript(command, arguments->transcript);
    return {command, *arguments};
}

void addTranscript(CLI::App &command, QString &fileName)
{
    addText(command, "--transcript", fileName,
            "Append to FILE what is said and answered, with the time in ms")
        ->type_name("FILE");
}

bool startTranscript(const QString &fileName)
{
    return fileName.isEmpty() || Transcript::start(fileName);
}

int runInstrumentJob(Console &console, InstrumentJob &job)
{
    const int exitCode = console.run(job);
    const QString words = "The instrument reports: " + job.reported();
    if (exitCode == ExitFailed && !job.reported().isEmpty() && console.lastReason() != words) {
        console.error(words);
    }
    return exitCode;
}

int printed(Console &console, int exitCode, const QByteArray &text)
{
    return exitCode != ExitDone || console.print(text) ? exitCode : console.failed();
}
