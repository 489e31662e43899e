// SPDX-License-Identifier: Apache-2.0
#include "CommandContext.h"
#include "Instrument.h"
#include "Link.h"
#include "ProgramUnit.h"

#include <array>

// MMEMory: files and folders.

namespace simulator {
namespace {

void report(CommandContext &context, int error)
{
    if (error != NoError) {
        context.error(error);
    }
}

// The fault that stands for an instrument which fails only after all bytes have moved.
void reportAfterTransfer(CommandContext &context)
{
    const Faults &faults = context.instrument.faults();
    if (faults.has("error-after-transfer")) {
        context.error(
            static_cast<int>(faults.number("error-after-transfer").value_or(SystemError)));
    }
}

std::string entryText(std::string_view name, std::string_view type, std::uint64_t size)
{
    std::string text(name);
    text.append(",").append(type).append(",").append(std::to_string(size));
    return quoted(text);
}

// The answer is `used,free,"name,type,size",...`. A catalog that cannot be read is answered with an
// empty line besides its error, so that a controller need not wait for its time-out.
void queryCatalog(CommandContext &context)
{
    std::string path;
    if (context.parameterCount() > 0) {
        const std::optional<std::string> given = context.string(0);
        if (!given) {
            return;
        }
        path = *given;
    }
    Instrument &instrument = context.instrument;
    MassMemory::Catalog catalog;
    int error = instrument.memory.catalog(path, catalog);
    if (instrument.faults().has("empty-dir-469") &&
        (error == FileNameNotFound || (error == NoError && catalog.entries.empty()))) {
        error = DirectoryEmpty;
    }
    if (error != NoError) {
        context.error(error);
        context.respond(std::string());
        return;
    }
    std::string text = std::to_string(catalog.usedBytes) + ',' + std::to_string(catalog.freeBytes);
    if (!catalog.filtered) {
        text += ",\".,DIR,0\",\"..,DIR,0\"";
    }
    for (const MassMemory::Entry &entry : catalog.entries) {
        text += ',' + entryText(entry.name, entry.type, entry.size);
    }
    context.respond(text);
}

// The content itself went to the file while it came; what is left is to tell how that ended.
void storeData(CommandContext &context)
{
    if (context.unit.parameters[1].kind != Parameter::Kind::Block || !context.link.hasTransfer()) {
        context.error(DataTypeError);
        return;
    }
    report(context, context.link.transferError());
    if (context.link.transferError() == NoError) {
        reportAfterTransfer(context);
    }
}

void queryData(CommandContext &context)
{
    if (context.parameterCount() == 0) {
        context.error(MissingParameter);
        return;
    }
    const std::optional<std::string> path = context.string(0);
    if (!path) {
        return;
    }
    UniqueFd fd;
    std::uint64_t size = 0;
    if (const int error = context.instrument.memory.openForReading(*path, fd, size);
        error != NoError) {
        context.error(error);
        return;
    }
    context.link.respondBlock(std::make_unique<FileSource>(std::move(fd)), size);
    reportAfterTransfer(context);
}

void deleteFile(CommandContext &context)
{
    if (const std::optional<std::string> path = context.string(0)) {
        report(context, context.instrument.memory.remove(*path));
    }
}

void makeDirectory(CommandContext &context)
{
    if (const std::optional<std::string> path = context.string(0)) {
        report(context, context.instrument.memory.makeDirectory(*path));
    }
}

void removeDirectory(CommandContext &context)
{
    if (const std::optional<std::string> path = context.string(0)) {
        report(context, context.instrument.memory.removeDirectory(*path));
    }
}

void changeDirectory(CommandContext &context)
{
    if (const std::optional<std::string> path = context.string(0)) {
        report(context, context.instrument.memory.changeDirectory(*path));
    }
}

void queryDirectory(CommandContext &context)
{
    context.respond(quoted(context.instrument.memory.currentDirectory()));
}

void moveFile(CommandContext &context)
{
    const std::optional<std::string> from = context.string(0);
    const std::optional<std::string> to = from ? context.string(1) : std::nullopt;
    if (to) {
        report(context, context.instrument.memory.move(*from, *to));
    }
}

void copyFile(CommandContext &context)
{
    const std::optional<std::string> from = context.string(0);
    const std::optional<std::string> to = from ? context.string(1) : std::nullopt;
    if (to) {
        report(context, context.instrument.memory.copy(*from, *to));
    }
}

constexpr Command pathCommand(std::string_view pattern, CommandHandler set)
{
    return {.pattern = pattern, .set = set, .minParameters = 1, .maxParameters = 1};
}

constexpr Command twoPathsCommand(std::string_view pattern, CommandHandler set)
{
    return {.pattern = pattern, .set = set, .minParameters = 2, .maxParameters = 2};
}

constexpr std::array Commands{
    Command{.pattern = "MMEMory:CATalog", .query = queryCatalog, .maxQueryParameters = 1},
    Command{.pattern = FileDataPattern,
            .set = storeData,
            .query = queryData,
            .minParameters = 2,
            .maxParameters = 2,
            .maxQueryParameters = 1},
    pathCommand("MMEMory:DELete", deleteFile),
    pathCommand("MMEMory:MDIRectory", makeDirectory),
    pathCommand("MMEMory:RDIRectory", removeDirectory),
    Command{.pattern = "MMEMory:CDIRectory",
            .set = changeDirectory,
            .query = queryDirectory,
            .minParameters = 1,
            .maxParameters = 1},
    pathCommand("MMEMory:MSIS", changeDirectory),
    twoPathsCommand("MMEMory:MOVE", moveFile),
    twoPathsCommand("MMEMory:COPY", copyFile),
};

} // namespace

std::span<const Command> memoryCommands()
{
    return Commands;
}

} // namespace simulator
