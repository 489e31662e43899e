// SPDX-License-Identifier: Apache-2.0
#include "ResampleJob.h"

#include "base/EngineeringNumber.h"
#include "dsp/Resample.h"
#include "log/Tracer.h"

#include <utility>

void ResampleTarget::follow(double sourceClockHz, qint64 sourceSamples)
{
    if (clockDecides) {
        samples = static_cast<qint64>(clockHz / sourceClockHz * static_cast<double>(sourceSamples));
    } else {
        clockHz = static_cast<double>(samples) * sourceClockHz / static_cast<double>(sourceSamples);
    }
}

QString ResampleTarget::problem() const
{
    if (!(clockHz >= MinClockHz && clockHz <= MaxClockHz)) {
        return QString("The target clock of %1 is out of range; permitted: %2 to %3.")
            .arg(engineeringText(clockHz, "Hz"), engineeringText(MinClockHz, "Hz"),
                 engineeringText(MaxClockHz, "Hz"));
    }
    if (samples < 1 || samples > MaxSamples) {
        return QString("The target of %1 samples is out of range; permitted: 1 to %2.")
            .arg(samples)
            .arg(MaxSamples);
    }
    return {};
}

ResampleJob::ResampleJob(ResampleRequest request, QObject *parent)
    : EditJob(request.inputFile, request.output, Reading::Reported, parent)
    , m_request(std::move(request))
{
    setEnding({"Resampling completed", "Resampling failed"});
}

bool ResampleJob::edit()
{
    const WvFileInfo &info = source().info();
    if (!(info.clock > 0)) {
        return Tracer::fail(
            QString("The waveform \"%1\" states no clock rate to convert from. Give "
                    "it one first, as by \"level --clock\".")
                .arg(inputFile()));
    }
    m_request.target.follow(info.clock, info.samples);
    const QString problem = m_request.target.problem();
    if (!problem.isEmpty()) {
        return Tracer::fail(problem);
    }
    reportSource();
    source().dropTags();
    return convert() && rescale() && save();
}

bool ResampleJob::convert()
{
    const qint64 sourceSamples = source().info().samples;
    const qint64 targetSamples = m_request.target.samples;
    emit report(ReportLine::heading("Resampling"));
    constexpr qsizetype LabelWidth = 13;
    emit report(ReportLine::row("IN-samples", QString::number(sourceSamples), LabelWidth));
    emit report(ReportLine::row("OUT-samples", QString::number(targetSamples), LabelWidth));
    if (!m_data.openFor(targetSamples)) {
        return Tracer::fail("Cannot create temporary data buffer for resampled data.");
    }
    if (!m_markers.open()) {
        return Tracer::fail("Cannot create temporary marker buffer for resampled data.");
    }
    // A sinc over 50 samples with its corner just below the source's half clock.
    constexpr double CutOff = 0.45;
    constexpr int FilterLength = 50;
    Resample resampler;
    resampler.setFilterFrequency(1.0, CutOff);
    resampler.setFilterLength(FilterLength);
    if (!resampler.setFilterType(0, 0.5) || !resampler.setWindowType(1)) {
        return false;
    }
    resampler.setInput(source().data(), sourceSamples);
    resampler.setOutput(m_data.stream(), targetSamples);
    resampler.setMarkers(source().markers(), m_markers.stream());
    const JobStep step(*this, "Resampling...", resampler);
    if (!resampler.run() || isCancelled()) {
        return Tracer::fail("Resampling of the waveform failed.");
    }
    m_runPeakOffset = resampler.peakOffset();
    m_runRmsOffset = resampler.rmsOffset();
    return true;
}

bool ResampleJob::rescale()
{
    emit report(ReportLine::heading("Rescaling to same peak level"));
    if (!rescaleToSourcePeak(*m_data.stream(), static_cast<int>(m_request.target.samples),
                             m_runPeakOffset, m_runRmsOffset)) {
        setFailureText("Rescaling failed");
        return false;
    }
    output().setLength(m_request.target.clockHz, m_request.target.samples);
    return true;
}

bool ResampleJob::save()
{
    output().reportWaveform();
    emit report(ReportLine::heading("Saving"));
    output().reportFile();
    return output().save({.data = m_data.stream(), .markers = m_markers.stream()}, "Saving...");
}
