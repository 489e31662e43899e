// SPDX-License-Identifier: Apache-2.0
#include "WaveformOutput.h"

#include "ReportText.h"
#include "ToolJob.h"

#include "base/freespace.h"
#include "log/Tracer.h"
#include "streams/levels.h"
#include "streams/samplestream.h"
#include "wvfile/HvFileIO.h"

#include <algorithm>
#include <utility>

WaveformOutput::WaveformOutput(ToolJob &job, OutputOptions options)
    : m_job(job)
    , m_options(std::move(options))
{
    m_record.levelsValid = true;
}

void WaveformOutput::setLength(double clockHz, qint64 samples)
{
    m_record.clock = clockHz;
    m_record.markerClock = clockHz;
    m_record.samples = static_cast<int>(samples);
}

void WaveformOutput::setLevels(double peak, double rms)
{
    m_record.peakOffset = offsetDb(peak);
    m_record.rmsOffset = offsetDb(rms);
}

void WaveformOutput::stateZeroCrest()
{
    m_zeroCrest = true;
    m_record.rmsOffset = m_record.peakOffset;
}

void WaveformOutput::reportFile()
{
    emit m_job.report(fileRow(fileName()));
}

void WaveformOutput::reportLevels()
{
    for (const ReportLine &line : levelRows(m_record)) {
        emit m_job.report(line);
    }
}

void WaveformOutput::reportWaveform()
{
    for (const ReportLine &line : waveformRows(fileName(), m_record)) {
        emit m_job.report(line);
    }
}

bool WaveformOutput::save(const WvStreams &streams, const QString &stepLabel)
{
    m_record.comment = tagText("comment", m_options.comment.value_or(m_record.comment));
    m_record.copyright = tagText("copyright", m_options.copyright.value_or(m_record.copyright));
    if (!write(streams, stepLabel)) {
        return false;
    }
    m_options.overwrite = true; // what stands there now is this job's own
    const bool writerClipped = m_record.clippedValues > 0;
    m_record.clippedValues += m_clipped.values;
    m_record.largestValue = std::max(m_record.largestValue, m_clipped.largest);
    if (m_record.clippedValues > 0) {
        emit m_job.report(ReportLine::warning(
            clippingText(m_record.clippedValues, 2 * static_cast<qint64>(m_record.samples),
                         m_record.largestValue)));
    }
    if (writerClipped && !m_levelsAsStated && streams.data != nullptr) {
        // The tags come before the samples in the file, so they are known too late only here.
        if (!measureClipped(*streams.data) || !write(streams, stepLabel)) {
            return false;
        }
        emit m_job.report(ReportLine::plain("Levels after clipping"));
        reportLevels();
    }
    reportLoop();
    return true;
}

void WaveformOutput::reportLoop()
{
    emit m_job.report(ReportLine::plain("Loop point: " + loopText(m_record.loop)));
    if (!m_record.loop.isContinuous) {
        emit m_job.report(ReportLine::warning(loopWarning(m_record.loop)));
    }
}

bool WaveformOutput::write(const WvStreams &streams, const QString &stepLabel)
{
    constexpr qint64 FileBytesPerSample = 4;
    if (!hasRoomFor(fileName(), FileBytesPerSample * m_record.samples)) {
        return Tracer::fail("Waveform generation failed.");
    }
    HvFileIO file;
    m_record.overwrite = m_options.overwrite;
    const JobStep step(m_job, stepLabel, file);
    return file.writeWaveform(m_record, fileName(), streams.data, streams.markers, streams.tags) ||
           Tracer::fail("Waveform generation failed.");
}

bool WaveformOutput::measureClipped(BufferedIO &data)
{
    LevelSums levels;
    const auto measure = [&levels](std::span<float> iq, qint64) {
        for (float &value : iq) {
            value = std::clamp(value, -1.0F, 1.0F);
        }
        addLevels(iq, levels);
        return true;
    };
    const auto stop = [this](qint64) { return m_job.isCancelled(); };
    if (!data.checkHeader(BufferedIO::DataHeader) ||
        forEachBlock(data, m_record.samples, stop, measure).end != BlockLoop::Done) {
        return m_job.mayProceed() && Tracer::fail("Cannot read I/Q data.");
    }
    setLevels(levels.peakLevel(), levels.rmsLevel(m_record.samples));
    if (m_zeroCrest) {
        stateZeroCrest();
    }
    return true;
}

QString emptyFileNameText()
{
    return "Output file name is empty.";
}
