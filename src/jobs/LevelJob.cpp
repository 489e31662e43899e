// SPDX-License-Identifier: Apache-2.0
#include "LevelJob.h"

#include "RangeMeter.h"
#include "ReportText.h"

#include "log/Tracer.h"
#include "wvfile/HvFileIO.h"

#include <algorithm>
#include <cmath>
#include <utility>

namespace {

double clampedLevel(double levelDb)
{
    return std::clamp(levelDb, LevelRequest::MinDb, LevelRequest::MaxDb);
}

} // namespace

LevelJob::LevelJob(LevelRequest request, QObject *parent)
    : ToolJob(parent)
    , m_request(std::move(request))
{
}

bool LevelJob::run()
{
    if (m_request.output.fileName.isEmpty()) {
        return Tracer::fail("Output file name is empty.");
    }
    if (!m_source.read(*this, m_request.inputFile) || !mayProceed()) {
        return false;
    }
    const double peakDb = m_request.peakDb.value_or(clampedLevel(-m_source.info().peakOffsetTag));
    double peakToRmsDb = m_request.peakToRmsDb.value_or(0);
    if (!m_request.peakToRmsDb && !defaultPeakToRms(peakToRmsDb)) {
        return false;
    }
    return mayProceed() && write(peakDb, peakToRmsDb);
}

/// What the samples measure over the whole file, seen from the RMS offset of the tag.
bool LevelJob::defaultPeakToRms(double &peakToRmsDb)
{
    const qint64 samples = m_source.info().samples;
    Tracer::Trace(Tracer::Information,
                  QString("Rescaling from pos. %1 to pos %2.").arg(1).arg(samples));
    RangeMeter meter;
    const JobStep step(*this, "Calculating...", meter);
    const std::optional<LevelSums> sums = meter.measure(*m_source.data(), 0, samples);
    if (!sums) {
        return false;
    }
    const double measured =
        20 * std::log10(1 / std::sqrt(sums->sum / static_cast<double>(samples)));
    peakToRmsDb = clampedLevel(-(m_source.info().rmsOffsetTag - measured));
    return true;
}

bool LevelJob::write(double peakDb, double peakToRmsDb)
{
    Tracer::Trace(Tracer::Information, "Creating rescaled waveform...");
    WvWriteJob job = m_source.writeJob();
    job.peakOffset = writtenDb(-peakDb);
    job.rmsOffset = writtenDb(peakToRmsDb - peakDb);
    job.comment = tagText("comment", m_request.output.comment.value_or(job.comment));
    job.copyright = tagText("copyright", m_request.output.copyright.value_or(job.copyright));
    HvFileIO file;
    const JobStep step(*this, "Saving waveform...", file);
    if (!file.writeWaveform(job, m_request.output.fileName, m_source.data(), m_source.markers(),
                            m_source.tags())) {
        return Tracer::fail("Waveform generation failed.");
    }
    emit report(fileLine(m_request.output.fileName));
    for (const QString &line :
         levelLines({static_cast<double>(job.samples), job.peakOffset, job.rmsOffset})) {
        emit report(line);
    }
    return true;
}
