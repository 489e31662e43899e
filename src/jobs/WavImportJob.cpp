// SPDX-License-Identifier: Apache-2.0
#include "WavImportJob.h"

#include "base/EngineeringNumber.h"
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

double WavImportJob::clockFor(const WavHeader &header) const
{
    if (!m_request.clockFromFile) {
        return m_request.target.clockHz;
    }
    const double clock = std::clamp(static_cast<double>(header.sampleRate),
                                    ImportTarget::MinClockHz, ImportTarget::MaxClockHz);
    if (clock != header.sampleRate) {
        Tracer::Trace(Tracer::Warning,
                      QString("The file's sample rate of %1 Hz is no permitted clock; using %2.")
                          .arg(header.sampleRate)
                          .arg(engineeringText(clock, "Hz")));
    }
    return clock;
}

bool WavImportJob::work()
{
    if (target().output.fileName.isEmpty()) {
        return Tracer::fail(emptyFileNameText());
    }
    emit report(ReportLine::heading("Reading directory entry from cache."));
    emit report(ReportLine::heading("Opening file."));
    WavFileAccess file;
    const std::optional<WavHeader> header = readHeader(file, m_request.inputFile);
    if (!header) {
        return false;
    }
    TempStream data;
    if (!data.open()) {
        return Tracer::fail("Cannot create temporary data buffer.");
    }
    emit report(ReportLine::heading("Reading WAV-file data"));
    {
        const JobStep step(*this, "Reading WAV-File Data...", file);
        if (!file.readSamples(data.stream(), 0)) {
            return false;
        }
    }
    return scaleAndSave(data, header->samples(), clockFor(*header));
}
