// SPDX-License-Identifier: Apache-2.0
#include "WrapPreview.h"

#include "dsp/windows.h"

#include <algorithm>

namespace {

IqList iqList(std::span<const std::complex<double>> samples)
{
    IqList list;
    list.reserve(static_cast<qsizetype>(samples.size()));
    for (const std::complex<double> &sample : samples) {
        list.append({sample.real(), sample.imag()});
    }
    return list;
}

} // namespace

IqList jointTail(const Joint &joint)
{
    return iqList(std::span(joint).subspan(JointHalf - JointShown, JointShown));
}

IqList jointHead(const Joint &joint)
{
    return iqList(std::span(joint).subspan(JointHalf, JointShown));
}

IqList jointSpectrumInput(const Joint &joint)
{
    constexpr int FadeWindow = 1;
    Joint weighted = joint;
    return applyWindow(weighted, FadeWindow) ? iqList(weighted) : IqList();
}

double stepAtJoint(const Joint &joint)
{
    return std::abs(joint[JointHalf] - joint[JointHalf - 1]);
}

double largestStep(const Joint &joint, int range)
{
    double largest = 0;
    for (auto i = static_cast<std::size_t>(JointHalf - range);
         i <= JointHalf + static_cast<std::size_t>(range); ++i) {
        largest = std::max(largest, std::abs(joint[i] - joint[i - 1]));
    }
    return largest;
}
