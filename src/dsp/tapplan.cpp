// SPDX-License-Identifier: Apache-2.0
#include "tapplan.h"

#include "vectorclones.h"

#include <cmath>
#include <cstddef>

namespace {

template <typename Real>
CORVANE_INLINE void planTapsBody(const TapGeometry &geometry, const SlopedLayout &layout,
                                 qint64 firstOutput, qint64 inputStart, const TapPlan<Real> &plan)
{
    const double half = geometry.half();
    const double back = geometry.length() - 1;
    const double maxTaps = geometry.maxTaps();
    const double ratio = geometry.ratio();
    const double scale = geometry.scale();
    const double onSampleLimit = (geometry.length() - 1.5) * scale;
    const auto start = static_cast<double>(firstOutput);
    const auto origin = static_cast<double>(inputStart);
    const int count = static_cast<int>(plan.offsets.size());
    std::int32_t *offsets = plan.offsets.data();
    std::int32_t *rowStarts = plan.rowStarts.data();
    Real *fractions = plan.fractions.data();
    for (int i = 0; i < count; ++i) {
        const double t = (start + i) / ratio;
        const double first = std::ceil(t - half);
        const double end = std::floor(half + t);
        const double position = (t - std::ceil(t) + back) * scale;
        const auto whole = static_cast<std::int32_t>(position);
        const std::int32_t between = (whole - layout.lowest) * layout.rowStride;
        const std::int32_t onSample =
            position > onSampleLimit ? layout.onSample : layout.onSampleNext;
        offsets[i] = static_cast<std::int32_t>(first - origin);
        rowStarts[i] = end - first < maxTaps ? between : onSample;
        fractions[i] = static_cast<Real>(position - whole);
    }
}

} // namespace

CORVANE_VECTOR_CLONES void planTaps(const TapGeometry &geometry, const SlopedLayout &layout,
                                    qint64 firstOutput, qint64 inputStart,
                                    const TapPlan<float> &plan)
{
    planTapsBody(geometry, layout, firstOutput, inputStart, plan);
}

CORVANE_VECTOR_CLONES void planTaps(const TapGeometry &geometry, const SlopedLayout &layout,
                                    qint64 firstOutput, qint64 inputStart,
                                    const TapPlan<double> &plan)
{
    planTapsBody(geometry, layout, firstOutput, inputStart, plan);
}
