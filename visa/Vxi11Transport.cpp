// SPDX-License-Identifier: Apache-2.0
#include "Vxi11Transport.h"

#include "ReadReply.h"
#include "portmapper.h"

#include <unistd.h>
#include <vxi11.h>

#include <algorithm>

namespace visa {

namespace {

// Both fit the largest record that RpcConnection takes.
constexpr std::size_t LargestRead = 1U << 20U;
constexpr std::size_t LargestWrite = 1U << 20U;

// The instrument watches the same time-out as this side; its word that it ran out needs a moment
// for the way back.
constexpr ViUInt32 ReplyGraceMs = 250;
constexpr ViUInt32 AbortMs = 100;
constexpr ViUInt32 DestroyLinkMs = 1000;

// Replies without error and without a byte moved, after which the peer counts as broken.
constexpr int MostIdleReplies = 16;
/// What is read ahead at once, and the smallest pieces for which it is.
constexpr std::size_t AheadBytes = 32U * 1024U;
constexpr std::size_t SmallestSeries = 1024;

ViStatus statusOf(Device_ErrorCode error)
{
    switch (error) {
    case DEVICE_ERROR_NONE:
        return VI_SUCCESS;
    case DEVICE_ERROR_NOT_ACCESSIBLE:
    case DEVICE_ERROR_INVALID_ADDRESS:
        return VI_ERROR_RSRC_NFOUND;
    case DEVICE_ERROR_INVALID_LINK:
        return VI_ERROR_CONN_LOST;
    case DEVICE_ERROR_SYNTAX:
    case DEVICE_ERROR_PARAMETER:
        return VI_ERROR_INV_PARAMETER;
    case DEVICE_ERROR_NOT_SUPPORTED:
        return VI_ERROR_NSUP_OPER;
    case DEVICE_ERROR_OUT_OF_RESOURCES:
        return VI_ERROR_ALLOC;
    case DEVICE_ERROR_LOCKED_BY_OTHER:
        return VI_ERROR_RSRC_LOCKED;
    case DEVICE_ERROR_TIMEOUT:
        return VI_ERROR_TMO;
    case DEVICE_ERROR_ABORT:
        return VI_ERROR_ABORT;
    default:
        return VI_ERROR_IO;
    }
}

constexpr RpcProcedure coreProcedure(std::uint32_t number)
{
    return {DEVICE_CORE, DEVICE_CORE_VERSION, number};
}

} // namespace

Vxi11Transport::Vxi11Transport(const Vxi11Address &address)
    : m_address(address)
    , m_core(m_waker)
{
}

Vxi11Transport::~Vxi11Transport()
{
    if (!m_hasLink || !m_core.isOpen()) {
        return;
    }
    // Waits for the answer, so that who opens the instrument again at once finds it free. An
    // interrupted session does not wait; the end of the connection frees the link then.
    const Deadline deadline = Deadline::after(m_isSilent ? AbortMs : DestroyLinkMs);
    protocols::XdrValue<Device_Error> reply(xdr_Device_Error);
    (void)m_core.call<Device_Link, Device_Error>(coreProcedure(destroy_link), xdr_Device_Link,
                                                 m_link, 0, reply, deadline);
}

ViStatus Vxi11Transport::open(const Vxi11Address &address, const Deadline &deadline,
                              std::unique_ptr<Transport> &transport)
{
    std::unique_ptr<Vxi11Transport> opened(new Vxi11Transport(address));
    if (const ViStatus status = opened->connect(deadline); status != VI_SUCCESS) {
        return status;
    }
    if (const ViStatus status = opened->createLink(deadline); status != VI_SUCCESS) {
        return status;
    }
    transport = std::move(opened);
    return VI_SUCCESS;
}

ViStatus Vxi11Transport::connect(const Deadline &deadline)
{
    if (const ViStatus status = lookUpHost(m_address.host, deadline, m_hostAddresses);
        status != VI_SUCCESS) {
        return status;
    }
    std::uint16_t port = m_address.port;
    if (port == 0) {
        const ViStatus status =
            findRpcPort(m_hostAddresses, DEVICE_CORE, DEVICE_CORE_VERSION, m_waker, deadline, port);
        if (status != VI_SUCCESS) {
            return status;
        }
    }
    return m_core.connect(m_hostAddresses, port, deadline);
}

ViStatus Vxi11Transport::createLink(const Deadline &deadline)
{
    Create_LinkParms arguments{};
    arguments.clientId = static_cast<int>(getpid());
    arguments.device = m_address.device.data();
    protocols::XdrValue<Create_LinkResp> reply(xdr_Create_LinkResp);
    const ViStatus status = m_core.call<Create_LinkParms, Create_LinkResp>(
        coreProcedure(create_link), xdr_Create_LinkParms, arguments, m_address.device.size() + 4,
        reply, deadline);
    if (status != VI_SUCCESS) {
        return status;
    }
    if (reply->error != DEVICE_ERROR_NONE) {
        const ViStatus refusal = statusOf(reply->error);
        return refusal == VI_ERROR_INV_PARAMETER ? VI_ERROR_RSRC_NFOUND : refusal;
    }
    m_hasLink = true;
    m_link = reply->lid;
    m_abortPort = reply->abortPort;
    // Devices have to take 1024 bytes at least (VXI-11 rule B.6.3); one that names none gets them.
    m_largestWrite =
        reply->maxRecvSize == 0 ? 1024 : std::min<std::size_t>(reply->maxRecvSize, LargestWrite);
    return VI_SUCCESS;
}

template <typename Arguments, typename Results>
ViStatus Vxi11Transport::callDevice(std::uint32_t procedure, protocols::XdrCode<Arguments> *encode,
                                    const Arguments &arguments, std::size_t dataSize,
                                    protocols::XdrValue<Results> &results, const Deadline &deadline)
{
    // A peer that answers on neither channel costs its time-out once, not with each call.
    if (m_isGone) {
        return VI_ERROR_TMO;
    }
    const ViStatus status =
        m_core.call<Arguments, Results>(coreProcedure(procedure), encode, arguments, dataSize,
                                        results, deadline.extendedBy(ReplyGraceMs));
    m_isSilent = status == VI_ERROR_TMO;
    if (status == VI_ERROR_TMO || status == VI_ERROR_ABORT) {
        m_isGone = !abortRunningCall() && m_isSilent;
    }
    if (status != VI_SUCCESS) {
        return status;
    }
    return statusOf(results->error);
}

ViStatus Vxi11Transport::write(std::span<const std::uint8_t> data, bool end,
                               const Deadline &deadline, std::size_t &count)
{
    count = 0;
    // The instrument drops an answer that a new message interrupts.
    m_ahead.drop();
    m_lastPart = 0;
    int idleReplies = 0;
    while (count < data.size()) {
        const auto part = data.subspan(count, std::min(data.size() - count, m_largestWrite));
        const bool isLast = count + part.size() == data.size();
        Device_WriteParms arguments{};
        arguments.lid = m_link;
        arguments.io_timeout = deadline.remainingMs();
        arguments.flags = end && isLast ? DEVICE_FLAG_END : 0;
        arguments.data.data_len = static_cast<unsigned>(part.size());
        // Encoding only reads, the structure is shared with decoding.
        auto *bytes = const_cast<std::uint8_t *>(part.data());
        arguments.data.data_val = reinterpret_cast<char *>(bytes);
        protocols::XdrValue<Device_WriteResp> reply(xdr_Device_WriteResp);
        const ViStatus status = callDevice<Device_WriteParms, Device_WriteResp>(
            device_write, xdr_Device_WriteParms, arguments, part.size() + 4, reply, deadline);
        if (reply->size > part.size()) {
            return VI_ERROR_IO;
        }
        count += reply->size;
        if (status != VI_SUCCESS) {
            return status;
        }
        idleReplies = reply->size == 0 ? idleReplies + 1 : 0;
        if (idleReplies > MostIdleReplies) {
            return VI_ERROR_IO;
        }
        if (count < data.size() && deadline.isOver()) {
            return VI_ERROR_TMO;
        }
    }
    return VI_SUCCESS;
}

void Vxi11Transport::Ahead::drop()
{
    bytes.clear();
    taken = 0;
    hasEnd = false;
}

/// Each read costs a round trip, so a controller that takes a long message in small pieces of one
/// size gets them out of a large one.
ViStatus Vxi11Transport::read(std::span<std::uint8_t> buffer, const ReadOptions &options,
                              const Deadline &deadline, std::size_t &count)
{
    count = 0;
    const bool isSeries = buffer.size() >= SmallestSeries && buffer.size() == m_lastPart &&
                          buffer.size() < AheadBytes && options.stopsAtEnd && !options.terminator;
    m_lastPart = 0;
    ViStatus status = VI_SUCCESS;
    if (isSeries && m_ahead.left() == 0) {
        status = readAhead(deadline);
    }
    if (m_ahead.left() > 0 || m_ahead.hasEnd) {
        status = takeAhead(buffer, options, count);
        if (status != VI_SUCCESS_MAX_CNT) {
            return status;
        }
        status = VI_SUCCESS;
    }
    if (status == VI_SUCCESS && count < buffer.size()) {
        std::size_t more = 0;
        status = readDevice(buffer.subspan(count), options, deadline, more);
        count += more;
    } else if (status == VI_SUCCESS) {
        status = VI_SUCCESS_MAX_CNT;
    }
    m_lastPart = status == VI_SUCCESS_MAX_CNT ? buffer.size() : 0;
    return status;
}

/// Holds what one reply of the device brings: a slow one isn't waited for.
ViStatus Vxi11Transport::readAhead(const Deadline &deadline)
{
    m_ahead.drop();
    m_ahead.bytes.resize(AheadBytes);
    std::size_t count = 0;
    const ViStatus status = readReply(m_ahead.bytes, {}, deadline, count);
    m_ahead.bytes.resize(count);
    m_ahead.hasEnd = status == VI_SUCCESS;
    return status == VI_SUCCESS_MAX_CNT ? VI_SUCCESS : status;
}

/// VI_SUCCESS_MAX_CNT where the message goes on, whether or not the buffer is full.
ViStatus Vxi11Transport::takeAhead(std::span<std::uint8_t> buffer, const ReadOptions &options,
                                   std::size_t &count)
{
    const auto source = std::span(m_ahead.bytes).subspan(m_ahead.taken);
    count = std::min(source.size(), buffer.size());
    bool isTerminated = false;
    if (options.terminator) {
        const auto part = source.first(count);
        const auto found = std::ranges::find(part, *options.terminator);
        isTerminated = found != part.end();
        count = static_cast<std::size_t>(found - part.begin()) + (isTerminated ? 1 : 0);
    }
    std::ranges::copy(source.first(count), buffer.begin());
    m_ahead.taken += count;
    if (m_ahead.left() == 0 && m_ahead.hasEnd) {
        m_ahead.drop();
        if (options.stopsAtEnd) {
            return VI_SUCCESS;
        }
    }
    return isTerminated ? VI_SUCCESS_TERM_CHAR : VI_SUCCESS_MAX_CNT;
}

ViStatus Vxi11Transport::readDevice(std::span<std::uint8_t> buffer, const ReadOptions &options,
                                    const Deadline &deadline, std::size_t &count)
{
    count = 0;
    int idleReplies = 0;
    for (;;) {
        std::size_t more = 0;
        const ViStatus status =
            readReply(buffer.subspan(count, std::min(buffer.size() - count, LargestRead)), options,
                      deadline, more);
        count += more;
        if (status != VI_SUCCESS_MAX_CNT || count == buffer.size()) {
            return status;
        }
        idleReplies = more == 0 ? idleReplies + 1 : 0;
        if (idleReplies > MostIdleReplies) {
            return VI_ERROR_IO;
        }
        if (deadline.isOver()) {
            return VI_ERROR_TMO;
        }
    }
}

/// One device_read. VI_SUCCESS_MAX_CNT where the message goes on, whatever came.
ViStatus Vxi11Transport::readReply(std::span<std::uint8_t> target, const ReadOptions &options,
                                   const Deadline &deadline, std::size_t &count)
{
    Device_ReadParms arguments{};
    arguments.lid = m_link;
    arguments.requestSize = static_cast<unsigned>(target.size());
    arguments.io_timeout = deadline.remainingMs();
    if (options.terminator) {
        arguments.flags = DEVICE_FLAG_TERMCHRSET;
        arguments.termChar = static_cast<char>(*options.terminator);
    }
    protocols::XdrValue<ReadReply> reply(decodeReadReply, {.target = target});
    const ViStatus status = callDevice<Device_ReadParms, ReadReply>(
        device_read, xdr_Device_ReadParms, arguments, 0, reply, deadline);
    if (reply->size > target.size()) {
        return VI_ERROR_IO;
    }
    count = reply->size;
    if (status != VI_SUCCESS) {
        return status;
    }
    if ((reply->reason & DEVICE_REASON_END) != 0 && options.stopsAtEnd) {
        return VI_SUCCESS;
    }
    if ((reply->reason & DEVICE_REASON_CHR) != 0 && options.terminator) {
        return VI_SUCCESS_TERM_CHAR;
    }
    return VI_SUCCESS_MAX_CNT;
}

ViStatus Vxi11Transport::callGeneric(std::uint32_t procedure, const Deadline &deadline)
{
    Device_GenericParms arguments{};
    arguments.lid = m_link;
    arguments.io_timeout = deadline.remainingMs();
    protocols::XdrValue<Device_Error> reply(xdr_Device_Error);
    return callDevice<Device_GenericParms, Device_Error>(procedure, xdr_Device_GenericParms,
                                                         arguments, 0, reply, deadline);
}

ViStatus Vxi11Transport::clear(const Deadline &deadline)
{
    m_ahead.drop();
    return callGeneric(device_clear, deadline);
}

ViStatus Vxi11Transport::controlRemote(ViUInt16 mode, const Deadline &deadline)
{
    // The protocol knows remote with local lockout, and local; nothing in between.
    switch (mode) {
    case VI_GPIB_REN_DEASSERT:
    case VI_GPIB_REN_DEASSERT_GTL:
    case VI_GPIB_REN_ADDRESS_GTL:
        return callGeneric(device_local, deadline);
    default:
        return callGeneric(device_remote, deadline);
    }
}

/// False if the instrument has an abort channel and doesn't answer there.
bool Vxi11Transport::abortRunningCall()
{
    if (m_abortPort == 0 || !m_core.isOpen()) {
        return true;
    }
    const Deadline deadline = Deadline::after(AbortMs);
    const Waker ownWaker; // the session's may be what ended the call
    RpcConnection connection(ownWaker);
    if (connection.connect(m_hostAddresses, m_abortPort, deadline) != VI_SUCCESS) {
        return false;
    }
    const RpcProcedure abort{DEVICE_ASYNC, DEVICE_ASYNC_VERSION, device_abort};
    protocols::XdrValue<Device_Error> reply(xdr_Device_Error);
    return connection.call<Device_Link, Device_Error>(abort, xdr_Device_Link, m_link, 0, reply,
                                                      deadline) == VI_SUCCESS;
}

} // namespace visa
