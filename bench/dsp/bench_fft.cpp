// SPDX-License-Identifier: Apache-2.0
// The spectrum display's transform, window included, against FFTW (double, FFTW_ESTIMATE) with a
// window of its own.
#include "dsp/fft.h"
#include "dsp/windows.h"

#include <benchmark/benchmark.h>
#include <fftw3.h>

#include <random>

namespace {

using Complex = std::complex<double>;

constexpr int WindowKind = 5;

std::vector<Complex> noise(std::size_t n)
{
    std::mt19937 generator(1);
    std::normal_distribution<double> level;
    std::vector<Complex> samples(n);
    for (Complex &sample : samples) {
        sample = {level(generator), level(generator)};
    }
    return samples;
}

/// FFTW with its plan, the way a display would hold it.
class Peer
{
public:
    explicit Peer(std::size_t n)
        : m_in(n)
        , m_out(n)
        , m_window(windowList(static_cast<int>(n), WindowKind))
        , m_plan(fftw_plan_dft_1d(
              static_cast<int>(n), reinterpret_cast<fftw_complex *>(m_in.data()),
              reinterpret_cast<fftw_complex *>(m_out.data()), FFTW_FORWARD, FFTW_ESTIMATE))
    {
    }
    ~Peer() { fftw_destroy_plan(m_plan); }
    Peer(const Peer &) = delete;
    Peer &operator=(const Peer &) = delete;

    const std::vector<Complex> &transform(const std::vector<Complex> &samples)
    {
        for (std::size_t i = 0; i < samples.size(); ++i) {
            m_in[i] = samples[i] * m_window[i];
        }
        fftw_execute(m_plan);
        return m_out;
    }

private:
    std::vector<Complex> m_in;
    std::vector<Complex> m_out;
    std::vector<double> m_window;
    fftw_plan m_plan;
};

void BM_Fft(benchmark::State &state)
{
    const std::vector<Complex> samples = noise(static_cast<std::size_t>(state.range(0)));
    std::vector<Complex> windowed;
    std::vector<Complex> out(samples.size());
    bool ok = true;
    for (auto _ : state) {
        windowed = samples;
        ok = applyWindow(windowed, WindowKind) && fft(windowed, out) && ok;
        benchmark::DoNotOptimize(out.data());
    }
    Peer peer(samples.size());
    const std::vector<Complex> &expected = peer.transform(samples);
    double worst = 0;
    for (std::size_t i = 0; i < out.size(); ++i) {
        worst = std::max(worst, std::abs(out[i] - expected[i]));
    }
    // The length of the result grows with the square root of n, its roundings with log n.
    if (!ok || worst > 1e-13 * std::sqrt(static_cast<double>(out.size()))) {
        state.SkipWithError("wrong result");
    }
}

void BM_Fftw(benchmark::State &state)
{
    const std::vector<Complex> samples = noise(static_cast<std::size_t>(state.range(0)));
    Peer peer(samples.size());
    for (auto _ : state) {
        benchmark::DoNotOptimize(peer.transform(samples).data());
    }
}

void lengths(benchmark::internal::Benchmark *bench)
{
    for (const int n : {64, 512, 1024, 4096, 65536, 1048576}) {
        bench->Arg(n);
    }
}

BENCHMARK(BM_Fft)->Apply(lengths);
BENCHMARK(BM_Fftw)->Apply(lengths);

} // namespace

BENCHMARK_MAIN();
