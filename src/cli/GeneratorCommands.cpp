// SPDX-License-Identifier: Apache-2.0
// The commands on what a generator plays.
#include "InstrumentArguments.h"

#include "base/EngineeringNumber.h"
#include "base/visibletext.h"
#include "jobs/instrument/GeneratorJob.h"

#include <QJsonDocument>
#include <QJsonObject>
#include <QJsonValue>

namespace {

QJsonValue jsonOf(const std::optional<bool> &value)
{
    return value ? QJsonValue(*value) : QJsonValue();
}

QJsonValue jsonOf(const std::optional<double> &value)
{
    return value ? QJsonValue(*value) : QJsonValue();
}

QByteArray stateJson(const GeneratorState &state)
{
    return QJsonDocument(
               QJsonObject{{"waveform",
                            state.waveform.isEmpty() ? QJsonValue() : QJsonValue(state.waveform)},
                           {"arb", jsonOf(state.arb)},
                           {"clock", jsonOf(state.clockHz)},
                           {"frequency", jsonOf(state.frequencyHz)},
                           {"level", jsonOf(state.levelDbm)},
                           {"output", jsonOf(state.output)}})
        .toJson();
}

QString textOf(const std::optional<double> &value, const QString &unit)
{
    return value ? engineeringText(*value, unit) : QString("-");
}

QString textOf(const std::optional<bool> &value)
{
    return value ? QString(*value ? "on" : "off") : QString("-");
}

QByteArray stateText(const GeneratorState &state)
{
    const QString waveform = state.waveform.isEmpty() ? QString("-") : visibleText(state.waveform);
    // Levels are no numbers for prefixes: 1500 mdBm is no level that anybody writes.
    const QString level = state.levelDbm ? QString("%1 dBm").arg(*state.levelDbm) : QString("-");
    QString text;
    for (const auto &[label, value] :
         {std::pair{"Waveform:", waveform}, std::pair{"ARB:", textOf(state.arb)},
          std::pair{"Clock:", textOf(state.clockHz, "Hz")},
          std::pair{"Frequency:", textOf(state.frequencyHz, "Hz")}, std::pair{"Level:", level},
          std::pair{"RF output:", textOf(state.output)}}) {
        text += QString(label).leftJustified(16) + value + '\n';
    }
    return text.toLocal8Bit();
}

int runState(InstrumentArguments &arguments)
{
    GeneratorJob job({.resource = resourceOf(arguments.resource)}, GeneratorJob::Operation::Read);
    const int exitCode = runInstrumentJob(arguments.console, job);
    return printed(arguments.console, exitCode,
                   arguments.json ? stateJson(job.state()) : stateText(job.state()));
}

int runRf(InstrumentArguments &arguments)
{
    GeneratorChange change{.frequencyHz = arguments.frequencyHz, .levelDbm = arguments.levelDbm};
    if (arguments.on || arguments.off) {
        change.output = arguments.on;
    }
    if (!change.frequencyHz && !change.levelDbm && !change.output) {
        return arguments.console.wrongUsage("nothing to set: give --freq, --level, --on or --off");
    }
    return runOn<GeneratorJob>(arguments, GeneratorJob::Operation::Change, change);
}

int runStop(InstrumentArguments &arguments)
{
    return runOn<GeneratorJob>(arguments, GeneratorJob::Operation::StopArb);
}

} // namespace

void addGeneratorCommands(CLI::App &instr, CommandSet &commands)
{
    using C = GeneratorChange;
    auto [state, shown] = addInstrumentCommand(
        instr, commands, "state", "Show what a generator plays and how its RF is set", runState);
    state.add_flag("--json", shown.json, "Print JSON");
    state.footer("Example: corvane-cli instr state 192.168.1.20 --json");
    auto [rf, set] =
        addInstrumentCommand(instr, commands, "rf", "Set the RF side of a generator", runRf);
    addNumber(rf, "--freq", set.frequencyHz, {"Hz", C::MinFrequencyHz, C::MaxFrequencyHz},
              "Frequency in Hz, within the range of the instrument (default: as it is)");
    addNumber(rf, "--level", set.levelDbm, {"dBm", C::MinLevelDbm, C::MaxLevelDbm},
              "Level in dBm, within the range of the instrument (default: as it is)");
    CLI::Option *on = rf.add_flag("--on", set.on, "Switch the RF output on");
    rf.add_flag("--off", set.off, "Switch the RF output off")->excludes(on);
    rf.footer("Example: corvane-cli instr rf 192.168.1.20 --freq 1.5G --level -10 --on");
    const InstrumentCommand stop = addInstrumentCommand(
        instr, commands, "stop", "Stop playing; the RF output stays as it is", runStop);
    stop.app.footer("Example: corvane-cli instr stop 192.168.1.20");
}
