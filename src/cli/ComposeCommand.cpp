// SPDX-License-Identifier: Apache-2.0
#include "CliOptions.h"
#include "Console.h"
#include "commands.h"

#include "base/EngineeringNumber.h"
#include "jobs/ComposeJob.h"

#include <QJsonArray>
#include <QJsonDocument>
#include <QJsonObject>

namespace {

struct ComposeArguments
{
    Console &console;
    QString inputFile;
    QString output;
    bool force = false;
    bool singleProcess = false;
    bool list = false;
    bool json = false;
};

QJsonObject jsonOf(const ComposerTarget &target)
{
    return {{"sName", target.sName},       {"iLenMode", target.iLenMode},
            {"bSamples", target.bSamples}, {"lSamples", target.lSamples},
            {"dTime", target.dTime},       {"bClk", target.bClk},
            {"dUsrClk", target.dUsrClk}};
}

QJsonObject jsonOf(const ComposerSegment &segment)
{
    return {{"sName", segment.sName},       {"missing", segment.missing},
            {"dFOfs", segment.dFOfs},       {"dLOfs", segment.dLOfs},
            {"dFadeIn", segment.dFadeIn},   {"iFadeIn", segment.iFadeIn},
            {"dFadeOut", segment.dFadeOut}, {"iFadeOut", segment.iFadeOut},
            {"lSamples", segment.lSamples}, {"dSrcClk", segment.dSrcClk},
            {"lStart", segment.lStart},     {"lUsed", segment.lUsed},
            {"lTarget", segment.lTarget},   {"bMkr", segment.bMkr},
            {"bWrap", segment.bWrap},       {"bAdjOfs", segment.bAdjOfs},
            {"dAdjLim", segment.dAdjLim}};
}

QJsonObject jsonOf(const Composition &document)
{
    QJsonArray tracks;
    for (const ComposerTrack &track : document.tracks()) {
        QJsonArray segments;
        for (const ComposerSegment &segment : track.segments) {
            segments.append(jsonOf(segment));
        }
        tracks.append(QJsonObject{
            {"bEnable", track.bEnable}, {"bSelect", track.bSelect}, {"segments", segments}});
    }
    return {{"target", jsonOf(document.target)}, {"tracks", tracks}};
}

QString textOf(const Composition &document)
{
    const ComposerTarget &target = document.target;
    QString text = QStringLiteral("Target:     %1\nClock Rate: %2\nSamples:    %3\n")
                       .arg(target.sName, engineeringText(target.dUsrClk, QStringLiteral("Hz")))
                       .arg(target.lSamples);
    for (int track = 0; track < document.trackCount(); ++track) {
        const bool enabled = document.tracks()[static_cast<std::size_t>(track)].bEnable;
        text += QStringLiteral("Track %1%2\n")
                    .arg(track + 1)
                    .arg(enabled ? QString() : QStringLiteral(" (disabled)"));
        for (int i = 0; i < document.segmentCount(track); ++i) {
            const ComposerSegment &segment = *document.segment(track, i);
            text +=
                QStringLiteral("  Segment %1: %2 samples from %3 on at sample %4, %5%6\n")
                    .arg(i + 1)
                    .arg(segment.lUsed)
                    .arg(segment.lStart)
                    .arg(segment.lTarget)
                    .arg(segment.sName, segment.missing ? QStringLiteral(" (missing)") : QString());
        }
    }
    return text;
}

int runCompose(ComposeArguments &arguments)
{
    Console &console = arguments.console;
    ComposeRequest request;
    if (!request.composition.load(arguments.inputFile)) {
        return console.failed();
    }
    if (arguments.list) {
        const QByteArray text = arguments.json ? QJsonDocument(jsonOf(request.composition)).toJson()
                                               : textOf(request.composition).toLocal8Bit();
        return console.print(text) ? ExitDone : console.failed();
    }
    if (!arguments.output.isEmpty()) {
        request.composition.target.sName = arguments.output;
    }
    if (!mayWrite(console, request.composition.target.sName, arguments.force)) {
        return console.failed();
    }
    request.overwrite = arguments.force;
    request.multiProcess = !arguments.singleProcess;
    ComposeJob job(std::move(request));
    return console.run(job);
}

} // namespace

void addComposeCommand(CommandSet &commands)
{
    auto compose = std::make_shared<ComposeArguments>(
        ComposeArguments{.console = commands.console, .inputFile = {}, .output = {}});
    CLI::App &command = addCommand<ComposeArguments>(commands.app, "compose",
                                                     "Render a composition into a waveform",
                                                     commands.action, compose, runCompose);
    addText(command, "file", compose->inputFile, "Composition to read")->required();
    addOutputFile(command, compose->output, "Waveform file to write (default: as composed)");
    command.add_flag("--force", compose->force, "Overwrite an existing file");
    command.add_flag("--no-multi-process", compose->singleProcess, "Work on one segment at a time");
    command.add_flag("--list", compose->list, "Show the composition instead of rendering it");
    command.add_flag("--json", compose->json, "With --list: print JSON");
}
