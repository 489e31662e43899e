// SPDX-License-Identifier: Apache-2.0
#include "hints.h"

#include <QStringList>

#include <algorithm>
#include <numeric>
#include <vector>

namespace {

struct Example
{
    const char *command;
    const char *arguments;
};

constexpr Example Examples[] = {
    {"info", "*.wv --check"},
    {"dump", "fm.wv --from 1000 --count 10"},
    {"measure", "fm.wv --band -100k,100k --limit 'crest<3'"},
    {"plot", "fm.wv -o fm.png --view spectrum"},
    {"export", "fm.wv -o fm.sigmf-meta"},
    {"create function", "--shape sine --freq 100k -o tone.wv"},
    {"create pulse", "--rise 1us --on 10us --blank 100us --ramp rcos -o pulse.wv"},
    {"create chirp", "--on 100us --range 5M -o chirp.wv"},
    {"create fm", "--freq 1k --dev 75k -o fm.wv"},
    {"create sweep", "--shape triangular --dev 1M --time 10ms -o sweep.wv"},
    {"create am", "--mode usb --freq 3k -o usb.wv"},
    {"create multicarrier", "--spacing 15k --carriers 64 --seed 1 -o tones.wv"},
    {"create pm", "--freq 10k --dev 90 -o pm.wv"},
    {"create noise", "--bandwidth 5M --duration 10ms -o noise.wv"},
    {"resample", "fm.wv -o fm2.wv --clock 2M"},
    {"filter", "fm.wv -o narrow.wv --type gauss --bandwidth 50k --param 0.5"},
    {"polar", "fm.wv --phase phase.wv --amplitude amplitude.wv"},
    {"level", "fm.wv -o quiet.wv --peak -6"},
    {"markers", "fm.wv -o marked.wv --marker 1 --from 1 --to 100 --action high"},
    {"crop", "fm.wv -o piece.wv --from 1000 --count 500"},
    {"wrap", "fm.wv -o loop.wv --range 50"},
    {"compose", "scene.cms -o scene.wv"},
    {"import data", "samples.txt -o samples.wv --clock 10M"},
    {"import mat", "iq.mat --variable iq -o iq.wv --clock 10M"},
    {"import riq", "record.riq --packet 1 -o record.wv"},
    {"import wav", "tone.wav -o tone.wv"},
    {"import sigmf", "record.sigmf-meta -o record.wv"},
};

CLI::App *findCommand(CLI::App &app, const QStringList &path)
{
    CLI::App *command = &app;
    for (const QString &name : path) {
        const auto found = command->get_subcommands(
            [&](const CLI::App *sub) { return sub->get_name() == name.toStdString(); });
        if (found.empty()) {
            return nullptr;
        }
        command = found.front();
    }
    return command;
}

/// Letters to be put in, left out, replaced or swapped with their neighbour.
int distance(const QString &one, const QString &other)
{
    const auto width = static_cast<std::size_t>(other.size()) + 1;
    std::vector<int> before(width);
    std::vector<int> row(width);
    std::vector<int> next(width);
    std::iota(row.begin(), row.end(), 0);
    for (qsizetype i = 0; i < one.size(); ++i) {
        next[0] = static_cast<int>(i) + 1;
        for (std::size_t j = 1; j < width; ++j) {
            const auto at = static_cast<qsizetype>(j) - 1;
            const bool isSame = one[i] == other[at];
            next[j] = std::min({row[j] + 1, next[j - 1] + 1, row[j - 1] + (isSame ? 0 : 1)});
            if (i > 0 && at > 0 && one[i] == other[at - 1] && one[i - 1] == other[at]) {
                next[j] = std::min(next[j], before[j - 2] + 1);
            }
        }
        std::swap(before, row);
        std::swap(row, next);
    }
    return row.back();
}

/// The last of the commands that were understood.
const CLI::App *understood(const CLI::App &app)
{
    const CLI::App *command = &app;
    while (!command->get_subcommands().empty()) {
        command = command->get_subcommands().back();
    }
    return command;
}

QStringList knownNames(const CLI::App &command, bool options)
{
    QStringList names;
    if (!options) {
        for (const CLI::App *sub : command.get_subcommands([](const CLI::App *) { return true; })) {
            names << QString::fromStdString(sub->get_name());
        }
        return names;
    }
    for (const CLI::App *at = &command; at != nullptr; at = at->get_parent()) {
        for (const CLI::Option *option : at->get_options()) {
            for (const std::string &name : option->get_lnames()) {
                names << "--" + QString::fromStdString(name);
            }
        }
    }
    return names;
}

} // namespace

void addExamples(CLI::App &app)
{
    const std::string common =
        "\nFor all commands: --quiet, --verbose, --no-progress. Numbers may be written as 10k, "
        "1.5M or 10us.";
    for (const Example &example : Examples) {
        const QString path = example.command;
        if (CLI::App *command = findCommand(app, path.split(' '))) {
            command->footer("Example: corvane-cli " + std::string(example.command) + ' ' +
                            example.arguments + common);
        }
    }
}

QString nearestName(const CLI::App &app, const QString &typed)
{
    constexpr int MostDifferent = 3;
    const QString name = typed.section('=', 0, 0);
    QString nearest;
    int smallest = std::min(MostDifferent, static_cast<int>(name.size()) / 3 + 1);
    const QStringList names = knownNames(*understood(app), name.startsWith('-'));
    for (const QString &known : names) {
        if (const int steps = distance(name, known);
            steps < smallest + (nearest.isEmpty() ? 1 : 0)) {
            smallest = steps;
            nearest = known;
        }
    }
    return nearest;
}
