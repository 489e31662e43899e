// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <array>
#include <complex>
#include <span>
#include <vector>

/// Cosine-sum windows w(i) = sum over j = 0 to 4 of a[j] cos(2 pi j i / n). They are periodic, that
/// is w(n) would equal w(0) and the top lies at index n / 2.

/// Number of window kinds; any other kind stands for kind 0, which leaves samples as they are.
inline constexpr int WindowKindCount = 9;

/// Number of leading kinds that have a name and are offered to users.
inline constexpr int NamedWindowCount = 7;

/// The coefficients a0 to a4 of a kind.
[[nodiscard]] const std::array<double, 5> &windowCoefficients(int kind);

/// The name that the tools show for the kinds 0 to 6; an empty text for all others. Names and
/// coefficients are paired as waveforms in the field expect them: "Hanning" is the row with
/// 0.53836, "Rife Vincent" the one of second order.
[[nodiscard]] const char *windowName(int kind);

/// Fills the span with the window of its length. Always true; an empty span is left as it is.
bool fillWindow(std::span<double> window, int kind);

/// Multiplies both parts of each sample by the window of the span's length. False if it is empty.
[[nodiscard]] bool applyWindow(std::span<std::complex<double>> samples, int kind);

/// The values of fillWindow as a list of n; empty for n below 1.
[[nodiscard]] std::vector<double> windowList(int n, int kind);
