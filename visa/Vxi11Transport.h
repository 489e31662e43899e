// SPDX-License-Identifier: Apache-2.0
#pragma once

#include "RpcConnection.h"
#include "Transport.h"
#include "Waker.h"

#include <memory>
#include <string>
#include <vector>

namespace visa {

/// Where a VXI-11 device is found.
struct Vxi11Address
{
    std::string host;
    ViUInt16 port = 0;  ///< of the core channel; 0 asks the host's port mapper
    std::string device; ///< "inst0"; behind a gateway "gpib0,28"
    ViUInt16 interfaceType = VI_INTF_TCPIP;
};

/// An instrument on the network, or on GPIB behind a gateway, over the VXI-11 TCP/IP Instrument
/// Protocol: one link on a core channel of its own. The abort channel is used when a call gets no
/// answer in time, so that the instrument gives the call up as well.
class Vxi11Transport : public Transport
{
public:
    /// Connects and creates the link. VI_ERROR_RSRC_NFOUND if the host, its VXI-11 service or the
    /// device is not there.
    [[nodiscard]] static ViStatus open(const Vxi11Address &address, const Deadline &deadline,
                                       std::unique_ptr<Transport> &transport);
    ~Vxi11Transport() override;

    [[nodiscard]] ViUInt16 interfaceType() const override { return m_address.interfaceType; }
    [[nodiscard]] ViStatus write(std::span<const std::uint8_t> data, bool end,
                                 const Deadline &deadline, std::size_t &count) override;
    [[nodiscard]] ViStatus read(std::span<std::uint8_t> buffer, const ReadOptions &options,
                                const Deadline &deadline, std::size_t &count) override;
    [[nodiscard]] ViStatus clear(const Deadline &deadline) override;
    [[nodiscard]] ViStatus controlRemote(ViUInt16 mode, const Deadline &deadline) override;
    void interrupt() noexcept override { m_waker.wake(); }

private:
    explicit Vxi11Transport(const Vxi11Address &address);

    [[nodiscard]] ViStatus connect(const Deadline &deadline);
    [[nodiscard]] ViStatus createLink(const Deadline &deadline);
    [[nodiscard]] ViStatus callGeneric(std::uint32_t procedure, const Deadline &deadline);
    template <typename Arguments, typename Results>
    [[nodiscard]] ViStatus
    callDevice(std::uint32_t procedure, protocols::XdrCode<Arguments> *encode,
               const Arguments &arguments, std::size_t dataSize,
               protocols::XdrValue<Results> &results, const Deadline &deadline);
    bool abortRunningCall();

    /// What was read ahead of the controller's own reads.
    struct Ahead
    {
        std::vector<std::uint8_t> bytes;
        std::size_t taken = 0; ///< bytes that the controller has
        bool hasEnd = false;   ///< the message ends behind the bytes

        [[nodiscard]] std::size_t left() const { return bytes.size() - taken; }
        void drop();
    };

    [[nodiscard]] ViStatus readDevice(std::span<std::uint8_t> buffer, const ReadOptions &options,
                                      const Deadline &deadline, std::size_t &count);
    [[nodiscard]] ViStatus readReply(std::span<std::uint8_t> target, const ReadOptions &options,
                                     const Deadline &deadline, std::size_t &count);
    [[nodiscard]] ViStatus readAhead(const Deadline &deadline);
    [[nodiscard]] ViStatus takeAhead(std::span<std::uint8_t> buffer, const ReadOptions &options,
                                     std::size_t &count);

    Vxi11Address m_address;
    Waker m_waker;
    std::vector<HostAddress> m_hostAddresses;
    RpcConnection m_core;
    bool m_hasLink = false;
    bool m_isSilent = false; // the last call got no answer in time
    bool m_isGone = false;   // nor did the abort of it: only a new session may try again
    int m_link = 0;
    std::uint16_t m_abortPort = 0;  // 0: the instrument offers no abort channel
    std::size_t m_largestWrite = 0; // bytes that one device_write may carry
    std::size_t m_lastPart = 0;     // bytes of the last read if it left some of its message
    Ahead m_ahead;
};

} // namespace visa
