// SPDX-License-Identifier: Apache-2.0
#pragma once

#include "dsp/wraparound.h"
#include "view/IqSample.h"

/// Samples on each side of the loop point that a preview shows.
inline constexpr int JointShown = 64;

/// The last samples before the loop point, and the first ones behind it.
[[nodiscard]] IqList jointTail(const Joint &joint);
[[nodiscard]] IqList jointHead(const Joint &joint);

/// What the spectrum at the loop point is made of: the joint, faded in and out.
[[nodiscard]] IqList jointSpectrumInput(const Joint &joint);

/// How far the signal moves over the loop point, as a part of full scale.
[[nodiscard]] double stepAtJoint(const Joint &joint);

/// The largest move from one sample to the next within `range` samples on each side of the loop
/// point and over it, as a part of full scale.
[[nodiscard]] double largestStep(const Joint &joint, int range);
