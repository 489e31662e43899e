// SPDX-License-Identifier: Apache-2.0
#include "CreateJob.h"

#include "ReportText.h"

#include "base/EngineeringNumber.h"
#include "dsp/Resample.h"
#include "log/Tracer.h"
#include "streams/TempStream.h"
#include "wvfile/HvFileIO.h"

#include <algorithm>
#include <cmath>
#include <utility>

SignalJob::SignalJob(CreateRequest request, QObject *parent)
    : ToolJob(parent)
    , m_request(std::move(request))
{
}

bool SignalJob::generate(TempStream &data)
{
    if (!configureSignal(m_engine, m_request)) {
        return false;
    }
    if (!data.open()) {
        return Tracer::fail("Cannot create temporary data buffer.");
    }
    m_engine.setOutput(data.stream());
    const JobStep step(*this, "Creating waveform data...", m_engine);
    if (!m_engine.generate() || isCancelled() ||
        !m_engine.statistics(&m_facts.samples, &m_facts.rms, &m_facts.peak)) {
        return Tracer::fail("Cannot create waveform.");
    }
    m_facts.clockHz = m_engine.clockRate();
    return true;
}

bool SignalJob::scale(TempStream &data, const QString &label)
{
    const double factor = 1 / m_facts.peak;
    Resample scaler;
    const JobStep step(*this, label, scaler);
    if (!scaler.rescale(m_facts.samples, factor, data.stream()) || isCancelled()) {
        return Tracer::fail("Cannot rescale waveform data.");
    }
    m_facts.rms *= factor;
    m_facts.peak = 1.0;
    return true;
}

bool SignalPreviewJob::run()
{
    TempStream data;
    if (!generate(data) || (isScaled() && !scale(data, "Rescaling..."))) {
        return false;
    }
    if (!data->checkHeader(BufferedIO::DataHeader)) {
        return Tracer::fail("Cannot read temporary file.");
    }
    const auto count = 2 * static_cast<size_t>(facts().samples);
    std::vector<float> values(count);
    const auto bytes = static_cast<int>(count * sizeof(float));
    if (data->readBlock(bytes, values.data()) != bytes) {
        return Tracer::fail("Cannot read temporary file.");
    }
    m_samples.resize(count);
    std::transform(values.begin(), values.end(), m_samples.begin(), [](float value) {
        return std::trunc(static_cast<double>(value) * 32767.0) / 32767.0;
    });
    return true;
}

bool CreateJob::run()
{
    if (request().output.fileName.isEmpty()) {
        return Tracer::fail("Output file name is empty.");
    }
    const bool created = create();
    emit report(created ? successLine("Signal creation completed")
                        : failureLine("Creation failed"));
    return created;
}

bool CreateJob::create()
{
    emit report(stepLine("Creating signal"));
    TempStream data;
    if (!generate(data)) {
        return false;
    }
    if (isScaled()) {
        emit report(stepLine("Level scaling"));
        if (!scale(data, "Scaling...")) {
            return false;
        }
    }
    return save(data);
}

bool CreateJob::save(TempStream &data)
{
    WvWriteJob job;
    job.clock = request().clockHz.value_or(facts().clockHz);
    job.markerClock = job.clock;
    job.samples = facts().samples;
    job.peakOffset = offsetDb(facts().peak);
    job.rmsOffset = request().zeroCrest ? job.peakOffset : offsetDb(facts().rms);
    job.levelsValid = true;
    job.comment = tagText("comment", request().output.comment.value_or(QString()));
    job.copyright = tagText("copyright", request().output.copyright.value_or(QString()));

    emit report(stepLine("Signal statistics"));
    QStringList lines =
        levelLines({static_cast<double>(job.samples), job.peakOffset, job.rmsOffset});
    lines.insert(1, " Clock:      \t" + engineeringText(job.clock, "Hz"));
    for (const QString &line : std::as_const(lines)) {
        emit report(line);
    }
    emit report(stepLine("Saving file"));
    HvFileIO file;
    const JobStep step(*this, "Saving file...", file);
    return file.writeWaveform(job, request().output.fileName, data.stream(), nullptr, nullptr) ||
           Tracer::fail("Waveform generation failed.");
}
