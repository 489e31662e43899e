// SPDX-License-Identifier: Apache-2.0
#pragma once

#include "OutputOptions.h"
#include "signalfields.h"

#include "dsp/signalsettings.h"

#include <functional>
#include <optional>
#include <variant>

class CreateSignal;

/// Settings of the one signal that is wanted.
using SignalSettings =
    std::variant<FunctionSettings, PulseSettings, ChirpSettings, FmSettings, SweepSettings,
                 AmSettings, MultiCarrierSettings, PmSettings, NoiseSettings>;

/// The kinds of signals as users see them, in the order of SignalSettings.
enum class CreateKind { Function, Pulse, Chirp, Fm, Sweep, Am, MultiCarrier, Pm, Noise };

/// The choices of a signal that are no numbers.
struct CreateChoices
{
    int subKind = 0; ///< shape, tones, mode or colour, by its number
    RampKind ramp = RampKind::Linear;
    bool customOversampling = false;
    bool randomPhase = true;
};

/// What a signal is to be made like.
struct CreateRequest
{
    OutputOptions output;
    SignalSettings signal;
    double minClockHz = signalfields::minClock.start;
    double maxClockHz = signalfields::maxClock.start;
    std::optional<double> clockHz; ///< written to the file; nothing: the fitted one
    bool autoScaling = true;       ///< the peak vector is brought to full scale
    bool zeroCrest = false;        ///< the file states a peak to RMS ratio of 0 dB
    std::optional<unsigned> seed;  ///< of random values; nothing: the clock
};

/// Collects the settings of a kind from the values of its fields.
[[nodiscard]] SignalSettings makeSettings(CreateKind kind, const CreateChoices &choices,
                                          const std::function<double(const SignalField &)> &value);

/// Prepares the generator for the request. False, with the reason logged, if the settings don't
/// fit, or give more than a million samples.
[[nodiscard]] bool configureSignal(CreateSignal &engine, const CreateRequest &request);
