// SPDX-License-Identifier: Apache-2.0
// Qt as packaged is not built for the thread sanitizer, which therefore doesn't see what its
// semaphores, recursive mutexes and thread pools put in order, and would report all that they
// guard. These functions stand in the place of Qt's, call them, and tell the sanitizer.
#include <QRecursiveMutex>
#include <QSemaphore>
#include <QThread>
#include <QThreadPool>

#include <atomic>
#include <functional>
#include <thread>
#include <utility>

#include <dlfcn.h>
#include <sanitizer/tsan_interface.h>

namespace {

/// Qt's own function behind that of this file.
template <typename Function>
Function next(const char *name)
{
    return reinterpret_cast<Function>(dlsym(RTLD_NEXT, name));
}

std::atomic<int> busyThreads{0};

} // namespace

void QSemaphore::acquire(int n)
{
    static const auto original = next<void (*)(QSemaphore *, int)>("_ZN10QSemaphore7acquireEi");
    original(this, n);
    __tsan_acquire(this);
}

void QSemaphore::release(int n)
{
    static const auto original = next<void (*)(QSemaphore *, int)>("_ZN10QSemaphore7releaseEi");
    __tsan_release(this);
    original(this, n);
}

bool QRecursiveMutex::tryLock(int timeout)
{
    static const auto original =
        next<bool (*)(QRecursiveMutex *, int)>("_ZN15QRecursiveMutex7tryLockEi");
    const bool locked = original(this, timeout);
    if (locked) {
        __tsan_acquire(this);
    }
    return locked;
}

void QRecursiveMutex::unlock() noexcept
{
    static const auto original = next<void (*)(QRecursiveMutex *)>("_ZN15QRecursiveMutex6unlockEv");
    __tsan_release(this);
    original(this);
}

void QThread::start(Priority priority)
{
    static const auto original =
        next<void (*)(QThread *, Priority)>("_ZN7QThread5startENS_8PriorityE");
    // Emitted by the thread itself, before anybody can see that it has ended.
    connect(
        this, &QThread::finished, this, [this] { __tsan_release(this); }, Qt::DirectConnection);
    original(this, priority);
}

bool QThread::wait(QDeadlineTimer deadline)
{
    static const auto original =
        next<bool (*)(QThread *, QDeadlineTimer)>("_ZN7QThread4waitE14QDeadlineTimer");
    const bool ended = original(this, deadline);
    if (ended) {
        __tsan_acquire(this);
    }
    return ended;
}

bool QThread::isRunning() const
{
    static const auto original = next<bool (*)(const QThread *)>("_ZNK7QThread9isRunningEv");
    const bool running = original(this);
    if (!running) {
        __tsan_acquire(const_cast<QThread *>(this));
    }
    return running;
}

/// A thread of its own for each task: what a pool does among its own threads would be reported,
/// too.
bool QThreadPool::tryStart(std::function<void()> functionToRun)
{
    if (++busyThreads > maxThreadCount()) {
        --busyThreads;
        return false;
    }
    std::thread([work = std::move(functionToRun)] {
        work();
        --busyThreads;
    }).detach();
    return true;
}
