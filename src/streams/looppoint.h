// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <QString>

#include <array>
#include <span>

/// What happens to a signal that is played in a loop when its end meets its start.
struct LoopPoint
{
    double magnitudeStepDb = 0;  ///< from the last sample to the first one
    double phaseStepDegrees = 0; ///< likewise, above -180 to 180; 0 where one of them is silent
    bool isContinuous = true;    ///< the step is no larger than the largest between neighbours
};

/// Compares the step over the loop point of a signal with those between its neighbouring samples.
/// Takes the samples as they pass, in blocks of any size.
class LoopMeter
{
public:
    /// `values` holds I and Q in turn, of full scale 1.
    void add(std::span<const float> values);

    /// Of all samples so far. A single one, or none, is continuous.
    [[nodiscard]] LoopPoint result() const;

private:
    bool m_hasSamples = false;
    std::array<float, 2> m_first{};
    std::array<float, 2> m_last{};
    float m_largest = 0; ///< square of the largest step between neighbours
};

/// "continuous", or the size of the step.
[[nodiscard]] QString loopText(const LoopPoint &loop);

/// A warning about the step; empty if there is none.
[[nodiscard]] QString loopWarning(const LoopPoint &loop);
