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

    /// Checks the header and reads both ends of the stream. Logs the reason of a failure.
    [[nodiscard]] bool open();

    /// Makes the samples from `first` to before `end` available, and zeros for `readAhead` more.
    /// `first` never falls from call to call. What samples() gave before the call stays readable
    /// until the next one. Logs the reason of a failure.
    [[nodiscard]] bool advance(qint64 first, qint64 end, int readAhead);

    /// The samples; index 0 is the sample `start()`.
    [[nodiscard]] PlanarInput samples() const
    {
        return {m_window.inPhase.data(), m_window.quadrature.data()};
    }
    [[nodiscard]] qint64 start() const { return m_window.start; }

private:
    struct Window
    {
        qint64 start = 0; ///< sample at index 0
        qint64 end = 0;   ///< one behind the last sample
        std::vector<float> inPhase;
        std::vector<float> quadrature;
    };

    [[nodiscard]] bool readInner(Window &window, qint64 first, qint64 end);
    void copyWrapped(Window &window, qint64 index) const;
    [[nodiscard]] bool failReading(qint64 sample) const;

    BufferedIO &m_stream;
    qint64 m_count;     ///< samples in the stream
    int m_filterLength; ///< for messages
    bool m_started = false;
    Window m_window;
    Window m_spare;             ///< the window before, to be the next one
    std::vector<float> m_block; ///< interleaved, as read
    std::vector<float> m_head;  ///< the first samples, interleaved
    std::vector<float> m_tail;  ///< the last samples, interleaved, the very last one at its end
};
