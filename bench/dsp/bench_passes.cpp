// SPDX-License-Identifier: Apache-2.0
// The light passes over a stream of 4 million samples against copying it, and against the literal
// loop of the frequency shift.
#include "base/parallel.h"
#include "dsp/Resample.h"
#include "log/Tracer.h"
#include "streams/TempStream.h"
#include "support/samples.h"

#include <benchmark/benchmark.h>

#include <cmath>
#include <complex>
#include <vector>

namespace {

constexpr int Count = 4000000;
constexpr int CopyBlock = 32768 * 8; ///< bytes

[[nodiscard]] bool fill(BufferedIO &stream)
{
    return stream.writeHeader("IQF") && stream.writeBytes(Count * 8, uniformNoise(Count).data()) &&
           stream.checkHeader("IQF");
}

/// Reading and writing back in place, as rescale does.
void BM_CopyInPlace(benchmark::State &state)
{
    TempStream stream;
    if (!stream.open() || !fill(*stream.stream())) {
        state.SkipWithError("no stream");
        return;
    }
    std::vector<char> block(CopyBlock);
    for (auto _ : state) {
        bool ok = stream->checkHeader("IQF") && stream->writeBytes(3, "IQF");
        for (int done = 0; done < Count * 8 && ok;) {
            const int bytes = std::min(CopyBlock, Count * 8 - done);
            ok = stream->readBytes(bytes, block.data()) && stream->writeBytes(bytes, block.data());
            done += bytes;
        }
        if (!ok) {
            state.SkipWithError("copy failed");
            return;
        }
    }
}

/// From one stream to another.
void BM_Copy(benchmark::State &state)
{
    TempStream stream;
    TempStream target;
    if (!stream.open() || !target.open() || !fill(*stream.stream())) {
        state.SkipWithError("no stream");
        return;
    }
    std::vector<char> block(CopyBlock);
    for (auto _ : state) {
        bool ok = stream->checkHeader("IQF") && target->writeHeader("IQF");
        for (int done = 0; done < Count * 8 && ok;) {
            const int bytes = std::min(CopyBlock, Count * 8 - done);
            ok = stream->readBytes(bytes, block.data()) && target->writeBytes(bytes, block.data());
            done += bytes;
        }
        if (!ok) {
            state.SkipWithError("copy failed");
            return;
        }
    }
}

void BM_Rescale(benchmark::State &state)
{
    TempStream stream;
    if (!stream.open() || !fill(*stream.stream())) {
        state.SkipWithError("no stream");
        return;
    }
    Resample resample;
    for (auto _ : state) {
        if (!resample.rescale(Count, -1.0, stream.stream())) {
            state.SkipWithError("rescale failed");
            return;
        }
    }
    Samples samples(Count);
    const Samples expected = uniformNoise(Count);
    const float sign = state.iterations() % 2 == 0 ? 1.0F : -1.0F;
    bool ok = stream->checkHeader("IQF") && stream->readBytes(Count * 8, samples.data());
    for (size_t i = 0; i < samples.size(); ++i) {
        ok = ok && samples[i] == sign * expected[i];
    }
    if (!ok) {
        state.SkipWithError("wrong result");
    }
}

void BM_Statistics(benchmark::State &state)
{
    TempStream stream;
    if (!stream.open() || !fill(*stream.stream())) {
        state.SkipWithError("no stream");
        return;
    }
    Resample resample;
    double peak = 0;
    double rms = 0;
    for (auto _ : state) {
        if (!resample.statistics(Count, stream.stream(), &peak, &rms)) {
            state.SkipWithError("statistics failed");
            return;
        }
    }
    double sum = 0;
    for (const std::complex<float> &sample : uniformNoise(Count)) {
        sum += std::norm(std::complex<double>(sample));
    }
    if (std::abs(rms - std::sqrt(sum / Count)) > 1e-9) {
        state.SkipWithError("wrong result");
    }
}

constexpr double ShiftStep = 12345.0 * 6.283185307179586 / 1e7;

void BM_FrequencyShift(benchmark::State &state)
{
    setThreadLimit(static_cast<unsigned>(state.range(0)));
    TempStream stream;
    if (!stream.open()) {
        state.SkipWithError("no stream");
        return;
    }
    Resample resample;
    for (auto _ : state) {
        state.PauseTiming();
        bool ok = fill(*stream.stream());
        state.ResumeTiming();
        ok = ok && resample.frequencyShift(Count, 12345.0, 1e7, stream.stream());
        if (!ok) {
            state.SkipWithError("shift failed");
            return;
        }
    }
    Samples samples(Count);
    const Samples expected = uniformNoise(Count);
    bool ok = stream->checkHeader("IQF") && stream->readBytes(Count * 8, samples.data());
    double angle = 0;
    for (size_t i = 0; i < samples.size(); ++i) {
        const std::complex<double> turned =
            std::complex<double>(expected[i]) * std::polar(1.0, angle);
        ok = ok && std::abs(turned - std::complex<double>(samples[i])) < 1e-6;
        angle += ShiftStep;
    }
    if (!ok) {
        state.SkipWithError("wrong result");
    }
}

/// The loop as defined, in memory: polar form, one sum, and back.
void BM_FrequencyShiftLiteral(benchmark::State &state)
{
    const Samples original = uniformNoise(Count);
    Samples samples = original;
    for (auto _ : state) {
        double angle = 0;
        for (size_t i = 0; i < samples.size(); ++i) {
            const double re = original[i].real();
            const double im = original[i].imag();
            const double magnitude = std::sqrt(re * re + im * im);
            const double phase = std::atan2(im, re) + angle;
            samples[i] = {static_cast<float>(magnitude * std::cos(phase)),
                          static_cast<float>(magnitude * std::sin(phase))};
            angle += ShiftStep;
        }
        benchmark::DoNotOptimize(samples.data());
    }
}

BENCHMARK(BM_CopyInPlace)->Unit(benchmark::kMillisecond);
BENCHMARK(BM_Rescale)->Unit(benchmark::kMillisecond);
BENCHMARK(BM_Copy)->Unit(benchmark::kMillisecond);
BENCHMARK(BM_Statistics)->Unit(benchmark::kMillisecond);
BENCHMARK(BM_FrequencyShift)->Arg(1)->Arg(2)->UseRealTime()->Unit(benchmark::kMillisecond);
BENCHMARK(BM_FrequencyShiftLiteral)->Unit(benchmark::kMillisecond);

} // namespace

BENCHMARK_MAIN();
