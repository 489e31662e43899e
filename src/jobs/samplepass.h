// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <QtGlobal>

#include <functional>
#include <span>

class SourceWaveform;
class ToolJob;

/// What a pass hands over: I and Q in turn, one marker byte for each sample, and the number of the
/// first sample in the file. False ends the pass, with the reason logged by the taker.
using SampleTaker =
    std::function<bool(std::span<const float> values, std::span<const char> markers, qint64 first)>;

/// Goes once through `count` samples from sample `begin`, which lie in the source, with the
/// progress and the cancel of the job. Progress runs from `fromPercent` to `toPercent`. False, with
/// the reason logged, if they can't be read, the taker has failed, or the job was cancelled.
[[nodiscard]] bool passSamples(ToolJob &job, SourceWaveform &source, qint64 begin, qint64 count,
                               const SampleTaker &take, int fromPercent = 0, int toPercent = 100);
