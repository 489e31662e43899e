// SPDX-License-Identifier: Apache-2.0
#include "CommandContext.h"
#include "Instrument.h"
#include "ProgramUnit.h"

#include <algorithm>
#include <array>

// Settings that are only kept and told back.

namespace simulator {
namespace {

void setNumber(CommandContext &context);
void queryNumber(CommandContext &context);
void setSwitch(CommandContext &context);
void querySwitch(CommandContext &context);

struct Setting
{
    Command command;
    NumberRange range;
};

constexpr Setting setting(std::string_view pattern, unsigned applies, NumberRange range)
{
    return {.command = {.pattern = pattern,
                        .applies = applies,
                        .set = setNumber,
                        .query = queryNumber,
                        .minParameters = 1,
                        .maxParameters = 1,
                        .maxQueryParameters = 1},
            .range = range};
}

constexpr std::array Settings{
    setting("[:SOURce#]:FREQuency[:CW]", ToGenerators, {"HZ", 9e3, 6e9, 1e9}),
    setting("[:SOURce#]:POWer[:LEVel][:IMMediate][:AMPLitude]", ToGenerators,
            {"DBM", -145, 30, -30}),
    setting("[:SENSe#]:FREQuency:CENTer", ToAnalyzer, {"HZ", 0, 26.5e9, 1e9}),
    setting("[:SENSe#]:FREQuency:SPAN", ToAnalyzer, {"HZ", 0, 26.5e9, 10e6}),
    setting("INPut#:ATTenuation", ToAnalyzer, {"DB", 0, 75, 10}),
    setting("DISPlay[:WINDow#]:TRACe#:Y[:SCALe]:RLEVel", ToAnalyzer, {"DBM", -130, 30, -10}),
    setting("TRIGger[:SEQuence]:LEVel:IFPower", ToAnalyzer, {"DBM", -70, 30, -20}),
};

constexpr auto numberCommands()
{
    std::array<Command, Settings.size() + 1> commands{};
    for (std::size_t i = 0; i < Settings.size(); ++i) {
        commands[i] = Settings[i].command;
    }
    commands.back() = {.pattern = "OUTPut#[:STATe]",
                       .applies = ToGenerators,
                       .set = setSwitch,
                       .query = querySwitch,
                       .minParameters = 1,
                       .maxParameters = 1};
    return commands;
}

constexpr auto Commands = numberCommands();

const NumberRange &rangeOf(std::string_view pattern)
{
    const auto *found =
        std::find_if(Settings.begin(), Settings.end(),
                     [pattern](const Setting &entry) { return entry.command.pattern == pattern; });
    static constexpr NumberRange None;
    return found == Settings.end() ? None : found->range;
}

void setNumber(CommandContext &context)
{
    const std::string_view pattern = context.command.pattern;
    if (const std::optional<double> value = context.number(0, rangeOf(pattern))) {
        context.instrument.numbers[pattern] = *value;
    }
}

// A query may ask for a limit or the preset by its word.
void queryNumber(CommandContext &context)
{
    const std::string_view pattern = context.command.pattern;
    if (context.parameterCount() == 0) {
        context.respond(settingValue(context.instrument, pattern));
    } else if (const std::optional<double> value = context.number(0, rangeOf(pattern))) {
        context.respond(*value);
    }
}

void setSwitch(CommandContext &context)
{
    if (const std::optional<bool> on = context.boolean(0)) {
        context.instrument.numbers[context.command.pattern] = *on ? 1 : 0;
    }
}

void querySwitch(CommandContext &context)
{
    context.respond(settingValue(context.instrument, context.command.pattern));
}

} // namespace

double settingValue(const Instrument &instrument, std::string_view pattern)
{
    const auto found = instrument.numbers.find(pattern);
    return found == instrument.numbers.end() ? rangeOf(pattern).preset : found->second;
}

std::span<const Command> settingCommands()
{
    return Commands;
}

} // namespace simulator
