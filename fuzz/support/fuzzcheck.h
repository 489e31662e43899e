// SPDX-License-Identifier: Apache-2.0
#pragma once

#include "log/Tracer.h"
#include "require.h"

#include <algorithm>

/// Takes the log. True if it tells an error.
[[nodiscard]] inline bool takeErrors()
{
    const QList<Tracer::Entry> entries = Tracer::takeEntries();
    return std::any_of(entries.begin(), entries.end(),
                       [](const Tracer::Entry &entry) { return entry.second == Tracer::Error; });
}
