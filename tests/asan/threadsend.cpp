// SPDX-License-Identifier: Apache-2.0

// The toolkit runs threads of its own: the watchdog of QtTest, the pool of the image conversions.
// Waiting for their end, it is content with a thread's last word, which comes before the thread
// frees what is kept for it: a leak check in between, at the end of the process, takes that for
// lost. So the process waits until its other threads are gone.

#include <chrono>
#include <filesystem>
#include <iterator>
#include <system_error>
#include <thread>

namespace {

bool hasOtherThreads()
{
    std::error_code error;
    const std::filesystem::directory_iterator tasks("/proc/self/task", error);
    return !error && std::distance(begin(tasks), end(tasks)) > 1;
}

class ThreadsEnd
{
public:
    ThreadsEnd() = default;
    ThreadsEnd(const ThreadsEnd &) = delete;
    ThreadsEnd &operator=(const ThreadsEnd &) = delete;

    // Made before all other objects that end with the process, it goes after them, and before the
    // leak check, which was registered earlier.
    ~ThreadsEnd()
    {
        constexpr std::chrono::seconds Longest(2);
        const auto deadline = std::chrono::steady_clock::now() + Longest;
        while (hasOtherThreads() && std::chrono::steady_clock::now() < deadline) {
            std::this_thread::yield();
        }
    }
};

[[gnu::init_priority(101)]] const ThreadsEnd threadsEnd;

} // namespace
