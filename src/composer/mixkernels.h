// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <QtGlobal>

#include <span>

/// The sums of the combining stage. Each is rounded to single precision after each track, as if
/// made sample by sample.

/// sum += values * factor; all spans hold I and Q in turn and have the same length.
void addScaled(std::span<float> sum, std::span<const float> values, double factor);

/// As above, with one factor for each sample.
void addWeighted(std::span<float> sum, std::span<const float> values,
                 std::span<const double> factors);

void addMarkers(std::span<quint8> sum, std::span<const quint8> values);
