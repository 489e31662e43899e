// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <span>

/// Magnitude and phase in radians of vectors given by their parts. Vectors on the imaginary axis
/// have the phase of a full circle, +2 pi above zero and -2 pi at and below it, as established
/// waveforms expect; all others that of atan2. All spans have the same length.
void cartesianToPolar(std::span<const double> re, std::span<const double> im,
                      std::span<double> magnitude, std::span<double> phase);

/// The parts of vectors given by magnitude and phase in radians. All spans have the same length.
void polarToCartesian(std::span<const double> magnitude, std::span<const double> phase,
                      std::span<double> re, std::span<double> im);
