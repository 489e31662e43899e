// SPDX-License-Identifier: Apache-2.0
#include "HislipServer.h"

#include "HislipSession.h"

#include <string_view>
#include <utility>
#include <vector>

namespace simulator {
namespace {

namespace hislip = protocols::hislip;

constexpr std::size_t MaxSessions = 64;
constexpr std::uint64_t LongestName = 256;
constexpr std::uint32_t VendorId = ('C' << 8U) | 'V';

} // namespace

HislipServer::HislipServer() = default;

HislipServer::~HislipServer()
{
    stop();
}

bool HislipServer::open(const std::string &address, std::string &error)
{
    return m_server.open(address, hislip::Port, error);
}

void HislipServer::start(Instrument &instrument, const std::string &label)
{
    m_server.start([this, &instrument, label](int fd) { serve(instrument, label, fd); });
}

/// The first message tells which of a session's two connections this is.
void HislipServer::serve(Instrument &instrument, const std::string &label, int fd)
{
    hislip::Header head;
    if (!receiveHead(fd, head)) {
        return;
    }
    if (head.length > LongestName) {
        sendFatal(fd, hislip::InvalidInitialization, "Invalid initialization sequence");
        return;
    }
    std::vector<char> payload(static_cast<std::size_t>(head.length));
    if (!receiveAll(fd, payload)) {
        return;
    }
    if (head.type == hislip::Initialize) {
        const std::string_view name(payload.data(), payload.size());
        if (!name.empty() && name != SubAddress) {
            sendFatal(fd, hislip::InvalidInitialization, "No such device");
            return;
        }
        if (const std::shared_ptr<HislipSession> session = open(instrument, label, fd)) {
            const std::uint32_t parameter = (std::uint32_t{hislip::Version} << 16U) | session->id();
            if (sendMessage(fd, {hislip::InitializeResponse, 0, parameter, 0})) {
                session->serveMessages();
            }
            const std::lock_guard lock(m_mutex);
            m_sessions.erase(session->id());
        } else {
            sendFatal(fd, hislip::TooManyClients, "Too many sessions");
        }
        return;
    }
    const std::shared_ptr<HislipSession> session =
        head.type == hislip::AsyncInitialize ? find(static_cast<std::uint16_t>(head.parameter))
                                             : nullptr;
    if (!session) {
        sendFatal(fd, hislip::InvalidInitialization, "Invalid initialization sequence");
    } else if (sendMessage(fd, {hislip::AsyncInitializeResponse, 0, VendorId, 0})) {
        session->serveRequests(fd);
    }
}

std::shared_ptr<HislipSession> HislipServer::open(Instrument &instrument, const std::string &label,
                                                  int fd)
{
    const std::lock_guard lock(m_mutex);
    if (m_sessions.size() >= MaxSessions) {
        return nullptr;
    }
    do {
        ++m_lastId;
    } while (m_sessions.contains(m_lastId));
    auto session = std::make_shared<HislipSession>(
        instrument, label + " session " + std::to_string(m_lastId), m_lastId, fd);
    m_sessions[m_lastId] = session;
    return session;
}

std::shared_ptr<HislipSession> HislipServer::find(std::uint16_t id)
{
    const std::lock_guard lock(m_mutex);
    const auto found = m_sessions.find(id);
    return found == m_sessions.end() ? nullptr : found->second;
}

} // namespace simulator
