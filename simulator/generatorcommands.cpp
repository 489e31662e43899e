// SPDX-License-Identifier: Apache-2.0
#include "CommandContext.h"
#include "Instrument.h"

#include <array>

// The waveform player of generators: below SOURce:BB:ARBitrary where there is a baseband coder,
// below SOURce itself where there is none.

namespace simulator {
namespace {

void selectWaveform(CommandContext &context)
{
    const std::optional<std::string> path = context.string(0);
    if (!path) {
        return;
    }
    Instrument &instrument = context.instrument;
    UniqueFd fd;
    std::uint64_t size = 0;
    if (const int error = instrument.memory.openForReading(*path, fd, size); error != NoError) {
        context.error(error);
        return;
    }
    instrument.arb.select(*path, size, instrument.faults().number("busy"), context.now);
}

void querySelection(CommandContext &context)
{
    context.respond(quoted(context.instrument.arb.selection()));
}

void setState(CommandContext &context)
{
    const std::optional<bool> on = context.boolean(0);
    if (!on) {
        return;
    }
    if (*on && context.instrument.arb.selection().empty()) {
        context.error(SettingsConflict);
    } else {
        context.instrument.arb.setOn(*on);
    }
}

void queryState(CommandContext &context)
{
    context.respond(context.instrument.arb.isOn() ? 1 : 0);
}

void queryProgress(CommandContext &context)
{
    context.respond(context.instrument.arb.progressPercent(context.now));
}

constexpr Command selectCommand(std::string_view pattern, unsigned applies)
{
    return {.pattern = pattern,
            .applies = applies,
            .set = selectWaveform,
            .query = querySelection,
            .minParameters = 1,
            .maxParameters = 1};
}

constexpr Command stateCommand(std::string_view pattern, unsigned applies)
{
    return {.pattern = pattern,
            .applies = applies,
            .set = setState,
            .query = queryState,
            .minParameters = 1,
            .maxParameters = 1};
}

constexpr std::array Commands{
    selectCommand("[:SOURce#]:BB#:ARBitrary:WAVeform:SELect", ToGenerator),
    stateCommand("[:SOURce#]:BB#:ARBitrary:STATe", ToGenerator),
    Command{.pattern = "[:SOURce#]:BB#:PROGress:MCODer",
            .applies = ToGenerator,
            .query = queryProgress},
    selectCommand("[:SOURce#]:WAVeform:SELect", ToPlainGenerator),
    stateCommand("[:SOURce#]:STATe", ToPlainGenerator),
};

} // namespace

std::span<const Command> generatorCommands()
{
    return Commands;
}

} // namespace simulator
