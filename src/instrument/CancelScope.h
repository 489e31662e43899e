// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <atomic>

/// For an operation that can be cancelled but leaves the flag of a cancel as it is: a cancel from
/// before does not end the operation, and is there again behind it.
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
