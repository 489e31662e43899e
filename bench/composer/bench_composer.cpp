// SPDX-License-Identifier: Apache-2.0
// The sum of 16 tracks of 10 million samples with gains and fades, from streams to a stream,
// against the same sum of the same data in memory; and the passes before it with one and with two
// threads. Needs 3 GB in the temporary folder.
#include "composer/ComposerEngine.h"
#include "composer/TrackMixer.h"
#include "log/Tracer.h"
#include "streams/levels.h"
#include "streams/samplestream.h"

#include <benchmark/benchmark.h>

#include <QCoreApplication>
#include <QTemporaryDir>

#include <algorithm>
#include <cmath>
#include <vector>

namespace {

constexpr int TrackCount = 16;
constexpr int Samples = 10'000'000;
constexpr double ClockHz = 1e6;
constexpr double FadeSeconds = 0.5;

/// Values in memory that every track takes; the tracks differ in their gains.
const std::vector<float> &source()
{
    static const std::vector<float> values = [] {
        std::vector<float> result(2 * static_cast<std::size_t>(Samples));
        quint32 state = 1;
        for (float &value : result) {
            state = state * 1664525U + 1013904223U;
            value = static_cast<float>(state >> 8U) / 16777216.0F - 0.5F;
        }
        return result;
    }();
    return values;
}

Composition sixteenTracks()
{
    Composition document;
    for (int track = 0; track < TrackCount; ++track) {
        document.addTrack();
        ComposerSegment segment;
        segment.lSamples = Samples;
        segment.lUsed = Samples;
        segment.dSrcClk = ClockHz;
        segment.dLOfs = 3 + track;
        segment.dFadeIn = FadeSeconds;
        segment.dFadeOut = FadeSeconds;
        document.track(track)->segments.push_back(segment);
    }
    document.target.lSamples = Samples;
    return document;
}

bool fill(SegmentBufferMap &buffers)
{
    for (int track = 0; track < TrackCount; ++track) {
        SegmentBuffers &segment = buffers[sampleKey(track, 0)];
        segment.makeStreams();
        if (!segment.data->open() || !segment.markers->open() ||
            !(*segment.data)->writeHeader(BufferedIO::DataHeader) ||
            !writeSamples(*segment.data->stream(), source()) || !segment.release()) {
            return false;
        }
    }
    return true;
}

void BM_Combine(benchmark::State &state)
{
    const Composition document = sixteenTracks();
    SegmentBufferMap buffers;
    if (!fill(buffers)) {
        state.SkipWithError("no streams");
        return;
    }
    for (auto _ : state) {
        TempStream result(SegmentBuffers::DataBufferSize);
        bool done = result.open() && result->writeHeader(BufferedIO::DataHeader);
        TrackMixer mixer(document, buffers);
        LevelSums levels;
        for (int position = 0; done && position < Samples;) {
            const int count = std::min(Samples - position, TrackMixer::BlockSamples);
            done = mixer.mix(count);
            addLevels(mixer.samples(), levels);
            done = done && result->writeBlock(static_cast<int>(mixer.samples().size_bytes()),
                                              mixer.samples().data());
            position += count;
        }
        if (!done) {
            state.SkipWithError("mixing failed");
            return;
        }
        benchmark::DoNotOptimize(levels);
    }
    state.SetItemsProcessed(state.iterations() * Samples);
}

void BM_MixInMemory(benchmark::State &state)
{
    std::vector<std::vector<float>> tracks(TrackCount, source());
    std::vector<float> sum(source().size());
    constexpr std::size_t Fade = static_cast<std::size_t>(FadeSeconds * ClockHz);
    for (auto _ : state) {
        std::fill(sum.begin(), sum.end(), 0.0F);
        for (std::size_t track = 0; track < TrackCount; ++track) {
            const float *values = tracks[track].data();
            const double gain = std::pow(10.0, (3.0 + static_cast<double>(track)) / -20);
            const auto add = [&](std::size_t from, std::size_t to, auto factor) {
                for (std::size_t i = from; i < to; ++i) {
                    const double v = factor(i);
                    sum[2 * i] = static_cast<float>(sum[2 * i] + values[2 * i] * v);
                    sum[2 * i + 1] = static_cast<float>(sum[2 * i + 1] + values[2 * i + 1] * v);
                }
            };
            add(0, Fade, [&](std::size_t i) { return gain * static_cast<double>(i) / Fade; });
            add(Fade, Samples - Fade, [&](std::size_t) { return gain; });
            add(Samples - Fade, Samples,
                [&](std::size_t i) { return gain * static_cast<double>(Samples - i) / Fade; });
        }
        LevelSums levels;
        addLevels(sum, levels);
        benchmark::DoNotOptimize(levels);
    }
    state.SetItemsProcessed(state.iterations() * Samples);
}

/// Passes 1 to 3 of four files, each of them resampled and shifted.
void BM_Passes(benchmark::State &state)
{
    constexpr int FileSamples = 2'000'000;
    const QTemporaryDir folder;
    Composition document;
    document.target.dUsrClk = ClockHz * 1.25;
    for (int track = 0; track < 4; ++track) {
        const QString name = folder.filePath(QString::number(track) + ".wv");
        WvWriteJob job;
        job.clock = ClockHz;
        job.markerClock = ClockHz;
        job.samples = FileSamples;
        job.iSamples = QList<float>(source().begin(), source().begin() + FileSamples);
        job.qSamples = job.iSamples;
        if (!HvFileIO().writeWaveform(job, name, nullptr, nullptr, nullptr)) {
            state.SkipWithError("no source");
            return;
        }
        document.addTrack();
        ComposerSegment segment;
        segment.sName = name;
        segment.lSamples = FileSamples;
        segment.lUsed = FileSamples;
        segment.dSrcClk = ClockHz;
        segment.dFOfs = 12345;
        document.track(track)->segments.push_back(segment);
    }
    for (auto _ : state) {
        ComposerEngine engine(document);
        engine.setMaxThreads(static_cast<int>(state.range(0)));
        if (!engine.runPass(1) || !engine.runPass(2) || !engine.runPass(3)) {
            state.SkipWithError("a pass failed");
            return;
        }
    }
}

BENCHMARK(BM_Combine)->Unit(benchmark::kMillisecond)->UseRealTime()->Iterations(3);
BENCHMARK(BM_MixInMemory)->Unit(benchmark::kMillisecond)->UseRealTime()->Iterations(3);
BENCHMARK(BM_Passes)->Arg(1)->Arg(2)->Unit(benchmark::kMillisecond)->UseRealTime()->Iterations(3);

} // namespace

int main(int argc, char **argv)
{
    const QCoreApplication application(argc, argv);
    Tracer::setMask(Tracer::Error);
    benchmark::Initialize(&argc, argv);
    benchmark::RunSpecifiedBenchmarks();
    return 0;
}
