// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <complex>
#include <span>

/// Forward discrete Fourier transform without scaling: out[k] = sum of in[i] exp(-j 2 pi k i / n).
/// Radix 2, decimation in time, twiddles by recurrence. Both spans have the same length n, a power
/// of two, and don't overlap. False, with `out` untouched, if a span is empty or the lengths
/// differ or are no power of two. Any thread may call it.
[[nodiscard]] bool fft(std::span<const std::complex<double>> in,
                       std::span<std::complex<double>> out);

/// As fft, with the halves of the result swapped, so that zero frequency lies at index n / 2.
[[nodiscard]] bool fftCentred(std::span<const std::complex<double>> in,
                              std::span<std::complex<double>> out);
