// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <complex>
#include <vector>

using Samples = std::vector<std::complex<float>>;

/// Noise, I and Q evenly spread over -1 to 1; the same in each run and on each machine.
inline Samples uniformNoise(int count)
{
    Samples samples(static_cast<size_t>(count));
    unsigned state = 1;
    const auto draw = [&state] {
        state = state * 1664525U + 1013904223U;
        return static_cast<float>(state >> 8) / 8388608.0F - 1.0F;
    };
    for (std::complex<float> &sample : samples) {
        const float inPhase = draw();
        sample = {inPhase, draw()};
    }
    return samples;
}
