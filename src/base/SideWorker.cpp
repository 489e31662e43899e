// SPDX-License-Identifier: Apache-2.0
#include "SideWorker.h"

#include "parallel.h"

#include <system_error>
#include <utility>

SideWorker::~SideWorker()
{
    wait();
}

bool SideWorker::launch()
{
    if (m_thread.joinable()) {
        return true;
    }
    if (threadCount() < 2) {
        return false;
    }
    try {
        m_thread = std::jthread([this](const std::stop_token &stop) { loop(stop); });
    } catch (const std::system_error &) {
        return false;
    }
    return true;
}

void SideWorker::start(std::function<void()> work)
{
    wait();
    if (!launch()) {
        work();
        return;
    }
    {
        const std::scoped_lock lock(m_mutex);
        m_work = std::move(work);
    }
    m_changed.notify_all();
}

void SideWorker::wait()
{
    std::unique_lock lock(m_mutex);
    m_changed.wait(lock, [this] { return !m_work; });
}

void SideWorker::loop(const std::stop_token &stop)
{
    std::unique_lock lock(m_mutex);
    while (m_changed.wait(lock, stop, [this] { return static_cast<bool>(m_work); })) {
        lock.unlock();
        m_work();
        lock.lock();
        m_work = nullptr;
        m_changed.notify_all();
    }
}
