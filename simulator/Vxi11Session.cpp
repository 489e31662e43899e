// SPDX-License-Identifier: Apache-2.0
#include "Vxi11Session.h"

#include "Link.h"
#include "sockets.h"

#include <algorithm>
#include <chrono>

namespace simulator {
namespace {

// Procedures of the core channel, VXI-11, B.6.
enum Procedure : std::uint32_t {
    CreateLink = 10,
    DeviceWrite = 11,
    DeviceRead = 12,
    DeviceReadStb = 13,
    DeviceTrigger = 14,
    DeviceClear = 15,
    DeviceRemote = 16,
    DeviceLocal = 17,
    DeviceLock = 18,
    DeviceUnlock = 19,
    DeviceEnableSrq = 20,
    DeviceDoCmd = 22,
    DestroyLink = 23,
    CreateInterruptChannel = 25,
    DestroyInterruptChannel = 26,
};

// Bits of Device_Flags.
constexpr std::uint32_t WaitLock = 1;
constexpr std::uint32_t End = 8;
constexpr std::uint32_t TermCharSet = 128;

// Bits of the reason of device_read.
constexpr std::uint32_t RequestCount = 1;
constexpr std::uint32_t TermCharSeen = 2;
constexpr std::uint32_t EndSeen = 4;

// What one device_read returns at most; the controller asks again for the rest.
constexpr std::uint32_t MaxReadSize = 1'048'576;

void putError(XdrWriter &results, Vxi11Error error)
{
    results.number(static_cast<std::uint32_t>(error));
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
    case CreateLink:
        return createLink(arguments, results);
    case DeviceWrite:
        return write(arguments, results);
    case DeviceRead:
        return read(arguments, results);
    case DeviceReadStb:
    case DeviceTrigger:
    case DeviceClear:
    case DeviceRemote:
    case DeviceLocal:
        return generic(procedure, arguments, results);
    case DeviceLock:
        return lock(arguments, results);
    case DeviceUnlock:
        return unlock(arguments, results);
    case DestroyLink:
        return destroyLink(arguments, results);
    case DeviceEnableSrq:
    case CreateInterruptChannel:
    case DestroyInterruptChannel:
        // No service requests: there is no interrupt channel.
        putError(results, Vxi11Error::NotSupported);
        return RpcStatus::Success;
    case DeviceDoCmd:
        putError(results, Vxi11Error::NotSupported);
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

Vxi11Error Vxi11Session::access(std::unique_lock<std::mutex> &lock, Device &device,
                                std::uint32_t flags, std::uint32_t timeoutMs)
{
    // An abort that came while no call was running has nothing to end.
    (void)device.link->takeAbort();
    const TimePoint deadline = (flags & WaitLock) != 0 ? after(timeoutMs) : TimePoint();
    switch (device.instrument->waitForAccess(lock, *device.link, deadline,
                                             [this] { return isPeerGone(m_fd); })) {
    case Instrument::Wait::Ready:
        return Vxi11Error::None;
    case Instrument::Wait::TimedOut:
        return Vxi11Error::Locked;
    case Instrument::Wait::Aborted:
        return Vxi11Error::Abort;
    case Instrument::Wait::PeerGone:
    case Instrument::Wait::Stopped:
        break;
    }
    m_dropped = true;
    return Vxi11Error::IoError;
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
    const bool lockDevice = arguments.boolean();
    const std::uint32_t lockTimeoutMs = arguments.number();
    const std::string_view name = arguments.text();
    if (!arguments.isGood()) {
        return RpcStatus::GarbageArguments;
    }

    Vxi11Error error = Vxi11Error::None;
    std::uint32_t id = 0;
    if (Instrument *instrument = m_server.findDevice(name)) {
        Device device{std::make_shared<Link>(*instrument, Link::Transport::Vxi11,
                                             m_server.m_label + ' ' + std::string(name)),
                      instrument};
        id = m_server.registerLink(device.link, *instrument);
        if (id == 0) {
            error = Vxi11Error::OutOfResources;
        } else {
            if (lockDevice) {
                std::unique_lock lock(instrument->mutex());
                error = access(lock, device, WaitLock, lockTimeoutMs);
                if (error == Vxi11Error::None) {
                    instrument->setAccess(device.link.get());
                }
            }
            if (error == Vxi11Error::None) {
                m_devices[id] = device;
            } else {
                m_server.unregisterLink(id);
            }
        }
    } else {
        error = Vxi11Error::NotAccessible;
    }
    putError(results, error);
    results.number(error == Vxi11Error::None ? id : 0);
    results.number(m_server.abortPort());
    results.number(Vxi11Server::MaxReceiveSize);
    return RpcStatus::Success;
}

RpcStatus Vxi11Session::write(XdrReader &arguments, XdrWriter &results)
{
    const std::uint32_t id = arguments.number();
    (void)arguments.number(); // input is never held up, so its time-out cannot pass
    const std::uint32_t lockTimeoutMs = arguments.number();
    const std::uint32_t flags = arguments.number();
    const std::span<const char> data = arguments.opaque();
    if (!arguments.isGood()) {
        return RpcStatus::GarbageArguments;
    }

    Vxi11Error error = Vxi11Error::InvalidLink;
    std::size_t taken = 0;
    if (Device *device = find(id)) {
        std::unique_lock lock(device->instrument->mutex());
        error = access(lock, *device, flags, lockTimeoutMs);
        if (error == Vxi11Error::None) {
            const bool end = (flags & End) != 0;
            do {
                taken += device->link->feed(data.subspan(taken), end);
            } while (taken < data.size());
            m_dropped = m_dropped || device->link->isDropDue();
        }
    }
    putError(results, error);
    results.number(static_cast<std::uint32_t>(taken));
    return RpcStatus::Success;
}

RpcStatus Vxi11Session::read(XdrReader &arguments, XdrWriter &results)
{
    const std::uint32_t id = arguments.number();
    const std::uint32_t requested = arguments.number();
    const std::uint32_t ioTimeoutMs = arguments.number();
    const std::uint32_t lockTimeoutMs = arguments.number();
    const std::uint32_t flags = arguments.number();
    const std::uint32_t termChar = arguments.number();
    if (!arguments.isGood()) {
        return RpcStatus::GarbageArguments;
    }

    const std::size_t errorPlace = results.size();
    results.number(0);
    const std::size_t reasonPlace = results.size();
    results.number(0);
    const std::span<char> buffer = results.openOpaque(std::min(requested, MaxReadSize));

    Vxi11Error error = Vxi11Error::InvalidLink;
    std::uint32_t reason = 0;
    std::size_t count = 0;
    if (Device *device = find(id)) {
        std::unique_lock lock(device->instrument->mutex());
        error = access(lock, *device, flags, lockTimeoutMs);
        if (error == Vxi11Error::None) {
            Link &link = *device->link;
            const Instrument::Wait waited = device->instrument->waitForOutput(
                lock, link, after(ioTimeoutMs), [this] { return isPeerGone(m_fd); });
            if (waited == Instrument::Wait::Ready) {
                std::optional<char> last;
                if ((flags & TermCharSet) != 0) {
                    last = static_cast<char>(termChar & 0xFFU);
                }
                const OutputQueue::ReadResult result = link.read(buffer, last);
                count = result.count;
                if (count == requested) {
                    reason |= RequestCount;
                }
                if (result.termChar) {
                    reason |= TermCharSeen;
                }
                if (result.messageEnd) {
                    reason |= EndSeen;
                }
            } else if (waited == Instrument::Wait::TimedOut) {
                link.noteUnterminated();
                error = Vxi11Error::Timeout;
            } else if (waited == Instrument::Wait::Aborted) {
                error = Vxi11Error::Abort;
            } else {
                error = Vxi11Error::IoError;
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
    Generic parameters;
    parameters.link = arguments.number();
    parameters.flags = arguments.number();
    parameters.lockTimeoutMs = arguments.number();
    parameters.ioTimeoutMs = arguments.number();
    if (!arguments.isGood()) {
        return RpcStatus::GarbageArguments;
    }

    Vxi11Error error = Vxi11Error::InvalidLink;
    unsigned statusByte = 0;
    if (Device *device = find(parameters.link)) {
        std::unique_lock lock(device->instrument->mutex());
        error = access(lock, *device, parameters.flags, parameters.lockTimeoutMs);
        if (error == Vxi11Error::None) {
            if (procedure == DeviceReadStb) {
                statusByte = device->instrument->statusByte(*device->link);
            } else if (procedure == DeviceTrigger) {
                device->instrument->trigger();
            } else if (procedure == DeviceClear) {
                device->link->clear();
                device->instrument->clearPendingCompletion();
            }
        }
    }
    putError(results, error);
    if (procedure == DeviceReadStb) {
        results.number(statusByte);
    }
    return RpcStatus::Success;
}

RpcStatus Vxi11Session::lock(XdrReader &arguments, XdrWriter &results)
{
    const std::uint32_t id = arguments.number();
    const std::uint32_t flags = arguments.number();
    const std::uint32_t timeoutMs = arguments.number();
    if (!arguments.isGood()) {
        return RpcStatus::GarbageArguments;
    }

    Vxi11Error error = Vxi11Error::InvalidLink;
    if (Device *device = find(id)) {
        std::unique_lock lock(device->instrument->mutex());
        // A link that has the lock gets no second one.
        error = device->instrument->access() == device->link.get()
                    ? Vxi11Error::Locked
                    : access(lock, *device, flags, timeoutMs);
        if (error == Vxi11Error::None) {
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

    Vxi11Error error = Vxi11Error::InvalidLink;
    if (Device *device = find(id)) {
        const std::lock_guard lock(device->instrument->mutex());
        const bool held = device->instrument->access() == device->link.get();
        if (held) {
            device->instrument->releaseAccess();
        }
        error = held ? Vxi11Error::None : Vxi11Error::NoLock;
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
        putError(results, Vxi11Error::None);
    } else {
        putError(results, Vxi11Error::InvalidLink);
    }
    return RpcStatus::Success;
}

} // namespace simulator
