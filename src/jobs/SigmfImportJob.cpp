// SPDX-License-Identifier: Apache-2.0
#include "SigmfImportJob.h"

#include "ReportText.h"

#include "log/Tracer.h"

#include <utility>

SigmfImportJob::SigmfImportJob(SigmfImportRequest request, QObject *parent)
    : ImportJob(request.target, parent)
    , m_request(std::move(request))
{
}

std::optional<qint64> SigmfImportJob::readInput(TempStream &data, qint64 limit)
{
    emit report(ReportLine::heading("Reading SigMF recording"));
    SigmfFileAccess file;
    if (!file.open(m_request.inputFile)) {
        return std::nullopt;
    }
    const SigmfMetadata &metadata = file.metadata();
    if (m_request.channel < 1 || m_request.channel > metadata.channels) {
        Tracer::Trace(Tracer::Error, QString("There is no channel %1; permitted: 1 to %2.")
                                         .arg(m_request.channel)
                                         .arg(metadata.channels));
        return std::nullopt;
    }
    if (m_request.clockFromFile) {
        if (!(metadata.sampleRate > 0)) {
            Tracer::Trace(Tracer::Error, "The SigMF metadata state no sample rate. Give the clock "
                                         "of the waveform by --clock.");
            return std::nullopt;
        }
        setClock(permittedClock(metadata.sampleRate));
    }
    emit report(ReportLine::row("Datatype", metadata.type.name));
    if (limit == 0 && !hasTemporaryRoomFor(file.samples() * BufferedIO::RecordSize)) {
        return std::nullopt;
    }
    const JobStep step(*this, "Reading SigMF Data...", file);
    if (!file.readSamples(*data.stream(), m_request.channel, limit)) {
        return std::nullopt;
    }
    // A magnitude above full scale needs no other level as long as no value of I or Q lies beyond.
    if (file.clipped().values == 0) {
        keepLevelUnlessAuto();
    }
    const qint64 samples = limit > 0 ? std::min(limit, file.samples()) : file.samples();
    if (limit > 0) {
        return samples;
    }
    m_hasMarkers = !metadata.marks.empty();
    if (m_hasMarkers && (!m_markers.initBuf(&m_markerBytes, BufferedIO::ReadWrite) ||
                         !file.writeMarkers(m_markers, samples))) {
        return std::nullopt;
    }
    return keepTexts(metadata) ? std::optional(samples) : std::nullopt;
}

bool SigmfImportJob::keepTexts(const SigmfMetadata &metadata)
{
    output().record().comment = metadata.description;
    output().record().copyright = metadata.copyright;
    m_hasTags = !metadata.unknownTags.isEmpty();
    return !m_hasTags ||
           (m_tags.open() && m_tags->writeBytes(static_cast<int>(metadata.unknownTags.size()),
                                                metadata.unknownTags.constData())) ||
           Tracer::fail("Cannot save unknown tag.");
}
