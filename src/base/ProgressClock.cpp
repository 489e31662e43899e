// SPDX-License-Identifier: Apache-2.0
#include "ProgressClock.h"

#include "vectorstate.h"

#include <QCoreApplication>
#include <QThread>

#include <utility>

ProgressClock::ProgressClock(std::function<void(int)> report, const std::atomic<bool> &cancelled)
    : m_report(std::move(report))
    , m_cancelled(cancelled)
{
    m_timer.start();
}

bool ProgressClock::shouldStop(qint64 done, qint64 total, int from, int to)
{
    if (m_timer.elapsed() <= IntervalMs) {
        return false;
    }
    const double share = total > 0 ? static_cast<double>(done) / static_cast<double>(total) : 0.0;
    return shouldStop(from + static_cast<int>(share * (to - from)));
}

bool ProgressClock::shouldStop(int percent)
{
    if (m_timer.elapsed() <= IntervalMs) {
        return false;
    }
    m_timer.restart();
    m_report(percent);
    runEvents();
    return m_cancelled.load(std::memory_order_relaxed);
}

void ProgressClock::runEvents()
{
    const QCoreApplication *application = QCoreApplication::instance();
    if (application != nullptr && application->thread() == QThread::currentThread()) {
        QCoreApplication::processEvents();
        clearVectorState();
    }
}
