// SPDX-License-Identifier: Apache-2.0
// Whether an instrument can play a waveform.
#include "InstrumentArguments.h"

#include "jobs/instrument/ScanJob.h"

#include <QJsonArray>
#include <QJsonDocument>
#include <QJsonObject>

namespace {

struct CheckArguments
{
    Console &console;
    QString file{};
    QString resource{};
    QString model{};
    bool json = false;
};

int runCheck(CheckArguments &arguments)
{
    Console &console = arguments.console;
    InstrumentSummary instrument;
    if (arguments.resource.isEmpty() == arguments.model.isEmpty()) {
        return console.wrongUsage("give either --for RES or --model NAME");
    }
    const bool namesModel = summaryOfModel(arguments.resource).has_value();
    const QString modelName = namesModel ? arguments.resource : arguments.model;
    if (!modelName.isEmpty()) {
        const std::optional<InstrumentSummary> model = summaryOfModel(modelName);
        if (!model) {
            return console.wrongUsage("--model: '" + arguments.model +
                                      "' is no model that is known here");
        }
        instrument = *model;
    }
    const std::optional<WaveformNeeds> needs = needsOf(arguments.file);
    if (!needs) {
        return console.failed();
    }
    if (modelName.isEmpty()) {
        IdentifyJob job({.resource = resourceOf(arguments.resource)});
        if (const int exitCode = runInstrumentJob(console, job); exitCode != ExitDone) {
            return exitCode;
        }
        instrument = job.summary();
    }
    const QStringList problems = waveformProblems(*needs, instrument);
    const QJsonObject object{{"ok", problems.isEmpty()},
                             {"problems", QJsonArray::fromStringList(problems)}};
    const QString text = problems.isEmpty() ? QString("ok") : problems.join('\n');
    const int exitCode =
        printed(console, ExitDone,
                arguments.json ? QJsonDocument(object).toJson() : text.toLocal8Bit() + '\n');
    return exitCode != ExitDone || problems.isEmpty() ? exitCode : int{ExitLimit};
}

} // namespace

void addCheckCommand(CommandSet &commands)
{
    const auto state =
        std::make_shared<CheckArguments>(CheckArguments{.console = commands.console});
    CLI::App &command =
        addCommand(commands.app, "check", "Tell whether an instrument can play a waveform",
                   commands.action, state, runCheck);
    addText(command, "file", state->file, "Waveform file")->type_name("FILE")->required();
    addText(command, "--for", state->resource, "Instrument that is to play it, or its model")
        ->type_name("RES|MODEL");
    addText(command, "--model", state->model,
            "Model that is to play it, with the largest memory that it is sold with")
        ->type_name("NAME");
    command.add_flag("--json", state->json, "Print JSON");
    command.footer("Exit status 3: it can't.\n"
                   "Example: corvane-cli check a.wv --for TGX-870");
}
