// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <QString>

#include <span>

/// The step at or above the value that is 1, 2, 5 or 10 times a power of ten; minus that of the
/// positive for a negative value, 0 for 0. Axes and grids get their round divisions from it.
[[nodiscard]] double niceStep(double value);

/// A power as text. In dB (`linearPower` false) the value is written as it is, "%6.2f dBm", or
/// "%6.2f dB " when relative. In watts it gets a prefix from GW to pW; below 1e-12 the text is
/// empty.
[[nodiscard]] QString powerText(double value, bool relative, bool linearPower);

/// 10 log10(|watts|) + 30, that is dBm; -60 for 0.
[[nodiscard]] double powerToDbm(double watts);

/// The vector form: a 0 takes the value before it, in `in` too; the first fill value is the first
/// value that isn't 0, or -60 (as a value, before the logarithm) if there is none. The spans have
/// the same length.
void powerToDbm(std::span<double> in, std::span<double> out);

/// A level in dB of a magnitude; the tiny amount keeps silence finite (-640 dB).
[[nodiscard]] double magnitudeToDb(double magnitude);

/// Of `count` labels in a row that lie `spacing` apart, every n-th fits without touching when each
/// takes `extent`. Returns n from the series 1, 2, 5, 10, 20, and so on.
[[nodiscard]] int labelStride(double spacing, double extent);
