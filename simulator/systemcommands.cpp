// SPDX-License-Identifier: Apache-2.0
#include "CommandContext.h"
#include "Instrument.h"
#include "ProgramUnit.h"

#include <array>

// SYSTem and STATus, and the door through which tests switch faults.

namespace simulator {
namespace {

void queryError(CommandContext &context)
{
    context.respond(context.instrument.errors.take());
}

void queryErrorCount(CommandContext &context)
{
    context.respond(static_cast<double>(context.instrument.errors.size()));
}

void queryAllErrors(CommandContext &context)
{
    ErrorQueue &errors = context.instrument.errors;
    std::string text = errors.take();
    while (!errors.isEmpty()) {
        text += ',' + errors.take();
    }
    context.respond(text);
}

void queryVersion(CommandContext &context)
{
    context.respond("1999.0");
}

void preset(CommandContext &context)
{
    context.instrument.reset();
}

void setTerminator(CommandContext &context)
{
    if (const auto word = context.choice(0, {"STANdard", "EOI"})) {
        context.instrument.setEndsOnEoiOnly(*word == 1);
    }
}

void queryTerminator(CommandContext &context)
{
    context.respond(context.instrument.endsOnEoiOnly() ? "EOI" : "STAN");
}

void setFault(CommandContext &context)
{
    const std::optional<std::string> name = context.string(0);
    if (!name) {
        return;
    }
    std::string value;
    if (context.parameterCount() > 1) {
        const Parameter &parameter = context.unit.parameters[1];
        value = parameter.kind == Parameter::Kind::Number ? numberText(parameter.value)
                                                          : parameter.text;
    }
    Instrument &instrument = context.instrument;
    std::string reason;
    if (!instrument.faults().set(*name, value, reason)) {
        context.error(IllegalParameterValue);
        return;
    }
    if (*name == "queue") {
        for (std::int64_t i = instrument.faults().number("queue").value_or(0); i > 0; --i) {
            context.error(SystemError);
        }
    }
}

void queryFaults(CommandContext &context)
{
    context.respond(quoted(context.instrument.faults().list()));
}

void clearFaults(CommandContext &context)
{
    if (context.parameterCount() == 0) {
        context.instrument.faults().clear();
    } else if (const std::optional<std::string> name = context.string(0)) {
        context.instrument.faults().clear(*name);
    }
}

StatusGroup &group(CommandContext &context)
{
    StatusRegisters &status = context.instrument.status;
    return context.command.pattern.find("QUES") == std::string_view::npos ? status.operation
                                                                          : status.questionable;
}

void queryCondition(CommandContext &context)
{
    context.respond(group(context).condition());
}

void queryEvents(CommandContext &context)
{
    context.respond(group(context).takeEvents());
}

template <unsigned StatusGroup::*Register>
void setRegister(CommandContext &context)
{
    if (const auto value = context.integer(0, 0, 65535)) {
        group(context).*Register = static_cast<unsigned>(*value) & StatusGroup::Mask;
    }
}

template <unsigned StatusGroup::*Register>
void queryRegister(CommandContext &context)
{
    context.respond(group(context).*Register);
}

void presetStatus(CommandContext &context)
{
    context.instrument.status.operation.preset();
    context.instrument.status.questionable.preset();
}

template <unsigned StatusGroup::*Register>
constexpr Command registerCommand(std::string_view pattern)
{
    return {.pattern = pattern,
            .set = setRegister<Register>,
            .query = queryRegister<Register>,
            .minParameters = 1,
            .maxParameters = 1};
}

constexpr std::array Commands{
    Command{.pattern = "SYSTem:ERRor[:NEXT]", .query = queryError},
    Command{.pattern = "SYSTem:ERRor:COUNt", .query = queryErrorCount},
    Command{.pattern = "SYSTem:ERRor:ALL", .query = queryAllErrors},
    Command{.pattern = "SYSTem:VERSion", .query = queryVersion},
    Command{.pattern = "SYSTem:PRESet", .set = preset},
    Command{.pattern = "SYSTem:COMMunicate:GPIB[:SELF]:LTERminator",
            .set = setTerminator,
            .query = queryTerminator,
            .minParameters = 1,
            .maxParameters = 1},
    Command{.pattern = "SYSTem:FAULt",
            .set = setFault,
            .query = queryFaults,
            .minParameters = 1,
            .maxParameters = 2},
    Command{.pattern = "SYSTem:FAULt:CLEar", .set = clearFaults, .maxParameters = 1},
    Command{.pattern = "STATus:OPERation:CONDition", .query = queryCondition},
    Command{.pattern = "STATus:OPERation[:EVENt]", .query = queryEvents},
    registerCommand<&StatusGroup::enable>("STATus:OPERation:ENABle"),
    registerCommand<&StatusGroup::positive>("STATus:OPERation:PTRansition"),
    registerCommand<&StatusGroup::negative>("STATus:OPERation:NTRansition"),
    Command{.pattern = "STATus:QUEStionable:CONDition", .query = queryCondition},
    Command{.pattern = "STATus:QUEStionable[:EVENt]", .query = queryEvents},
    registerCommand<&StatusGroup::enable>("STATus:QUEStionable:ENABle"),
    registerCommand<&StatusGroup::positive>("STATus:QUEStionable:PTRansition"),
    registerCommand<&StatusGroup::negative>("STATus:QUEStionable:NTRansition"),
    Command{.pattern = "STATus:PRESet", .set = presetStatus},
    Command{.pattern = "STATus:QUEue[:NEXT]", .query = queryError},
};

} // namespace

std::span<const Command> systemCommands()
{
    return Commands;
}

} // namespace simulator
