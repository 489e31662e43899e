// SPDX-License-Identifier: Apache-2.0
#pragma once

#include "signalsettings.h"

#include <optional>

/// The clock range of the instrument.
struct ClockLimits
{
    double minClock = 100000.0;    ///< Hz
    double maxClock = 100000000.0; ///< Hz
    int minSamples = 512;          ///< a warning is logged below
};

/// What a signal was fitted to. The fields behind `samples` serve the kinds that are named.
struct SignalFit
{
    double clock = 0;   ///< Hz
    int samples = 0;    ///< of one period of the signal
    double base = 0;    ///< FM: greatest common divisor of the frequencies in Hz
    double period1 = 0; ///< AM of two tones: samples in a period of tone 1
    double period2 = 0; ///< AM of two tones: samples in a period of tone 2
};

// Periodic signals hold a whole number of periods, so that they loop without a jump: the number of
// samples in a period is fixed first, and the clock is made a multiple of the frequency. All
// functions log why a signal doesn't fit, and give nothing then.

[[nodiscard]] std::optional<SignalFit> fitFunction(const FunctionSettings &settings,
                                                   const ClockLimits &limits);
[[nodiscard]] std::optional<SignalFit> fitMultiCarrier(const MultiCarrierSettings &settings,
                                                       const ClockLimits &limits);
[[nodiscard]] std::optional<SignalFit> fitPulse(const PulseSettings &settings,
                                                const ClockLimits &limits);
[[nodiscard]] std::optional<SignalFit> fitChirp(const ChirpSettings &settings,
                                                const ClockLimits &limits);
[[nodiscard]] std::optional<SignalFit> fitFm(const FmSettings &settings, const ClockLimits &limits);
[[nodiscard]] std::optional<SignalFit> fitAm(const AmSettings &settings, const ClockLimits &limits);
[[nodiscard]] std::optional<SignalFit> fitPm(const PmSettings &settings, const ClockLimits &limits);
[[nodiscard]] std::optional<SignalFit> fitSweep(const SweepSettings &settings,
                                                const ClockLimits &limits);
[[nodiscard]] std::optional<SignalFit> fitNoise(const NoiseSettings &settings,
                                                const ClockLimits &limits);
