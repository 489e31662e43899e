// SPDX-License-Identifier: Apache-2.0
#include "fft.h"

#include <algorithm>
#include <bit>
#include <cmath>
#include <cstddef>
#include <numbers>

namespace {

using Complex = std::complex<double>;

void copyBitReversed(std::span<const Complex> in, std::span<Complex> out)
{
    std::size_t reversed = 0;
    for (const Complex &sample : in) {
        out[reversed] = sample;
        std::size_t bit = in.size() / 2;
        while (bit > 0 && (reversed & bit) != 0) {
            reversed &= ~bit;
            bit /= 2;
        }
        reversed |= bit;
    }
}

void butterflies(std::span<Complex> x, std::size_t distance)
{
    const double angle = -std::numbers::pi / static_cast<double>(distance);
    const double alpha = -2.0 * std::sin(angle / 2) * std::sin(angle / 2);
    const double beta = std::sin(angle);
    double wr = 1.0;
    double wi = 0.0;
    for (std::size_t j = 0; j < distance; ++j) {
        for (std::size_t i = j; i < x.size(); i += 2 * distance) {
            const double re = x[i + distance].real();
            const double im = x[i + distance].imag();
            const Complex t(wr * re - wi * im, wr * im + wi * re);
            x[i + distance] = x[i] - t;
            x[i] += t;
        }
        const double oldWr = wr;
        wr = wr + (wr * alpha - wi * beta);
        wi = wi + (wi * alpha + oldWr * beta);
    }
}

} // namespace

bool fft(std::span<const Complex> in, std::span<Complex> out)
{
    const std::size_t n = in.size();
    if (out.size() != n || !std::has_single_bit(n)) {
        return false;
    }
    copyBitReversed(in, out);
    for (std::size_t distance = 1; distance < n; distance *= 2) {
        butterflies(out, distance);
    }
    return true;
}

bool fftCentred(std::span<const Complex> in, std::span<Complex> out)
{
    if (!fft(in, out)) {
        return false;
    }
    const auto half = static_cast<std::ptrdiff_t>(out.size() / 2);
    std::swap_ranges(out.begin(), out.begin() + half, out.begin() + half);
    return true;
}
