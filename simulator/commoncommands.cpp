// SPDX-License-Identifier: Apache-2.0
#include "CommandContext.h"
#include "Instrument.h"
#include "Link.h"

#include <array>
#include <utility>

// The commands that IEEE 488.2, chapter 10, gives every instrument.

namespace simulator {
namespace {

constexpr std::int64_t MaxByte = 255;

void clearStatus(CommandContext &context)
{
    context.instrument.errors.clear();
    context.instrument.status.clear();
}

void setEventEnable(CommandContext &context)
{
    if (const auto value = context.integer(0, 0, MaxByte)) {
        context.instrument.status.eventEnable = static_cast<unsigned>(*value);
    }
}

void queryEventEnable(CommandContext &context)
{
    context.respond(context.instrument.status.eventEnable);
}

void queryEventStatus(CommandContext &context)
{
    context.respond(std::exchange(context.instrument.status.events, 0));
}

void queryIdentification(CommandContext &context)
{
    context.respond(context.instrument.identification());
}

void completeOperation(CommandContext &context)
{
    context.instrument.status.completionPending = true;
}

void queryOperationComplete(CommandContext &context)
{
    if (context.instrument.isOperationPending(context.now)) {
        context.link.awaitOperation();
    }
    context.respond(context.instrument.faults().has("opc-zero") ? "0" : "1");
}

void queryOptions(CommandContext &context)
{
    const std::string &options = context.instrument.setup().options;
    context.respond(options.empty() ? "0" : options);
}

void reset(CommandContext &context)
{
    context.instrument.reset();
}

// Bit 6 has no enable bit: the master summary would depend on itself.
void setServiceEnable(CommandContext &context)
{
    if (const auto value = context.integer(0, 0, MaxByte)) {
        context.instrument.status.serviceEnable =
            static_cast<unsigned>(*value) & ~static_cast<unsigned>(MasterSummary);
    }
}

void queryServiceEnable(CommandContext &context)
{
    context.respond(context.instrument.status.serviceEnable);
}

void queryStatusByte(CommandContext &context)
{
    context.respond(context.instrument.statusByte(context.link));
}

void trigger(CommandContext &context)
{
    context.instrument.trigger();
}

void querySelfTest(CommandContext &context)
{
    context.respond("0");
}

void waitToContinue(CommandContext &context)
{
    context.link.holdForOperation();
}

constexpr std::array Commands{
    Command{.pattern = "*CLS", .set = clearStatus},
    Command{.pattern = "*ESE",
            .set = setEventEnable,
            .query = queryEventEnable,
            .minParameters = 1,
            .maxParameters = 1},
    Command{.pattern = "*ESR", .query = queryEventStatus},
    Command{.pattern = "*IDN", .query = queryIdentification},
    Command{.pattern = "*OPC", .set = completeOperation, .query = queryOperationComplete},
    Command{.pattern = "*OPT", .query = queryOptions},
    Command{.pattern = "*RST", .set = reset},
    Command{.pattern = "*SRE",
            .set = setServiceEnable,
            .query = queryServiceEnable,
            .minParameters = 1,
            .maxParameters = 1},
    Command{.pattern = "*STB", .query = queryStatusByte},
    Command{.pattern = "*TRG", .set = trigger},
    Command{.pattern = "*TST", .query = querySelfTest},
    Command{.pattern = "*WAI", .set = waitToContinue},
};

} // namespace

std::span<const Command> commonCommands()
{
    return Commands;
}

} // namespace simulator
