// SPDX-License-Identifier: Apache-2.0
#include "CaptureSaveJob.h"

#include "CaptureJob.h"

#include "dsp/Resample.h"
#include "log/Tracer.h"

#include <cmath>
#include <utility>

namespace {

double decibels(double level)
{
    constexpr double Silence = 1e-12;
    return 20 * std::log10(level + Silence);
}

} // namespace

CaptureSaveJob::CaptureSaveJob(Capture &capture, OutputOptions output, double clockHz,
                               ImportScaling scaling, QObject *parent)
    : ToolJob(parent)
    , m_capture(capture)
    , m_clockHz(clockHz)
    , m_scaling(scaling)
    , m_output(*this, std::move(output))
{
    setEnding({"Waveform File Created", "Creation failed"});
}

bool CaptureSaveJob::work()
{
    if (m_output.fileName().isEmpty()) {
        return refuse("Output file name is empty.");
    }
    if (!scale() || !mayProceed()) {
        return false;
    }
    emit report(ReportLine::heading("Signal statistics"));
    const auto row = [this](const QString &label, const QString &value) {
        emit report(ReportLine::row(label, value));
    };
    row("Samples", QString::number(m_capture.samples));
    row("Clock", QString::number(m_clockHz, 'g', 12));
    row("Peak Offset", QString::asprintf("%4.2f dB", decibels(m_capture.peak)));
    row("Peak/RMS",
        QString::asprintf("%4.2f dB", decibels(m_capture.peak) - decibels(m_capture.rms)));
    emit report(ReportLine::heading("Saving file"));
    m_output.setLength(m_clockHz, m_capture.samples);
    m_output.setLevels(m_capture.peak, m_capture.rms);
    m_output.record().comment = m_capture.comment;
    return m_output.save({.data = m_capture.data.stream()}, "Saving file...");
}

bool CaptureSaveJob::scale()
{
    const double recorded = m_capture.peak / m_capture.gain;
    const bool isAuto = m_scaling == ImportScaling::Auto && recorded > 0;
    const double gain = isAuto ? 1 / recorded : 1;
    const double factor = gain / m_capture.gain;
    if (factor == 1) {
        return true;
    }
    emit report(ReportLine::heading("Level scaling"));
    Resample levels;
    const JobStep step(*this, "Scaling...", levels);
    if (!levels.rescale(m_capture.samples, factor, m_capture.data.stream())) {
        return Tracer::fail("Cannot rescale waveform data.");
    }
    m_capture.gain = gain;
    m_capture.rms *= factor;
    m_capture.peak = isAuto ? 1 : recorded;
    return true;
}
