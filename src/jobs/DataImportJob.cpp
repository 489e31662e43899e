// SPDX-License-Identifier: Apache-2.0
#include "DataImportJob.h"

#include "import/DataFileAccess.h"
#include "log/Tracer.h"
#include "streams/TempStream.h"

#include <utility>

DataImportJob::DataImportJob(DataImportRequest request, QObject *parent)
    : ImportJob(request.target, parent)
    , m_request(std::move(request))
{
}

std::optional<qint64> DataImportJob::readInput(TempStream &data, qint64 limit)
{
    emit report(ReportLine::heading("Importing user data"));
    DataFileAccess file;
    const JobStep step(*this, "Reading Data...", file);
    if (!file.importData(m_request.input, &m_tags, data.stream(),
                         limit > 0 ? limit : m_request.limit)) {
        Tracer::Trace(Tracer::Error, "Data import failed.");
        return std::nullopt;
    }
    if (m_request.clockFromFile && file.clockHz()) {
        setClock(permittedClock(*file.clockHz()));
    }
    if (clockHz() == 0) {
        Tracer::Trace(Tracer::Error,
                      "No clock is given, and the file names none in a CLOCKRATE line.");
        return std::nullopt;
    }
    output().addClipped(file.clipped());
    return m_tags.samples;
}

/// The reader has scaled the samples already.
bool DataImportJob::scale(TempStream &, qint64)
{
    WvWriteJob &record = output().record();
    record.peakOffset = m_tags.peakOffset;
    record.rmsOffset = m_tags.rmsOffset;
    record.samples = m_tags.samples;
    record.comment = m_tags.comment;
    record.copyright = m_tags.copyright;
    emit report(ReportLine::heading("Statistics"));
    return true;
}

void DataImportJob::reportSaving()
{
    emit report(ReportLine::heading("Creating waveform"));
}
