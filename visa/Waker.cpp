// SPDX-License-Identifier: Apache-2.0
#include "Waker.h"

#include <sys/eventfd.h>
#include <unistd.h>

namespace visa {

Waker::Waker()
    : m_descriptor(eventfd(0, EFD_CLOEXEC | EFD_NONBLOCK))
{
}

Waker::~Waker()
{
    if (m_descriptor >= 0) {
        ::close(m_descriptor);
    }
}

void Waker::wake() noexcept
{
    if (m_descriptor >= 0) {
        eventfd_write(m_descriptor, 1);
    }
}

} // namespace visa
