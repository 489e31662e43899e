// SPDX-License-Identifier: Apache-2.0
// The FIR filter, equal counts and 201 taps over 4 million complex samples, against an overlap-save
// of the same length with FFTW on one thread.
#include "base/parallel.h"
#include "dsp/Resample.h"
#include "streams/TempStream.h"

#include <benchmark/benchmark.h>
#include <fftw3.h>

#include <algorithm>
#include <cmath>
#include <complex>
#include <vector>

namespace {

using Samples = std::vector<std::complex<float>>;
using Complex = std::complex<double>;

constexpr int Count = 4000000;
constexpr int Length = 201;
constexpr double Cutoff = 0.25;

const Samples &source()
{
    static const Samples samples = [] {
        Samples made(Count);
        unsigned state = 1;
        for (std::complex<float> &sample : made) {
            const auto draw = [&state] {
                state = state * 1664525U + 1013904223U;
                return static_cast<float>(state >> 8) / 8388608.0F - 1.0F;
            };
            const float inPhase = draw();
            sample = {inPhase, draw()};
        }
        return made;
    }();
    return samples;
}

[[nodiscard]] bool runFilter(const Samples &input, Samples &output, benchmark::State *state)
{
    TempStream in;
    TempStream out;
    const int count = static_cast<int>(input.size());
    if (!in.open() || !out.open() || !in->writeHeader("IQF") ||
        !in->writeBytes(count * 8, input.data())) {
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
    return out->checkHeader("IQF") && out->readBytes(count * 8, output.data());
}

/// The taps, as the filter itself shows them.
std::vector<double> taps()
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

class OverlapSave
{
public:
    explicit OverlapSave(const std::vector<double> &taps)
        : m_block(Size)
        , m_spectrum(Size)
        , m_filter(Size)
        , m_forward(plan(m_block, m_spectrum, FFTW_FORWARD))
        , m_backward(plan(m_spectrum, m_block, FFTW_BACKWARD))
    {
        std::fill(m_block.begin(), m_block.end(), 0.0);
        std::copy(taps.begin(), taps.end(), m_block.begin());
        fftw_execute(m_forward);
        for (size_t i = 0; i < Size; ++i) {
            m_filter[i] = m_spectrum[i] / static_cast<double>(Size);
        }
    }
    ~OverlapSave()
    {
        fftw_destroy_plan(m_forward);
        fftw_destroy_plan(m_backward);
    }
    OverlapSave(const OverlapSave &) = delete;
    OverlapSave &operator=(const OverlapSave &) = delete;

    /// Round the loop, as the filter does.
    void run(const Samples &in, Samples &out)
    {
        constexpr size_t Step = Size - Length + 1;
        constexpr size_t Half = Length / 2;
        const size_t n = in.size();
        for (size_t first = 0; first < n; first += Step) {
            for (size_t i = 0; i < Size; ++i) {
                m_block[i] = Complex(in[(first + i + n - Half) % n]);
            }
            fftw_execute(m_forward);
            for (size_t i = 0; i < Size; ++i) {
                m_spectrum[i] *= m_filter[i];
            }
            fftw_execute(m_backward);
            for (size_t i = 0; i < std::min(Step, n - first); ++i) {
                out[first + i] = std::complex<float>(m_block[Length - 1 + i]);
            }
        }
    }

private:
    static constexpr size_t Size = 2048;

    static fftw_plan plan(std::vector<Complex> &in, std::vector<Complex> &out, int sign)
    {
        return fftw_plan_dft_1d(static_cast<int>(Size), reinterpret_cast<fftw_complex *>(in.data()),
                                reinterpret_cast<fftw_complex *>(out.data()), sign, FFTW_MEASURE);
    }

    std::vector<Complex> m_block;
    std::vector<Complex> m_spectrum;
    std::vector<Complex> m_filter;
    fftw_plan m_forward;
    fftw_plan m_backward;
};

void BM_Filter(benchmark::State &state)
{
    setThreadLimit(static_cast<unsigned>(state.range(0)));
    Samples result;
    if (!runFilter(source(), result, &state)) {
        state.SkipWithError("run failed");
        return;
    }
    Samples expected(Count);
    OverlapSave(taps()).run(source(), expected);
    for (size_t i = 0; i < expected.size(); ++i) {
        if (std::abs(result[i] - expected[i]) > 1e-5F) {
            state.SkipWithError("wrong result");
            return;
        }
    }
}

void BM_OverlapSave(benchmark::State &state)
{
    OverlapSave filter(taps());
    Samples result(Count);
    for (auto _ : state) {
        filter.run(source(), result);
        benchmark::DoNotOptimize(result.data());
    }
}

BENCHMARK(BM_Filter)->Arg(1)->Arg(2)->UseRealTime()->Unit(benchmark::kMillisecond);
BENCHMARK(BM_OverlapSave)->UseRealTime()->Unit(benchmark::kMillisecond);

} // namespace

BENCHMARK_MAIN();
