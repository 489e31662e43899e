// SPDX-License-Identifier: Apache-2.0
#pragma once

#include "HislipChannel.h"
#include "Transport.h"
#include "Waker.h"

#include <memory>
#include <string>
#include <vector>

namespace visa {

/// Where a HiSLIP device is found.
struct HislipAddress
{
    std::string host;
    ViUInt16 port = 0;      ///< 0 for the one that the protocol names
    std::string subAddress; ///< "hislip0"
};

/// An instrument on the network over HiSLIP (IVI-6.1), in synchronized mode: an answer carries the
/// number of the message that asked for it, so one that comes too late is never taken for the
/// answer of a later query.
class HislipTransport : public Transport
{
public:
    /// VI_ERROR_RSRC_NFOUND if the host, its service or the device is not there;
    /// VI_ERROR_NSUP_OPER if it insists on overlapped mode.
    [[nodiscard]] static ViStatus open(const HislipAddress &address, const Deadline &deadline,
                                       std::unique_ptr<Transport> &transport);

    [[nodiscard]] ViUInt16 interfaceType() const override { return VI_INTF_TCPIP; }
    [[nodiscard]] ViStatus write(std::span<const std::uint8_t> data, bool end,
                                 const Deadline &deadline, std::size_t &count) override;
    [[nodiscard]] ViStatus read(std::span<std::uint8_t> buffer, const ReadOptions &options,
                                const Deadline &deadline, std::size_t &count) override;
    [[nodiscard]] ViStatus clear(const Deadline &deadline) override;
    [[nodiscard]] ViStatus controlRemote(ViUInt16 mode, const Deadline &deadline) override;
    void interrupt() noexcept override { m_waker.wake(); }

private:
    using Header = protocols::hislip::Header;

    HislipTransport(HislipAddress address, std::vector<HostAddress> hostAddresses);

    [[nodiscard]] ViStatus connect(const Deadline &deadline);
    [[nodiscard]] ViStatus openChannels(const Deadline &deadline, bool &prefersOverlap);
    [[nodiscard]] ViStatus agreeOnSize(const Deadline &deadline);
    [[nodiscard]] ViStatus clearDevice(const Deadline &deadline, bool &overlaps);
    [[nodiscard]] ViStatus awaitAnswer(HislipChannel &channel, std::uint8_t type, Header &header,
                                       const Deadline &deadline);
    [[nodiscard]] ViStatus nextData(const Deadline &deadline);
    [[nodiscard]] ViStatus takeData(std::span<std::uint8_t> buffer, const ReadOptions &options,
                                    const Deadline &deadline, std::size_t &count,
                                    bool &isTerminated);
    void startMessages();

    HislipAddress m_address;
    Waker m_waker;
    std::vector<HostAddress> m_hostAddresses;
    HislipChannel m_sync;
    HislipChannel m_async;
    std::size_t m_largestWrite = 0; // payload bytes that the instrument takes in one message
    std::uint32_t m_nextId = 0;     // of the messages to the instrument
    std::uint32_t m_lastId = 0;
    bool m_hasDelivered = false; // an answer was read whole since the last message was sent
    bool m_isInData = false;     // a message with data is being taken
    bool m_isLastData = false;   // it ends the answer
};

} // namespace visa
