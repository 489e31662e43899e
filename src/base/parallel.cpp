// SPDX-License-Identifier: Apache-2.0
#include "parallel.h"

#include <QSemaphore>
#include <QThreadPool>

#include <algorithm>
#include <atomic>
#include <thread>

namespace {

std::atomic<unsigned> threadLimit{0};
thread_local unsigned ownThreadLimit = 0;

/// Loops come block by block, and a new thread for each would cost more than a small block.
QThreadPool &keptThreads()
{
    static QThreadPool pool;
    return pool;
}

} // namespace

void setThreadLimit(unsigned count)
{
    threadLimit = count;
    keptThreads().setMaxThreadCount(static_cast<int>(threadCount()));
}

void setOwnThreadLimit(unsigned count)
{
    ownThreadLimit = count;
}

unsigned threadCount()
{
    const unsigned limit = threadLimit;
    const unsigned count = limit > 0 ? limit : std::max(1U, std::thread::hardware_concurrency());
    return ownThreadLimit > 0 ? std::min(ownThreadLimit, count) : count;
}

void parallelFor(std::size_t count, const std::function<void(std::size_t)> &work)
{
    const std::size_t workers = std::min<std::size_t>(count, threadCount());
    std::atomic<std::size_t> next{0};
    const auto drain = [&] {
        for (std::size_t index = next++; index < count; index = next++) {
            work(index);
        }
    };
    QSemaphore ended;
    int started = 0;
    while (static_cast<std::size_t>(started) + 1 < workers && keptThreads().tryStart([&] {
        drain();
        ended.release();
    })) {
        ++started;
    }
    drain();
    ended.acquire(started);
}
