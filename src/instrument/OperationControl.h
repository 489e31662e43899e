// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <atomic>
#include <functional>
#include <utility>

/// How a long operation on an instrument tells its progress and learns that it is to stop. Shared
/// by all operations of one device, of which one runs at a time.
struct OperationControl
{
    /// Takes the progress in percent. Never empty.
    std::function<void(int percent)> report;

    /// Set by a slot while the operation lets events through, or by another thread.
    std::atomic<bool> cancelled{false};
};

/// For an operation that can be cancelled but leaves the flag of a cancel as it is: a cancel from
/// before does not end the operation, and is there again after it.
class CancelScope
{
public:
    explicit CancelScope(std::atomic<bool> &flag)
        : m_flag(flag)
        , m_wasSet(flag.exchange(false))
    {
    }
    ~CancelScope()
    {
        if (m_wasSet) {
            m_flag = true;
        }
    }
    CancelScope(const CancelScope &) = delete;
    CancelScope &operator=(const CancelScope &) = delete;

private:
    std::atomic<bool> &m_flag;
    bool m_wasSet;
};
