// SPDX-License-Identifier: Apache-2.0
#include "EditJob.h"

#include "ReportText.h"

#include "base/OutputFile.h"
#include "dsp/Resample.h"
#include "log/Tracer.h"

#include <QFileInfo>

#include <cmath>
#include <utility>

EditJob::EditJob(const QString &inputFile, OutputOptions output, Reading reading, QObject *parent)
    : ToolJob(parent)
    , m_inputFile(inputFile)
    , m_reading(reading)
    , m_output(*this, std::move(output))
{
}

bool EditJob::work()
{
    if (const QString reason = refusal(); !reason.isEmpty()) {
        return refuse(reason);
    }
    if (!read()) {
        return false;
    }
    source().tellDroppedTags();
    m_output.record() = source().writeJob();
    return edit();
}

bool EditJob::read()
{
    const bool reported = m_reading == Reading::Reported;
    if (reported) {
        emit report(ReportLine::heading("Reading waveform"));
    }
    if ((m_loaded || m_source.read(*this, m_inputFile, sampleReading())) && mayProceed()) {
        return true;
    }
    if (reported) {
        Tracer::Trace(Tracer::Error, "Reading failed.");
    }
    return false;
}

/// A result that has to be written over its source, in a folder where nothing can be added, needs
/// the samples elsewhere; all others leave them in the file.
SampleReading EditJob::sampleReading() const
{
    const bool overwritten =
        isSameFile(m_inputFile, m_output.fileName()) &&
        !QFileInfo(QFileInfo(m_output.fileName()).canonicalPath()).isWritable();
    return overwritten ? SampleReading::Unpacked : wantedReading();
}

QString EditJob::refusal() const
{
    return m_output.fileName().isEmpty() ? emptyFileNameText() : QString();
}

bool EditJob::rescaleToSourcePeak(BufferedIO &data, int samples, double peakOffset,
                                  double rmsOffset)
{
    WvWriteJob &record = m_output.record();
    const double change = peakOffset - source().info().peakOffset;
    Resample scaler;
    const JobStep step(*this, "Rescaling...", scaler);
    if (!scaler.rescale(samples, std::pow(10.0, change / 20), &data) || isCancelled()) {
        return Tracer::fail("Rescaling of the waveform failed.");
    }
    record.peakOffset = source().info().peakOffset;
    record.rmsOffset = rmsOffset - change;
    return true;
}

void EditJob::reportSource()
{
    reportAll(waveformRows(m_inputFile, source().writeJob()));
}

std::optional<double> EditJob::clockOr(std::optional<double> wantedHz)
{
    const double clockHz = wantedHz.value_or(source().info().clock);
    if (!(clockHz > 0)) {
        Tracer::Trace(Tracer::Error,
                      QString("The waveform \"%1\" states no clock rate. Give the clock rate of "
                              "the result in the field ARB Clockrate, or by --clock.")
                          .arg(m_inputFile));
        return std::nullopt;
    }
    return clockHz;
}
