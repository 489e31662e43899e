// SPDX-License-Identifier: Apache-2.0
#include "ImportJob.h"

#include "dsp/Resample.h"
#include "log/Tracer.h"
#include "streams/TempStream.h"

#include <cmath>
#include <utility>

ImportJob::ImportJob(ImportTarget target, QObject *parent)
    : ToolJob(parent)
    , m_target(std::move(target))
    , m_output(*this, m_target.output)
{
    setEnding({"Import completed", "Import failed"});
}

bool ImportJob::scale(TempStream &data, int samples, double &peak, double &rms)
{
    emit report(ReportLine::heading("Scaling"));
    Resample levels;
    {
        const JobStep step(*this, "Analyzing Levels...", levels);
        if (!levels.statistics(samples, data.stream(), &peak, &rms)) {
            return Tracer::fail("Cannot calculate peak and RMS value.");
        }
    }
    if (!std::isfinite(peak) || !std::isfinite(rms)) {
        return Tracer::fail("Invalid peak and RMS values.");
    }
    const bool tooHigh = m_target.scaling == ImportScaling::Down && peak > 1;
    const bool offScale = m_target.scaling == ImportScaling::Auto && peak != 1;
    if (!mayProceed()) {
        return false;
    }
    if (peak == 0 || (!tooHigh && !offScale)) {
        return true;
    }
    const JobStep step(*this, "Rescaling...", levels);
    if (!levels.rescale(samples, 1 / peak, data.stream())) {
        return Tracer::fail("Cannot rescale imported data.");
    }
    rms /= peak;
    peak = 1;
    return true;
}

bool ImportJob::scaleAndSave(TempStream &data, qint64 samples, double clockHz)
{
    double peak = 0;
    double rms = 0;
    if (!mayProceed() || !scale(data, static_cast<int>(samples), peak, rms) || !mayProceed()) {
        return false;
    }
    m_output.setLength(clockHz, samples);
    m_output.setLevels(peak, rms);
    m_output.reportLevels();
    emit report(ReportLine::heading("Saving"));
    m_output.reportFile();
    return m_output.save({.data = data.stream()}, "Creating Waveform File...");
}
