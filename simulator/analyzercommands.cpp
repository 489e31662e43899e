// SPDX-License-Identifier: Apache-2.0
#include "CommandContext.h"
#include "Instrument.h"
#include "Link.h"
#include "ProgramUnit.h"

#include <algorithm>
#include <array>
#include <string>

// The I/Q recorder of signal analyzers.

namespace simulator {
namespace {

constexpr NumberRange FilterRange{"HZ", 300e3, 50e6, 10e6};
constexpr NumberRange SampleRateRange{"HZ", 10e3, 326e6, 32e6};
constexpr std::int64_t MinPretrigger = -16'776'703;
constexpr std::int64_t MaxPretrigger = 65'023;
constexpr std::uint64_t SampleSize = IqSource::SampleSize;
constexpr std::int64_t MaxSamples = 999'999'999 / static_cast<std::int64_t>(SampleSize);
constexpr std::uint64_t MaxTextSamples = 100'000;

constexpr std::string_view ReferenceLevel = "DISPlay[:WINDow#]:TRACe#:Y[:SCALe]:RLEVel";
constexpr std::string_view IfPowerLevel = "TRIGger[:SEQuence]:LEVel:IFPower";

void setIqMode(CommandContext &context)
{
    if (const std::optional<bool> on = context.boolean(0)) {
        context.instrument.analyzer.setIqMode(*on, context.now);
    }
}

void queryIqMode(CommandContext &context)
{
    context.respond(context.instrument.analyzer.isIqMode() ? 1 : 0);
}

// The I/Q inputs are options; an instrument without them refuses their selection.
void setInput(CommandContext &context)
{
    const auto word = context.choice(0, {"RF", "AIQ", "DIQ"});
    if (!word) {
        return;
    }
    constexpr std::array<std::string_view, 3> Options{"", "PAX600-A1", "PAX600-D1"};
    Instrument &instrument = context.instrument;
    if (instrument.setup().options.find(Options.at(*word)) == std::string::npos) {
        context.error(ExecutionError);
        return;
    }
    instrument.analyzer.input = static_cast<AnalyzerInput>(*word);
}

void queryInput(CommandContext &context)
{
    constexpr std::array<std::string_view, 3> Words{"RF", "AIQ", "DIQ"};
    const auto place = static_cast<std::size_t>(context.instrument.analyzer.input);
    context.respond(std::string(Words.at(place)));
}

// TRACe:IQ:SET NORMal,<filter>,<sample rate>,<trigger>,<slope>,<pretrigger samples>,<samples>
void setRecord(CommandContext &context)
{
    const auto filterType = context.choice(0, {"NORMal"});
    if (!filterType) {
        return;
    }
    const auto filter = context.number(1, FilterRange);
    const auto rate = filter ? context.number(2, SampleRateRange) : std::nullopt;
    const auto trigger =
        rate ? context.choice(3, {"IMMediate", "EXTernal", "IFPower"}) : std::nullopt;
    const auto slope = trigger ? context.choice(4, {"NEGative", "POSitive"}) : std::nullopt;
    const auto pretrigger = slope ? context.integer(5, MinPretrigger, MaxPretrigger) : std::nullopt;
    const auto samples = pretrigger ? context.integer(6, 1, MaxSamples) : std::nullopt;
    if (!samples) {
        return;
    }
    IqSettings settings;
    settings.filterHz = *filter;
    settings.sampleRateHz = *rate;
    settings.trigger = static_cast<IqSettings::Trigger>(*trigger);
    settings.positiveSlope = *slope == 1;
    settings.pretriggerSamples = *pretrigger;
    settings.sampleCount = *samples;
    context.instrument.analyzer.configure(settings, context.now);
}

void queryRecord(CommandContext &context)
{
    constexpr std::array<std::string_view, 3> Triggers{"IMM", "EXT", "IFP"};
    const IqSettings &settings = context.instrument.analyzer.settings();
    std::string text =
        "NORM," + numberText(settings.filterHz) + ',' + numberText(settings.sampleRateHz) + ',';
    text += Triggers.at(static_cast<std::size_t>(settings.trigger));
    text += settings.positiveSlope ? ",POS," : ",NEG,";
    text += std::to_string(settings.pretriggerSamples) + ',' + std::to_string(settings.sampleCount);
    context.respond(text);
}

void setSampleRate(CommandContext &context)
{
    if (const auto rate = context.number(0, SampleRateRange)) {
        IqSettings settings = context.instrument.analyzer.settings();
        settings.sampleRateHz = *rate;
        context.instrument.analyzer.configure(settings, context.now);
    }
}

void querySampleRate(CommandContext &context)
{
    context.respond(context.instrument.analyzer.settings().sampleRateHz);
}

void initiate(CommandContext &context)
{
    Instrument &instrument = context.instrument;
    instrument.analyzer.start(
        context.now,
        {.referenceDbm = settingValue(instrument, ReferenceLevel),
         .triggerDbm = settingValue(instrument, IfPowerLevel),
         .delay = std::chrono::milliseconds(instrument.faults().number("slow-sweep").value_or(0))});
}

void abortSweep(CommandContext &context)
{
    context.instrument.analyzer.abort(context.now);
}

void respondText(CommandContext &context, std::uint64_t first, std::uint64_t count)
{
    if (count > MaxTextSamples) {
        context.error(OutOfMemory);
        return;
    }
    const Analyzer &analyzer = context.instrument.analyzer;
    const std::unique_ptr<IqSource> record = analyzer.record(first, count);
    std::string text;
    std::string second;
    const bool pairs = analyzer.format == IqFormat::Pairs;
    for (std::uint64_t place = 0; place < count; ++place) {
        const IqSample sample = record->sample(place);
        text += numberText(sample.i) + ',';
        (pairs ? text : second) += numberText(sample.q) + ',';
    }
    text += second;
    text.pop_back();
    context.respond(text);
}

// The whole record, or <count> samples from number <first> on.
void respondRecord(CommandContext &context, std::uint64_t first, std::uint64_t count)
{
    Analyzer &analyzer = context.instrument.analyzer;
    if (analyzer.isPending(context.now)) {
        context.link.awaitOperation();
    }
    if (analyzer.binary) {
        context.link.respondBlock(analyzer.record(first, count), count * SampleSize);
    } else {
        respondText(context, first, count);
    }
}

void queryMemory(CommandContext &context)
{
    const Analyzer &analyzer = context.instrument.analyzer;
    if (!analyzer.isIqMode()) {
        context.error(SettingsConflict);
        return;
    }
    if (!analyzer.hasRecord()) {
        context.error(DataStale);
        return;
    }
    const std::int64_t total = analyzer.settings().sampleCount;
    std::int64_t first = 0;
    if (context.parameterCount() > 0) {
        const auto given = context.integer(0, 0, total - 1);
        if (!given) {
            return;
        }
        first = *given;
    }
    std::int64_t count = total - first;
    if (context.parameterCount() > 1) {
        const auto given = context.integer(1, 1, total - first);
        if (!given) {
            return;
        }
        count = *given;
    }
    respondRecord(context, static_cast<std::uint64_t>(first), static_cast<std::uint64_t>(count));
}

// Records and answers in one.
void queryData(CommandContext &context)
{
    if (!context.instrument.analyzer.isIqMode()) {
        context.error(SettingsConflict);
        return;
    }
    initiate(context);
    respondRecord(context, 0,
                  static_cast<std::uint64_t>(context.instrument.analyzer.settings().sampleCount));
}

void setDataFormat(CommandContext &context)
{
    if (const auto word = context.choice(0, {"IQPair", "IQBLock", "COMPatible"})) {
        context.instrument.analyzer.format = *word == 0 ? IqFormat::Pairs : IqFormat::Blocks;
    }
}

void queryDataFormat(CommandContext &context)
{
    context.respond(context.instrument.analyzer.format == IqFormat::Pairs ? "IQP" : "IQBL");
}

void setFormat(CommandContext &context)
{
    const auto word = context.choice(0, {"ASCii", "REAL"});
    if (!word) {
        return;
    }
    if (context.parameterCount() > 1) {
        const auto bits = context.integer(1, 0, 64);
        if (!bits) {
            return;
        }
        if (*bits != (*word == 1 ? 32 : 0)) {
            context.error(IllegalParameterValue);
            return;
        }
    }
    context.instrument.analyzer.binary = *word == 1;
}

void queryFormat(CommandContext &context)
{
    context.respond(context.instrument.analyzer.binary ? "REAL,32" : "ASC,0");
}

// A setting of one word out of a list, kept under the command's pattern.
void queryWord(CommandContext &context, std::string_view preset)
{
    const auto found = context.instrument.words.find(context.command.pattern);
    context.respond(found == context.instrument.words.end() ? std::string(preset) : found->second);
}

void setMode(CommandContext &context)
{
    if (context.choice(0, {"SANalyzer"})) {
        context.instrument.words[context.command.pattern] = "SAN";
    }
}

void queryMode(CommandContext &context)
{
    queryWord(context, "SAN");
}

void setPowerUnit(CommandContext &context)
{
    constexpr std::array<const char *, 3> Words{"DBM", "V", "W"};
    if (const auto word = context.choice(0, {"DBM", "V", "W"})) {
        context.instrument.words[context.command.pattern] = Words.at(*word);
    }
}

void queryPowerUnit(CommandContext &context)
{
    queryWord(context, "DBM");
}

void setContinuous(CommandContext &context)
{
    if (const std::optional<bool> on = context.boolean(0)) {
        context.instrument.words[context.command.pattern] = numberText(*on ? 1 : 0);
    }
}

void queryContinuous(CommandContext &context)
{
    queryWord(context, "1");
}

constexpr Command oneParameter(std::string_view pattern, CommandHandler set, CommandHandler query)
{
    return {.pattern = pattern,
            .applies = ToAnalyzer,
            .set = set,
            .query = query,
            .minParameters = 1,
            .maxParameters = 1};
}

constexpr std::array Commands{
    oneParameter("INSTrument[:SELect]", setMode, queryMode),
    oneParameter("TRACe#:IQ[:STATe]", setIqMode, queryIqMode),
    oneParameter("INPut#:SELect", setInput, queryInput),
    Command{.pattern = "TRACe#:IQ:SET",
            .applies = ToAnalyzer,
            .set = setRecord,
            .query = queryRecord,
            .minParameters = 7,
            .maxParameters = 7},
    oneParameter("TRACe#:IQ:SRATe", setSampleRate, querySampleRate),
    Command{.pattern = "TRACe#:IQ:DATA:MEMory",
            .applies = ToAnalyzer,
            .query = queryMemory,
            .maxQueryParameters = 2},
    Command{.pattern = "TRACe#:IQ:DATA", .applies = ToAnalyzer, .query = queryData},
    oneParameter("TRACe#:IQ:DATA:FORMat", setDataFormat, queryDataFormat),
    Command{.pattern = "FORMat[:DATA]",
            .applies = ToAnalyzer,
            .set = setFormat,
            .query = queryFormat,
            .minParameters = 1,
            .maxParameters = 2},
    oneParameter("UNIT:POWer", setPowerUnit, queryPowerUnit),
    Command{.pattern = "INITiate#[:IMMediate]", .applies = ToAnalyzer, .set = initiate},
    oneParameter("INITiate#:CONTinuous", setContinuous, queryContinuous),
    Command{.pattern = "ABORt", .applies = ToAnalyzer, .set = abortSweep},
};

} // namespace

std::span<const Command> analyzerCommands()
{
    return Commands;
}

} // namespace simulator
