// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <QtGlobal>

#include <limits>

/// The most samples that a waveform can have here.
inline constexpr qint64 MaxSamples = std::numeric_limits<qint32>::max();

inline constexpr int MarkerCount = 4;

/// Clock rates (Hz) of a waveform: above the first, up to and including the second.
inline constexpr double MinClockHz = 0.001;
inline constexpr double MaxClockHz = 600e6;
