// SPDX-License-Identifier: Apache-2.0
#include "InstrumentJob.h"

#include "instrument/VisaDevice.h"
#include "log/Tracer.h"

#include <QCoreApplication>
#include <QStringList>

#include <utility>

InstrumentJob::InstrumentJob(InstrumentRef instrument, QString label, QObject *parent)
    : ToolJob(parent)
    , m_instrument(std::move(instrument))
    , m_label(std::move(label))
{
}

bool InstrumentJob::work()
{
    if (m_instrument.device != nullptr) {
        const JobStep step(*this, m_label, *m_instrument.device);
        return talkTo(*m_instrument.device);
    }
    VisaDevice device(m_instrument.noVisa);
    const JobStep step(*this, m_label, device);
    if (const QString problem = device.takeLastError(); !problem.isEmpty()) {
        Tracer::Trace(Tracer::Error, problem);
    }
    device.setTakesInput(true);
    const bool isReady = device.openResource(m_instrument.resource);
    // A cancel from while the instrument was being opened.
    QCoreApplication::processEvents();
    if (isCancelled()) {
        return false;
    }
    if (!isReady) {
        noteReported(device.takeLastError());
        return Tracer::fail("The instrument '" + m_instrument.resource + "' cannot be reached.");
    }
    return talkTo(device);
}

bool InstrumentJob::talkTo(VisaDevice &device)
{
    const bool done = talk(device);
    if (!done && !isCancelled()) {
        if (device.isOpen()) {
            device.checkErrorQueue();
        }
        noteReported(device.takeLastError());
    }
    return done;
}

bool InstrumentJob::checked(VisaDevice &device, bool done)
{
    if (!done || device.checkErrorQueue()) {
        return done;
    }
    noteReported(device.takeLastError());
    return Tracer::fail(m_reported.isEmpty() ? QString("The instrument did not do as it was told.")
                                             : "The instrument reports: " + m_reported);
}

bool InstrumentJob::mayPlay(const QStringList &problems, WaveformCheck check)
{
    if (problems.isEmpty()) {
        return true;
    }
    if (check == WaveformCheck::Strict) {
        return Tracer::fail(problems.join(' '));
    }
    for (const QString &problem : problems) {
        emit report(ReportLine::warning(problem));
    }
    return true;
}

void InstrumentJob::noteReported(const QString &errors)
{
    QStringList lines = errors.split('\n', Qt::SkipEmptyParts);
    if (!m_reported.isEmpty()) {
        lines.prepend(m_reported);
    }
    m_reported = lines.join("; ");
}
