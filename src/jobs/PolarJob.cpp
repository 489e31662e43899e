// SPDX-License-Identifier: Apache-2.0
#include "PolarJob.h"

#include "log/Tracer.h"

#include <QDir>
#include <QFile>
#include <QFileInfo>

#include <utility>

QString PolarRequest::levelProblem() const
{
    const bool fits = offset + gain <= 1.0 && offset - gain >= -1.0;
    return fits ? QString() : "Invalid amplitude level settings.";
}

PolarJob::PolarJob(PolarRequest request, QObject *parent)
    : EditJob(request.inputFile, request.phase, Reading::Reported, parent)
    , m_request(std::move(request))
    , m_amplitudeOutput(*this, m_request.amplitude)
{
    setEnding({"Plar conversion completed", "Polar conversion failed"});
}

QString PolarJob::refusal() const
{
    if (QString problem = m_request.levelProblem(); !problem.isEmpty()) {
        return problem;
    }
    if (m_request.phase.fileName.isEmpty()) {
        return "Output file name for phase is empty.";
    }
    if (m_request.amplitude.fileName.isEmpty()) {
        return "Output file name for amplitude is empty.";
    }
    // Neither is there yet, which leaves no more than the names to be compared.
    if (QDir::cleanPath(QFileInfo(m_request.phase.fileName).absoluteFilePath()) ==
        QDir::cleanPath(QFileInfo(m_request.amplitude.fileName).absoluteFilePath())) {
        return QString("The files for phase and amplitude are the same: \"%1\".")
            .arg(m_request.phase.fileName);
    }
    return {};
}

bool PolarJob::edit()
{
    const std::optional<double> clock = clockOr(m_request.clockHz);
    if (!clock) {
        return false;
    }
    reportSource();
    output().setLength(*clock, source().info().samples);
    m_amplitudeOutput.record() = output().record();
    PolarLevels levels;
    const bool isNew = !QFileInfo::exists(output().fileName());
    if (!split(levels) || !save(output(), *m_phase.stream(), levels.phase, "Phase")) {
        return false;
    }
    if (save(m_amplitudeOutput, *m_amplitude.stream(), levels.amplitude, "Amplitude")) {
        return true;
    }
    // One file of the pair is of no use.
    if (isNew) {
        QFile::remove(output().fileName());
    }
    return false;
}

bool PolarJob::split(PolarLevels &levels)
{
    const int samples = source().info().samples;
    emit report(ReportLine::heading("Converting"));
    emit report(
        ReportLine::row("IN-samples", QString::number(samples), ReportLine::LabelWidth + 1));
    if (!m_phase.openFor(2LL * samples)) {
        return Tracer::fail("Cannot create temporary data buffer for phase data.");
    }
    if (!m_amplitude.open()) {
        return Tracer::fail("Cannot create temporary data buffer for amplitude data.");
    }
    Resample splitter;
    const JobStep step(*this, "Converting...", splitter);
    return (splitter.polarSplit(samples, source().data(), m_phase.stream(), m_amplitude.stream(),
                                m_request.offset, m_request.gain, &levels) &&
            !isCancelled()) ||
           Tracer::fail("Polar conversion of the waveform failed.");
}

bool PolarJob::save(WaveformOutput &file, BufferedIO &data, const LevelSums &levels,
                    const QString &part)
{
    file.setLevels(levels.peakLevel(), levels.rmsLevel(source().info().samples));
    emit report(ReportLine::heading("Saving " + part));
    file.reportWaveform();
    const WvStreams streams{&data, source().markers(), source().tags()};
    return file.save(streams, QString("Saving %1 File...").arg(part));
}
