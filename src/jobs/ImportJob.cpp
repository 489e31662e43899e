// SPDX-License-Identifier: Apache-2.0
#include "ImportJob.h"

#include "base/EngineeringNumber.h"
#include "base/limits.h"
#include "dsp/Resample.h"
#include "log/Tracer.h"
#include "streams/TempStream.h"
#include "streams/levels.h"
#include "streams/samplestream.h"

#include <algorithm>
#include <cmath>
#include <utility>

namespace {

float clipped(float value)
{
    return std::clamp(value, -1.0F, 1.0F);
}

double onGrid(float value)
{
    constexpr double FullWord = 32767;
    return std::trunc(static_cast<double>(clipped(value)) * FullWord) / FullWord;
}

} // namespace

ImportJob::ImportJob(ImportTarget target, QObject *parent)
    : ToolJob(parent)
    , m_target(std::move(target))
    , m_output(*this, m_target.output)
    , m_clockHz(m_target.clockHz)
{
    setEnding({"Import completed", "Import failed"});
}

double ImportJob::permittedClock(double sampleRate)
{
    const double clock = std::clamp(sampleRate, ImportTarget::MinClockHz, ImportTarget::MaxClockHz);
    if (clock != sampleRate) {
        Tracer::Trace(Tracer::Warning,
                      QString("The file's sample rate of %1 Hz is no permitted clock; using %2.")
                          .arg(sampleRate)
                          .arg(engineeringText(clock, "Hz")));
    }
    return clock;
}

bool ImportJob::work()
{
    if (m_previewSamples == 0 && m_output.fileName().isEmpty()) {
        return Tracer::fail(emptyFileNameText());
    }
    TempStream data;
    if (!data.open()) {
        return Tracer::fail("Cannot create temporary data buffer.");
    }
    const std::optional<qint64> samples = readInput(data, m_previewSamples);
    if (!samples || !mayProceed()) {
        return false;
    }
    if (*samples > MaxSamples) {
        return Tracer::fail(QString("The data holds %1 samples; a waveform can have %2 at most.")
                                .arg(*samples)
                                .arg(MaxSamples));
    }
    if (*samples == 0) {
        return Tracer::fail("The data holds no samples.");
    }
    if (!scale(data, *samples) || !mayProceed()) {
        return false;
    }
    if (m_previewSamples > 0) {
        return collectPreview(data, *samples);
    }
    m_output.setLength(m_clockHz, *samples);
    m_output.reportLevels();
    reportSaving();
    return m_output.save({.data = data.stream(), .markers = foundMarkers(), .tags = unknownTags()},
                         "Creating Waveform File...");
}

void ImportJob::reportSaving()
{
    emit report(ReportLine::heading("Saving"));
    m_output.reportFile();
}

void ImportJob::keepLevelUnlessAuto()
{
    if (m_target.scaling == ImportScaling::Down) {
        m_target.scaling = ImportScaling::None;
    }
}

bool ImportJob::scale(TempStream &data, qint64 samples)
{
    emit report(ReportLine::heading("Scaling"));
    m_output.setLength(m_clockHz, samples);
    double peak = 0;
    double rms = 0;
    Resample levels;
    {
        const JobStep step(*this, "Analyzing Levels...", levels);
        if (!levels.statistics(static_cast<int>(samples), data.stream(), &peak, &rms)) {
            return Tracer::fail("Cannot calculate peak and RMS value.");
        }
    }
    if (!std::isfinite(peak) || !std::isfinite(rms)) {
        return Tracer::fail("Invalid peak and RMS values.");
    }
    if (!mayProceed()) {
        return false;
    }
    if (m_target.scaling == ImportScaling::None && peak > 1) {
        LevelSums sums;
        if (!measureClipped(data, samples, sums)) {
            return Tracer::fail("Cannot calculate peak and RMS value.");
        }
        m_output.setLevels(sums.peakLevel(), sums.rmsLevel(samples));
        return true;
    }
    const bool tooHigh = m_target.scaling == ImportScaling::Down && peak > 1;
    const bool offScale = m_target.scaling == ImportScaling::Auto && peak != 1;
    if (peak != 0 && (tooHigh || offScale)) {
        const JobStep step(*this, "Rescaling...", levels);
        if (!levels.rescale(static_cast<int>(samples), 1 / peak, data.stream())) {
            return Tracer::fail(m_previewSamples > 0 ? "Cannot rescale I/Q data."
                                                     : "Cannot rescale imported data.");
        }
        rms /= peak;
        peak = 1;
    }
    m_output.setLevels(peak, rms);
    return true;
}

/// The levels of the words that the writer will make of samples beyond full scale.
bool ImportJob::measureClipped(TempStream &data, qint64 samples, LevelSums &sums)
{
    if (!data->checkHeader(BufferedIO::DataHeader)) {
        return false;
    }
    const BlockLoop loop = forEachBlock(
        *data.stream(), samples, [this](qint64) { return isCancelled(); },
        [&sums](std::span<float> iq, qint64) {
            std::transform(iq.begin(), iq.end(), iq.begin(), clipped);
            addLevels(iq, sums);
            return true;
        });
    return loop.end == BlockLoop::Done;
}

bool ImportJob::collectPreview(TempStream &data, qint64 samples)
{
    m_preview.clear();
    m_preview.reserve(samples);
    if (!data->checkHeader(BufferedIO::DataHeader)) {
        return Tracer::fail("Cannot reset temporary file.");
    }
    const BlockLoop loop = forEachBlock(
        *data.stream(), samples, [](qint64) { return false; },
        [this](std::span<const float> iq, qint64) {
            for (size_t i = 0; i + 1 < iq.size(); i += 2) {
                m_preview.append({onGrid(iq[i]), onGrid(iq[i + 1])});
            }
            return true;
        });
    return loop.end == BlockLoop::Done || Tracer::fail("Cannot read file content.");
}
