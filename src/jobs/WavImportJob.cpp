// SPDX-License-Identifier: Apache-2.0
#include "WavImportJob.h"

#include "log/Tracer.h"
#include "streams/TempStream.h"

#include <algorithm>
#include <utility>

WavImportJob::WavImportJob(WavImportRequest request, QObject *parent)
    : ImportJob(request.target, parent)
    , m_request(std::move(request))
{
}

std::optional<WavHeader> WavImportJob::readHeader(WavFileAccess &file, const QString &fileName)
{
    if (!file.open(fileName)) {
        Tracer::Trace(Tracer::Error, "Cannot open .wav file.");
        return std::nullopt;
    }
    if (!file.readHeader()) {
        return std::nullopt;
    }
    if (!file.header().valid) {
        Tracer::Trace(Tracer::Error, "Cannot evaluate .wav file header.");
        return std::nullopt;
    }
    return file.header();
}

std::optional<qint64> WavImportJob::readInput(TempStream &data, qint64 limit)
{
    emit report(ReportLine::heading("Reading directory entry from cache."));
    emit report(ReportLine::heading("Opening file."));
    WavFileAccess file;
    const std::optional<WavHeader> header = readHeader(file, m_request.inputFile);
    if (!header) {
        return std::nullopt;
    }
    if (m_request.clockFromFile) {
        setClock(permittedClock(header->sampleRate));
    }
    emit report(ReportLine::heading("Reading WAV-file data"));
    if (limit == 0 && !hasTemporaryRoomFor(header->samples() * BufferedIO::RecordSize)) {
        return std::nullopt;
    }
    const JobStep step(*this, "Reading WAV-File Data...", file);
    if (!file.readSamples(data.stream(), limit)) {
        return std::nullopt;
    }
    return limit > 0 ? std::min(limit, header->samples()) : header->samples();
}
