// SPDX-License-Identifier: Apache-2.0
#pragma once

#include "Transport.h"
#include "UsbtmcKernel.h"

#include <memory>
#include <string>

namespace visa {

/// An instrument on USB (USB Test and Measurement Class) over the kernel's usbtmc driver. A read or
/// write that the kernel has begun cannot be interrupted; it ends by its time-out, which the driver
/// does not take below 100 ms.
class UsbtmcTransport : public Transport
{
public:
    /// `devicePath` as of UsbtmcDevice. VI_ERROR_NPERMISSION, VI_ERROR_RSRC_BUSY or
    /// VI_ERROR_RSRC_NFOUND if it can't be opened.
    [[nodiscard]] static ViStatus open(const std::string &devicePath,
                                       std::unique_ptr<UsbtmcKernel> kernel,
                                       std::unique_ptr<Transport> &transport);
    ~UsbtmcTransport() override;

    [[nodiscard]] ViUInt16 interfaceType() const override { return VI_INTF_USB; }
    [[nodiscard]] ViStatus write(std::span<const std::uint8_t> data, bool end,
                                 const Deadline &deadline, std::size_t &count) override;
    [[nodiscard]] ViStatus read(std::span<std::uint8_t> buffer, const ReadOptions &options,
                                const Deadline &deadline, std::size_t &count) override;
    [[nodiscard]] ViStatus clear(const Deadline &deadline) override;
    [[nodiscard]] ViStatus controlRemote(ViUInt16 mode, const Deadline &deadline) override;

private:
    UsbtmcTransport(int descriptor, std::unique_ptr<UsbtmcKernel> kernel);

    [[nodiscard]] ViStatus control(unsigned long request, void *argument = nullptr);
    [[nodiscard]] ViStatus controlRemoteEnable(bool isEnabled);
    [[nodiscard]] ViStatus setTimeout(const Deadline &deadline);
    [[nodiscard]] ViStatus setTerminator(std::optional<std::uint8_t> terminator);

    int m_descriptor;
    std::unique_ptr<UsbtmcKernel> m_kernel;
    std::optional<std::uint8_t> m_terminator; // as the driver has it
};

} // namespace visa
