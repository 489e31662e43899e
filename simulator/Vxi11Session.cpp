// SPDX-License-Identifier: Apache-2.0
#include "Vxi11Session.h"

#include "Link.h"
#include "sockets.h"

#include <algorithm>
#include <chrono>

namespace simulator {
namespace {

// What one device_read returns at most; the controller asks again for the rest.
constexpr std::uint32_t MaxReadSize = 1'048'576;

void putError(protocols::XdrWriter &results, Device_ErrorCode error)
{
    results.value(xdr_Device_Error, {error});
}

TimePoint after(std::uint32_t milliseconds)
{
    return Clock::now() + std::chrono::milliseconds(milliseconds);
}

} // namespace

Vxi11Session::~Vxi11Session()
{
    for (const auto &[id, device] : m_devices) {
        release(device, id);
    }
}

RpcStatus Vxi11Session::call(std::uint32_t procedure, XdrReader &arguments, XdrWriter &results)
{
    switch (procedure) {
    case create_link:
        return createLink(arguments, results);
    case device_write:
        return write(arguments, results);
    case device_read:
        return read(arguments, results);
    case device_readstb:
    case device_trigger:
    case device_clear:
    case device_remote:
    case device_local:
        return generic(procedure, arguments, results);
    case device_lock:
        return lock(arguments, results);
    case device_unlock:
        return unlock(arguments, results);
    case destroy_link:
        return destroyLink(arguments, results);
    case device_enable_srq:
    case create_intr_chan:
    case destroy_intr_chan:
        // No service requests: there is no interrupt channel.
        putError(results, DEVICE_ERROR_NOT_SUPPORTED);
        return RpcStatus::Success;
    case device_docmd:
        putError(results, DEVICE_ERROR_NOT_SUPPORTED);
        (void)results.openOpaque(0);
        results.closeOpaque(0);
        return RpcStatus::Success;
    default:
        return RpcStatus::ProcedureUnavailable;
    }
}

Vxi11Session::Device *Vxi11Session::find(std::uint32_t link)
{
    const auto found = m_devices.find(link);
    return found == m_devices.end() ? nullptr : &found->second;
}

Device_ErrorCode Vxi11Session::access(std::unique_lock<std::mutex> &lock, Device &device,
                                      Device_Flags flags, std::uint32_t timeoutMs)
{
    // An abort that came while no call was running has nothing to end.
    (void)device.link->takeAbort();
    const TimePoint deadline = (flags & DEVICE_FLAG_WAITLOCK) != 0 ? after(timeoutMs) : TimePoint();
    switch (device.instrument->waitForAccess(lock, *device.link, deadline,
                                             [this] { return isPeerGone(m_fd); })) {
    case Instrument::Wait::Ready:
        return DEVICE_ERROR_NONE;
    case Instrument::Wait::TimedOut:
        return DEVICE_ERROR_LOCKED_BY_OTHER;
    case Instrument::Wait::Aborted:
        return DEVICE_ERROR_ABORT;
    case Instrument::Wait::PeerGone:
    case Instrument::Wait::Stopped:
        break;
    }
    m_dropped = true;
    return DEVICE_ERROR_IO;
}

void Vxi11Session::release(const Device &device, std::uint32_t id)
{
    m_server.unregisterLink(id);
    const std::lock_guard lock(device.instrument->mutex());
    if (device.instrument->access() == device.link.get()) {
        device.instrument->releaseAccess();
    }
    device.link->clear();
}

RpcStatus Vxi11Session::createLink(XdrReader &arguments, XdrWriter &results)
{
    (void)arguments.number(); // the client's own number
    const bool lockDevice = arguments.number() != 0;
    const std::uint32_t lockTimeoutMs = arguments.number();
    const std::string_view name = arguments.text();
    if (!arguments.isGood()) {
        return RpcStatus::GarbageArguments;
    }

    Device_ErrorCode error = DEVICE_ERROR_NONE;
    std::uint32_t id = 0;
    if (Instrument *instrument = m_server.findDevice(name)) {
        Device device{std::make_shared<Link>(*instrument, Link::Transport::Vxi11,
                                             m_server.m_label + ' ' + std::string(name)),
                      instrument};
        id = m_server.registerLink(device.link, *instrument);
        if (id == 0) {
            error = DEVICE_ERROR_OUT_OF_RESOURCES;
        } else {
            if (lockDevice) {
                std::unique_lock lock(instrument->mutex());
                error = access(lock, device, DEVICE_FLAG_WAITLOCK, lockTimeoutMs);
                if (error == DEVICE_ERROR_NONE) {
                    instrument->setAccess(device.link.get());
                }
            }
            if (error == DEVICE_ERROR_NONE) {
                m_devices[id] = device;
            } else {
                m_server.unregisterLink(id);
            }
        }
    } else {
        error = DEVICE_ERROR_NOT_ACCESSIBLE;
    }
    const bool opened = error == DEVICE_ERROR_NONE;
    results.value(xdr_Create_LinkResp, {error, opened ? static_cast<Device_Link>(id) : 0,
                                        m_server.abortPort(), Vxi11Server::MaxReceiveSize});
    return RpcStatus::Success;
}

RpcStatus Vxi11Session::write(XdrReader &arguments, XdrWriter &results)
{
    const std::uint32_t id = arguments.number();
    (void)arguments.number(); // input is never held up, so its time-out cannot pass
    const std::uint32_t lockTimeoutMs = arguments.number();
    const auto flags = static_cast<Device_Flags>(arguments.number());
    const std::span<const std::uint8_t> bytes = arguments.opaque();
    if (!arguments.isGood()) {
        return RpcStatus::GarbageArguments;
    }

    Device_ErrorCode error = DEVICE_ERROR_INVALID_LINK;
    std::size_t taken = 0;
    if (Device *device = find(id)) {
        std::unique_lock lock(device->instrument->mutex());
        error = access(lock, *device, flags, lockTimeoutMs);
        if (error == DEVICE_ERROR_NONE) {
            const std::span data(reinterpret_cast<const char *>(bytes.data()), bytes.size());
            const bool end = (flags & DEVICE_FLAG_END) != 0;
            do {
                taken += device->link->feed(data.subspan(taken), end);
            } while (taken < data.size());
            m_dropped = m_dropped || device->link->isDropDue();
        }
    }
    results.value(xdr_Device_WriteResp, {error, static_cast<unsigned>(taken)});
    return RpcStatus::Success;
}

RpcStatus Vxi11Session::read(XdrReader &arguments, XdrWriter &results)
{
    const auto call = arguments.value(xdr_Device_ReadParms);
    if (!arguments.isGood()) {
        return RpcStatus::GarbageArguments;
    }

    const std::size_t errorPlace = results.size();
    results.number(0);
    const std::size_t reasonPlace = results.size();
    results.number(0);
    const auto room = results.openOpaque(std::min(call.requestSize, MaxReadSize));
    const std::span buffer(reinterpret_cast<char *>(room.data()), room.size());

    Device_ErrorCode error = DEVICE_ERROR_INVALID_LINK;
    std::uint32_t reason = 0;
    std::size_t count = 0;
    if (Device *device = find(static_cast<std::uint32_t>(call.lid))) {
        std::unique_lock lock(device->instrument->mutex());
        error = access(lock, *device, call.flags, call.lock_timeout);
        if (error == DEVICE_ERROR_NONE) {
            Link &link = *device->link;
            const Instrument::Wait waited = device->instrument->waitForOutput(
                lock, link, after(call.io_timeout), [this] { return isPeerGone(m_fd); });
            if (waited == Instrument::Wait::Ready) {
                std::optional<char> last;
                if ((call.flags & DEVICE_FLAG_TERMCHRSET) != 0) {
                    last = call.termChar;
                }
                const OutputQueue::ReadResult result = link.read(buffer, last);
                count = result.count;
                if (count == call.requestSize) {
                    reason |= DEVICE_REASON_REQCNT;
                }
                if (result.termChar) {
                    reason |= DEVICE_REASON_CHR;
                }
                if (result.messageEnd) {
                    reason |= DEVICE_REASON_END;
                }
            } else if (waited == Instrument::Wait::TimedOut) {
                link.noteUnterminated();
                error = DEVICE_ERROR_TIMEOUT;
            } else if (waited == Instrument::Wait::Aborted) {
                error = DEVICE_ERROR_ABORT;
            } else {
                error = DEVICE_ERROR_IO;
                m_dropped = true;
            }
            m_dropped = m_dropped || link.isDropDue();
        }
    }
    results.patch(errorPlace, static_cast<std::uint32_t>(error));
    results.patch(reasonPlace, reason);
    results.closeOpaque(count);
    return RpcStatus::Success;
}

RpcStatus Vxi11Session::generic(std::uint32_t procedure, XdrReader &arguments, XdrWriter &results)
{
    const auto parameters = arguments.value(xdr_Device_GenericParms);
    if (!arguments.isGood()) {
        return RpcStatus::GarbageArguments;
    }

    Device_ErrorCode error = DEVICE_ERROR_INVALID_LINK;
    unsigned char statusByte = 0;
    if (Device *device = find(static_cast<std::uint32_t>(parameters.lid))) {
        std::unique_lock lock(device->instrument->mutex());
        error = access(lock, *device, parameters.flags, parameters.lock_timeout);
        if (error == DEVICE_ERROR_NONE) {
            if (procedure == device_readstb) {
                statusByte =
                    static_cast<unsigned char>(device->instrument->statusByte(*device->link));
            } else if (procedure == device_trigger) {
                device->instrument->trigger();
            } else if (procedure == device_clear) {
                device->link->clear();
                device->instrument->clearPendingCompletion();
            }
        }
    }
    if (procedure == device_readstb) {
        results.value(xdr_Device_ReadStbResp, {error, statusByte});
    } else {
        putError(results, error);
    }
    return RpcStatus::Success;
}

RpcStatus Vxi11Session::lock(XdrReader &arguments, XdrWriter &results)
{
    const auto call = arguments.value(xdr_Device_LockParms);
    if (!arguments.isGood()) {
        return RpcStatus::GarbageArguments;
    }

    Device_ErrorCode error = DEVICE_ERROR_INVALID_LINK;
    if (Device *device = find(static_cast<std::uint32_t>(call.lid))) {
        std::unique_lock lock(device->instrument->mutex());
        // A link that has the lock gets no second one.
        error = device->instrument->access() == device->link.get()
                    ? DEVICE_ERROR_LOCKED_BY_OTHER
                    : access(lock, *device, call.flags, call.lock_timeout);
        if (error == DEVICE_ERROR_NONE) {
            device->instrument->setAccess(device->link.get());
        }
    }
    putError(results, error);
    return RpcStatus::Success;
}

RpcStatus Vxi11Session::unlock(XdrReader &arguments, XdrWriter &results)
{
    const std::uint32_t id = arguments.number();
    if (!arguments.isGood()) {
        return RpcStatus::GarbageArguments;
    }

    Device_ErrorCode error = DEVICE_ERROR_INVALID_LINK;
    if (Device *device = find(id)) {
        const std::lock_guard lock(device->instrument->mutex());
        const bool held = device->instrument->access() == device->link.get();
        if (held) {
            device->instrument->releaseAccess();
        }
        error = held ? DEVICE_ERROR_NONE : DEVICE_ERROR_NO_LOCK_HELD;
    }
    putError(results, error);
    return RpcStatus::Success;
}

RpcStatus Vxi11Session::destroyLink(XdrReader &arguments, XdrWriter &results)
{
    const std::uint32_t id = arguments.number();
    if (!arguments.isGood()) {
        return RpcStatus::GarbageArguments;
    }
    const auto found = m_devices.find(id);
    if (found != m_devices.end()) {
        release(found->second, id);
        m_devices.erase(found);
        putError(results, DEVICE_ERROR_NONE);
    } else {
        putError(results, DEVICE_ERROR_INVALID_LINK);
    }
    return RpcStatus::Success;
}

} // namespace simulator
