// SPDX-License-Identifier: Apache-2.0
#include "HvFileIO.h"

#include "WvReader.h"
#include "WvScanner.h"
#include "WvWriter.h"
#include "streams/BufferedIO.h"

#include "base/OutputFile.h"
#include "base/ProgressClock.h"
#include "log/Tracer.h"

#include <QDateTime>
#include <QFile>
#include <QFileInfo>

#include <algorithm>

namespace {

/// Only regular files are opened: a device or a pipe may never end, or never begin.
bool openForReading(QFile &file)
{
    return QFileInfo(file.fileName()).isFile() &&
           file.open(QIODevice::ReadOnly | QIODevice::Unbuffered);
}

void clearOutputs(WvFileInfo &info)
{
    WvFileInfo cleared;
    cleared.reading = info.reading;
    cleared.gainDb = info.gainDb;
    cleared.fileName = info.fileName;
    cleared.dataStream = info.dataStream;
    cleared.markerStream = info.markerStream;
    cleared.tagsStream = info.tagsStream;
    info = cleared;
}

/// The birth date where the file system keeps one.
QDateTime creationTime(const QFileInfo &file)
{
    const QDateTime birth = file.birthTime();
    return birth.isValid() ? birth : file.metadataChangeTime();
}

} // namespace

HvFileIO::HvFileIO(QObject *parent)
    : QObject(parent)
{
}

void HvFileIO::cancel()
{
    m_abort = true;
}

bool HvFileIO::readWaveform(WvFileInfo *info)
{
    m_abort = false;
    if (info == nullptr) {
        return Tracer::fail("Invalid input parameter.");
    }
    const bool unpacks = info->reading == SampleReading::Unpacked;
    if ((unpacks && info->dataStream == nullptr) || info->markerStream == nullptr) {
        return Tracer::fail("No temporary data storage available.");
    }
    if (!info->markerStream->restartAtBegining()) {
        return Tracer::fail("Temporary marker storage not accessible.");
    }
    Tracer::Trace(Tracer::Information, "Reading waveform file '" + info->fileName + "'...");
    clearOutputs(*info);
    QFile file(info->fileName);
    if (!openForReading(file)) {
        return Tracer::fail("Cannot open waveform input file.");
    }
    ProgressClock progress([this](int percent) { emit ProgressUpdate(percent); }, m_abort);
    if (!WvReader(*info, file, progress).read()) {
        return false;
    }
    emit ProgressUpdate(100);
    ProgressClock::runEvents();
    if ((unpacks && !info->dataStream->restartAtBegining()) ||
        !info->markerStream->restartAtBegining()) {
        return Tracer::fail("Writing to temporary data storage failed.");
    }
    return true;
}

bool HvFileIO::writeWaveform(WvWriteJob &job, const QString &fileName, BufferedIO *dataStream,
                             BufferedIO *markerStream, BufferedIO *tagsStream)
{
    m_abort = false;
    Tracer::Trace(Tracer::Information, "Creating waveform file " + fileName + "...");
    if (job.samples < 1) {
        return Tracer::fail("Number of points cannot be zero.");
    }
    if (fileName.isEmpty()) {
        return Tracer::fail("Waveform file name is empty.");
    }
    if (dataStream != nullptr && !dataStream->checkHeader(BufferedIO::DataHeader)) {
        return Tracer::fail("Cannot read data stream header.");
    }
    if (markerStream != nullptr && !markerStream->restartAtBegining()) {
        return Tracer::fail("Cannot setup buffer for temporary marker file.");
    }
    const bool inMemory = !job.iSamples.isEmpty() && !job.qSamples.isEmpty();
    const qsizetype held = std::min(job.iSamples.size(), job.qSamples.size());
    const bool usesStream =
        dataStream != nullptr && job.iSamples.isEmpty() && job.qSamples.isEmpty();
    if (!usesStream && (dataStream != nullptr || !inMemory || held < job.samples)) {
        return Tracer::fail(
            QString("Waveform data for %1 samples is not available.").arg(job.samples));
    }
    if (markerStream == nullptr && !job.markers.isEmpty() && job.markers.size() < job.samples) {
        return Tracer::fail(
            QString("Marker data for %1 samples is not available.").arg(job.samples));
    }
    emit ProgressUpdate(0);
    const auto report = [this](int percent) { emit ProgressUpdate(percent); };
    ProgressClock progress(report, m_abort);
    WvWriter writer(job, {.data = dataStream, .markers = markerStream, .tags = tagsStream},
                    progress, report);
    writer.prepareLevels();
    OutputFile file(fileName,
                    job.overwrite ? OutputFile::Existing::Replaced : OutputFile::Existing::Kept);
    if (!file.open()) {
        return Tracer::fail(
            QString("Error opening output file '%1': %2").arg(fileName, file.errorString()));
    }
    if (!writer.write(file)) {
        return false;
    }
    // A cancel that came with the last samples counts, too: nothing has been replaced yet.
    ProgressClock::runEvents();
    if (m_abort) {
        return Tracer::fail("Action aborted by user.");
    }
    if (!file.commit()) {
        return Tracer::fail("Error writing output file: " + file.errorString());
    }
    emit ProgressUpdate(100);
    Tracer::Trace(Tracer::Information, "Waveform file generated.");
    return true;
}

bool HvFileIO::readWaveformInfo(const QString &fileName, WvFileSummary *summary)
{
    if (summary == nullptr) {
        return Tracer::fail("Invalid input parameter.");
    }
    *summary = WvFileSummary();
    Tracer::Trace(Tracer::Information, "Reading information from file: " + fileName);
    const QFileInfo fileInfo(fileName);
    if (!fileInfo.exists()) {
        return Tracer::fail("File does not exist.");
    }
    summary->fileName = fileInfo.fileName();
    summary->fileSize = fileInfo.size();
    summary->created = creationTime(fileInfo).toString("yyyy-MM-dd");
    QFile file(fileName);
    if (!openForReading(file)) {
        return Tracer::fail("Cannot open file.");
    }
    return WvScanner(*summary).scan(file);
}
