// SPDX-License-Identifier: Apache-2.0
// The commands that find instruments.
#include "InstrumentArguments.h"

#include "base/visibletext.h"
#include "jobs/instrument/DoctorJob.h"
#include "jobs/instrument/LanScanJob.h"
#include "jobs/instrument/ScanJob.h"

#include <QJsonArray>
#include <QJsonDocument>
#include <QJsonObject>

namespace {

constexpr int ScanLan = 2; ///< behind the kinds of VisaDevice

QString row(const QStringList &texts)
{
    QStringList visible;
    for (const QString &text : texts) {
        visible.append(visibleText(text));
    }
    return visible.join('\t') + '\n';
}

QJsonObject objectOf(const InstrumentSummary &found)
{
    return {{"resource", found.resource},
            {"model", found.model},
            {"serial", found.serial},
            {"interface", found.interfaceName}};
}

QStringList textsOf(const InstrumentSummary &found)
{
    return {found.resource, found.model, found.serial, found.interfaceName};
}

/// Nothing on the standard output would leave one in doubt whether anything was asked.
void tellIfNone(qsizetype found, int exitCode, const char *advice)
{
    if (found == 0 && exitCode == 0) {
        Tracer::Trace(Tracer::Warning, QString("No instrument answered. %1").arg(advice));
    }
}

int runLanScan(InstrumentArguments &arguments)
{
    LanScanJob job(arguments.listenSeconds.value_or(LanScanJob::DefaultSeconds));
    const int exitCode = arguments.console.run(job);
    tellIfNone(job.found().size(), exitCode,
               "'corvane-cli instr doctor HOST' looks where the way to one ends.");
    QJsonArray objects;
    QString text;
    for (const LanInstrument &found : job.found()) {
        QJsonObject object = objectOf(found.summary);
        object["found"] = QJsonArray::fromStringList(found.found);
        object["resources"] = QJsonArray::fromStringList(found.resources);
        objects.append(object);
        text += row(textsOf(found.summary) + QStringList{found.found.join(',')});
    }
    return printed(arguments.console, exitCode,
                   arguments.json ? QJsonDocument(objects).toJson() : text.toLocal8Bit());
}

int runScan(InstrumentArguments &arguments)
{
    if (arguments.scanKind == ScanLan) {
        return runLanScan(arguments);
    }
    if (arguments.listenSeconds) {
        return arguments.console.wrongUsage("--time: only of a scan of the network");
    }
    ScanJob job(arguments.scanKind);
    const int exitCode = arguments.console.run(job);
    tellIfNone(job.found().size(), exitCode, "Check that it is on and its cable is plugged in.");
    QJsonArray objects;
    QString text;
    for (const InstrumentSummary &found : job.found()) {
        objects.append(objectOf(found));
        text += row(textsOf(found));
    }
    return printed(arguments.console, exitCode,
                   arguments.json ? QJsonDocument(objects).toJson() : text.toLocal8Bit());
}

int runDoctor(InstrumentArguments &arguments)
{
    const QString host = arguments.first.trimmed();
    if (host.isEmpty() || hostOf(resourceOf(host)) != host) {
        return arguments.console.wrongUsage("HOST: '" + host + "' is no host name or address");
    }
    DoctorJob job(host);
    const int exitCode = arguments.console.run(job);
    QJsonArray objects;
    QString text;
    for (const DoctorStep &step : job.steps()) {
        objects.append(QJsonObject{
            {"step", step.step}, {"ok", step.ok}, {"text", step.text}, {"advice", step.advice}});
        text += (step.ok ? "ok    " : "FAIL  ") + step.step.leftJustified(12) + ' ' +
                visibleText(step.text) + (step.advice.isEmpty() ? QString() : ' ' + step.advice) +
                '\n';
    }
    // What was found counts above all where there is no way.
    if (!arguments.console.print(arguments.json ? QJsonDocument(objects).toJson()
                                                : text.toLocal8Bit())) {
        return arguments.console.failed();
    }
    return exitCode;
}

} // namespace

void addDiscoveryCommands(CLI::App &instr, CommandSet &commands)
{
    auto [scan, scanned] = addInstrumentCommand(
        instr, commands, "scan", "Find the instruments of an interface", runScan, false);
    addChoice(scan, "interface", scanned.scanKind, {"gpib", "usb", "lan"}, "Interface to look at")
        ->required();
    scan.add_flag("--json", scanned.json, "Print one JSON array");
    addNumber(scan, "--time", scanned.listenSeconds,
              {"s", LanScanJob::MinSeconds, LanScanJob::MaxSeconds},
              "Time to listen on the network (default: 2 s)");
    scan.footer("Example: corvane-cli instr scan lan --time 5");
    auto [doctor, asked] = addInstrumentCommand(
        instr, commands, "doctor", "Walk the way to an instrument and tell where it ends",
        runDoctor, false);
    addText(doctor, "host", asked.first, "Host name or address")->type_name("HOST")->required();
    doctor.add_flag("--json", asked.json, "Print one JSON array");
    doctor.footer("Exit status 1: there is no way to an instrument.\n"
                  "Example: corvane-cli instr doctor 192.168.1.20");
}
