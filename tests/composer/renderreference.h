// SPDX-License-Identifier: Apache-2.0
#pragma once

#include "composer/Composition.h"

#include <complex>
#include <optional>
#include <vector>

/// A source as it goes into the sum: at the target clock and with its offset applied.
struct ReferenceSource
{
    std::vector<std::complex<float>> samples;
    std::vector<quint8> markers;
};

struct Rendered
{
    std::vector<std::complex<float>> samples; ///< scaled to a peak of 1
    std::vector<quint8> markers;
    double rms = 0; ///< after the scaling
};

/// The render told sample by sample, without a thought for time: what the engine is checked
/// against. `sources` are by track and segment; those of disabled tracks aren't looked at.
[[nodiscard]] Rendered renderLiterally(const Composition &document,
                                       const std::vector<std::vector<ReferenceSource>> &sources);
