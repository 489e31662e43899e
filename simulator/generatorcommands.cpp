// SPDX-License-Identifier: Apache-2.0
#include "CommandContext.h"
#include "Instrument.h"

#include <unistd.h>

#include <algorithm>
#include <array>
#include <charconv>
#include <string_view>

// The waveform player of generators: below SOURce:BB:ARBitrary where there is a baseband coder,
// below SOURce itself where there is none.

namespace simulator {
namespace {

/// The clock rate that the tags at the start of a waveform file name, in Hz; 0 if they name none.
double clockOf(int fd)
{
    constexpr std::string_view Tag = "{CLOCK:";
    std::array<char, 4096> head{};
    const ssize_t count = ::pread(fd, head.data(), head.size(), 0);
    const std::string_view text(head.data(), static_cast<std::size_t>(std::max<ssize_t>(count, 0)));
    const std::size_t tag = text.find(Tag);
    if (tag == std::string_view::npos) {
        return 0;
    }
    std::string_view number = text.substr(tag + Tag.size());
    number.remove_prefix(std::min(number.find_first_not_of(' '), number.size()));
    double clock = 0;
    (void)std::from_chars(number.data(), number.data() + number.size(), clock);
    return clock;
}

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
    instrument.arb.setClockHz(clockOf(fd.get()));
}

void queryClock(CommandContext &context)
{
    context.respond(context.instrument.arb.clockHz());
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
    Command{
        .pattern = "[:SOURce#]:BB#:ARBitrary:CLOCk", .applies = ToGenerator, .query = queryClock},
    Command{.pattern = "[:SOURce#]:CLOCk", .applies = ToPlainGenerator, .query = queryClock},
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
