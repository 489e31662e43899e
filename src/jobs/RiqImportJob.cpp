// SPDX-License-Identifier: Apache-2.0
#include "RiqImportJob.h"

#include "import/RiqFileAccess.h"
#include "log/Tracer.h"
#include "streams/TempStream.h"

#include <algorithm>
#include <utility>

RiqImportJob::RiqImportJob(RiqFileAccess &file, RiqImportRequest request, QObject *parent)
    : ImportJob(request.target, parent)
    , m_file(file)
    , m_request(std::move(request))
{
}

QString RiqImportJob::proposedComment(const RiqEntry &entry)
{
    return QString::asprintf("RF=%f MHz, Bandwidth=%f kHz", entry.ifFrequency / 1e6,
                             entry.ifBandwidth / 1e3);
}

std::optional<qint64> RiqImportJob::readInput(TempStream &data, qint64 limit)
{
    emit report(ReportLine::heading("Reading directory entry from cache."));
    const RiqEntry entry = m_file.entry(m_request.packet - 1);
    if (!entry.valid) {
        Tracer::Trace(Tracer::Error, "Cannot get directory structure from RIQ file cache.");
        return std::nullopt;
    }
    emit report(ReportLine::heading("Opening file."));
    if (!m_file.open({})) {
        Tracer::Trace(Tracer::Error, "Cannot open RIQ file.");
        return std::nullopt;
    }
    if (limit == 0 && !hasTemporaryRoomFor(entry.samples * BufferedIO::RecordSize)) {
        return std::nullopt;
    }
    if (m_request.clockFromFile) {
        setClock(permittedClock(entry.sampleRate));
    }
    output().record().comment = proposedComment(entry);
    emit report(ReportLine::heading("Reading RIQ-file data"));
    const JobStep step(*this, "Reading RIQ-File Data...", m_file);
    const bool read = m_file.readSamples(m_request.packet - 1, data.stream(), limit);
    m_file.close();
    if (!read) {
        return std::nullopt;
    }
    return limit > 0 ? std::min(limit, entry.samples) : entry.samples;
}
