// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <benchmark/benchmark.h>

#include <complex>
#include <cstddef>
#include <random>
#include <vector>

/// What the transform and its peer are measured on.
namespace fftcase {

using Complex = std::complex<double>;

constexpr int WindowKind = 5;

inline std::vector<Complex> noise(std::size_t n)
{
    std::mt19937 generator(1);
    std::normal_distribution<double> level;
    std::vector<Complex> samples(n);
    for (Complex &sample : samples) {
        sample = {level(generator), level(generator)};
    }
    return samples;
}

inline void lengths(benchmark::internal::Benchmark *bench)
{
    for (const int n : {64, 512, 1024, 4096, 65536, 1048576}) {
        bench->Arg(n);
    }
}

/// True if some lines of the spectrum are those of the sum by definition.
[[nodiscard]] bool isSpectrum(const std::vector<Complex> &samples,
                              const std::vector<Complex> &spectrum);

} // namespace fftcase
