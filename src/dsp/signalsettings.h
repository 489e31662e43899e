// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <QByteArray>

// What a user chooses for a signal. Frequencies and bandwidths are in Hz, times in seconds, phases
// in degrees, levels linear with full scale 1. The kinds keep their numbers: dialogs store them.

enum class SignalType {
    Function = 0,
    MultiCarrier = 1,
    Fm = 2,
    Pulse = 3,
    Pm = 4,
    Am = 5,
    FmSweep = 6,
    Noise = 7,
};

enum class FunctionKind { Sine = 0, Square = 1, Triangular = 2, Sawtooth = 3 };

struct FunctionSettings
{
    FunctionKind kind = FunctionKind::Sine;
    double frequency = 1000.0;
    double amplitudeI = 1.0;
    double amplitudeQ = 1.0;
    double offsetI = 0.0;
    double offsetQ = 0.0;
    double phaseQ = 0.0;             ///< of Q against I
    bool customOversampling = false; ///< start the fit at `oversampling` instead of 1000
    int oversampling = 100;          ///< samples per period
};

struct MultiCarrierSettings
{
    double spacing = 1000.0;
    int carriers = 10; ///< at least 2; they lie on both sides of zero
    double offsetI = 0.0;
    bool randomPhase = true;
};

enum class RampKind { Linear = 0, RaisedCosine = 1 };

struct PulseSettings
{
    double riseTime = 1e-6;
    double onTime = 1e-4;
    double fallTime = 1e-6;
    double blankTime = 1e-4;
    RampKind ramp = RampKind::Linear;
    double timeResolution = 1e-7; ///< the longest time of one sample
};

struct ChirpSettings
{
    PulseSettings pulse;
    double range = 1e7; ///< from minus half to plus half of it
};

enum class PulseKind { Single = 0, Double = 1, Chirp = 2, Coded = 3 };

/// A pulse with the fields of all kinds. Double and coded pulses aren't offered to users.
struct PulseRecord
{
    PulseKind kind = PulseKind::Single;
    PulseSettings pulse;
    QByteArray pattern;          ///< symbols of a coded pulse, "1" for the positive level
    double transitionTime = 0.0; ///< between symbols
    double chirpRange = 1e7;
    double pause = 5e-5; ///< between the two pulses
    double level1 = 1.0; ///< of the first pulse
    double level2 = 1.0; ///< of the second pulse
    double phase2 = 0.0; ///< of the second pulse
};

enum class FmKind { SingleTone = 0, TwoTone = 1 };

struct FmSettings
{
    FmKind kind = FmKind::SingleTone;
    double frequency1 = 1000.0;
    double deviation1 = 10000.0;
    double frequency2 = 2000.0;
    double deviation2 = 10000.0;
};

enum class AmKind {
    Regular = 0,
    Lsb = 1,
    Usb = 2,
    LsbCarrier = 3,
    UsbCarrier = 4,
    LsbUsb = 5,
    TwoTone = 6,
    TwoToneNoCarrier = 7,
};

struct AmSettings
{
    AmKind kind = AmKind::Regular;
    double frequency1 = 10000.0;
    double depth1 = 100.0; ///< per cent
    double frequency2 = 15000.0;
    double depth2 = 100.0; ///< per cent
};

struct PmSettings
{
    double frequency = 10000.0;
    double deviation = 180.0;
};

enum class SweepKind { Linear = 0, Sine = 1, Triangular = 2 };

struct SweepSettings
{
    SweepKind kind = SweepKind::Linear;
    double deviation = 1e5; ///< the whole range
    double sweepTime = 0.01;
    double startPhase = 0.0;  ///< of the frequency's curve
    double stopPhase = 360.0; ///< of the frequency's curve
};

enum class NoiseKind { White = 0, Pink = 1, Brown = 2 };

struct NoiseSettings
{
    NoiseKind kind = NoiseKind::White;
    double bandwidth = 1e6;
    double duration = 0.01;
};
