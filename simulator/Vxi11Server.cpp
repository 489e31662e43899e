// SPDX-License-Identifier: Apache-2.0
#include "Vxi11Server.h"

#include "Instrument.h"
#include "Link.h"
#include "Vxi11Session.h"
#include "rpcserver.h"

#include <vxi11.h>

#include <algorithm>
#include <array>

namespace simulator {
namespace {

using protocols::XdrReader;
using protocols::XdrWriter;

// Arguments beside the data of a call are short.
constexpr std::size_t MaxCallOverhead = 4096;

} // namespace

bool Vxi11Server::open(const std::string &address, std::uint16_t corePort, std::string &error)
{
    return m_core.open(address, corePort, error) && m_abort.open(address, 0, error);
}

void Vxi11Server::addDevice(const std::string &name, Instrument &instrument)
{
    m_devices[name] = &instrument;
}

void Vxi11Server::start(const std::string &label)
{
    m_label = label;
    m_core.start([this](int fd) {
        Vxi11Session session(*this, fd);
        const std::array programs{RpcProgram{
            DEVICE_CORE, DEVICE_CORE_VERSION,
            [&session](std::uint32_t procedure, XdrReader &arguments, XdrWriter &results) {
                return session.call(procedure, arguments, results);
            }}};
        serveRpcStream(fd, MaxReceiveSize + MaxCallOverhead, programs,
                       [&session] { return session.isDropped(); });
    });
    m_abort.start([this](int fd) { serveAbort(fd); });
}

void Vxi11Server::stop()
{
    m_core.stop();
    m_abort.stop();
}

Instrument *Vxi11Server::findDevice(std::string_view name) const
{
    std::string key(name);
    std::transform(key.begin(), key.end(), key.begin(), [](char byte) {
        return byte >= 'A' && byte <= 'Z' ? static_cast<char>(byte - 'A' + 'a') : byte;
    });
    const auto found = m_devices.find(key);
    return found == m_devices.end() ? nullptr : found->second;
}

std::uint32_t Vxi11Server::registerLink(const std::shared_ptr<Link> &link, Instrument &instrument)
{
    const std::lock_guard lock(m_mutex);
    if (m_links.size() >= MaxLinks) {
        return 0;
    }
    // Link numbers are signed on the wire.
    do {
        m_lastLink = (m_lastLink + 1) & 0x7FFFFFFFU;
    } while (m_lastLink == 0 || m_links.contains(m_lastLink));
    m_links[m_lastLink] = {link, &instrument};
    return m_lastLink;
}

void Vxi11Server::unregisterLink(std::uint32_t id)
{
    const std::lock_guard lock(m_mutex);
    m_links.erase(id);
}

void Vxi11Server::serveAbort(int fd)
{
    const std::array programs{
        RpcProgram{DEVICE_ASYNC, DEVICE_ASYNC_VERSION,
                   [this](std::uint32_t procedure, XdrReader &arguments, XdrWriter &results) {
                       if (procedure != device_abort) {
                           return RpcStatus::ProcedureUnavailable;
                       }
                       const auto id = static_cast<std::uint32_t>(arguments.value(xdr_Device_Link));
                       if (!arguments.isGood()) {
                           return RpcStatus::GarbageArguments;
                       }
                       Entry entry;
                       {
                           const std::lock_guard lock(m_mutex);
                           const auto found = m_links.find(id);
                           if (found != m_links.end()) {
                               entry = found->second;
                           }
                       }
                       if (entry.link) {
                           // With the mutex held the waiting thread cannot be between its look and
                           // its sleep.
                           const std::lock_guard lock(entry.instrument->mutex());
                           entry.link->abort();
                           entry.instrument->notify();
                       }
                       results.value(xdr_Device_Error,
                                     {entry.link ? DEVICE_ERROR_NONE : DEVICE_ERROR_INVALID_LINK});
                       return RpcStatus::Success;
                   }}};
    serveRpcStream(fd, MaxCallOverhead, programs, [] { return false; });
}

} // namespace simulator
