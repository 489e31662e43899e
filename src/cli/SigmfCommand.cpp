// SPDX-License-Identifier: Apache-2.0
#include "Console.h"
#include "ImportArguments.h"
#include "commands.h"

#include "jobs/SigmfImportJob.h"

namespace {

struct SigmfArguments : ImportArguments
{
    using ImportArguments::ImportArguments;
    std::optional<qint64> channel;
};

int runSigmf(SigmfArguments &arguments)
{
    int exitCode = ExitDone;
    if (!outputStands(arguments, exitCode)) {
        return exitCode;
    }
    SigmfImportJob job({.inputFile = arguments.inputFile,
                        .target = arguments.target(),
                        .channel = static_cast<int>(arguments.channel.value_or(1)),
                        .clockFromFile = !arguments.clockHz.has_value()});
    return arguments.console.run(job);
}

} // namespace

void addSigmfCommand(CLI::App &import, CommandSet &commands)
{
    auto sigmf = std::make_shared<SigmfArguments>(commands.console);
    CLI::App &command = addCommand<SigmfArguments>(
        import, "sigmf", "Import a SigMF recording; annotations M1 to M4 become markers",
        commands.action, sigmf, runSigmf);
    addImportOptions(command, *sigmf, "Recording to read: .sigmf-meta, .sigmf-data or .sigmf",
                     " (default: the recording's sample rate)");
    constexpr double MaxChannels = 65536;
    addInteger(command, "--channel", sigmf->channel, {{}, 1, MaxChannels},
               "Channel to import, from 1 (default: 1)");
    addImportPresets(command, commands, "Sigmf2Wv");
}
