// SPDX-License-Identifier: Apache-2.0
#pragma once

#include "IqSample.h"

#include <optional>
#include <span>
#include <vector>

class SpectrumLines;

/// How the frames of a spectrum become one trace; the numbers are those of the mode lists.
enum class SpectrumAverage {
    MeanDb =
        0, ///< of the levels of 512-sample frames; what is there half of the time vanishes in it
    Power = 1,
    Maximum = 2,
};

struct SpectrumSettings
{
    SpectrumAverage average = SpectrumAverage::MeanDb;
    int length = 2048; ///< points of the power and maximum averages
    int window = 5;    ///< one of dsp/windows.h, for the same
    bool showMaximum = true;
};

/// A spectrum as it is drawn: levels in dB of full scale, zero frequency in the middle.
struct SpectrumTrace
{
    std::vector<double> level;
    std::vector<double> maximum; ///< the greatest level of all frames; may be empty
    qint64 frames = 0;           ///< behind the trace
    double noiseBandwidth = 1.5; ///< of the window, in points
    const char *window = "Hann"; ///< its name

    /// Resolution bandwidth as a share of the clock; 0 without points.
    [[nodiscard]] double resolution() const;

    /// The point nearest to a frequency, given as a share of the clock from -0.5 to 0.5.
    [[nodiscard]] std::size_t pointAt(double share) const;
    /// The frequency of a point as a share of the clock.
    [[nodiscard]] double shareOf(std::size_t point) const;

    /// The point with the greatest level below `limit`, of those that are higher than their
    /// neighbours; nothing if there is none.
    [[nodiscard]] std::optional<std::size_t> peakBelow(double limit) const;
};

/// Makes a trace of the samples; `lines` are their 512-sample frames.
[[nodiscard]] SpectrumTrace makeTrace(const SpectrumSettings &settings, const SpectrumLines &lines,
                                      std::span<const IqSample> samples);
