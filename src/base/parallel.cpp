// SPDX-License-Identifier: Apache-2.0
#include "parallel.h"

#include <algorithm>
#include <atomic>
#include <thread>
#include <vector>

namespace {
std::atomic<unsigned> threadLimit{0};
}

void setThreadLimit(unsigned count)
{
    threadLimit = count;
}

unsigned threadCount()
{
    const unsigned limit = threadLimit;
    return limit > 0 ? limit : std::max(1U, std::thread::hardware_concurrency());
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
    std::vector<std::jthread> threads;
    for (std::size_t i = 1; i < workers; ++i) {
        threads.emplace_back(drain);
    }
    drain();
}
