// SPDX-License-Identifier: Apache-2.0
// Rate conversion of 4 million complex samples; peers stand in files of their own. The second
// argument is the number of threads.
#include "resamplecase.h"

#include "base/parallel.h"
#include "dsp/Resample.h"
#include "streams/BufferedIO.h"

#include <QTemporaryFile>

#include <cmath>
#include <numbers>

const Samples &resamplecase::source()
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

bool resamplecase::isTone(const Samples &result, double level)
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

void resamplecase::counts(benchmark::internal::Benchmark *bench)
{
    for (const int threads : {1, 2}) {
        for (const int outputCount : {6000000, 2920000, 4003600, 5000011}) {
            bench->Args({outputCount, threads});
        }
    }
    bench->UseRealTime()->Unit(benchmark::kMillisecond);
}

namespace {

using namespace resamplecase;

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

BENCHMARK(BM_Resample50)->Apply(counts);
BENCHMARK(BM_Resample201)->Apply(counts);

} // namespace

BENCHMARK_MAIN();
