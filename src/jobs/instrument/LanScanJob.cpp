// SPDX-License-Identifier: Apache-2.0
#include "LanScanJob.h"

#include "instrument/LanSearch.h"
#include "instrument/OperationControl.h"
#include "instrument/VisaDevice.h"
#include "log/Tracer.h"

#include <QCoreApplication>

#include <algorithm>

namespace {

constexpr int SearchPercent = 50;

void addNew(QStringList &list, const QStringList &texts)
{
    for (const QString &text : texts) {
        if (!list.contains(text)) {
            list.append(text);
        }
    }
}

} // namespace

LanScanJob::LanScanJob(double seconds, bool noVisa, QObject *parent)
    : ToolJob(parent)
    , m_seconds(seconds)
    , m_noVisa(noVisa)
{
}

void LanScanJob::add(const LanInstrument &instrument)
{
    const auto present =
        std::find_if(m_found.begin(), m_found.end(), [&](const LanInstrument &known) {
            return !known.summary.serial.isEmpty() &&
                   known.summary.serial == instrument.summary.serial &&
                   known.summary.model == instrument.summary.model;
        });
    if (present == m_found.end()) {
        m_found.append(instrument);
        return;
    }
    addNew(present->found, instrument.found);
    addNew(present->resources, instrument.resources);
}

bool LanScanJob::work()
{
    constexpr double MsPerSecond = 1000;
    emit stepStarted("Scanning the local networks...");
    OperationControl control;
    control.report = [this](int percent) {
        emit ProgressUpdate(percent * SearchPercent / 100);
        QCoreApplication::processEvents();
    };
    const auto stop =
        connect(this, &ToolJob::cancelRequested, this, [&control] { control.cancelled = true; });
    LanSearch search;
    const bool searched = search.run(static_cast<int>(m_seconds * MsPerSecond), control);
    disconnect(stop);
    if (!searched) {
        return false;
    }
    const QList<LanFinding> &findings = search.found();
    for (qsizetype i = 0; i < findings.size(); ++i) {
        const LanFinding &finding = findings.at(i);
        emit stepStarted(QString("Asking %1...").arg(finding.address.toString()));
        emit ProgressUpdate(static_cast<int>(
            SearchPercent + (100 - SearchPercent) * i / std::max<qsizetype>(findings.size(), 1)));
        for (const QString &resource : finding.resources) {
            VisaDevice device(m_noVisa);
            device.setTakesInput(true);
            const auto cancelDevice =
                connect(this, &ToolJob::cancelRequested, &device, &VisaDevice::cancel);
            if (device.isResourceOpenElsewhere(resource)) {
                // A second session might disturb the pane that works with it.
                Tracer::Trace(
                    Tracer::Information,
                    QString("The device '%1' is in use and was not asked.").arg(resource));
                break;
            }
            const bool isOpen = device.openResource(resource);
            disconnect(cancelDevice);
            QCoreApplication::processEvents();
            if (isCancelled()) {
                return false;
            }
            if (isOpen) {
                device.closeResource();
                QStringList found;
                addNew(found, finding.byVxi11 ? QStringList{"vxi11"} : QStringList());
                addNew(found, finding.byMdns ? QStringList{"mdns"} : QStringList());
                add({.summary = summaryOf(device), .found = found, .resources = finding.resources});
                break;
            }
        }
    }
    emit ProgressUpdate(100);
    return true;
}
