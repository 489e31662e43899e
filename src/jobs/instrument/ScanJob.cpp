// SPDX-License-Identifier: Apache-2.0
#include "ScanJob.h"

#include "instrument/InstrumentList.h"
#include "instrument/VisaDevice.h"
#include "log/Tracer.h"

#include <QCoreApplication>

#include <utility>

ScanJob::ScanJob(int kind, bool noVisa, QObject *parent)
    : ToolJob(parent)
    , m_kind(kind)
    , m_noVisa(noVisa)
{
}

bool ScanJob::work()
{
    VisaDevice device(m_noVisa);
    const JobStep step(*this,
                       m_kind == VisaDevice::ScanGpib ? "Scanning for GPIB devices..."
                                                      : "Scanning for USB devices...",
                       device);
    if (const QString problem = device.takeLastError(); !problem.isEmpty()) {
        Tracer::Trace(Tracer::Error, problem);
    }
    // The scan lets no events through by itself.
    connect(&device, &VisaDevice::ProgressUpdate, this, [] { QCoreApplication::processEvents(); });
    QList<VisaDevice *> found;
    const bool done = device.scanResources(found, m_kind);
    for (const VisaDevice *instrument : std::as_const(found)) {
        m_found.append(summaryOf(*instrument));
    }
    qDeleteAll(found);
    return done;
}

IdentifyJob::IdentifyJob(InstrumentRef instrument, QObject *parent)
    : InstrumentJob(std::move(instrument), "Reading...", parent)
{
}

bool IdentifyJob::talk(VisaDevice &device)
{
    m_summary = summaryOf(device);
    return true;
}

LookJob::LookJob(QList<InstrConfigEntry> entries, bool noVisa, QObject *parent)
    : ToolJob(parent)
    , m_entries(std::move(entries))
    , m_noVisa(noVisa)
    , m_states(m_entries.size())
{
}

bool LookJob::work()
{
    VisaDevice device(m_noVisa);
    device.setTakesInput(true);
    connect(this, &ToolJob::cancelRequested, &device, &VisaDevice::cancel);
    for (qsizetype i = 0; i < m_entries.size() && !isCancelled(); ++i) {
        const InstrConfigEntry &entry = m_entries.at(i);
        emit stepStarted(QString("Looking for the instrument '%1'...")
                             .arg(instrumentName(entry.model, entry.serial)));
        emit ProgressUpdate(static_cast<int>(100 * i / m_entries.size()));
        QCoreApplication::processEvents();
        if (!entry.enabled || isCancelled()) {
            continue;
        }
        State &state = m_states[i];
        state.isBusy = device.isOpenElsewhere(entry.model, entry.serial);
        if (!state.isBusy && device.openResource(entry.resource)) {
            device.closeResource();
            state.summary = summaryOf(device);
        }
    }
    return !isCancelled();
}
