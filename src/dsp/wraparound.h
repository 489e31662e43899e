// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <complex>
#include <span>
#include <vector>

/// Samples on each side of the point where a loop closes that are looked at.
inline constexpr int JointHalf = 2048;

/// The joint of a loop: its last JointHalf samples, then its first ones.
using Joint = std::vector<std::complex<double>>;

/// The joint with its step smoothed: over `range` samples on each side the low-pass filtered signal
/// is faded in and the signal itself out, so that the joint point is filtered alone. The filter, a
/// sinc over 63 taps, has its edge at `cutoff`, a share of the sample rate; its gain isn't
/// corrected. Samples outside the range stay. `joint` holds 2 JointHalf samples, and `range` is 1
/// to JointHalf - 31.
[[nodiscard]] Joint smoothedJoint(std::span<const std::complex<double>> joint, double cutoff,
                                  int range);

/// The level of a slow signal at the joint point after smoothedJoint, as a part of what it was.
[[nodiscard]] double jointGain(double cutoff);
