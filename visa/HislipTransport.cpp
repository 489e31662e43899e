// SPDX-License-Identifier: Apache-2.0
#include "HislipTransport.h"

#include <algorithm>
#include <array>

namespace visa {

namespace {

namespace hislip = protocols::hislip;

constexpr std::uint64_t LargestMessage = 1U << 20U; // in either direction
constexpr std::size_t SmallestMessage = 256;        // less than that is no instrument's limit
constexpr std::uint32_t VendorId = ('C' << 8U) | 'V';
constexpr std::uint32_t IdStep = 2;

// Messages without a byte of use, after which the peer counts as broken.
constexpr int MostIdleMessages = 1000;

} // namespace

HislipTransport::HislipTransport(HislipAddress address, std::vector<HostAddress> hostAddresses)
    : m_address(std::move(address))
    , m_hostAddresses(std::move(hostAddresses))
    , m_sync(m_waker)
    , m_async(m_waker)
{
}

ViStatus HislipTransport::open(const HislipAddress &address, const Deadline &deadline,
                               std::unique_ptr<Transport> &transport)
{
    std::vector<HostAddress> hosts;
    if (const ViStatus status = lookUpHost(address.host, deadline, hosts); status != VI_SUCCESS) {
        return status;
    }
    std::unique_ptr<HislipTransport> opened(new HislipTransport(address, std::move(hosts)));
    if (const ViStatus status = opened->connect(deadline); status != VI_SUCCESS) {
        return status;
    }
    transport = std::move(opened);
    return VI_SUCCESS;
}

ViStatus HislipTransport::connect(const Deadline &deadline)
{
    bool prefersOverlap = false;
    if (const ViStatus status = openChannels(deadline, prefersOverlap); status != VI_SUCCESS) {
        return status;
    }
    if (const ViStatus status = agreeOnSize(deadline); status != VI_SUCCESS) {
        return status;
    }
    startMessages();
    if (!prefersOverlap) {
        return VI_SUCCESS;
    }
    // The mode is negotiated anew with each device clear.
    const ViStatus status = clearDevice(deadline, prefersOverlap);
    return status == VI_SUCCESS && prefersOverlap ? VI_ERROR_NSUP_OPER : status;
}

ViStatus HislipTransport::openChannels(const Deadline &deadline, bool &prefersOverlap)
{
    const ViUInt16 port = m_address.port == 0 ? hislip::Port : m_address.port;
    if (const ViStatus status = m_sync.connect(m_hostAddresses, port, deadline);
        status != VI_SUCCESS) {
        return status;
    }
    const std::span name(reinterpret_cast<const std::uint8_t *>(m_address.subAddress.data()),
                         m_address.subAddress.size());
    constexpr std::uint32_t Parameter = (std::uint32_t{hislip::Version} << 16U) | VendorId;
    ViStatus status = m_sync.send({hislip::Initialize, 0, Parameter, 0}, name, deadline);
    Header answer;
    if (status == VI_SUCCESS) {
        status = awaitAnswer(m_sync, hislip::InitializeResponse, answer, deadline);
    }
    if (status != VI_SUCCESS) {
        // Who hangs up now has no such device.
        return status == VI_ERROR_CONN_LOST ? VI_ERROR_RSRC_NFOUND : status;
    }
    prefersOverlap = (answer.control & 1U) != 0;
    const std::uint32_t session = answer.parameter & 0xFFFFU;
    status = m_async.connect(m_hostAddresses, port, deadline);
    if (status == VI_SUCCESS) {
        status = m_async.send({hislip::AsyncInitialize, 0, session, 0}, {}, deadline);
    }
    return status == VI_SUCCESS
               ? awaitAnswer(m_async, hislip::AsyncInitializeResponse, answer, deadline)
               : status;
}

ViStatus HislipTransport::agreeOnSize(const Deadline &deadline)
{
    std::array<std::uint8_t, sizeof(std::uint64_t)> size{};
    hislip::put(LargestMessage, size.data());
    if (const ViStatus status =
            m_async.send({hislip::AsyncMaximumMessageSize, 0, 0, 0}, size, deadline);
        status != VI_SUCCESS) {
        return status;
    }
    Header answer;
    if (const ViStatus status =
            awaitAnswer(m_async, hislip::AsyncMaximumMessageSizeResponse, answer, deadline);
        status != VI_SUCCESS) {
        return status;
    }
    if (answer.length != size.size()) {
        return VI_ERROR_IO;
    }
    for (std::size_t done = 0; done < size.size();) {
        std::size_t count = 0;
        if (const ViStatus status =
                m_async.takeInto(std::span(size).subspan(done), deadline, count);
            status != VI_SUCCESS) {
            return status;
        }
        done += count;
    }
    const std::uint64_t largest = hislip::get<std::uint64_t>(size.data());
    m_largestWrite =
        std::max(static_cast<std::size_t>(std::min(largest, LargestMessage)), SmallestMessage);
    return VI_SUCCESS;
}

void HislipTransport::startMessages()
{
    m_nextId = hislip::FirstMessageId;
    m_lastId = hislip::FirstMessageId - IdStep;
    m_hasDelivered = false;
    m_isInData = false;
}

/// The next message of one type; what was under way before it is passed over.
ViStatus HislipTransport::awaitAnswer(HislipChannel &channel, std::uint8_t type, Header &header,
                                      const Deadline &deadline)
{
    for (;;) {
        if (const ViStatus status = channel.receive(header, deadline); status != VI_SUCCESS) {
            return status;
        }
        if (header.type == type) {
            return VI_SUCCESS;
        }
        if (header.type == hislip::FatalError) {
            channel.close();
            return VI_ERROR_CONN_LOST;
        }
        if (header.type == hislip::Error && &channel == &m_async) {
            return VI_ERROR_NSUP_OPER;
        }
        if (deadline.isOver()) {
            return VI_ERROR_TMO;
        }
    }
}

ViStatus HislipTransport::write(std::span<const std::uint8_t> data, bool end,
                                const Deadline &deadline, std::size_t &count)
{
    count = 0;
    m_isInData = false; // what wasn't read of an answer is of no interest any more
    do {
        const auto part = data.subspan(count, std::min(data.size() - count, m_largestWrite));
        const bool isLast = count + part.size() == data.size();
        const std::uint8_t type = end && isLast ? hislip::DataEnd : hislip::Data;
        const auto control = static_cast<std::uint8_t>(m_hasDelivered ? 1 : 0);
        if (const ViStatus status = m_sync.send({type, control, m_nextId, 0}, part, deadline);
            status != VI_SUCCESS) {
            return status;
        }
        m_hasDelivered = false;
        m_lastId = m_nextId;
        m_nextId += IdStep;
        count += part.size();
    } while (count < data.size());
    return VI_SUCCESS;
}

/// Goes to the next message that carries data of the answer to the last query.
ViStatus HislipTransport::nextData(const Deadline &deadline)
{
    for (int idle = 0; idle < MostIdleMessages; ++idle) {
        Header header;
        if (const ViStatus status = m_sync.receive(header, deadline); status != VI_SUCCESS) {
            return status;
        }
        if (header.type == hislip::FatalError) {
            m_sync.close();
            return VI_ERROR_CONN_LOST;
        }
        const bool isData = header.type == hislip::Data || header.type == hislip::DataEnd;
        // An answer to an earlier message came too late, and interruptions are told of those.
        if (isData &&
            (header.parameter == m_lastId || header.parameter == hislip::UnknownMessageId)) {
            m_isInData = true;
            m_isLastData = header.type == hislip::DataEnd;
            return VI_SUCCESS;
        }
        if (header.type == hislip::Error) {
            return VI_ERROR_IO;
        }
        if (deadline.isOver()) {
            return VI_ERROR_TMO;
        }
    }
    return VI_ERROR_IO;
}

ViStatus HislipTransport::takeData(std::span<std::uint8_t> buffer, const ReadOptions &options,
                                   const Deadline &deadline, std::size_t &count, bool &isTerminated)
{
    if (!options.terminator) {
        return m_sync.takeInto(buffer, deadline, count);
    }
    std::span<const std::uint8_t> bytes;
    if (const ViStatus status = m_sync.peek(bytes, deadline); status != VI_SUCCESS) {
        return status;
    }
    bytes = bytes.first(std::min(bytes.size(), buffer.size()));
    const auto found = std::find(bytes.begin(), bytes.end(), *options.terminator);
    isTerminated = found != bytes.end();
    count = static_cast<std::size_t>(found - bytes.begin()) + (isTerminated ? 1 : 0);
    std::copy_n(bytes.begin(), count, buffer.begin());
    m_sync.take(count);
    return VI_SUCCESS;
}

ViStatus HislipTransport::read(std::span<std::uint8_t> buffer, const ReadOptions &options,
                               const Deadline &deadline, std::size_t &count)
{
    count = 0;
    if (!m_sync.isUsable()) {
        return VI_ERROR_CONN_LOST;
    }
    for (int idle = 0; idle < MostIdleMessages; ++idle) {
        if (!m_isInData) {
            if (const ViStatus status = nextData(deadline); status != VI_SUCCESS) {
                return status;
            }
        }
        bool isTerminated = false;
        while (m_sync.payloadLeft() > 0 && count < buffer.size() && !isTerminated) {
            std::size_t taken = 0;
            if (const ViStatus status =
                    takeData(buffer.subspan(count), options, deadline, taken, isTerminated);
                status != VI_SUCCESS) {
                return status;
            }
            count += taken;
            idle = 0;
            if (deadline.isOver() && count < buffer.size() && !isTerminated) {
                return VI_ERROR_TMO;
            }
        }
        if (m_sync.payloadLeft() == 0) {
            m_isInData = false;
            m_hasDelivered = m_isLastData;
            if (m_isLastData && options.stopsAtEnd) {
                return VI_SUCCESS;
            }
        }
        if (isTerminated) {
            return VI_SUCCESS_TERM_CHAR;
        }
        if (count == buffer.size()) {
            return VI_SUCCESS_MAX_CNT;
        }
    }
    return VI_ERROR_IO;
}

ViStatus HislipTransport::clearDevice(const Deadline &deadline, bool &overlaps)
{
    Header answer;
    ViStatus status = m_async.send({hislip::AsyncDeviceClear, 0, 0, 0}, {}, deadline);
    if (status == VI_SUCCESS) {
        status = awaitAnswer(m_async, hislip::AsyncDeviceClearAcknowledge, answer, deadline);
    }
    if (status == VI_SUCCESS) {
        status = m_sync.send({hislip::DeviceClearComplete, 0, 0, 0}, {}, deadline);
    }
    if (status == VI_SUCCESS) {
        status = awaitAnswer(m_sync, hislip::DeviceClearAcknowledge, answer, deadline);
    }
    overlaps = (answer.control & 1U) != 0;
    startMessages();
    return status;
}

ViStatus HislipTransport::clear(const Deadline &deadline)
{
    if (!m_sync.isUsable() || !m_async.isUsable()) {
        // A message that was cut off can't be taken back; a new session begins with none.
        m_sync.close();
        m_async.close();
        const ViStatus status = connect(deadline);
        return status == VI_ERROR_RSRC_NFOUND ? VI_ERROR_CONN_LOST : status;
    }
    bool overlaps = false;
    return clearDevice(deadline, overlaps);
}

ViStatus HislipTransport::controlRemote(ViUInt16 mode, const Deadline &deadline)
{
    // The protocol numbers the requests as VISA does.
    Header answer;
    const ViStatus status = m_async.send(
        {hislip::AsyncRemoteLocalControl, static_cast<std::uint8_t>(mode), m_lastId, 0}, {},
        deadline);
    return status == VI_SUCCESS
               ? awaitAnswer(m_async, hislip::AsyncRemoteLocalResponse, answer, deadline)
               : status;
}

} // namespace visa
