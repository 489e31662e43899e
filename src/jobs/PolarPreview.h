// SPDX-License-Identifier: Apache-2.0
#pragma once

#include "view/IqSample.h"

#include <optional>

class BufferedIO;

/// The first samples of a waveform and what the polar conversion makes of them.
struct PolarPreview
{
    static constexpr int MaxSamples = 10000;

    IqList source;
    IqList phase;
    IqList amplitude;
};

/// `samples` is the number of samples in the stream. Nothing, with the reason logged, if that
/// fails.
[[nodiscard]] std::optional<PolarPreview> makePolarPreview(BufferedIO &source, qint64 samples,
                                                           double offset, double gain);
