// SPDX-License-Identifier: Apache-2.0
// The FIR filter, equal counts and 201 taps over 4 million complex samples; peers stand in files of
// their own.
#include "filtercase.h"

#include "base/parallel.h"
#include "dsp/Resample.h"

#include <benchmark/benchmark.h>

#include <cmath>

namespace {

using namespace filtercase;

constexpr double Cutoff = 0.25;

[[nodiscard]] bool runFilter(const Samples &input, Samples &output, benchmark::State *state)
{
    TempStream in;
    TempStream out;
    const int count = static_cast<int>(input.size());
    if (!openStreams(input, in, out)) {
        return false;
    }
    Resample resample;
    resample.setFilterFrequency(1.0, Cutoff);
    resample.setFilterLength(Length);
    resample.setInput(in.stream(), count);
    resample.setOutput(out.stream(), count);
    if (state != nullptr) {
        for (auto _ : *state) {
            if (!resample.run()) {
                return false;
            }
        }
    } else if (!resample.run()) {
        return false;
    }
    output.resize(input.size());
    return readStream(out, output);
}

} // namespace

bool filtercase::openStreams(const Samples &input, TempStream &in, TempStream &out)
{
    return in.open() && out.open() && in->writeHeader(BufferedIO::DataHeader) &&
           in->writeBytes(static_cast<int>(8 * input.size()), input.data());
}

bool filtercase::readStream(TempStream &stream, Samples &output)
{
    return stream->checkHeader(BufferedIO::DataHeader) &&
           stream->readBytes(static_cast<int>(8 * output.size()), output.data());
}

const Samples &filtercase::source()
{
    static const Samples samples = uniformNoise(Count);
    return samples;
}

std::vector<double> filtercase::taps()
{
    Samples impulse(1000);
    impulse[500] = 1;
    Samples response;
    std::vector<double> result(Length);
    if (runFilter(impulse, response, nullptr)) {
        for (size_t i = 0; i < result.size(); ++i) {
            result[i] = response[400 + i].real();
        }
    }
    return result;
}

bool filtercase::isFiltered(const Samples &result)
{
    const std::vector<double> coefficients = taps();
    constexpr size_t Half = Length / 2;
    const size_t n = source().size();
    if (result.size() != n) {
        return false;
    }
    for (size_t i = 0; i < n; i += 997) {
        std::complex<double> sum = 0;
        for (size_t k = 0; k < coefficients.size(); ++k) {
            sum += coefficients[k] * std::complex<double>(source()[(i + n + Half - k) % n]);
        }
        if (std::abs(std::complex<double>(result[i]) - sum) > 1e-5) {
            return false;
        }
    }
    return true;
}

namespace {

void BM_Filter(benchmark::State &state)
{
    setThreadLimit(static_cast<unsigned>(state.range(0)));
    Samples result;
    if (!runFilter(source(), result, &state)) {
        state.SkipWithError("run failed");
        return;
    }
    if (!isFiltered(result)) {
        state.SkipWithError("wrong result");
    }
}

BENCHMARK(BM_Filter)->Arg(1)->Arg(2)->UseRealTime()->Unit(benchmark::kMillisecond);

} // namespace

BENCHMARK_MAIN();
