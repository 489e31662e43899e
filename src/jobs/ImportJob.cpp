// SPDX-License-Identifier: Apache-2.0
#include "ImportJob.h"

#include "ReportText.h"

#include "dsp/Resample.h"
#include "log/Tracer.h"
#include "streams/TempStream.h"
#include "wvfile/HvFileIO.h"

#include <cmath>

ImportJob::ImportJob(QObject *parent)
    : ToolJob(parent)
{
}

bool ImportJob::run()
{
    const bool done = import();
    emit report(done ? successLine("Import completed") : failureLine("Import failed"));
    return done;
}

bool ImportJob::scale(TempStream &data, int samples, ImportScaling scaling, double &peak,
                      double &rms)
{
    emit report("<b>Scaling</b>\n");
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
    const bool tooHigh = scaling == ImportScaling::Down && peak > 1;
    const bool offScale = scaling == ImportScaling::Auto && peak != 1;
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

bool ImportJob::scaleAndSave(TempStream &data, qint64 samples, const ImportTarget &target)
{
    double peak = 0;
    double rms = 0;
    if (!mayProceed() || !scale(data, static_cast<int>(samples), target.scaling, peak, rms) ||
        !mayProceed()) {
        return false;
    }
    WvWriteJob job;
    job.clock = target.clockHz;
    job.markerClock = target.clockHz;
    job.samples = static_cast<int>(samples);
    job.peakOffset = offsetDb(peak);
    job.rmsOffset = offsetDb(rms);
    job.levelsValid = true;
    job.comment = tagText("comment", target.output.comment.value_or(QString()));
    job.copyright = tagText("copyright", target.output.copyright.value_or(QString()));
    for (const QString &line :
         levelLines({static_cast<double>(samples), job.peakOffset, job.rmsOffset})) {
        emit report(line);
    }
    emit report(stepLine("Saving"));
    emit report(fileLine(target.output.fileName));
    HvFileIO file;
    const JobStep step(*this, "Creating Waveform File...", file);
    return file.writeWaveform(job, target.output.fileName, data.stream(), nullptr, nullptr) ||
           Tracer::fail("Waveform generation failed.");
}
