// SPDX-License-Identifier: Apache-2.0
#pragma once

#include "IqSample.h"

#include <span>
#include <utility>
#include <vector>

/// Transforms of 512 samples, 256 samples apart, in time order. Lines that are still wanted when
/// the view moves are kept, so that only new frames are transformed.
class SpectrumLines
{
public:
    static constexpr int FrameSize = 512;
    static constexpr int FrameStep = 256;

    struct Line
    {
        qint64 position = 0;       ///< of the frame's first sample in the waveform
        std::vector<double> level; ///< 512 values in dB, zero frequency in the middle
    };

    /// Makes the lines of a view: `samples` lie from position `first` on. Frames start at the first
    /// sample, as long as a whole frame fits. The samples at positions that an earlier view
    /// covered must be the same; else call clear first.
    void update(std::span<const IqSample> samples, qint64 first);

    /// Takes lines made elsewhere, in time order.
    void setLines(std::vector<Line> lines) { m_lines = std::move(lines); }

    void clear();

    [[nodiscard]] const std::vector<Line> &lines() const { return m_lines; }

    /// The mean of all lines in dB, 512 values; empty without lines.
    [[nodiscard]] std::vector<double> mean() const;

    /// The greatest level of all lines, 512 values; empty without lines.
    [[nodiscard]] std::vector<double> maximum() const;

    /// Frames transformed since the object was made.
    [[nodiscard]] qint64 transformCount() const { return m_transformCount; }

    /// The levels of one frame of 512 samples.
    [[nodiscard]] static std::vector<double> transform(std::span<const IqSample> frame);

private:
    std::vector<Line> m_lines;
    qint64 m_transformCount = 0;
};
