// SPDX-License-Identifier: Apache-2.0
#include "EditJob.h"

#include "ReportText.h"

#include "log/Tracer.h"

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
    if (m_output.fileName().isEmpty()) {
        return refuse(emptyFileNameText());
    }
    if (!read()) {
        return false;
    }
    m_output.record() = source().writeJob();
    return edit();
}

bool EditJob::read()
{
    const bool reported = m_reading == Reading::Reported;
    if (reported) {
        emit report(ReportLine::heading("Reading waveform"));
    }
    if ((m_loaded || m_source.read(*this, m_inputFile)) && mayProceed()) {
        return true;
    }
    if (reported) {
        Tracer::Trace(Tracer::Error, "Reading failed.");
    }
    return false;
}

void EditJob::reportSource()
{
    reportAll(waveformRows(m_inputFile, source().writeJob()));
}

bool EditJob::stopWith(const QString &reportText, const QString &logText)
{
    setFailureText(reportText);
    return Tracer::fail(logText);
}
