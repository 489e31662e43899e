// SPDX-License-Identifier: Apache-2.0
#include "vectormath.h"

#include "base/simd.h"

#include <algorithm>
#include <bit>
#include <cmath>
#include <cstddef>
#include <cstdint>
#include <numbers>

namespace {

/// Quarter turn in three parts. The first two have 26 bits, so that their products with a count of
/// quarters below 2^27 are exact.
constexpr double Quarter1 = 0x1.921fb5p+0;
constexpr double Quarter2 = 0x1.110b46p-26;
constexpr double Quarter3 = 0x1.1a62633145c07p-54;

/// Angles above go to the C library.
constexpr double MaxReducible = 0x1p27;

/// Added to a number below 2^51, leaves it rounded to an integer in the low bits.
constexpr double RoundingOffset = 0x1.8p52;

/// (sin(r) / r - 1) / r^2 and (cos(r) - 1 + r^2 / 2) / r^4 as polynomials of r^2 for |r| up to an
/// eighth turn, by interpolation at the Chebyshev nodes; relative error below 2^-57.
constexpr double S0 = -0x1.5555555555555p-3;
constexpr double S1 = 0x1.1111111111110p-7;
constexpr double S2 = -0x1.a01a01a019934p-13;
constexpr double S3 = 0x1.71de3a5460281p-19;
constexpr double S4 = -0x1.ae64541207023p-26;
constexpr double S5 = 0x1.61217e74a8c33p-33;
constexpr double S6 = -0x1.ab177b1e72186p-41;
constexpr double C0 = 0.041666666666666664;
constexpr double C1 = -0.0013888888888887393;
constexpr double C2 = 2.4801587298761176e-05;
constexpr double C3 = -2.755731726939027e-07;
constexpr double C4 = 2.0876145780903544e-09;
constexpr double C5 = -1.1382597309861877e-11;

struct SineCosine
{
    double sine;
    double cosine;
};

/// `choose` has all bits set or none.
CORVANE_INLINE double select(std::uint64_t choose, double ifSet, double ifClear)
{
    return std::bit_cast<double>((std::bit_cast<std::uint64_t>(ifSet) & choose) |
                                 (std::bit_cast<std::uint64_t>(ifClear) & ~choose));
}

CORVANE_INLINE double flipSign(double value, std::uint64_t signBit)
{
    return std::bit_cast<double>(std::bit_cast<std::uint64_t>(value) ^ signBit);
}

CORVANE_INLINE SineCosine sineCosineOf(double x)
{
    const double shifted = x * (2 / std::numbers::pi) + RoundingOffset;
    const double quarters = shifted - RoundingOffset;
    const auto quadrant = std::bit_cast<std::uint64_t>(shifted);

    const double partly = (x - quarters * Quarter1) - quarters * Quarter2;
    const double rest = quarters * Quarter3;
    const double r = partly - rest;
    const double low = (partly - r) - rest; // what the rounding of r lost
    const double z = r * r;

    const double sinePoly = S0 + z * (S1 + z * (S2 + z * (S3 + z * (S4 + z * (S5 + z * S6)))));
    const double half = 0.5 * z;
    const double sine = r + (r * z * sinePoly + low * (1.0 - half));

    const double cosinePoly = C0 + z * (C1 + z * (C2 + z * (C3 + z * (C4 + z * C5))));
    const double head = 1.0 - half;
    const double cosine = head + (((1.0 - head) - half) + (z * z * cosinePoly - r * low));

    const std::uint64_t odd = 0 - (quadrant & 1);
    const std::uint64_t sineSign = (quadrant & 2) << 62;
    const std::uint64_t cosineSign = ((quadrant + 1) & 2) << 62;
    return {flipSign(select(odd, cosine, sine), sineSign),
            flipSign(select(odd, sine, cosine), cosineSign)};
}

CORVANE_INLINE bool areReducible(std::span<const double> angles)
{
    std::uint64_t outside = 0;
    for (const double angle : angles) {
        outside |= std::abs(angle) <= MaxReducible ? 0U : 1U;
    }
    return outside == 0;
}

/// Angles that are checked for their size at a time.
constexpr std::size_t ChunkSize = 512;

CORVANE_CLONES void sinCosChunk(std::span<const double> angles, double *sine, double *cosine)
{
    if (!areReducible(angles)) {
        for (std::size_t i = 0; i < angles.size(); ++i) {
            sine[i] = std::sin(angles[i]);
            cosine[i] = std::cos(angles[i]);
        }
        return;
    }
    for (std::size_t i = 0; i < angles.size(); ++i) {
        const SineCosine both = sineCosineOf(angles[i]);
        sine[i] = both.sine;
        cosine[i] = both.cosine;
    }
}

CORVANE_CLONES void sineChunk(std::span<const double> angles, double *sine)
{
    if (!areReducible(angles)) {
        for (std::size_t i = 0; i < angles.size(); ++i) {
            sine[i] = std::sin(angles[i]);
        }
        return;
    }
    for (std::size_t i = 0; i < angles.size(); ++i) {
        sine[i] = sineCosineOf(angles[i]).sine;
    }
}

} // namespace

void sinCos(std::span<const double> angles, std::span<double> sines, std::span<double> cosines)
{
    for (std::size_t first = 0; first < angles.size(); first += ChunkSize) {
        const std::size_t count = std::min(ChunkSize, angles.size() - first);
        sinCosChunk(angles.subspan(first, count), sines.data() + first, cosines.data() + first);
    }
}

void sines(std::span<const double> angles, std::span<double> result)
{
    for (std::size_t first = 0; first < angles.size(); first += ChunkSize) {
        const std::size_t count = std::min(ChunkSize, angles.size() - first);
        sineChunk(angles.subspan(first, count), result.data() + first);
    }
}
