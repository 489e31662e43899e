// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <span>
#include <vector>

/// Low-pass by the window method: n samples of sin(x) / x round the centre, multiplied by window
/// kind 1. `cutoff` is the edge as a share of the sample rate, 0 to 0.5. The sum of the
/// coefficients isn't normalised. Even n have their centre between two coefficients.
[[nodiscard]] std::vector<double> sincFir(int n, double cutoff);

/// Resamples a short table to a finer grid by a parabola through neighbouring points. `inStep` and
/// `outStep` are the distances of the points of both tables, above 0 and in the same unit. Points
/// behind the end of the input repeat its last value. Inputs below three points have no parabola;
/// the nearest point is taken.
void interpolateQuadratic(std::span<const double> in, double inStep, std::span<double> out,
                          double outStep);
