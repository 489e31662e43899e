// SPDX-License-Identifier: Apache-2.0
#pragma once

#include "Deadline.h"

#include <condition_variable>
#include <mutex>

namespace visa {

/// Lets one call at a time through to an instrument, the others wait no longer than their
/// deadlines. A std::timed_mutex would do the same, but thread sanitizers don't see its lock.
class Turnstile
{
public:
    [[nodiscard]] bool enter(const Deadline &deadline)
    {
        std::unique_lock lock(m_mutex);
        while (m_isTaken) {
            if (deadline.isOver()) {
                return false;
            }
            // Without end in pieces, as the clock has no value for it.
            m_freed.wait_for(lock, std::chrono::milliseconds(deadline.atMost(1000).remainingMs()));
        }
        m_isTaken = true;
        return true;
    }

    void leave()
    {
        const std::lock_guard lock(m_mutex);
        m_isTaken = false;
        m_freed.notify_one();
    }

    /// Leaves at the end of a scope.
    class Passage
    {
    public:
        explicit Passage(Turnstile &turnstile)
            : m_turnstile(turnstile)
        {
        }
        ~Passage() { m_turnstile.leave(); }
        Passage(const Passage &) = delete;
        Passage &operator=(const Passage &) = delete;

    private:
        Turnstile &m_turnstile;
    };

private:
    std::mutex m_mutex;
    std::condition_variable m_freed;
    bool m_isTaken = false;
};

} // namespace visa
