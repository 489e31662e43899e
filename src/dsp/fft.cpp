// SPDX-License-Identifier: Apache-2.0
#include "fft.h"

#include "widevector.h"

#include <algorithm>
#include <array>
#include <bit>
#include <cmath>
#include <cstddef>
#include <cstring>
#include <mutex>
#include <numbers>
#include <vector>

// The transform is the plain radix-2 one, decimation in time: every butterfly has the operands and
// the twiddle of the textbook's three loops, so the results are the same to the last bit. Only the
// order of independent butterflies and the place of the data differ: between the passes, samples
// lie in blocks of eight real parts and eight imaginary ones, and two stages share a pass.

namespace {

using Complex = std::complex<double>;

constexpr std::size_t BlockSize = 8; ///< samples

/// Below this length the blocks don't pay.
constexpr std::size_t MinBlockedLength = 64;

/// Twiddles of longer stages are made for each transform instead of being kept.
constexpr std::size_t MaxKeptDistance = 65536;

struct Twiddle
{
    double re;
    double im;
};

/// Calls use(j, twiddle) for j = 0 to distance - 1, by the recurrence exp(j (a + b)) =
/// exp(j a) + exp(j a) (alpha + j beta), which is stable, without a call of sin or cos in between.
template <typename Use>
void forEachTwiddle(std::size_t distance, const Use &use)
{
    const double angle = -std::numbers::pi / static_cast<double>(distance);
    const double alpha = -2.0 * std::sin(angle / 2) * std::sin(angle / 2);
    const double beta = std::sin(angle);
    Twiddle w{1.0, 0.0};
    for (std::size_t j = 0; j < distance; ++j) {
        use(j, w);
        w = {w.re + (w.re * alpha - w.im * beta), w.im + (w.im * alpha + w.re * beta)};
    }
}

/// The twiddles of a stage in the layout of the blocks.
std::vector<double> makeTwiddles(std::size_t distance)
{
    std::vector<double> twiddles(2 * distance);
    forEachTwiddle(distance, [&twiddles](std::size_t j, Twiddle w) {
        const std::size_t place = 2 * (j - j % BlockSize) + j % BlockSize;
        twiddles[place] = w.re;
        twiddles[place + BlockSize] = w.im;
    });
    return twiddles;
}

/// The twiddles of a stage, kept for the next transform where they aren't too long.
class StageTwiddles
{
public:
    explicit StageTwiddles(std::size_t distance)
    {
        struct Kept
        {
            std::once_flag made;
            std::vector<double> twiddles;
        };
        static std::array<Kept, std::bit_width(MaxKeptDistance)> kept;
        if (distance > MaxKeptDistance) {
            m_own = makeTwiddles(distance);
            m_data = m_own.data();
            return;
        }
        Kept &entry = kept[static_cast<std::size_t>(std::bit_width(distance)) - 1];
        std::call_once(entry.made, [&entry, distance] { entry.twiddles = makeTwiddles(distance); });
        m_data = entry.twiddles.data();
    }

