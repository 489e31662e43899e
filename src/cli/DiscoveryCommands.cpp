// SPDX-License-Identifier: Apache-2.0
// The commands that find instruments.
#include "InstrumentArguments.h"

#include "base/visibletext.h"
#include "jobs/instrument/ScanJob.h"

#include <QJsonArray>
#include <QJsonDocument>
#include <QJsonObject>

namespace {

int runScan(InstrumentArguments &arguments)
{
    ScanJob job(arguments.scanKind);
    const int exitCode = arguments.console.run(job);
    QJsonArray objects;
    QString text;
    for (const InstrumentSummary &found : job.found()) {
        objects.append(QJsonObject{{"resource", found.resource},
                                   {"model", found.model},
                                   {"serial", found.serial},
                                   {"interface", found.interfaceName}});
        text += visibleText(found.resource) + '\t' + visibleText(found.model) + '\t' +
                visibleText(found.serial) + '\t' + found.interfaceName + '\n';
    }
    return printed(arguments.console, exitCode,
                   arguments.json ? QJsonDocument(objects).toJson() : text.toLocal8Bit());
}

} // namespace

void addDiscoveryCommands(CLI::App &instr, CommandSet &commands)
{
    auto [scan, scanned] = addInstrumentCommand(
        instr, commands, "scan", "Find the instruments of an interface", runScan, false);
    addChoice(scan, "interface", scanned.scanKind, {"gpib", "usb"}, "Interface to look at")
        ->required();
    scan.add_flag("--json", scanned.json, "Print one JSON array");
}
