// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <QElapsedTimer>

#include <atomic>
#include <functional>

/// The one clock of long loops: not more often than every 100 ms it reports the progress, lets the
/// event loop run if it is called on the application's thread, and says whether the work is to
/// stop. Worker threads have no events of their own to handle.
class ProgressClock
{
public:
    static constexpr qint64 IntervalMs = 100;

    /// `report` gets the progress in percent; `cancelled` is the worker's flag, which a slot sets
    /// while the event loop runs or another thread sets at any time. Both outlive the clock.
    ProgressClock(std::function<void(int)> report, const std::atomic<bool> &cancelled);

    /// To be called at every block boundary. True when the work was cancelled; between the ticks
    /// it costs one look at the time. `done` of `total` is scaled to `from`..`to` per cent.
    [[nodiscard]] bool shouldStop(qint64 done, qint64 total, int from = 0, int to = 100);

    /// As above, for a caller that knows its percentage.
    [[nodiscard]] bool shouldStop(int percent);

    /// Lets the event loop run if this is the application's thread; in any other it does nothing.
    static void runEvents();

private:
    std::function<void(int)> m_report;
    const std::atomic<bool> &m_cancelled;
    QElapsedTimer m_timer;
};
