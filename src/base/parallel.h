// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <cstddef>
#include <functional>

/// Number of threads that parallelFor uses at most; 0 (the default) means one per processor.
void setThreadLimit(unsigned count);

/// The same for work that the calling thread starts, and for that alone: threads that run beside
/// each other share the processors. The lower of both limits counts.
void setOwnThreadLimit(unsigned count);

/// The number of threads that parallelFor would use for many items on the calling thread.
[[nodiscard]] unsigned threadCount();

/// Calls `work(index)` for each index from 0 to count - 1, spread over the processors, and returns
/// when all are done. The calls must be independent of each other, so that the result doesn't
/// depend on the number of threads. Runs on the calling thread alone for a single item, and with
/// fewer threads while other callers hold those that are kept for it.
void parallelFor(std::size_t count, const std::function<void(std::size_t)> &work);
