// SPDX-License-Identifier: Apache-2.0
#pragma once

#include "view/IqSample.h"

#include <cmath>
#include <cstddef>
#include <numbers>

/// A tone of so many turns per sample.
inline IqList toneSamples(qsizetype count, double turnsPerSample, double amplitude = 0.8)
{
    IqList samples(count);
    for (qsizetype k = 0; k < count; ++k) {
        const double angle = 2 * std::numbers::pi * turnsPerSample * static_cast<double>(k);
        samples[k] = {amplitude * std::cos(angle), amplitude * std::sin(angle)};
    }
    return samples;
}

/// Four points of one square, in turn.
inline IqList squareSamples(qsizetype count, double size = 0.5)
{
    IqList samples(count);
    for (qsizetype k = 0; k < count; ++k) {
        samples[k] = {k % 4 < 2 ? size : -size, k % 4 == 0 || k % 4 == 3 ? size : -size};
    }
    return samples;
}
