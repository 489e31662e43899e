// SPDX-License-Identifier: Apache-2.0
// Rate conversion of 4 million complex samples against libsoxr's HQ recipe, with the same number
// of threads for both. The second argument is the number of threads.
#include "base/parallel.h"
#include "dsp/Resample.h"
#include "streams/BufferedIO.h"

#include <QTemporaryFile>
#include <benchmark/benchmark.h>
#include <omp.h>
#include <soxr.h>

#include <cmath>
#include <complex>
#include <numbers>
#include <vector>

namespace {

constexpr int InputCount = 4000000;
constexpr double ToneCycles = 333333; // in the whole waveform

using Samples = std::vector<std::complex<float>>;

const Samples &source()
{
    static const Samples samples = [] {
        Samples made(InputCount);
        for (size_t i = 0; i < made.size(); ++i) {
            const double cycles = std::fmod(ToneCycles * static_cast<double>(i) / InputCount, 1.0);
            made[i] = std::complex<float>(std::polar(0.5, 2 * std::numbers::pi * cycles));
        }
        return made;
    }();
    return samples;
}

/// The tone must come out at its place, 60 dB above everything else; the ends are left out, since
/// the peer doesn't loop.
bool isTone(const Samples &result, double level)
{
    for (size_t i = 1000; i + 1000 < result.size(); i += 97) {
        const double cycles = std::fmod(
            ToneCycles * static_cast<double>(i) / static_cast<double>(result.size()), 1.0);
        const std::complex<double> expected = std::polar(level, 2 * std::numbers::pi * cycles);
        if (std::abs(std::complex<double>(result[i]) - expected) > 1e-3 * level) {
            return false;
        }
    }
    return true;
}

/// An odd length of the same cost would be checked in place; the tool's even one leads by one
/// sample, which turns the tone by a fixed angle.
Samples turnedBack(const Samples &result, double lead)
{
    const std::complex<double> turn =
        std::polar(1.0, -2 * std::numbers::pi * ToneCycles / InputCount * lead);
    Samples turned(result.size());
    for (size_t i = 0; i < result.size(); ++i) {
        turned[i] = std::complex<float>(std::complex<double>(result[i]) * turn);
    }
    return turned;
}

void convert(benchmark::State &state, int length)
{
    const int outputCount = static_cast<int>(state.range(0));
    setThreadLimit(static_cast<unsigned>(state.range(1)));
    QTemporaryFile inputFile;
    QTemporaryFile outputFile;
    BufferedIO input;
    BufferedIO output;
    if (!input.initBuf(&inputFile, BufferedIO::ReadWrite) ||
        !output.initBuf(&outputFile, BufferedIO::ReadWrite) || !input.writeHeader("IQF") ||
        !input.writeBytes(InputCount * 8, source().data())) {
        state.SkipWithError("no temporary stream");
        return;
    }
    Resample resample;
    resample.setFilterFrequency(1.0, 0.45);
    resample.setFilterLength(length);
    if (!resample.setFilterType(0, 0.5) || !resample.setWindowType(1)) {
        state.SkipWithError("settings refused");
        return;
    }
    resample.setInput(&input, InputCount);
    resample.setOutput(&output, outputCount);
    for (auto _ : state) {
        if (!resample.run()) {
            state.SkipWithError("run failed");
            return;
        }
    }
    Samples result(static_cast<size_t>(outputCount));
    if (!output.checkHeader("IQF") || !output.readBytes(outputCount * 8, result.data()) ||
        !isTone(turnedBack(result, length % 2 == 0 ? 1.0 : 0.0), 0.5 / 0.9)) {
        state.SkipWithError("wrong result");
    }
    state.SetItemsProcessed(state.iterations() * InputCount);
}

void BM_Resample50(benchmark::State &state)
{
    convert(state, 50);
}

void BM_Resample201(benchmark::State &state)
{
    convert(state, 201);
}

void BM_Soxr(benchmark::State &state)
{
    const auto outputCount = static_cast<size_t>(state.range(0));
    const auto threads = static_cast<unsigned>(state.range(1));
    // Channels in arrays of their own are what soxr can spread over threads.
    std::vector<float> inPhase(InputCount);
    std::vector<float> quadrature(InputCount);
    for (size_t i = 0; i < inPhase.size(); ++i) {
        inPhase[i] = source()[i].real();
        quadrature[i] = source()[i].imag();
    }
    std::vector<float> outI(outputCount + 1000);
    std::vector<float> outQ(outputCount + 1000);
    const void *in[] = {inPhase.data(), quadrature.data()};
    void *out[] = {outI.data(), outQ.data()};
    const soxr_io_spec_t io = soxr_io_spec(SOXR_FLOAT32_S, SOXR_FLOAT32_S);
    const soxr_quality_spec_t quality = soxr_quality_spec(SOXR_HQ, 0);
    // With 0 soxr takes as many threads as OpenMP offers, one for each channel; above 1 none more.
    omp_set_num_threads(static_cast<int>(threads));
    const soxr_runtime_spec_t runtime = soxr_runtime_spec(threads == 1 ? 1 : 0);
    size_t done = 0;
    for (auto _ : state) {
        const soxr_error_t error =
            soxr_oneshot(InputCount, static_cast<double>(outputCount), 2, in, InputCount, nullptr,
                         out, outputCount, &done, &io, &quality, &runtime);
        if (error != nullptr) {
            state.SkipWithError(error);
            return;
        }
    }
    Samples result(outputCount);
    for (size_t i = 0; i < done; ++i) {
        result[i] = {outI[i], outQ[i]};
    }
    if (done + 2 < outputCount || !isTone(result, 0.5)) {
        state.SkipWithError("wrong result");
    }
    state.SetItemsProcessed(state.iterations() * InputCount);
}

/// Ratios 1.5, 0.73, 1.0009, and a prime count.
void counts(benchmark::internal::Benchmark *bench)
{
    for (const int threads : {1, 2}) {
        for (const int outputCount : {6000000, 2920000, 4003600, 5000011}) {
            bench->Args({outputCount, threads});
        }
    }
    bench->UseRealTime()->Unit(benchmark::kMillisecond);
}

BENCHMARK(BM_Resample50)->Apply(counts);
BENCHMARK(BM_Soxr)->Apply(counts);
BENCHMARK(BM_Resample201)->Apply(counts);

} // namespace

BENCHMARK_MAIN();
