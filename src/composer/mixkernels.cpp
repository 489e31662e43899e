// SPDX-License-Identifier: Apache-2.0
#include "mixkernels.h"

#include "base/simd.h"

#include <cstddef>

namespace {

CORVANE_CLONES void addScaledValues(float *__restrict sum, const float *__restrict values,
                                    double factor, std::size_t count)
{
    for (std::size_t i = 0; i < count; ++i) {
        sum[i] = static_cast<float>(static_cast<double>(sum[i]) +
                                    static_cast<double>(values[i]) * factor);
    }
}

CORVANE_CLONES void addWeightedValues(float *__restrict sum, const float *__restrict values,
                                      const double *__restrict factors, std::size_t samples)
{
    for (std::size_t i = 0; i < samples; ++i) {
        sum[2 * i] = static_cast<float>(static_cast<double>(sum[2 * i]) +
                                        static_cast<double>(values[2 * i]) * factors[i]);
        sum[2 * i + 1] = static_cast<float>(static_cast<double>(sum[2 * i + 1]) +
                                            static_cast<double>(values[2 * i + 1]) * factors[i]);
    }
}

} // namespace

void addScaled(std::span<float> sum, std::span<const float> values, double factor)
{
    addScaledValues(sum.data(), values.data(), factor, sum.size());
}

void addWeighted(std::span<float> sum, std::span<const float> values,
                 std::span<const double> factors)
{
    addWeightedValues(sum.data(), values.data(), factors.data(), factors.size());
}

void addMarkers(std::span<quint8> sum, std::span<const quint8> values)
{
    for (std::size_t i = 0; i < sum.size(); ++i) {
        sum[i] |= values[i];
    }
}
