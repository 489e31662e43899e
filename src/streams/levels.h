// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <cmath>

/// Offset in dB below full scale of a linear level that was measured on the samples of a file; the
/// small amount keeps silence finite, at 140 dB.
[[nodiscard]] inline double measuredOffset(double level)
{
    return 20 * std::log10(1 / (level + 1e-7));
}
