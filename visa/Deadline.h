// SPDX-License-Identifier: Apache-2.0
#pragma once

#include "visa.h"

#include <algorithm>
#include <chrono>
#include <limits>

namespace visa {

/// The point in time at which a call has to be over. One deadline goes down through all layers, so
/// that a call of many steps ends within the one time-out of its session.
class Deadline
{
public:
    /// VI_TMO_INFINITE never comes.
    [[nodiscard]] static Deadline after(ViUInt32 milliseconds)
    {
        Deadline deadline;
        if (milliseconds != VI_TMO_INFINITE) {
            deadline.m_end = Clock::now() + std::chrono::milliseconds(milliseconds);
        }
        return deadline;
    }

    [[nodiscard]] Deadline extendedBy(ViUInt32 milliseconds) const
    {
        Deadline deadline = *this;
        if (!isInfinite()) {
            deadline.m_end += std::chrono::milliseconds(milliseconds);
        }
        return deadline;
    }

    /// This deadline, or one `milliseconds` from now if that comes first.
    [[nodiscard]] Deadline atMost(ViUInt32 milliseconds) const
    {
        Deadline deadline = after(milliseconds);
        deadline.m_end = std::min(deadline.m_end, m_end);
        return deadline;
    }

    [[nodiscard]] bool isInfinite() const { return m_end == Clock::time_point::max(); }
    [[nodiscard]] bool isOver() const { return !isInfinite() && Clock::now() >= m_end; }

    /// What is left in ms, rounded up; VI_TMO_INFINITE for no end.
    [[nodiscard]] ViUInt32 remainingMs() const
    {
        if (isInfinite()) {
            return VI_TMO_INFINITE;
        }
        const auto left = std::chrono::ceil<std::chrono::milliseconds>(m_end - Clock::now());
        return static_cast<ViUInt32>(
            std::clamp<decltype(left.count())>(left.count(), 0, VI_TMO_INFINITE - 1));
    }

    /// The same as an argument of poll(2): -1 for no end.
    [[nodiscard]] int pollMs() const
    {
        if (isInfinite()) {
            return -1;
        }
        constexpr ViUInt32 Largest = std::numeric_limits<int>::max();
        return static_cast<int>(std::min(remainingMs(), Largest));
    }

private:
    using Clock = std::chrono::steady_clock;

    Clock::time_point m_end = Clock::time_point::max();
};

} // namespace visa
