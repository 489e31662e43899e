// SPDX-License-Identifier: Apache-2.0
#include "looppoint.h"

#include "levels.h"

#include "base/simd.h"

#include <algorithm>
#include <cmath>
#include <complex>
#include <cstddef>
#include <numbers>

namespace {

constexpr std::size_t StepBlock = 256;

/// The squares of `count` steps from the first sample.
CORVANE_CLONES void squaresOf(const float *values, float *squares, std::size_t count)
{
    for (std::size_t i = 0; i < count; ++i) {
        const float inPhase = values[2 * i + 2] - values[2 * i];
        const float quadrature = values[2 * i + 3] - values[2 * i + 1];
        squares[i] = inPhase * inPhase + quadrature * quadrature;
    }
}

CORVANE_CLONES float largestOf(const float *squares, std::size_t count, float largest)
{
    // Independent maxima let the compiler vectorise; the order doesn't matter to a maximum.
    std::array<float, 16> lanes{};
    lanes.fill(largest);
    std::size_t i = 0;
    for (; i + lanes.size() <= count; i += lanes.size()) {
        for (std::size_t lane = 0; lane < lanes.size(); ++lane) {
            lanes[lane] = squares[i + lane] > lanes[lane] ? squares[i + lane] : lanes[lane];
        }
    }
    for (; i < count; ++i) {
        lanes[0] = squares[i] > lanes[0] ? squares[i] : lanes[0];
    }
    return *std::max_element(lanes.begin(), lanes.end());
}

float squareBetween(const std::array<float, 2> &one, const std::array<float, 2> &other)
{
    const float inPhase = other[0] - one[0];
    const float quadrature = other[1] - one[1];
    return inPhase * inPhase + quadrature * quadrature;
}

} // namespace

void LoopMeter::add(std::span<const float> values)
{
    if (values.size() < 2) {
        return;
    }
    const std::array<float, 2> first{values[0], values[1]};
    if (m_hasSamples) {
        m_largest = std::max(m_largest, squareBetween(m_last, first));
    } else {
        m_first = first;
        m_hasSamples = true;
    }
    const std::size_t samples = values.size() / 2;
    std::array<float, StepBlock> squares;
    for (std::size_t done = 0; done + 1 < samples; done += StepBlock) {
        const std::size_t count = std::min(StepBlock, samples - 1 - done);
        squaresOf(values.data() + 2 * done, squares.data(), count);
        m_largest = largestOf(squares.data(), count, m_largest);
    }
    m_last = {values[2 * samples - 2], values[2 * samples - 1]};
}

LoopPoint LoopMeter::result() const
{
    LoopPoint loop;
    const std::complex<double> first(m_first[0], m_first[1]);
    const std::complex<double> last(m_last[0], m_last[1]);
    loop.magnitudeStepDb = measuredOffset(std::abs(last)) - measuredOffset(std::abs(first));
    if (std::abs(first) > 0 && std::abs(last) > 0) {
        loop.phaseStepDegrees = std::arg(first * std::conj(last)) * 180 / std::numbers::pi;
    }
    // Of two steps that are alike, as those of a tone, either may come out larger by the rounding
    // of its two samples to words.
    constexpr float Rounding = 2.0F / 32767.0F;
    loop.isContinuous =
        std::sqrt(squareBetween(m_last, m_first)) <= std::sqrt(m_largest) + Rounding;
    return loop;
}

QString loopText(const LoopPoint &loop)
{
    // What rounds to zero has no sign.
    const auto text = [](double value, int digits) {
        const double unit = std::pow(10.0, digits);
        return QString::number(std::round(value * unit) / unit + 0.0, 'f', digits);
    };
    return loop.isContinuous
               ? QString("continuous")
               : QString("step of %1 dB, %2 degrees")
                     .arg(text(loop.magnitudeStepDb, 2), text(loop.phaseStepDegrees, 1));
}

QString loopWarning(const LoopPoint &loop)
{
    return loop.isContinuous ? QString()
                             : QString("Loop point: %1, which is more than between any neighbours. "
                                       "The signal jumps whenever it is repeated.")
                                   .arg(loopText(loop));
}
