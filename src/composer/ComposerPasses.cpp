// SPDX-License-Identifier: Apache-2.0
#include "ComposerPasses.h"

#include "SegmentBuffers.h"
#include "wholenumbers.h"

#include "base/parallel.h"
#include "log/Tracer.h"
#include "streams/markerstream.h"

#include <QFileInfo>

#include <utility>

Pass23::Pass23(const Job &job, QObject *parent)
    : QThread(parent)
    , m_job(job)
{
}

void Pass23::cancel()
{
    m_cancelled = true;
    emit cancelTask();
}

void Pass23::progressValueChanged(int percent)
{
    m_progress = percent;
}

void Pass23::run()
{
    setOwnThreadLimit(m_job.processors);
    m_ok = !m_cancelled && work();
    // A full disk may show only now.
    if (!buffers().release() && m_ok) {
        m_ok = Tracer::fail(QStringLiteral("Cannot write the temporary data of %1.").arg(place()));
    }
}

QString Pass23::place() const
{
    return QStringLiteral("track %1, segment %2").arg(m_job.track + 1).arg(m_job.index + 1);
}

Pass1::Pass1(const Job &job, QObject *parent)
    : Pass23(job, parent)
{
    wire(m_file);
}

bool Pass1::work()
{
    progressValueChanged(0);
    const QString &name = segment().sName;
    Tracer::Trace(Tracer::Debug,
                  QStringLiteral("Creating temporary buffers for file '%1'").arg(name));
    if (!QFileInfo(name).isFile()) {
        return Tracer::fail(
            QStringLiteral("The source file '%1' of %2 is missing.").arg(name, place()));
    }
    buffers().makeStreams();
    if (!buffers().data->open()) {
        return Tracer::fail("Cannot create temporary data buffer.");
    }
    if (!buffers().markers->open()) {
        return Tracer::fail("Cannot create temporary marker buffer.");
    }
    WvFileInfo info;
    info.fileName = name;
    info.dataStream = buffers().data->stream();
    info.markerStream = buffers().markers->stream();
    if (!m_file.readWaveform(&info)) {
        return Tracer::fail(QStringLiteral("Cannot read waveform file '%1'.").arg(name));
    }
    if (info.clock != segment().dSrcClk) {
        return Tracer::fail(
            QStringLiteral("Waveform clock rate in file '%1' does not match setup.").arg(name));
    }
    if (info.samples != segment().lSamples) {
        return Tracer::fail(
            QStringLiteral("Sample count in file '%1' does not match setup.").arg(name));
    }
    return completeMarkers(*info.markerStream, info.samples);
}

Pass2::Pass2(const Job &job, QObject *parent)
    : Pass23(job, parent)
{
    wire(m_resample);
}

bool Pass2::work()
{
    if (!composition().needsResampling(segment())) {
        progressValueChanged(100);
        return true;
    }
    const qint64 count = wholePart(composition().target.dUsrClk / segment().dSrcClk *
                                       static_cast<double>(segment().lSamples) +
                                   0.5);
    SegmentBuffers result;
    result.makeStreams();
    if (!result.data->open()) {
        return Tracer::fail(
            QStringLiteral("Cannot create temporary data buffer for %1.").arg(place()));
    }
    if (!result.markers->open()) {
        return Tracer::fail(
            QStringLiteral("Cannot create temporary marker buffer for %1.").arg(place()));
    }
    BufferedIO &data = *buffers().data->stream();
    BufferedIO &markers = *buffers().markers->stream();
    m_resample.setInput(&data, segment().lSamples);
    m_resample.setOutput(result.data->stream(), count);
    m_resample.setMarkers(&markers, result.markers->stream());
    const bool done = data.reinitBuf() && markers.reinitBuf() && m_resample.run();
    if (!done || !result.release()) {
        return Tracer::fail(QStringLiteral("Resampling failed for %1.").arg(place()));
    }
    std::swap(buffers(), result);
    return true;
}

Pass3::Pass3(const Job &job, QObject *parent)
    : Pass23(job, parent)
{
    wire(m_resample);
}

bool Pass3::work()
{
    const double offset = composition().effectiveOffset(segment()).hz;
    if (!segment().hasFrequencyOffset()) {
        progressValueChanged(100);
        return true;
    }
    const double clockHz = composition().target.dUsrClk;
    const auto samples = static_cast<qint32>(segment().lSamples);
    const auto count =
        wholePart<qint32>(clockHz / segment().dSrcClk * static_cast<double>(samples) + 0.5);
    BufferedIO &data = *buffers().data->stream();
    return (data.reinitBuf() && m_resample.frequencyShift(count, offset, clockHz, &data)) ||
           Tracer::fail(QStringLiteral("Frequency shifting failed for %1.").arg(place()));
}
