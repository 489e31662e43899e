// SPDX-License-Identifier: Apache-2.0
#include "UsbtmcTransport.h"

#include <fcntl.h>
#include <linux/usb/tmc.h>
#include <sys/ioctl.h>
#include <unistd.h>

#include <algorithm>
#include <cerrno>

namespace visa {

namespace {

// One request to the device; short enough that the time-out, which holds for each, stays near that
// of the whole call.
constexpr std::size_t LargestTransfer = std::size_t{64} * 1024;

// What the driver takes (drivers/usb/class/usbtmc.c): not below 100 ms. Its upper end is a signed
// number of ms; a day stands for no time-out.
constexpr ViUInt32 ShortestTimeoutMs = 100;
constexpr ViUInt32 LongestTimeoutMs = 86'400'000;

constexpr int MostIdleReads = 16;

// bmTransferAttributes of a DEV_DEP_MSG_IN header (USBTMC 1.0 table 9).
constexpr std::uint8_t AttributeEnd = 0x01;
constexpr std::uint8_t AttributeTerminator = 0x02;

ViStatus statusOf(int error)
{
    switch (error) {
    case ETIMEDOUT:
    case EAGAIN:
        return VI_ERROR_TMO;
    case ENODEV:
    case ENXIO:
    case ESHUTDOWN:
        return VI_ERROR_CONN_LOST;
    case ENOENT:
        return VI_ERROR_RSRC_NFOUND;
    case EACCES:
    case EPERM:
        return VI_ERROR_NPERMISSION;
    case EBUSY:
        return VI_ERROR_RSRC_BUSY;
    case ENOMEM:
    case EMFILE:
    case ENFILE:
        return VI_ERROR_ALLOC;
    case ENOTTY:
    case EINVAL:
    case EOPNOTSUPP:
        return VI_ERROR_NSUP_OPER;
    default:
        return VI_ERROR_IO;
    }
}

} // namespace

int UsbtmcKernel::open(const std::string &path)
{
    return ::open(path.c_str(), O_RDWR | O_CLOEXEC);
}

void UsbtmcKernel::close(int descriptor)
{
    ::close(descriptor);
}

ssize_t UsbtmcKernel::read(int descriptor, void *buffer, std::size_t size)
{
    return ::read(descriptor, buffer, size);
}

ssize_t UsbtmcKernel::write(int descriptor, const void *data, std::size_t size)
{
    return ::write(descriptor, data, size);
}

int UsbtmcKernel::ioctl(int descriptor, unsigned long request, void *argument)
{
    return ::ioctl(descriptor, request, argument);
}

UsbtmcTransport::UsbtmcTransport(int descriptor, std::unique_ptr<UsbtmcKernel> kernel)
    : m_descriptor(descriptor)
    , m_kernel(std::move(kernel))
{
}

UsbtmcTransport::~UsbtmcTransport()
{
    m_kernel->close(m_descriptor);
}

ViStatus UsbtmcTransport::open(const std::string &devicePath, std::unique_ptr<UsbtmcKernel> kernel,
                               std::unique_ptr<Transport> &transport)
{
    const int descriptor = kernel->open(devicePath);
    if (descriptor < 0) {
        return statusOf(errno);
    }
    transport.reset(new UsbtmcTransport(descriptor, std::move(kernel)));
    return VI_SUCCESS;
}

ViStatus UsbtmcTransport::control(unsigned long request, void *argument)
{
    return m_kernel->ioctl(m_descriptor, request, argument) < 0 ? statusOf(errno) : VI_SUCCESS;
}

ViStatus UsbtmcTransport::setTimeout(const Deadline &deadline)
{
    __u32 timeout = std::clamp(deadline.remainingMs(), ShortestTimeoutMs, LongestTimeoutMs);
    return control(USBTMC_IOCTL_SET_TIMEOUT, &timeout);
}

ViStatus UsbtmcTransport::setTerminator(std::optional<std::uint8_t> terminator)
{
    if (terminator == m_terminator) {
        return VI_SUCCESS;
    }
    usbtmc_termchar setting{terminator.value_or('\n'),
                            static_cast<__u8>(terminator.has_value() ? 1 : 0)};
    const ViStatus status = control(USBTMC_IOCTL_CONFIG_TERMCHAR, &setting);
    if (status == VI_SUCCESS) {
        m_terminator = terminator;
    }
    return status;
}

ViStatus UsbtmcTransport::write(std::span<const std::uint8_t> data, bool end,
                                const Deadline &deadline, std::size_t &count)
{
    count = 0;
    int idleWrites = 0;
    while (count < data.size()) {
        const auto part = data.subspan(count, std::min(data.size() - count, LargestTransfer));
        __u8 setsEnd = end && count + part.size() == data.size() ? 1 : 0;
        ViStatus status = control(USBTMC_IOCTL_EOM_ENABLE, &setsEnd);
        if (status == VI_SUCCESS) {
            status = setTimeout(deadline);
        }
        if (status != VI_SUCCESS) {
            return status;
        }
        const ssize_t written = m_kernel->write(m_descriptor, part.data(), part.size());
        if (written < 0) {
            const int error = errno;
            if (error == EINTR && !deadline.isOver()) {
                continue;
            }
            // Leaves the endpoint ready for the next command; the write has failed either way.
            if (error == ETIMEDOUT) {
                (void)control(USBTMC_IOCTL_ABORT_BULK_OUT);
            } else if (error == EPIPE) {
                (void)control(USBTMC_IOCTL_CLEAR_OUT_HALT);
            }
            return error == EINTR ? VI_ERROR_TMO : statusOf(error);
        }
        count += std::min(static_cast<std::size_t>(written), part.size());
        idleWrites = written == 0 ? idleWrites + 1 : 0;
        if (idleWrites > MostIdleReads) {
            return VI_ERROR_IO;
        }
        if (count < data.size() && deadline.isOver()) {
            return VI_ERROR_TMO;
        }
    }
    return VI_SUCCESS;
}

ViStatus UsbtmcTransport::read(std::span<std::uint8_t> buffer, const ReadOptions &options,
                               const Deadline &deadline, std::size_t &count)
{
    count = 0;
    int idleReads = 0;
    if (const ViStatus status = setTerminator(options.terminator); status != VI_SUCCESS) {
        return status;
    }
    for (;;) {
        const auto part = buffer.subspan(count, std::min(buffer.size() - count, LargestTransfer));
        if (const ViStatus status = setTimeout(deadline); status != VI_SUCCESS) {
            return status;
        }
        const ssize_t received = m_kernel->read(m_descriptor, part.data(), part.size());
        if (received < 0) {
            const int error = errno;
            if (error == EINTR && !deadline.isOver()) {
                continue;
            }
            if (error == ETIMEDOUT) {
                (void)control(USBTMC_IOCTL_ABORT_BULK_IN);
            } else if (error == EPIPE) {
                (void)control(USBTMC_IOCTL_CLEAR_IN_HALT);
            }
            return error == EINTR ? VI_ERROR_TMO : statusOf(error);
        }
        const std::size_t size = std::min(static_cast<std::size_t>(received), part.size());
        count += size;
        __u8 attributes = 0;
        // Drivers before Linux 4.20 don't tell; a short answer was the last one there.
        if (control(USBTMC_IOCTL_MSG_IN_ATTR, &attributes) != VI_SUCCESS) {
            attributes = size < part.size() ? AttributeEnd : 0;
        }
        if ((attributes & AttributeEnd) != 0 && options.stopsAtEnd) {
            return VI_SUCCESS;
        }
        if ((attributes & AttributeTerminator) != 0 && options.terminator) {
            return VI_SUCCESS_TERM_CHAR;
        }
        if (count == buffer.size()) {
            return VI_SUCCESS_MAX_CNT;
        }
        idleReads = size == 0 ? idleReads + 1 : 0;
        if (idleReads > MostIdleReads) {
            return VI_ERROR_IO;
        }
        if (deadline.isOver()) {
            return VI_ERROR_TMO;
        }
    }
}

ViStatus UsbtmcTransport::clear(const Deadline &deadline)
{
    if (const ViStatus status = setTimeout(deadline); status != VI_SUCCESS) {
        return status;
    }
    return control(USBTMC_IOCTL_CLEAR);
}

ViStatus UsbtmcTransport::controlRemote(ViUInt16 mode, const Deadline &deadline)
{
    ViStatus status = setTimeout(deadline);
    if (status != VI_SUCCESS) {
        return status;
    }
    switch (mode) {
    case VI_GPIB_REN_DEASSERT:
        return controlRemoteEnable(false);
    case VI_GPIB_REN_ASSERT:
    case VI_GPIB_REN_ASSERT_ADDRESS:
        return controlRemoteEnable(true);
    case VI_GPIB_REN_DEASSERT_GTL:
        status = control(USBTMC488_IOCTL_GOTO_LOCAL);
        return status == VI_SUCCESS ? controlRemoteEnable(false) : status;
    case VI_GPIB_REN_ASSERT_LLO:
        return control(USBTMC488_IOCTL_LOCAL_LOCKOUT);
    case VI_GPIB_REN_ASSERT_ADDRESS_LLO:
        status = controlRemoteEnable(true);
        return status == VI_SUCCESS ? control(USBTMC488_IOCTL_LOCAL_LOCKOUT) : status;
    default:
        return control(USBTMC488_IOCTL_GOTO_LOCAL);
    }
}

ViStatus UsbtmcTransport::controlRemoteEnable(bool isEnabled)
{
    unsigned char value = isEnabled ? 1 : 0;
    return control(USBTMC488_IOCTL_REN_CONTROL, &value);
}

} // namespace visa
