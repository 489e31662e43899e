// SPDX-License-Identifier: Apache-2.0
#include "ResampleJob.h"

#include "ReportText.h"

#include "base/EngineeringNumber.h"
#include "dsp/Resample.h"
#include "log/Tracer.h"
#include "wvfile/HvFileIO.h"

#include <cmath>
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
    : ToolJob(parent)
    , m_request(std::move(request))
{
}

bool ResampleJob::stopWith(const QString &reportText, const QString &logText)
{
    emit report(failureLine(reportText));
    return Tracer::fail(logText);
}

bool ResampleJob::run()
{
    if (m_request.output.fileName.isEmpty()) {
        return Tracer::fail("Output file name is empty.");
    }
    return read() && convert() && rescale() && save();
}

void ResampleJob::reportFile(const QString &fileName, double clockHz, const WvWriteJob &job)
{
    const QStringList lines = sourceLines(
        fileName, clockHz, {static_cast<double>(job.samples), job.peakOffset, job.rmsOffset});
    for (const QString &line : lines) {
        emit report(line);
    }
}

bool ResampleJob::read()
{
    emit report("<b>Reading waveform</b>");
    if (!m_source.read(*this, m_request.inputFile) || isCancelled()) {
        return stopWith("Resampling failed", "Reading failed.");
    }
    const WvFileInfo &info = m_source.info();
    m_request.target.follow(info.clock, info.samples);
    const QString problem = m_request.target.problem();
    if (!problem.isEmpty()) {
        return stopWith("Resampling failed", problem);
    }
    reportFile(m_request.inputFile, info.clock, m_source.writeJob());
    m_source.dropTags();
    return true;
}

bool ResampleJob::convert()
{
    const qint64 sourceSamples = m_source.info().samples;
    const qint64 targetSamples = m_request.target.samples;
    emit report(stepLine("Resampling"));
    emit report(QString(" IN-samples:  \t%1").arg(sourceSamples));
    emit report(QString(" OUT-samples: \t%1").arg(targetSamples));
    if (!m_data.open()) {
        return Tracer::fail("Cannot create temporary data buffer for resampled data.");
    }
    if (!m_markers.open()) {
        return Tracer::fail("Cannot create temporary marker buffer for resampled data.");
    }
    // A sinc over 50 samples with its corner just below the source's half clock.
    constexpr double cutOff = 0.45;
    constexpr int filterLength = 50;
    Resample resampler;
    resampler.setFilterFrequency(1.0, cutOff);
    resampler.setFilterLength(filterLength);
    if (!resampler.setFilterType(0, 0.5) || !resampler.setWindowType(1)) {
        return false;
    }
    resampler.setInput(m_source.data(), sourceSamples);
    resampler.setOutput(m_data.stream(), targetSamples);
    resampler.setMarkers(m_source.markers(), m_markers.stream());
    const JobStep step(*this, "Resampling...", resampler);
    if (!resampler.run() || isCancelled()) {
        return stopWith("Resampling failed", "Resampling of the waveform failed.");
    }
    m_runPeakOffset = resampler.peakOffset();
    m_runRmsOffset = resampler.rmsOffset();
    return true;
}

bool ResampleJob::rescale()
{
    emit report(stepLine("Rescaling to same peak level"));
    m_result = m_source.writeJob();
    const double change = m_runPeakOffset - m_result.peakOffset;
    Resample scaler;
    const JobStep step(*this, "Rescaling...", scaler);
    if (!scaler.rescale(static_cast<int>(m_request.target.samples), std::pow(10.0, change / 20),
                        m_data.stream()) ||
        isCancelled()) {
        return stopWith("Rescaling failed", "Rescaling of the waveform failed.");
    }
    m_result.samples = static_cast<int>(m_request.target.samples);
    m_result.clock = m_request.target.clockHz;
    m_result.markerClock = m_result.clock;
    m_result.rmsOffset = m_runRmsOffset - change;
    m_result.comment = tagText("comment", m_request.output.comment.value_or(m_result.comment));
    m_result.copyright =
        tagText("copyright", m_request.output.copyright.value_or(m_result.copyright));
    return true;
}

bool ResampleJob::save()
{
    reportFile(m_request.output.fileName, m_result.clock, m_result);
    emit report(stepLine("Saving"));
    emit report(fileLine(m_request.output.fileName));
    HvFileIO file;
    const JobStep step(*this, "Saving...", file);
    if (!file.writeWaveform(m_result, m_request.output.fileName, m_data.stream(),
                            m_markers.stream(), nullptr)) {
        return stopWith("Resampling failed", "Waveform generation failed.");
    }
    emit report(successLine("Resampling completed"));
    return true;
}
