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
    if (!data.openFor(static_cast<qint64>(m_engine.sampleCount()))) {
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

bool SignalPreviewJob::work()
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

CreateJob::CreateJob(const CreateRequest &request, QObject *parent)
    : SignalJob(request, parent)
    , m_output(*this, request.output)
{
    setEnding({"Signal creation completed", "Creation failed"});
}

bool CreateJob::work()
{
    if (m_output.fileName().isEmpty()) {
        return refuse(emptyFileNameText());
    }
    emit report(ReportLine::heading("Creating signal"));
    TempStream data;
    if (!generate(data)) {
        return false;
    }
    if (isScaled()) {
        emit report(ReportLine::heading("Level scaling"));
        if (!scale(data, "Scaling...")) {
            return false;
        }
    }
    return save(data);
}

bool CreateJob::save(TempStream &data)
{
    m_output.setLength(request().clockHz.value_or(facts().clockHz), facts().samples);
    m_output.setLevels(facts().peak, facts().rms);
    WvWriteJob &record = m_output.record();
    if (request().zeroCrest) {
        m_output.stateZeroCrest();
    }
    emit report(ReportLine::heading("Signal statistics"));
    ReportLines rows = levelRows(record);
    rows.insert(1, ReportLine::row("Clock", engineeringText(record.clock, "Hz")));
    reportAll(rows);
    warnOfOtherClock();
    emit report(ReportLine::heading("Saving file"));
    return m_output.save({.data = data.stream()}, "Saving file...");
}

void CreateJob::warnOfOtherClock()
{
    const double factor = request().clockHz.value_or(facts().clockHz) / facts().clockHz;
    constexpr double Rounding = 1e-9; // of a clock that came through a field
    if (std::fabs(factor - 1) > Rounding) {
        emit report(ReportLine::warning(
            QString("The samples were made for a clock of %1. At %2 all frequencies are those "
                    "asked for times %3, all times divided by it.")
                .arg(engineeringText(facts().clockHz, "Hz"),
                     engineeringText(*request().clockHz, "Hz"))
                .arg(factor, 0, 'g', 6)));
    }
}
