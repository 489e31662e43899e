// SPDX-License-Identifier: Apache-2.0
#include "CliOptions.h"
#include "Console.h"
#include "RangeArguments.h"
#include "commands.h"

#include "base/EngineeringNumber.h"
#include "jobs/MeasureJob.h"

#include <QJsonDocument>
#include <QRegularExpression>

#include <cmath>

namespace {

struct MeasureArguments
{
    Console &console;
    SampleRange range;
    bool json = false;
    std::optional<FrequencyBand> band;
    QList<FigureLimit> limits;
};

/// Why the band and the limits don't fit the file or each other; empty if they do.
QString measureUsageProblem(const MeasureArguments &arguments)
{
    const std::optional<WvFileSummary> summary = scanned(arguments.range.fileName);
    if (arguments.band && summary && summary->clock > 0) {
        const double half = summary->clock / 2;
        for (const double edge : {arguments.band->lowHz, arguments.band->highHz}) {
            if (std::fabs(edge) > half) {
                return QString("--band: %1 is out of range; permitted: %2 to %3")
                    .arg(engineeringText(edge, "Hz"), engineeringText(-half, "Hz"),
                         engineeringText(half, "Hz"));
            }
        }
    }
    for (const FigureLimit &limit : arguments.limits) {
        if (limit.name == "bandPower" && !arguments.band) {
            return "--limit: " + limit.text() + " needs the band, by --band";
        }
    }
    return {};
}

int runMeasure(MeasureArguments &arguments)
{
    Console &console = arguments.console;
    int exitCode = ExitDone;
    if (!rangeFits(console, arguments.range, exitCode)) {
        return exitCode;
    }
    if (const QString problem = measureUsageProblem(arguments); !problem.isEmpty()) {
        return console.wrongUsage(problem);
    }
    MeasureJob job(arguments.range, arguments.band);
    exitCode = console.run(job);
    if (exitCode != ExitDone) {
        return exitCode;
    }
    QByteArray text;
    if (arguments.json) {
        text = QJsonDocument(figuresJson(job.result())).toJson();
    } else {
        for (const NamedFigure &figure : namedFigures(job.result())) {
            constexpr qsizetype LabelWidth = 13;
            if (const QString value = figureText(figure); !value.isEmpty()) {
                text += (QString(figure.label) + ':').leftJustified(LabelWidth).toLatin1() +
                        value.toLatin1() + '\n';
            }
        }
    }
    if (!console.print(text)) {
        return console.failed();
    }
    for (const FigureLimit &limit : arguments.limits) {
        if (const QString problem = limitProblem(limit, job.result()); !problem.isEmpty()) {
            console.error(problem);
            exitCode = ExitLimit;
        }
    }
    return exitCode;
}

void addBand(CLI::App &command, std::optional<FrequencyBand> &band)
{
    const auto take = [&band](const std::string &text) {
        const QStringList parts = QString::fromStdString(text).split(',');
        const auto low = parts.size() == 2 ? numberIn(parts[0], "Hz") : std::nullopt;
        const auto high = parts.size() == 2 ? numberIn(parts[1], "Hz") : std::nullopt;
        if (!low || !high || !(*low < *high)) {
            throw CLI::ValidationError("--band: '" + text +
                                       "' is no band; permitted: two frequencies in Hz, the lower "
                                       "one first, such as -5M,5M");
        }
        band = FrequencyBand{*low, *high};
    };
    command
        .add_option_function<std::string>(
            "--band", take, "Measure the power from F1 to F2 (Hz) relative to the whole as well")
        ->type_name("F1,F2");
}

void addLimits(CLI::App &command, QList<FigureLimit> &limits)
{
    QStringList names;
    for (const NamedFigure &figure : namedFigures({})) {
        names += figure.name;
    }
    const auto take = [&limits, names](const std::vector<std::string> &texts) {
        for (const std::string &item : texts) {
            const QString text = QString::fromStdString(item);
            const auto sign = text.indexOf(QRegularExpression("[<>]"));
            const QString name = text.left(sign);
            const auto bound = sign > 0 ? numberIn(text.mid(sign + 1), {}) : std::nullopt;
            if (!bound || !names.contains(name)) {
                throw CLI::ValidationError(
                    "--limit: '" + item +
                    "' is no limit; permitted: NAME<VALUE or NAME>VALUE with NAME one of " +
                    names.join(", ").toStdString());
            }
            limits.append({name, text.at(sign) == '<', *bound});
        }
    };
    command
        .add_option_function<std::vector<std::string>>(
            "--limit", take,
            "End with exit status 3 if the figure isn't below (<) or above (>) the value; may be "
            "repeated. Figures: " +
                names.join(", ").toStdString())
        ->type_name("NAME<VALUE")
        ->allow_extra_args(false);
}

} // namespace

void addMeasureCommand(CommandSet &commands)
{
    auto measure = std::make_shared<MeasureArguments>(
        MeasureArguments{.console = commands.console, .range = {}, .band = {}, .limits = {}});
    CLI::App &measureCommand = addCommand<MeasureArguments>(
        commands.app, "measure", "Measure levels, bandwidth and power distribution",
        commands.action, measure, runMeasure);
    addRange(measureCommand, measure->range);
    addBand(measureCommand, measure->band);
    addLimits(measureCommand, measure->limits);
    measureCommand.add_flag("--json", measure->json, "Print JSON");
}