    [[nodiscard]] const double *data() const { return m_data; }

private:
    std::vector<double> m_own;
    const double *m_data = nullptr;
};

/// Steps through the bit-reversed indices below n: adds one from the top.
std::size_t nextReversed(std::size_t reversed, std::size_t n)
{
    std::size_t bit = n / 2;
    while (bit > 0 && (reversed & bit) != 0) {
        reversed &= ~bit;
        bit /= 2;
    }
    return reversed | bit;
}

void transformShort(std::span<const Complex> in, std::span<Complex> out)
{
    std::size_t reversed = 0;
    for (const Complex &sample : in) {
        out[reversed] = sample;
        reversed = nextReversed(reversed, in.size());
    }
    for (std::size_t distance = 1; distance < out.size(); distance *= 2) {
        forEachTwiddle(distance, [&](std::size_t j, Twiddle w) {
            for (std::size_t i = j; i < out.size(); i += 2 * distance) {
                const double re = out[i + distance].real();
                const double im = out[i + distance].imag();
                const Complex t(w.re * re - w.im * im, w.re * im + w.im * re);
                out[i + distance] = out[i] - t;
                out[i] += t;
            }
        });
    }
}

/// Eight samples, or one sample of each of eight groups.
template <std::size_t Bytes>
struct Block
{
    WideVector<double, Bytes> re;
    WideVector<double, Bytes> im;
};

template <std::size_t Bytes>
CORVANE_INLINE void load(Block<Bytes> &block, const double *from)
{
    load(block.re, from);
    load(block.im, from + BlockSize);
}

template <std::size_t Bytes>
CORVANE_INLINE void store(const Block<Bytes> &block, double *to)
{
    store(block.re, to);
    store(block.im, to + BlockSize);
}

/// Twiddles are those of a block, or one for all lanes.
template <std::size_t Bytes>
CORVANE_INLINE const typename WideVector<double, Bytes>::Part &
partOf(const WideVector<double, Bytes> &twiddles, std::size_t part)
{
    return twiddles.parts[part];
}

CORVANE_INLINE double partOf(double twiddle, std::size_t)
{
    return twiddle;
}

template <std::size_t Bytes, typename W>
CORVANE_INLINE void butterfly(Block<Bytes> &upper, Block<Bytes> &lower, const W &wRe, const W &wIm)
{
    for (std::size_t part = 0; part < WideVector<double, Bytes>::Parts; ++part) {
        auto &upperRe = upper.re.parts[part];
        auto &upperIm = upper.im.parts[part];
        auto &lowerRe = lower.re.parts[part];
        auto &lowerIm = lower.im.parts[part];
        const auto re = partOf(wRe, part) * lowerRe - partOf(wIm, part) * lowerIm;
        const auto im = partOf(wRe, part) * lowerIm + partOf(wIm, part) * lowerRe;
        lowerRe = upperRe - re;
        lowerIm = upperIm - im;
        upperRe = upperRe + re;
        upperIm = upperIm + im;
    }
}

template <std::size_t Bytes>
CORVANE_INLINE void plainButterfly(Block<Bytes> &upper, Block<Bytes> &lower)
{
    for (std::size_t part = 0; part < WideVector<double, Bytes>::Parts; ++part) {
        const auto re = lower.re.parts[part];
        const auto im = lower.im.parts[part];
        lower.re.parts[part] = upper.re.parts[part] - re;
        lower.im.parts[part] = upper.im.parts[part] - im;
        upper.re.parts[part] = upper.re.parts[part] + re;
        upper.im.parts[part] = upper.im.parts[part] + im;
    }
}

/// Twiddles of the stages with distance 2 and 4, at index distance + j.
const std::array<Twiddle, BlockSize> &shortTwiddles()
{
    static const std::array<Twiddle, BlockSize> twiddles = [] {
        std::array<Twiddle, BlockSize> made{};
        for (const std::size_t distance : {2U, 4U}) {
            forEachTwiddle(distance, [&](std::size_t j, Twiddle w) { made[distance + j] = w; });
        }
        return made;
    }();
    return twiddles;
}

/// The first three stages. Eight groups of eight samples that end up beside each other are
/// transformed at a time, a group in each lane; their samples lie n / 8 apart in the input.
template <std::size_t Bytes>
CORVANE_INLINE void firstStages(const double *in, std::size_t n, double *out)
{
    const std::array<Twiddle, BlockSize> &w = shortTwiddles();
    const std::size_t groups = n / BlockSize;
    constexpr std::array<std::size_t, BlockSize> Reversed{0, 4, 2, 6, 1, 5, 3, 7};
    std::size_t target = 0;
    for (std::size_t first = 0; first < groups; first += BlockSize) {
        std::array<Block<Bytes>, BlockSize> x;
        for (std::size_t b = 0; b < BlockSize; ++b) {
            const double *from = in + 2 * (first + Reversed[b] * groups);
            double re[BlockSize];
            double im[BlockSize];
            for (std::size_t lane = 0; lane < BlockSize; ++lane) {
                re[lane] = from[2 * lane];
                im[lane] = from[2 * lane + 1];
            }
            load(x[b].re, re);
            load(x[b].im, im);
        }
        for (std::size_t b = 0; b < BlockSize; b += 2) {
            plainButterfly(x[b], x[b + 1]);
        }
        for (std::size_t b = 0; b < BlockSize; b += 4) {
            plainButterfly(x[b], x[b + 2]);
            butterfly(x[b + 1], x[b + 3], w[3].re, w[3].im);
        }
        plainButterfly(x[0], x[4]);
        for (std::size_t b = 1; b < 4; ++b) {
            butterfly(x[b], x[b + 4], w[4 + b].re, w[4 + b].im);
        }
        double lanes[BlockSize][2][BlockSize];
        for (std::size_t b = 0; b < BlockSize; ++b) {
            store(x[b], lanes[b][0]);
        }
        for (std::size_t lane = 0; lane < BlockSize; ++lane) {
            double *to = out + 2 * BlockSize * target;
            for (std::size_t b = 0; b < BlockSize; ++b) {
                to[b] = lanes[b][0][lane];
                to[b + BlockSize] = lanes[b][1][lane];
            }
            target = nextReversed(target, groups);
        }
    }
}

template <std::size_t Bytes>
CORVANE_INLINE void oneStage(double *x, std::size_t n, std::size_t distance, const double *twiddles)
{
    for (std::size_t group = 0; group < 2 * n; group += 4 * distance) {
        for (std::size_t j = 0; j < 2 * distance; j += 2 * BlockSize) {
            Block<Bytes> w;
            Block<Bytes> upper;
            Block<Bytes> lower;
            load(w, twiddles + j);
            load(upper, x + group + j);
            load(lower, x + group + j + 2 * distance);
            butterfly(upper, lower, w.re, w.im);
            store(upper, x + group + j);
            store(lower, x + group + j + 2 * distance);
        }
    }
}

/// The stages of a distance and of twice that.
template <std::size_t Bytes>
CORVANE_INLINE void twoStages(double *x, std::size_t n, std::size_t distance,
                              const double *twiddles, const double *nextTwiddles)
{
    const std::size_t step = 2 * distance;
    for (std::size_t group = 0; group < 2 * n; group += 4 * step) {
        for (std::size_t j = 0; j < step; j += 2 * BlockSize) {
            Block<Bytes> w;
            Block<Bytes> x0;
            Block<Bytes> x1;
            Block<Bytes> x2;
            Block<Bytes> x3;
            double *from = x + group + j;
            load(w, twiddles + j);
            load(x0, from);
            load(x1, from + step);
            load(x2, from + 2 * step);
            load(x3, from + 3 * step);
            butterfly(x0, x1, w.re, w.im);
            butterfly(x2, x3, w.re, w.im);
            load(w, nextTwiddles + j);
            butterfly(x0, x2, w.re, w.im);
            load(w, nextTwiddles + j + step);
            butterfly(x1, x3, w.re, w.im);
            store(x0, from);
            store(x1, from + step);
            store(x2, from + 2 * step);
            store(x3, from + 3 * step);
        }
    }
}

/// From blocks to samples, in place.
CORVANE_INLINE void interleave(double *x, std::size_t n)
{
    for (std::size_t block = 0; block < 2 * n; block += 2 * BlockSize) {
        double parts[2 * BlockSize];
        std::memcpy(parts, x + block, sizeof(parts));
        for (std::size_t lane = 0; lane < BlockSize; ++lane) {
            x[block + 2 * lane] = parts[lane];
            x[block + 2 * lane + 1] = parts[lane + BlockSize];
        }
    }
}

struct Transform
{
    std::span<const Complex> in;
    std::span<Complex> out;
};

template <std::size_t Bytes>
CORVANE_INLINE void transformBody(const Transform &transform)
{
    const std::size_t n = transform.in.size();
    // Complex numbers may be taken as pairs of their parts, [complex.numbers].
    const auto *source = reinterpret_cast<const double *>(transform.in.data());
    auto *x = reinterpret_cast<double *>(transform.out.data());
    firstStages<Bytes>(source, n, x);
    std::size_t distance = BlockSize;
    if (std::countr_zero(n / BlockSize) % 2 != 0) {
        oneStage<Bytes>(x, n, distance, StageTwiddles(distance).data());
        distance *= 2;
    }
    for (; distance < n; distance *= 4) {
        twoStages<Bytes>(x, n, distance, StageTwiddles(distance).data(),
                         StageTwiddles(2 * distance).data());
    }
    interleave(x, n);
}

CORVANE_WIDE_KERNEL(transformBlocked, const Transform &, transformBody)

} // namespace

bool fft(std::span<const Complex> in, std::span<Complex> out)
{
    const std::size_t n = in.size();
    if (out.size() != n || !std::has_single_bit(n)) {
        return false;
    }
    if (n < MinBlockedLength) {
        transformShort(in, out);
    } else {
        transformBlocked({in, out});
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
