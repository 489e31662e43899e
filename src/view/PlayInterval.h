// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <QtGlobal>

/// The time between two steps of a playback. It starts at 40 ms and grows where a refresh takes
/// longer, so that the event loop keeps room for the stop button.
class PlayInterval
{
public:
    static constexpr int StartMs = 40;
    static constexpr int LongestMs = 1000;

    [[nodiscard]] int milliseconds() const { return m_milliseconds; }

    /// Takes the time that a refresh needed. True, and a line in the log, if the interval changed.
    bool fit(qint64 refreshMs);

    /// Back to the start, for a new playback.
    void reset() { m_milliseconds = StartMs; }

private:
    int m_milliseconds = StartMs;
};
