// SPDX-License-Identifier: Apache-2.0
#include "CliOptions.h"
#include "Console.h"
#include "Presets.h"
#include "RangeArguments.h"
#include "commands.h"

#include "base/EngineeringNumber.h"
#include "jobs/MarkerJob.h"
#include "jobs/WrapJob.h"

#include <vector>

namespace {

const QStringList ActionNames{"high", "low", "toggle", "pattern"};

/// One marker edit as its options are met; each "--marker" begins a new one.
struct EditGroup
{
    std::optional<qint64> marker;
    std::optional<qint64> from; ///< counted from 1
    std::optional<qint64> to;   ///< counted from 1, included
    std::optional<int> action;
    QByteArray pattern;
};

struct MarkerArguments
{
    Console &console;
    MarkerRequest request;
    std::vector<EditGroup> groups;
    OutputArguments output;
};

/// Why a group makes no edit; empty if it does, and `edit` is it.
QString toEdit(const EditGroup &group, std::optional<qint64> samples, MarkerEdit &edit)
{
    if (!group.marker) {
        return "--marker: each group of --from, --to and --action begins with it";
    }
    if (!group.from || !group.to || !group.action) {
        return QString("--marker %1: --from, --to and --action are required").arg(*group.marker);
    }
    edit.mask = static_cast<quint8>(1U << (*group.marker - 1));
    edit.first = *group.from - 1;
    edit.last = *group.to - 1;
    edit.action = static_cast<MarkerAction>(*group.action);
    edit.pattern = group.pattern;
    if ((edit.action == MarkerAction::Pattern) == group.pattern.isEmpty()) {
        return "--pattern: it goes with the action 'pattern'";
    }
    for (const auto &[name, position] : {std::pair{"--from", *group.from}, {"--to", *group.to}}) {
        if (samples && position > *samples) {
            return QString("%1: %2 lies outside the file; permitted: 1 to %3")
                .arg(QLatin1String(name))
                .arg(position)
                .arg(*samples);
        }
    }
    return {};
}

int runMarkers(MarkerArguments &arguments)
{
    const std::optional<WvFileSummary> summary = scanned(arguments.request.inputFile);
    std::optional<qint64> samples;
    if (summary && summary->samples > 0) {
        samples = summary->samples;
    }
    for (const EditGroup &group : arguments.groups) {
        MarkerEdit edit;
        if (const QString problem = toEdit(group, samples, edit); !problem.isEmpty()) {
            return arguments.console.wrongUsage(problem);
        }
        arguments.request.edits.append(edit);
    }
    if (!mayWrite(arguments.console, arguments.output.options.fileName, arguments.output.force)) {
        return arguments.console.failed();
    }
    arguments.request.output = arguments.output.options;
    MarkerJob job(arguments.request);
    return arguments.console.run(job);
}

/// The group that an option belongs to: the one begun last.
EditGroup &openGroup(std::vector<EditGroup> &groups)
{
    if (groups.empty()) {
        groups.emplace_back();
    }
    return groups.back();
}

/// Adds an option that may stand once in each group. Its texts are taken as they are met, so that
/// they fall to the group begun last; that takes an option with the callback at each of them.
template <typename Take>
void addGroupOption(CLI::App &command, const std::string &name, const std::string &type, Take take,
                    const std::string &help)
{
    command.add_option_function<std::string>(name, take, help)
        ->type_name(type)
        ->trigger_on_parse()
        ->multi_option_policy(CLI::MultiOptionPolicy::TakeLast);
}

qint64 positionOf(const std::string &name, const std::string &text)
{
    return takeInteger(name, text, {"", 1, double(MaxSamples)});
}

void addMarkers(CommandSet &commands)
{
    auto markers = std::make_shared<MarkerArguments>(MarkerArguments{commands.console, {}, {}, {}});
    CLI::App &command = addCommand<MarkerArguments>(
        commands.app, "markers",
        "Change marker traces of a waveform; the group from --marker on may be repeated",
        commands.action, markers, runMarkers);
    addText(command, "file", markers->request.inputFile, "Waveform file to read")->required();
    std::vector<EditGroup> &groups = markers->groups;
    addGroupOption(
        command, "--marker", "1..4",
        [&groups](const std::string &text) {
            const qint64 marker = takeInteger("--marker", text, {"", 1, double(MarkerCount)});
            // The options of a group may also stand before its marker, if it is the first.
            if (groups.empty() || groups.back().marker) {
                groups.emplace_back();
            }
            groups.back().marker = marker;
        },
        "Marker to change; begins a group");
    addGroupOption(
        command, "--from", "N",
        [&groups](const std::string &text) { openGroup(groups).from = positionOf("--from", text); },
        "First sample, counted from 1");
    addGroupOption(
        command, "--to", "N",
        [&groups](const std::string &text) { openGroup(groups).to = positionOf("--to", text); },
        "Last sample, included");
    addGroupOption(
        command, "--action", "high|low|toggle|pattern",
        [&groups](const std::string &text) {
            const auto index = ActionNames.indexOf(QString::fromStdString(text));
            if (index < 0) {
                throw CLI::ValidationError("--action: '" + text +
                                           "' is unknown; permitted: high, low, toggle, pattern");
            }
            openGroup(groups).action = static_cast<int>(index);
        },
        "What becomes of the marker");
    addGroupOption(
        command, "--pattern", "BITS",
        [&groups](const std::string &text) {
            if (text.empty() || text.find_first_not_of("01") != std::string::npos) {
                throw CLI::ValidationError("--pattern: '" + text +
                                           "' is no pattern; permitted: the characters 0 and 1");
            }
            openGroup(groups).pattern = QByteArray::fromStdString(text);
        },
        "Sequence of 0 and 1, repeated over the range");
    addNumber(command, "--clock", markers->request.clockHz, {"Hz", MinClockHz, MaxClockHz},
              "Clock written to the file (default: that of the source)");
    addOutputArguments(command, markers->output);
}

struct WrapArguments
{
    Console &console;
    WrapRequest request;
    std::optional<qint64> start; ///< counted from 1
    std::optional<qint64> end;   ///< counted from 1
    std::optional<qint64> range;
    OutputArguments output;
};

/// Why the options don't fit the file, naming the option; empty if they do.
QString wrapUsageProblem(const WrapArguments &arguments)
{
    const std::optional<WvFileSummary> summary = scanned(arguments.request.inputFile);
    if (!summary) {
        return {};
    }
    for (const auto &[name, position] :
         {std::pair{"--start", arguments.start}, {"--end", arguments.end}}) {
        if (position && summary->samples > 0 && *position > summary->samples) {
            return QString("%1: %2 lies outside the file; permitted: 1 to %3")
                .arg(QLatin1String(name))
                .arg(*position)
                .arg(summary->samples);
        }
    }
    const auto cutoff = arguments.request.settings.cutoffHz;
    const double least = 0.01 * summary->clock;
    const double most = 0.5 * summary->clock;
    if (cutoff && summary->clock > 0 && !(*cutoff >= least && *cutoff <= most)) {
        return QString("--cutoff: %1 is out of range; permitted: %2 to %3")
            .arg(engineeringText(*cutoff, "Hz"), engineeringText(least, "Hz"),
                 engineeringText(most, "Hz"));
    }
    return {};
}

int runWrap(WrapArguments &arguments)
{
    if (const QString problem = wrapUsageProblem(arguments); !problem.isEmpty()) {
        return arguments.console.wrongUsage(problem);
    }
    if (!mayWrite(arguments.console, arguments.output.options.fileName, arguments.output.force)) {
        return arguments.console.failed();
    }
    WrapSettings &settings = arguments.request.settings;
    settings.start = arguments.start.value_or(1) - 1;
    if (arguments.end) {
        settings.end = *arguments.end - 1;
    }
    settings.range = static_cast<int>(arguments.range.value_or(settings.range));
    arguments.request.output = arguments.output.options;
    WrapJob job(arguments.request);
    return arguments.console.run(job);
}

void addWrap(CommandSet &commands)
{
    auto wrap = std::make_shared<WrapArguments>(WrapArguments{.console = commands.console,
                                                              .request = {},
                                                              .start = {},
                                                              .end = {},
                                                              .range = {},
                                                              .output = {}});
    CLI::App &command = addCommand<WrapArguments>(
        commands.app, "wrap", "Remove the step of a waveform where its end meets its start",
        commands.action, wrap, runWrap);
    addText(command, "file", wrap->request.inputFile, "Waveform file to read")->required();
    addInteger(command, "--start", wrap->start, {"", 1, double(MaxSamples)},
               "First sample used, counted from 1 (default: 1)");
    addInteger(command, "--end", wrap->end, {"", 1, double(MaxSamples)},
               "Sample behind the last one used, counted from 1 (default: the last one)");
    addNumber(command, "--cutoff", wrap->request.settings.cutoffHz, {"Hz", 0, MaxClockHz / 2},
              "One-sided filter bandwidth (default: a quarter of the clock)");
    addInteger(command, "--range", wrap->range,
               {"", WrapSettings::MinRange, WrapSettings::MaxRange},
               "Samples that are changed on each side (default: 10)");
    addNumber(command, "--clock", wrap->request.clockHz, {"Hz", MinClockHz, MaxClockHz},
              "Clock written to the file (default: that of the source)");
    addOutputArguments(command, wrap->output);
    commands.presets.add(command, "WrapAround",
                         QList<PresetField>{{.option = "--cutoff", .key = "filter", .unit = "Hz"},
                                            {.option = "--range", .key = "range"},
                                            {.option = "--clock", .key = "clock", .unit = "Hz"}} +
                             presetTexts());
}

} // namespace

void addMarkerCommands(CommandSet &commands)
{
    addMarkers(commands);
    addWrap(commands);
}
