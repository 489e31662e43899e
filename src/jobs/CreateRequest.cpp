// SPDX-License-Identifier: Apache-2.0
#include "CreateRequest.h"

#include "dsp/CreateSignal.h"
#include "log/Tracer.h"

namespace {

using FieldValue = std::function<double(const SignalField &)>;

PulseSettings pulseSettings(const CreateChoices &choices, const FieldValue &value)
{
    using namespace signalfields;
    return {.riseTime = value(pulseRise),
            .onTime = value(pulseOn),
            .fallTime = value(pulseFall),
            .blankTime = value(pulseBlank),
            .ramp = choices.ramp,
            .timeResolution = value(pulseResolution)};
}

ChirpSettings chirpSettings(const CreateChoices &choices, const FieldValue &value)
{
    using namespace signalfields;
    return {.pulse = {.riseTime = value(chirpRise),
                      .onTime = value(chirpOn),
                      .fallTime = value(chirpFall),
                      .blankTime = value(chirpBlank),
                      .ramp = choices.ramp,
                      .timeResolution = value(chirpResolution)},
            .range = value(chirpRange)};
}

/// Hands the settings to the operation of the generator that takes them.
struct Configure
{
    CreateSignal &engine;

    bool operator()(const FunctionSettings &s) const { return engine.configureFunction(s); }
    bool operator()(const PulseSettings &s) const { return engine.configurePulse(s); }
    bool operator()(const ChirpSettings &s) const { return engine.configureChirp(s); }
    bool operator()(const FmSettings &s) const { return engine.configureFm(s); }
    bool operator()(const SweepSettings &s) const { return engine.configureSweep(s); }
    bool operator()(const AmSettings &s) const { return engine.configureAm(s); }
    bool operator()(const MultiCarrierSettings &s) const { return engine.configureMultiCarrier(s); }
    bool operator()(const PmSettings &s) const { return engine.configurePm(s); }
    bool operator()(const NoiseSettings &s) const { return engine.configureNoise(s); }
};

SignalType typeOf(CreateKind kind)
{
    switch (kind) {
    case CreateKind::Function:
        return SignalType::Function;
    case CreateKind::Pulse:
    case CreateKind::Chirp:
        return SignalType::Pulse;
    case CreateKind::Fm:
        return SignalType::Fm;
    case CreateKind::Sweep:
        return SignalType::FmSweep;
    case CreateKind::Am:
        return SignalType::Am;
    case CreateKind::MultiCarrier:
        return SignalType::MultiCarrier;
    case CreateKind::Pm:
        return SignalType::Pm;
    case CreateKind::Noise:
        break;
    }
    return SignalType::Noise;
}

} // namespace

SignalSettings makeSettings(CreateKind kind, const CreateChoices &choices, const FieldValue &value)
{
    using namespace signalfields;
    switch (kind) {
    case CreateKind::Function:
        return FunctionSettings{.kind = static_cast<FunctionKind>(choices.subKind),
                                .frequency = value(frequency),
                                .amplitudeI = value(amplitudeI),
                                .amplitudeQ = value(amplitudeQ),
                                .offsetI = value(offsetI),
                                .offsetQ = value(offsetQ),
                                .phaseQ = value(phaseQ),
                                .customOversampling = choices.customOversampling,
                                .oversampling = static_cast<int>(value(oversampling))};
    case CreateKind::Pulse:
        return pulseSettings(choices, value);
    case CreateKind::Chirp:
        return chirpSettings(choices, value);
    case CreateKind::Fm:
        return FmSettings{.kind = static_cast<FmKind>(choices.subKind),
                          .frequency1 = value(fmFrequency),
                          .deviation1 = value(fmDeviation),
                          .frequency2 = value(fmFrequency2),
                          .deviation2 = value(fmDeviation2)};
    case CreateKind::Sweep:
        return SweepSettings{.kind = static_cast<SweepKind>(choices.subKind),
                             .deviation = value(sweepDeviation),
                             .sweepTime = value(sweepTime),
                             .startPhase = value(sweepStart),
                             .stopPhase = value(sweepStop)};
    case CreateKind::Am:
        return AmSettings{.kind = static_cast<AmKind>(choices.subKind),
                          .frequency1 = value(amFrequency),
                          .depth1 = value(amDepth),
                          .frequency2 = value(amFrequency2),
                          .depth2 = value(amDepth2)};
    case CreateKind::MultiCarrier:
        return MultiCarrierSettings{.spacing = value(spacing),
                                    .carriers = static_cast<int>(value(carriers)),
                                    .offsetI = value(carrierOffsetI),
                                    .randomPhase = choices.randomPhase};
    case CreateKind::Pm:
        return PmSettings{.frequency = value(pmFrequency), .deviation = value(pmDeviation)};
    case CreateKind::Noise:
        break;
    }
    return NoiseSettings{.kind = static_cast<NoiseKind>(choices.subKind),
                         .bandwidth = value(noiseBandwidth),
                         .duration = value(noiseDuration)};
}

bool configureSignal(CreateSignal &engine, const CreateRequest &request)
{
    engine.setSignalType(typeOf(static_cast<CreateKind>(request.signal.index())));
    engine.setMinClock(request.minClockHz);
    engine.setMaxClock(request.maxClockHz);
    engine.setSeed(request.seed);
    if (!std::visit(Configure{engine}, request.signal)) {
        return Tracer::fail("Cannot configure waveform creation. Check settings.");
    }
    if (engine.sampleCount() > 1000000.0) {
        return Tracer::fail("Number of samples exceeds 1e6. Check settings.");
    }
    return true;
}
