// SPDX-License-Identifier: Apache-2.0
#include "LevelJob.h"

#include "RangeMeter.h"
#include "ReportText.h"

#include "log/Tracer.h"

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
    : EditJob(request.inputFile, request.output, Reading::Quiet, parent)
    , m_request(std::move(request))
{
}

bool LevelJob::edit()
{
    const double peakDb = m_request.peakDb.value_or(clampedLevel(-source().info().peakOffsetTag));
    double peakToRmsDb = m_request.peakToRmsDb.value_or(0);
    if (!m_request.peakToRmsDb && !defaultPeakToRms(peakToRmsDb)) {
        return false;
    }
    return mayProceed() && write(peakDb, peakToRmsDb);
}

/// What the samples measure over the whole file, seen from the RMS offset of the tag.
bool LevelJob::defaultPeakToRms(double &peakToRmsDb)
{
    const qint64 samples = source().info().samples;
    Tracer::Trace(Tracer::Information,
                  QString("Rescaling from pos. %1 to pos %2.").arg(1).arg(samples));
    RangeMeter meter;
    const JobStep step(*this, "Calculating...", meter);
    const std::optional<LevelSums> sums = meter.measure(*source().data(), 0, samples);
    if (!sums) {
        return false;
    }
    const double measured =
        20 * std::log10(1 / std::sqrt(sums->sum / static_cast<double>(samples)));
    peakToRmsDb = clampedLevel(-(source().info().rmsOffsetTag - measured));
    return true;
}

bool LevelJob::write(double peakDb, double peakToRmsDb)
{
    Tracer::Trace(Tracer::Information, "Creating rescaled waveform...");
    WvWriteJob &record = output().record();
    record.peakOffset = writtenDb(-peakDb);
    record.rmsOffset = writtenDb(peakToRmsDb - peakDb);
    output().keepLevelsAsStated();
    const WvStreams streams{source().data(), source().markers(), source().tags()};
    if (!output().save(streams, "Saving waveform...")) {
        return false;
    }
    output().reportFile();
    output().reportLevels();
    return true;
}
