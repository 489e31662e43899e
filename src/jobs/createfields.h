// SPDX-License-Identifier: Apache-2.0
#pragma once

/// One numeric field of signal creation, as the dialog shows it and the command line takes it.
struct CreateField
{
    const char *object; ///< name of the dialog's field
    const char *text;
    const char *unit;
    double min;
    double max;
    double start;
    const char *key; ///< in the dialog's settings
};

/// The fields, by kind of signal. Some texts are odd; they are established as they stand.
namespace createfields {

inline constexpr CreateField maxClock{
    "le_maxclock", "Maximum permissible ARB clock rate", "Hz", 1e7, 6e8, 1e8, "clk.max"};
inline constexpr CreateField minClock{
    "le_minclock", "Minimum permissible ARB clock rate", "Hz", 1000, 1e7, 1e5, "clk.min"};
inline constexpr CreateField clockRate{"le_clockrate", "ARB Clockrate", "Hz", 1000, 6e8, 1e8, ""};

inline constexpr CreateField frequency{"le_freq", "Frequency", "Hz", 100, 2e7, 10000, "fn.freq"};
inline constexpr CreateField amplitudeI{"le_ampi", "I Signal Amplitude", "", 0, 1, 0.707,
                                        "fn.ampi"};
inline constexpr CreateField amplitudeQ{"le_ampq", "Q Signal Amplitude", "", 0, 1, 0.707,
                                        "fn.ampq"};
inline constexpr CreateField offsetI{"le_ofsi", "I Signal Offset", "", -1, 1, 0, "fn.ofsi"};
inline constexpr CreateField offsetQ{"le_ofsq", "Q Signal Offset", "", -1, 1, 0, "fn.ofsq"};
inline constexpr CreateField phaseQ{"le_phaseq", "Q Signal Phase Offset", "deg", -180, 180, 90,
                                    "fn.phsq"};
inline constexpr CreateField oversampling{
    "le_over", "Prefer a Custom Oversampling Ratio", "", 4, 100000, 100, "fn.over"};

inline constexpr CreateField pulseResolution{
    "le_pulseresolution", "Rise Time", "s", 1e-9, 1e-7, 1e-7, "pulse.tres"};
inline constexpr CreateField pulseRise{"le_trise", "Rise Time", "s", 0, 0.1, 1e-5, "pulse.rise"};
inline constexpr CreateField pulseOn{"le_ton", "Pulse On Time", "s", 0, 0.1, 1e-4, "pulse.on"};
inline constexpr CreateField pulseFall{"le_tfall", "Fall Time", "s", 0, 0.1, 1e-5, "pulse.fall"};
inline constexpr CreateField pulseBlank{"le_tblank", "Blank Time", "s",          0,
                                        0.5,         1e-4,         "pulse.blank"};

inline constexpr CreateField chirpResolution{
    "le_pulseresolution_2", "Rise Time", "s", 1e-9, 1e-7, 1e-7, "chirp.tres"};
inline constexpr CreateField chirpRise{"le_trise_2", "Rise Time", "s", 0, 0.1, 1e-5, "chirp.rise"};
inline constexpr CreateField chirpOn{"le_ton_2", "Pulse On Time", "s", 0, 0.1, 1e-4, "chirp.on"};
inline constexpr CreateField chirpFall{"le_tfall_2", "Fall Time", "s", 0, 0.1, 1e-5, "chirp.fall"};
inline constexpr CreateField chirpBlank{"le_tblank_2", "Blank Time", "s",          0,
                                        0.5,           1e-4,         "chirp.blank"};
inline constexpr CreateField chirpRange{"le_chirprange", "Overall Chirp Range", "Hz", 100, 2e7, 1e6,
                                        "chirp.range"};

inline constexpr CreateField fmFrequency{
    "le_modfreq", "Modulation Frequency", "Hz", 100, 2.5e7, 1000, "fm.modf"};
inline constexpr CreateField fmDeviation{"le_dev", "Deviation", "Hz", 100, 4e7, 10000, "fm.dev"};
inline constexpr CreateField fmFrequency2{
    "le_modfreq_2", "Modulation Frequency, 2nd Tone", "Hz", 100, 2.5e7, 2000, "fm.modf2"};
inline constexpr CreateField fmDeviation2{"le_dev_2", "Deviation, 2nd Tone", "Hz", 100, 4e7, 10000,
                                          "fm.dev2"};

inline constexpr CreateField sweepDeviation{"le_sweepdev", "Deviation", "Hz",       1000,
                                            2e8,           1e5,         "fmswe.dev"};
inline constexpr CreateField sweepTime{"le_sweeptime", "Sweep Time", "s", 1e-5, 2,
                                       0.01,           "fmswe.time"};
inline constexpr CreateField sweepStart{
    "le_startphase", "Start Phase of Envelope", "deg", -360, 360, 0, "fmswe.pstart"};
/// The key keeps its name from another field of old.
inline constexpr CreateField sweepStop{
    "le_stopphase", "Stop Phase of Envelope", "deg", -360, 360, 360, "fmswe.modf"};

inline constexpr CreateField amFrequency{
    "le_ammodfreq", "Modulation Frequency", "Hz", 100, 2.5e7, 10000, "am.modf"};
inline constexpr CreateField amDepth{"le_amdepth", "Deviation", "%", 0, 100, 100, "am.dep"};
inline constexpr CreateField amFrequency2{
    "le_ammodfreq_2", "Modulation Frequency, 2nd Tone", "Hz", 100, 2.5e7, 15000, "am.modf2"};
inline constexpr CreateField amDepth2{"le_amdepth_2", "Deviation, 2nd Tone", "%", 0, 100, 100,
                                      "am.dep2"};

inline constexpr CreateField spacing{"le_spacing", "Frequeny Spacing", "Hz", 10000, 2.5e7, 10000,
                                     "mc.spc"};
inline constexpr CreateField carriers{"le_carriers", "Number of Carriers", "", 2, 10000, 100,
                                      "mc.carr"};
inline constexpr CreateField carrierOffsetI{"le_ioffset", "I Signal Offset", "", -1, 1, 0,
                                            "mc.iofs"};

inline constexpr CreateField pmFrequency{
    "le_pmmodfreq", "Modulation Frequency", "Hz", 100, 2.5e7, 10000, "pm.modf"};
inline constexpr CreateField pmDeviation{"le_pmdev", "Deviation", "deg", -180, 180, 180, "pm.dev"};

inline constexpr CreateField noiseBandwidth{
    "le_noisebw", "Total Noise Bandwidth", "Hz", 100, 2e7, 1e6, "noise.bw"};
inline constexpr CreateField noiseDuration{
    "le_noiseduration", "Duration of Noise Signal", "s", 1e-4, 1, 0.01, "noise.time"};

} // namespace createfields
