// SPDX-License-Identifier: Apache-2.0
#pragma once

#include "support/samples.h"

#include <benchmark/benchmark.h>

/// What the rate conversion and its peer are measured on: a tone of 4 million samples.
namespace resamplecase {

constexpr int InputCount = 4000000;
constexpr double ToneCycles = 333333; ///< in the whole waveform

const Samples &source();

/// The tone must come out at its place, 60 dB above everything else; the ends are left out, since
/// the peer doesn't loop.
[[nodiscard]] bool isTone(const Samples &result, double level);

/// Output counts for the ratios 1.5, 0.73, 1.0009 and a prime one, then the number of threads.
void counts(benchmark::internal::Benchmark *bench);

} // namespace resamplecase
