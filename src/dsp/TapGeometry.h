// SPDX-License-Identifier: Apache-2.0
#pragma once

#include "filtertable.h"

#include <QtGlobal>

#include <cmath>

/// The taps of one output sample: input samples `first`, `first + 1` ... and the place of the first
/// one in the filter table; each further tap lies one `scale` below.
struct TapRange
{
    qint64 first = 0;
    int count = 0;
    double position = 0; ///< table point, not rounded
};

/// Where the filter lies for each output sample of a conversion from `inputCount` to `outputCount`
/// samples. The position counts `length - 1` also for even lengths, whose table spans one less:
/// their outputs lead the input by one sample, as established waveforms do.
class TapGeometry
{
public:
    TapGeometry(int length, int inputCount, int outputCount)
        : m_half(halfLength(length))
        , m_length(length)
        , m_scale(1 / (2 * m_half / (FilterTablePoints - 1.0)))
        , m_ratio(static_cast<double>(outputCount) / static_cast<double>(inputCount))
    {
    }

    [[nodiscard]] int half() const { return m_half; }
    [[nodiscard]] int length() const { return m_length; }

    /// Most taps that an output has.
    [[nodiscard]] int maxTaps() const { return 2 * m_half; }

    /// Table points from one input sample to the next.
    [[nodiscard]] double scale() const { return m_scale; }

    /// Output samples for each input sample.
    [[nodiscard]] double ratio() const { return m_ratio; }

    /// The position of an output in input samples.
    [[nodiscard]] double inputPosition(qint64 output) const
    {
        return static_cast<double>(output) / m_ratio;
    }

    [[nodiscard]] TapRange taps(qint64 output) const
    {
        const double t = inputPosition(output);
        const auto first = static_cast<qint64>(std::ceil(t - m_half));
        const auto end = static_cast<qint64>(std::floor(m_half + t));
        return {first, static_cast<int>(end - first),
                (t - std::ceil(t) + (m_length - 1)) * m_scale};
    }

private:
    int m_half;
    int m_length;
    double m_scale;
    double m_ratio;
};
