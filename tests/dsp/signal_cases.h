// SPDX-License-Identifier: Apache-2.0
#pragma once

#include "dsp/CreateSignal.h"
#include "literal_signals.h"

#include <functional>

/// How a test sets a signal up, and what it then is, sample by sample.
struct Case
{
    const char *name;
    SignalType type;
    std::function<bool(CreateSignal &)> configure;
    std::function<Literal::Vectors(const ClockLimits &)> literal;
};

template <typename Settings, typename Configure, typename Fit, typename Make>
inline Case makeCase(const char *name, SignalType type, const Settings &settings,
                     Configure configure, Fit fit, Make make)
{
    return {name, type, [=](CreateSignal &signal) { return (signal.*configure)(settings); },
            [=](const ClockLimits &limits) {
                const std::optional<SignalFit> fitted = fit(settings, limits);
                return fitted ? make(settings, *fitted) : Literal::Vectors{};
            }};
}

inline Case functionCase(const char *name, const FunctionSettings &s)
{
    return makeCase(name, SignalType::Function, s, &CreateSignal::configureFunction, fitFunction,
                    Literal::function);
}

inline Case fmCase(const char *name, const FmSettings &s)
{
    return makeCase(name, SignalType::Fm, s, &CreateSignal::configureFm, fitFm, Literal::fm);
}

inline Case amCase(const char *name, const AmSettings &s)
{
    return makeCase(name, SignalType::Am, s, &CreateSignal::configureAm, fitAm, Literal::am);
}

inline Case sweepCase(const char *name, const SweepSettings &s)
{
    return makeCase(name, SignalType::FmSweep, s, &CreateSignal::configureSweep, fitSweep,
                    Literal::sweep);
}

inline Case carrierCase(const char *name, const MultiCarrierSettings &s)
{
    return makeCase(name, SignalType::MultiCarrier, s, &CreateSignal::configureMultiCarrier,
                    fitMultiCarrier, Literal::multiCarrier);
}

inline Case pulseCase(const char *name, const PulseSettings &s)
{
    return makeCase(name, SignalType::Pulse, s, &CreateSignal::configurePulse, fitPulse,
                    Literal::pulse);
}

inline Case chirpCase(const char *name, const ChirpSettings &s)
{
    return makeCase(name, SignalType::Pulse, s, &CreateSignal::configureChirp, fitChirp,
                    Literal::chirp);
}

inline Case noiseCase(const char *name, const NoiseSettings &s)
{
    return makeCase(name, SignalType::Noise, s, &CreateSignal::configureNoise, fitNoise,
                    Literal::noise);
}
