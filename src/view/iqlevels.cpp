// SPDX-License-Identifier: Apache-2.0
#include "iqlevels.h"

#include <algorithm>

LevelSums levelsOf(const IqList &samples)
{
    LevelSums sums;
    for (const IqSample &sample : samples) {
        const double power = sample.i * sample.i + sample.q * sample.q;
        sums.sum += power;
        sums.peak = std::max(sums.peak, power);
    }
    return sums;
}

IqList iqList(std::span<const float> iq)
{
    IqList samples;
    samples.reserve(static_cast<qsizetype>(iq.size() / 2));
    for (std::size_t i = 0; i + 1 < iq.size(); i += 2) {
        samples.append({iq[i], iq[i + 1]});
    }
    return samples;
}
