// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <condition_variable>
#include <functional>
#include <mutex>
#include <thread>

/// A second pair of hands for a block loop: one thread that does one piece of work at a time, in
/// the order given, while the caller goes on. Belongs to the thread that made it.
///
/// With a thread limit of 1, or when the system has no thread left, the work is done at once by the
/// caller, so results must not depend on when it is done.
class SideWorker
{
public:
    SideWorker() = default;

    /// Waits for the work at hand; the thread ends.
    ~SideWorker();
    SideWorker(const SideWorker &) = delete;
    SideWorker &operator=(const SideWorker &) = delete;

    /// Waits for the work at hand and hands over the next. What it uses must stay until the next
    /// start(), wait() or the end of the worker.
    void start(std::function<void()> work);

    /// Returns when the work at hand is done.
    void wait();

private:
    [[nodiscard]] bool launch();
    void loop(const std::stop_token &stop);

    std::mutex m_mutex;
    std::condition_variable_any m_changed;
    std::function<void()> m_work; ///< empty while there is nothing to do
    std::jthread m_thread;        // last: it uses the others
};
