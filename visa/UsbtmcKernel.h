// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <cstddef>
#include <string>

#include <sys/types.h>

namespace visa {

/// The calls to the kernel's usbtmc driver, as one object, so that a test can stand in for the
/// hardware. All return what the system calls of the same name return, and set errno.
class UsbtmcKernel
{
public:
    UsbtmcKernel() = default;
    virtual ~UsbtmcKernel() = default;
    UsbtmcKernel(const UsbtmcKernel &) = delete;
    UsbtmcKernel &operator=(const UsbtmcKernel &) = delete;

    [[nodiscard]] virtual int open(const std::string &path);
    virtual void close(int descriptor);
    [[nodiscard]] virtual ssize_t read(int descriptor, void *buffer, std::size_t size);
    [[nodiscard]] virtual ssize_t write(int descriptor, const void *data, std::size_t size);
    /// `argument` is null for a request without one.
    [[nodiscard]] virtual int ioctl(int descriptor, unsigned long request, void *argument);
};

} // namespace visa
