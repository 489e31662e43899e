// SPDX-License-Identifier: Apache-2.0
#pragma once

#include "dotkernels.h"

#include <QtGlobal>

#include <span>
#include <vector>

class BufferedIO;

/// A sliding window over a data stream that is taken as a loop: samples before the start come from
/// its end and samples behind the end from its start, up to `WrapSamples` on each side. What lies
/// further out, and what a shorter stream doesn't fill, is zero.
class LoopedInput
{
public:
    static constexpr int WrapSamples = 201;

    /// The stream isn't owned and must stay alive. `filterLength` only tells the numbers in an
    /// error message.
    LoopedInput(BufferedIO &stream, int sampleCount, int filterLength);

    /// Reads both ends of the stream and goes to its first sample. Logs the reason of a failure.
    [[nodiscard]] bool open();

    /// Makes the samples from `first` to before `end` available, and zeros for `readAhead` more.
    /// `first` never falls from call to call. Logs the reason of a failure.
    [[nodiscard]] bool advance(qint64 first, qint64 end, int readAhead);

    /// The samples; index 0 is the sample `start()`.
    [[nodiscard]] PlanarInput samples() const { return {m_inPhase.data(), m_quadrature.data()}; }
    [[nodiscard]] qint64 start() const { return m_start; }

private:
    [[nodiscard]] bool readEnd(qint64 first, std::span<float> target);
    [[nodiscard]] bool readInner(qint64 first, qint64 end);
    void copyWrapped(qint64 index);
    [[nodiscard]] bool failReading(qint64 sample) const;

    BufferedIO &m_stream;
    qint64 m_count;        ///< samples in the stream
    int m_filterLength;    ///< for messages
    qint64 m_start = 0;    ///< sample at index 0 of the window
    qint64 m_end = 0;      ///< one behind the last sample in the window
    bool m_filled = false; ///< the window holds something
    std::vector<float> m_inPhase;
    std::vector<float> m_quadrature;
    std::vector<float> m_block; ///< interleaved, as read
    std::vector<float> m_head;  ///< the first samples, interleaved
    std::vector<float> m_tail;  ///< the last samples, interleaved, the very last one at its end
};
