// SPDX-License-Identifier: Apache-2.0

// Goals: the trace's table of 100 000 samples below 1 ms; the same repaint for any number of
// samples, below 4 ms; a scroll step of the viewer over 100 million samples below 10 ms in the 99th
// percentile; the overview of these (overview/1) in less than twice the time of the bare read.

#include "display/CWidgetConstellation.h"
#include "display/CWidgetIQTrace.h"
#include "display/CWidgetSpectrum.h"
#include "display/renderplot.h"
#include "streams/TempStream.h"
#include "streams/samplestream.h"
#include "view/Overview.h"
#include "view/ViewWindow.h"

#include <QApplication>
#include <QRandomGenerator>

#include <benchmark/benchmark.h>

#include <algorithm>
#include <chrono>
#include <cmath>
#include <cstdio>
#include <memory>
#include <span>
#include <vector>

namespace {

IqList noisyTone(qsizetype count)
{
    QRandomGenerator random(1);
    IqList samples(count);
    for (qsizetype k = 0; k < count; ++k) {
        const double angle = 0.1 * static_cast<double>(k);
        samples[k] = {0.6 * std::cos(angle) + 0.1 * random.generateDouble(),
                      0.6 * std::sin(angle) + 0.1 * random.generateDouble()};
    }
    return samples;
}

void traceBins(benchmark::State &state)
{
    const IqList samples = noisyTone(state.range(0));
    const QList<quint8> markers(samples.size(), 5);
    TraceBins bins;
    for (auto _ : state) {
        bins.compute(samples, markers);
        benchmark::DoNotOptimize(bins);
    }
    qint64 sum = 0;
    for (const TraceBin &bin : bins.bins()) {
        sum += bin.count;
    }
    if (sum != samples.size()) {
        state.SkipWithError("bins lost samples");
    }
    state.SetItemsProcessed(state.iterations() * state.range(0));
}
BENCHMARK(traceBins)->Arg(1000)->Arg(5000)->Arg(100'000)->Unit(benchmark::kMicrosecond);

/// A repaint without new data, as when a window is uncovered.
template <typename Display>
void repaint(benchmark::State &state)
{
    Display display;
    display.resize(800, 500);
    display.setView(static_cast<int>(state.range(1)));
    display.setData(noisyTone(state.range(0)));
    (void)display.picture();
    for (auto _ : state) {
        benchmark::DoNotOptimize(display.picture());
    }
}
BENCHMARK(repaint<CWidgetIQTrace>)
    ->ArgsProduct({{1000, 10'000, 100'000, 1'000'000}, {0, 1, 2, 4}})
    ->Unit(benchmark::kMicrosecond);
BENCHMARK(repaint<CWidgetSpectrum>)
    ->ArgsProduct({{1000, 10'000, 100'000, 1'000'000}, {0, 1}})
    ->Unit(benchmark::kMicrosecond);

void spectrumLines(benchmark::State &state)
{
    const IqList samples = noisyTone(100'000);
    qint64 made = 0;
    for (auto _ : state) {
        SpectrumLines lines;
        lines.update(samples, 0);
        made = lines.transformCount();
        benchmark::DoNotOptimize(lines);
    }
    state.SetItemsProcessed(state.iterations() * made);
}
BENCHMARK(spectrumLines)->Unit(benchmark::kMicrosecond)->UseRealTime();

/// 100 million samples in temporary streams, made once.
struct LongWaveform
{
    static constexpr qint64 Count = 100'000'000;
    TempStream data;
    TempStream markers;
    bool good = false;

    LongWaveform()
    {
        constexpr int block = 100'000;
        const IqList samples = noisyTone(block);
        std::vector<float> iq;
        for (const IqSample &sample : samples) {
            iq.push_back(static_cast<float>(sample.i));
            iq.push_back(static_cast<float>(sample.q));
        }
        const std::vector<char> bytes(block, 3);
        good = data.open() && markers.open() && data->writeHeader("IQF");
        for (qint64 done = 0; done < Count && good; done += block) {
            good =
                data->writeBytes(8 * block, iq.data()) && markers->writeBytes(block, bytes.data());
        }
    }
};

/// What the viewer does on a move: read the difference, hand it to the three displays and paint
/// them. Arguments: points shown, and the move (0 a little step forward, 1 the play step, 2 a
/// jump).
void scrollStep(benchmark::State &state)
{
    static const auto waveform = std::make_unique<LongWaveform>();
    CWidgetIQTrace trace;
    CWidgetSpectrum spectrum;
    CWidgetConstellation constellation;
    trace.resize(800, 300);
    trace.setShowMarkers(true);
    spectrum.resize(400, 300);
    constellation.resize(400, 300);
    ViewWindow window;
    window.setSource(waveform->data.stream(), waveform->markers.stream(), LongWaveform::Count);
    bool good = waveform->good && window.show(LongWaveform::Count / 2);
    while (good && window.points() < state.range(0)) {
        good = window.zoomOut();
    }
    qint64 jump = 7'654'321;
    std::vector<double> steps;
    for (auto _ : state) {
        const auto start = std::chrono::steady_clock::now();
        const qint64 target = state.range(1) == 0   ? window.forwardLittle()
                              : state.range(1) == 1 ? window.first() + window.playStep()
                                                    : (window.first() + jump) % window.end();
        good = good && window.show(target <= window.end() ? target : 0);
        trace.setData(window.samples(), window.markers());
        spectrum.setData(window.samples(), window.first(), window.first() + window.points() - 1);
        const double scale = constellationScale(peakMagnitude(window.samples()));
        constellation.setScale(scale, scale);
        constellation.setData(window.samples());
        benchmark::DoNotOptimize(trace.picture());
        benchmark::DoNotOptimize(spectrum.picture());
        benchmark::DoNotOptimize(constellation.picture());
        const std::chrono::duration<double, std::milli> step =
            std::chrono::steady_clock::now() - start;
        steps.push_back(step.count());
    }
    std::ranges::sort(steps);
    if (!good || steps.empty()) {
        state.SkipWithError("the waveform can't be shown");
        return;
    }
    state.counters["p99_ms"] = steps[steps.size() * 99 / 100];
}
BENCHMARK(scrollStep)
    ->ArgsProduct({{5000, 100'000}, {0, 1, 2}})
    ->Unit(benchmark::kMillisecond)
    ->UseRealTime();

/// The envelope of the whole file for the bar below the trace, and the reading alone.
void overview(benchmark::State &state)
{
    const auto waveform = std::make_unique<LongWaveform>();
    constexpr std::size_t Block = 1 << 19;
    std::vector<float> iq(2 * Block);
    std::vector<quint8> markers(Block);
    bool good = waveform->good;
    for (auto _ : state) {
        good = good && waveform->data->restartAtPosition(BufferedIO::HeaderSize) &&
               waveform->markers->restartAtPosition(0);
        Overview overview(LongWaveform::Count);
        for (qint64 left = LongWaveform::Count; left > 0 && good;) {
            const auto count = std::min(Block, static_cast<std::size_t>(left));
            const auto values = std::span(iq).first(2 * count);
            const auto bytes = std::span(markers).first(count);
            good = readSamples(*waveform->data.stream(), values) == static_cast<int>(count) &&
                   waveform->markers->readBlock(static_cast<int>(count), bytes.data()) ==
                       static_cast<int>(count);
            if (state.range(0) != 0) {
                overview.append(values, bytes);
            }
            left -= static_cast<qint64>(count);
        }
        good = good && overview.isComplete() == (state.range(0) != 0);
    }
    if (!good) {
        state.SkipWithError("the waveform can't be read");
    }
}
BENCHMARK(overview)->Arg(0)->Arg(1)->Iterations(3)->Unit(benchmark::kMillisecond)->UseRealTime();

} // namespace

int main(int argc, char **argv)
{
    qputenv("QT_QPA_PLATFORM", "offscreen");
    const QApplication application(argc, argv);
    benchmark::Initialize(&argc, argv);
    if (benchmark::ReportUnrecognizedArguments(argc, argv)) {
        return 1;
    }
    benchmark::RunSpecifiedBenchmarks();
    benchmark::Shutdown();
    return 0;
}
