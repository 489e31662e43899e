// SPDX-License-Identifier: Apache-2.0
#pragma once

#include "SampleSource.h"

#include <optional>
#include <vector>

/// A range of frequencies in Hz, about the carrier at 0.
struct FrequencyBand
{
    double lowHz = 0;
    double highHz = 0;
};

/// One point of the complementary cumulative distribution: how likely a sample's power lies more
/// than so many dB over the mean power.
struct CcdfPoint
{
    double overMeanDb = 0;
    double probability = 0;
};

/// What is measured of a stretch of samples. Levels are linear, full scale 1.
struct SignalFigures
{
    qint64 samples = 0;
    double peak = 0; ///< magnitudes
    double rms = 0;
    double dcI = 0; ///< means
    double dcQ = 0;
    qint64 clipped = 0; ///< values of I or Q at full scale or beyond

    /// The band that holds 99 % of the power, with half a per cent on each side of it, and its
    /// middle, in Hz; nothing without a clock or of silence.
    std::optional<double> occupiedHz;
    std::optional<double> occupiedCentreHz;

    /// Power in the band asked for, in dB relative to the whole; nothing if none was, or of
    /// silence.
    std::optional<double> bandDb;

    /// From 0 dB in tenths of a dB (whole dB above 20 dB) to the first step that no sample exceeds;
    /// empty for silence.
    std::vector<CcdfPoint> ccdf;

    /// Peak over RMS in dB; 0 of silence.
    [[nodiscard]] double crestDb() const;
};

/// Measures a stretch, which is read twice. Nothing, with the reason logged, if it can't be read.
[[nodiscard]] std::optional<SignalFigures>
measureFigures(SampleSource &source, double clockHz,
               const std::optional<FrequencyBand> &band = std::nullopt);

/// How likely the power of complex Gaussian noise lies more than so many dB over its mean.
[[nodiscard]] double gaussianCcdf(double overMeanDb);

/// Part of the power (0 to 1) of a spectrum with zero frequency in the middle that lies in a band.
/// Each point stands for a clock / n about its frequency.
[[nodiscard]] double powerShare(std::span<const double> power, double clockHz,
                                const FrequencyBand &band);

/// The band that leaves `outside` / 2 of the power on each side; nothing of silence.
[[nodiscard]] std::optional<FrequencyBand> occupiedBand(std::span<const double> power,
                                                        double clockHz, double outside = 0.01);
