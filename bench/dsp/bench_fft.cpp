// SPDX-License-Identifier: Apache-2.0
// The spectrum display's transform, window included; peers stand in files of their own.
#include "fftcase.h"

#include "dsp/fft.h"
#include "dsp/windows.h"

#include <cmath>
#include <numbers>

bool fftcase::isSpectrum(const std::vector<Complex> &samples, const std::vector<Complex> &spectrum)
{
    const std::size_t n = samples.size();
    const std::vector<double> window = windowList(static_cast<int>(n), WindowKind);
    for (const std::size_t line : {std::size_t{0}, std::size_t{1}, n / 3, n / 2, n - 1}) {
        Complex sum = 0;
        for (std::size_t i = 0; i < n; ++i) {
            const double turns =
                static_cast<double>(line * i % n) / static_cast<double>(n); // below 1
            sum += samples[i] * window[i] * std::polar(1.0, -2 * std::numbers::pi * turns);
        }
        // The roundings of the plain sum, which grow with n, are the larger ones.
        if (std::abs(spectrum[line] - sum) > 1e-14 * static_cast<double>(n) + 1e-12) {
            return false;
        }
    }
    return true;
}

namespace {

using namespace fftcase;

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
    if (!ok || !isSpectrum(samples, out)) {
        state.SkipWithError("wrong result");
    }
}

BENCHMARK(BM_Fft)->Apply(lengths);

} // namespace

BENCHMARK_MAIN();
