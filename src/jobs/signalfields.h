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
};

/// The numbers, by kind of signal. Some texts are odd; they are established as they stand.
namespace signalfields {

// Named as the fields of a request.
// NOLINTBEGIN(readability-identifier-naming)

inline constexpr SignalField maxClock{"Maximum permissible ARB clock rate", "Hz", 1e7, MaxClockHz,
                                      1e8};
inline constexpr SignalField minClock{"Minimum permissible ARB clock rate", "Hz", 1000, 1e7, 1e5};
inline constexpr SignalField clockRate{"ARB Clockrate", "Hz", MinClockHz, MaxClockHz, 1e8};

inline constexpr SignalField frequency{"Frequency", "Hz", 100, 2e7, 10000};
inline constexpr SignalField amplitudeI{"I Signal Amplitude", "", 0, 1, 0.707};
inline constexpr SignalField amplitudeQ{"Q Signal Amplitude", "", 0, 1, 0.707};
inline constexpr SignalField offsetI{"I Signal Offset", "", -1, 1, 0};
inline constexpr SignalField offsetQ{"Q Signal Offset", "", -1, 1, 0};
inline constexpr SignalField phaseQ{"Q Signal Phase Offset", "deg", -180, 180, 90};
inline constexpr SignalField oversampling{"Prefer a Custom Oversampling Ratio", "", 4, 100000, 100};

inline constexpr SignalField pulseResolution{"Rise Time", "s", 1e-9, 1e-7, 1e-7};
inline constexpr SignalField pulseRise{"Rise Time", "s", 0, 0.1, 1e-5};
inline constexpr SignalField pulseOn{"Pulse On Time", "s", 0, 0.1, 1e-4};
inline constexpr SignalField pulseFall{"Fall Time", "s", 0, 0.1, 1e-5};
inline constexpr SignalField pulseBlank{"Blank Time", "s", 0, 0.5, 1e-4};

inline constexpr SignalField chirpResolution{"Rise Time", "s", 1e-9, 1e-7, 1e-7};
inline constexpr SignalField chirpRise{"Rise Time", "s", 0, 0.1, 1e-5};
inline constexpr SignalField chirpOn{"Pulse On Time", "s", 0, 0.1, 1e-4};
inline constexpr SignalField chirpFall{"Fall Time", "s", 0, 0.1, 1e-5};
inline constexpr SignalField chirpBlank{"Blank Time", "s", 0, 0.5, 1e-4};
inline constexpr SignalField chirpRange{"Overall Chirp Range", "Hz", 100, 2e7, 1e6};

inline constexpr SignalField fmFrequency{"Modulation Frequency", "Hz", 100, 2.5e7, 1000};
inline constexpr SignalField fmDeviation{"Deviation", "Hz", 100, 4e7, 10000};
inline constexpr SignalField fmFrequency2{"Modulation Frequency, 2nd Tone", "Hz", 100, 2.5e7, 2000};
inline constexpr SignalField fmDeviation2{"Deviation, 2nd Tone", "Hz", 100, 4e7, 10000};

inline constexpr SignalField sweepDeviation{"Deviation", "Hz", 1000, 2e8, 1e5};
inline constexpr SignalField sweepTime{"Sweep Time", "s", 1e-5, 2, 0.01};
inline constexpr SignalField sweepStart{"Start Phase of Envelope", "deg", -360, 360, 0};
inline constexpr SignalField sweepStop{"Stop Phase of Envelope", "deg", -360, 360, 360};

inline constexpr SignalField amFrequency{"Modulation Frequency", "Hz", 100, 2.5e7, 10000};
inline constexpr SignalField amDepth{"Deviation", "%", 0, 100, 100};
inline constexpr SignalField amFrequency2{"Modulation Frequency, 2nd Tone", "Hz", 100, 2.5e7,
                                          15000};
inline constexpr SignalField amDepth2{"Deviation, 2nd Tone", "%", 0, 100, 100};

inline constexpr SignalField spacing{"Frequeny Spacing", "Hz", 10000, 2.5e7, 10000};
inline constexpr SignalField carriers{"Number of Carriers", "", 2, 10000, 100};
inline constexpr SignalField carrierOffsetI{"I Signal Offset", "", -1, 1, 0};

inline constexpr SignalField pmFrequency{"Modulation Frequency", "Hz", 100, 2.5e7, 10000};
inline constexpr SignalField pmDeviation{"Deviation", "deg", -180, 180, 180};

inline constexpr SignalField noiseBandwidth{"Total Noise Bandwidth", "Hz", 100, 2e7, 1e6};
inline constexpr SignalField noiseDuration{"Duration of Noise Signal", "s", 1e-4, 1, 0.01};

// NOLINTEND(readability-identifier-naming)

} // namespace signalfields
