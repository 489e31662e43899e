// SPDX-License-Identifier: Apache-2.0
#include "PlayInterval.h"

#include "log/Tracer.h"

#include <algorithm>

bool PlayInterval::fit(qint64 refreshMs)
{
    if (refreshMs < m_milliseconds || m_milliseconds >= LongestMs) {
        return false;
    }
    // Half as much again is left for the user.
    const qint64 wanted = std::min<qint64>(refreshMs, LongestMs) * 3 / 2;
    m_milliseconds = static_cast<int>(std::min<qint64>(wanted, LongestMs));
    Tracer::Trace(Tracer::Information, "Play interval adjusted.");
    return true;
}
