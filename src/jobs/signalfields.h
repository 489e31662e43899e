// SPDX-License-Identifier: Apache-2.0
#pragma once

#include "wvfile/WvTypes.h"

/// One number that a signal is made by, as the dialog shows it and the command line takes it.
struct SignalField
{
    const char *text;
    const char *unit;
    double min;
    double max;
    double start;
    const char *key = nullptr;  ///< of its stored setting; null: it isn't stored
    const char *help = nullptr; ///< what the text leaves open
};

/// The numbers, by kind of signal. Some texts are odd; they are established as they stand.
namespace signalfields {

// Named as the fields of a request.
// NOLINTBEGIN(readability-identifier-naming)

inline constexpr SignalField maxClock{
    "Maximum permissible ARB clock rate", "Hz", 1e7, MaxClockHz, 1e8, "clk.max"};
inline constexpr SignalField minClock{
    "Minimum permissible ARB clock rate", "Hz", 1000, 1e7, 1e5, "clk.min"};
inline constexpr SignalField clockRate{"ARB Clockrate",
                                       "Hz",
                                       MinClockHz,
                                       MaxClockHz,
                                       1e8,
                                       nullptr,
                                       "Stated in the file; the samples stay those for the fitted "
                                       "clock, so another one moves all frequencies"};

inline constexpr SignalField frequency{"Frequency", "Hz", 100, 2e7, 10000, "fn.freq"};
inline constexpr SignalField amplitudeI{"I Signal Amplitude", "", 0, 1, 0.707, "fn.ampi"};
inline constexpr SignalField amplitudeQ{"Q Signal Amplitude", "", 0, 1, 0.707, "fn.ampq"};
inline constexpr SignalField offsetI{"I Signal Offset", "", -1, 1, 0, "fn.ofsi"};
inline constexpr SignalField offsetQ{"Q Signal Offset", "", -1, 1, 0, "fn.ofsq"};
inline constexpr SignalField phaseQ{"Q Signal Phase Offset",
                                    "deg",
                                    -180,
                                    180,
                                    90,
                                    "fn.phsq",
                                    "Phase of Q to I: with 90 a sine turns to the negative "
                                    "frequency, with -90 to the positive one"};
inline constexpr SignalField oversampling{
    "Prefer a Custom Oversampling Ratio", "", 4, 100000, 100, "fn.over"};

inline constexpr SignalField pulseResolution{
    "Rise Time",
    "s",
    1e-9,
    1e-7,
    1e-7,
    "pulse.tres",
    "Time between two samples that the edges are fitted to"};
inline constexpr SignalField pulseRise{"Rise Time", "s", 0, 0.1, 1e-5, "pulse.rise"};
inline constexpr SignalField pulseOn{"Pulse On Time", "s", 0, 0.1, 1e-4, "pulse.on"};
inline constexpr SignalField pulseFall{"Fall Time", "s", 0, 0.1, 1e-5, "pulse.fall"};
inline constexpr SignalField pulseBlank{"Blank Time", "s", 0, 0.5, 1e-4, "pulse.blank"};

inline constexpr SignalField chirpResolution{
    "Rise Time",
    "s",
    1e-9,
    1e-7,
    1e-7,
    "chirp.tres",
    "Time between two samples that the edges are fitted to"};
inline constexpr SignalField chirpRise{"Rise Time", "s", 0, 0.1, 1e-5, "chirp.rise"};
inline constexpr SignalField chirpOn{"Pulse On Time", "s", 0, 0.1, 1e-4, "chirp.on"};
inline constexpr SignalField chirpFall{"Fall Time", "s", 0, 0.1, 1e-5, "chirp.fall"};
inline constexpr SignalField chirpBlank{"Blank Time", "s", 0, 0.5, 1e-4, "chirp.blank"};
inline constexpr SignalField chirpRange{"Overall Chirp Range", "Hz", 100, 2e7, 1e6, "chirp.range"};

inline constexpr SignalField fmFrequency{
    "Modulation Frequency",
    "Hz",
    100,
    2.5e7,
    1000,
    "fm.modf",
    "Frequency of the tone; with decimals, whole periods may not fit into the signal: the report "
    "tells the step at its loop point"};
inline constexpr SignalField fmDeviation{"Deviation", "Hz", 100, 4e7, 10000, "fm.dev"};
inline constexpr SignalField fmFrequency2{
    "Modulation Frequency, 2nd Tone",
    "Hz",
    100,
    2.5e7,
    2000,
    "fm.modf2",
    "Frequency of the tone; with decimals, whole periods may not fit into the signal: the report "
    "tells the step at its loop point"};
inline constexpr SignalField fmDeviation2{"Deviation, 2nd Tone", "Hz", 100, 4e7, 10000, "fm.dev2"};

inline constexpr SignalField sweepDeviation{"Deviation", "Hz", 1000, 2e8, 1e5, "fmswe.dev"};
inline constexpr SignalField sweepTime{"Sweep Time", "s", 1e-5, 2, 0.01, "fmswe.time"};
inline constexpr SignalField sweepStart{
    "Start Phase of Envelope", "deg", -360, 360, 0, "fmswe.pstart"};
inline constexpr SignalField sweepStop{
    "Stop Phase of Envelope", "deg", -360, 360, 360, "fmswe.modf"};

inline constexpr SignalField amFrequency{
    "Modulation Frequency", "Hz", 100, 2.5e7, 10000, "am.modf"};
inline constexpr SignalField amDepth{
    "Deviation", "%", 0, 100, 100, "am.dep", "Depth of the modulation"};
inline constexpr SignalField amFrequency2{
    "Modulation Frequency, 2nd Tone", "Hz", 100, 2.5e7, 15000, "am.modf2"};
inline constexpr SignalField amDepth2{
    "Deviation, 2nd Tone", "%", 0, 100, 100, "am.dep2", "Depth of the modulation by the 2nd tone"};

inline constexpr SignalField spacing{"Frequeny Spacing",
                                     "Hz",
                                     10000,
                                     2.5e7,
                                     10000,
                                     "mc.spc",
                                     "Frequency between neighbouring carriers"};
inline constexpr SignalField carriers{
    "Number of Carriers",
    "",
    2,
    10000,
    100,
    "mc.carr",
    "Carriers in all, half of them on each side and none in the middle: an odd number gives one "
    "less. Q is 0, so both halves mirror each other"};
inline constexpr SignalField carrierOffsetI{"I Signal Offset", "", -1, 1, 0, "mc.iofs"};

inline constexpr SignalField pmFrequency{
    "Modulation Frequency", "Hz", 100, 2.5e7, 10000, "pm.modf"};
inline constexpr SignalField pmDeviation{"Deviation", "deg", -180, 180, 180, "pm.dev"};

inline constexpr SignalField noiseBandwidth{
    "Total Noise Bandwidth", "Hz", 100, 2e7, 1e6, "noise.bw"};
inline constexpr SignalField noiseDuration{"Duration of Noise Signal",
                                           "s",
                                           1e-4,
                                           1,
                                           0.01,
                                           "noise.time",
                                           "Duration of the noise, of at most 1 000 000 samples"};

// NOLINTEND(readability-identifier-naming)

} // namespace signalfields
