// SPDX-License-Identifier: Apache-2.0
#include "Arb.h"

#include <utility>

namespace simulator {

void Arb::select(std::string path, std::uint64_t size, std::optional<std::int64_t> busySeconds,
                 TimePoint now)
{
    m_selection = std::move(path);
    m_loadBegin = now;
    if (busySeconds) {
        m_loadEnd = now + std::chrono::seconds(*busySeconds);
    } else {
        m_loadEnd = now + std::chrono::milliseconds(200) + std::chrono::nanoseconds(5) * size;
    }
}

int Arb::progressPercent(TimePoint now) const
{
    if (!isLoading(now)) {
        return 100;
    }
    const auto gone = now - m_loadBegin;
    return static_cast<int>(100 * gone / (m_loadEnd - m_loadBegin));
}

} // namespace simulator
