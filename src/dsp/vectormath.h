// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <span>

/// Sines and cosines of angles in radians, for whole arrays at a time. The error is below one unit
/// in the last place, also next to the zeros, for every finite angle; others give not-a-number.
/// All spans have the same length and don't overlap.
void sinCos(std::span<const double> angles, std::span<double> sines, std::span<double> cosines);

/// The sines alone.
void sines(std::span<const double> angles, std::span<double> result);
