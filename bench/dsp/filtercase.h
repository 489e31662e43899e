// SPDX-License-Identifier: Apache-2.0
#pragma once

#include "streams/TempStream.h"
#include "support/samples.h"

/// What the filter and its peer are measured on: equal counts of input and output, a loop.
namespace filtercase {

constexpr int Count = 4000000;
constexpr int Length = 201; ///< taps

const Samples &source();

/// Opens both streams and stores the input.
[[nodiscard]] bool openStreams(const Samples &input, TempStream &in, TempStream &out);

/// The samples of an output stream.
[[nodiscard]] bool readStream(TempStream &stream, Samples &output);

/// The taps, as the filter itself shows them.
std::vector<double> taps();

/// True if some samples are those of the sum over the taps.
[[nodiscard]] bool isFiltered(const Samples &result);

} // namespace filtercase
