// SPDX-License-Identifier: Apache-2.0
#pragma once

namespace visa {

/// Lets one thread end the waiting of another: every poll of a session also watches this
/// descriptor. Once woken it stays so, because only a session that is being closed wakes.
class Waker
{
public:
    Waker();
    ~Waker();
    Waker(const Waker &) = delete;
    Waker &operator=(const Waker &) = delete;

    void wake() noexcept;

    /// Readable after wake(); -1, which poll ignores, if the system gave no descriptor.
    [[nodiscard]] int descriptor() const { return m_descriptor; }

private:
    int m_descriptor;
};

} // namespace visa
