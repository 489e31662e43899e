// SPDX-License-Identifier: Apache-2.0
#include "CheckJob.h"

#include "base/ProgressClock.h"
#include "log/Tracer.h"
#include "streams/RunLengthDevice.h"
#include "streams/levels.h"
#include "streams/samplestream.h"
#include "wvfile/HvFileIO.h"
#include "wvfile/SampleDevice.h"

#include <algorithm>

namespace {

constexpr int SmallBuffer = 1024 * 1024;

/// The largest words of either sign, as all codings decode them; the words next to them lie a whole
/// step below.
bool isAtFullScale(float value)
{
    constexpr float Step = 1.0F / 32767.0F;
    return value >= 1 - 0.75F * Step || value <= -1 + 0.25F * Step;
}

} // namespace

CheckJob::CheckJob(const QString &fileName, QObject *parent)
    : ToolJob(parent)
    , m_fileName(fileName)
{
}

bool CheckJob::work()
{
    RunLengthDevice markerBytes;
    BufferedIO markers(SmallBuffer);
    if (!markers.initBuf(&markerBytes, BufferedIO::ReadWrite)) {
        return Tracer::fail("Cannot create temporary marker buffer.");
    }
    WvFileInfo info;
    info.fileName = m_fileName;
    info.reading = SampleReading::Checked;
    info.markerStream = &markers;
    {
        HvFileIO file;
        const JobStep step(*this, "Reading Waveform...", file);
        if (!file.readWaveform(&info)) {
            return false;
        }
    }
    m_result = SampleCheck();
    m_result.isComplete = info.missingSamples == 0;
    m_result.samples = info.samples;
    if (info.samples == 0) {
        return true;
    }
    SampleDevice decoder;
    BufferedIO data(SmallBuffer);
    if (!decoder.setSource(info) || !data.initBuf(&decoder, BufferedIO::Read) ||
        !data.checkHeader(BufferedIO::DataHeader)) {
        return Tracer::fail("Cannot open waveform input file.");
    }
    ProgressClock progress([this](int percent) { emit ProgressUpdate(percent); }, cancelFlag());
    LevelSums levels;
    LoopMeter loop;
    const BlockLoop read = forEachBlock(
        data, info.samples, [&](qint64 done) { return progress.shouldStop(done, info.samples); },
        [&](std::span<const float> iq, qint64) {
            addLevels(iq, levels);
            loop.add(iq);
            m_result.clipped += std::count_if(iq.begin(), iq.end(), isAtFullScale);
            return true;
        });
    if (read.end != BlockLoop::Done) {
        return mayProceed() && Tracer::fail("Cannot read I/Q data.");
    }
    m_result.peakOffset = measuredOffset(levels.peakLevel());
    m_result.rmsOffset = measuredOffset(levels.rmsLevel(info.samples));
    m_result.loop = loop.result();
    return true;
}
