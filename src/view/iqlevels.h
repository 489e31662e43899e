// SPDX-License-Identifier: Apache-2.0
#pragma once

#include "IqSample.h"

#include "streams/levels.h"

#include <span>

/// Power sums of samples that are held in memory.
[[nodiscard]] LevelSums levelsOf(const IqList &samples);

/// Samples given as interleaved I and Q.
[[nodiscard]] IqList iqList(std::span<const float> iq);
