// SPDX-License-Identifier: Apache-2.0
#include "FaultyRoad.h"

#include <arpa/inet.h>
#include <netinet/in.h>
#include <netinet/tcp.h>
#include <sys/socket.h>
#include <unistd.h>

#include <thread>
#include <utility>

namespace {

constexpr std::size_t MostBytes = 64 * 1024;

int connectedTo(const std::string &address, std::uint16_t port)
{
    const int descriptor = ::socket(AF_INET, SOCK_STREAM | SOCK_CLOEXEC, 0);
    const int on = 1;
    setsockopt(descriptor, IPPROTO_TCP, TCP_NODELAY, &on, sizeof on);
    sockaddr_in endpoint{};
    endpoint.sin_family = AF_INET;
    endpoint.sin_port = htons(port);
    inet_pton(AF_INET, address.c_str(), &endpoint.sin_addr);
    (void)::connect(descriptor, reinterpret_cast<const sockaddr *>(&endpoint), sizeof endpoint);
    return descriptor;
}

} // namespace

FaultyRoad::FaultyRoad(const std::string &address, std::string targetAddress,
                       std::uint16_t targetPort)
    : m_targetAddress(std::move(targetAddress))
    , m_targetPort(targetPort)
    , m_peer([this](PeerConnection &client) { carry(client); }, address)
{
}

FaultyRoad::~FaultyRoad()
{
    const std::lock_guard lock(m_mutex);
    m_isEnding = true;
    m_end.notify_all();
}

void FaultyRoad::arm(const RoadFault &fault)
{
    const std::lock_guard lock(m_mutex);
    m_fault = fault;
    m_replyCount = 0;
    m_isSilent = false;
}

void FaultyRoad::carry(PeerConnection &client)
{
    const int descriptor = connectedTo(m_targetAddress, m_targetPort);
    PeerConnection target(descriptor);
    std::thread replies([&] { carryReplies(target, client); });
    for (;;) {
        const std::string bytes = client.receiveSome(MostBytes);
        if (bytes.empty() || (!m_isSilent && !target.send(bytes))) {
            break;
        }
    }
    target.shutDown();
    replies.join();
    ::close(descriptor);
}

void FaultyRoad::carryReplies(PeerConnection &target, PeerConnection &client)
{
    bool isDead = false;
    for (;;) {
        std::string bytes = target.receiveSome(MostBytes);
        if (bytes.empty()) {
            break;
        }
        const RoadFault fault = faultOfNextReply();
        if (fault.kind == RoadFault::Late) {
            std::unique_lock lock(m_mutex);
            m_end.wait_for(lock, fault.delay, [this] { return m_isEnding; });
        } else if (fault.kind == RoadFault::Reset) {
            client.reset();
            break;
        } else if (fault.kind == RoadFault::Half || fault.kind == RoadFault::Flood) {
            (void)client.send(std::string_view(bytes).substr(0, bytes.size() / 2));
            isDead = true;
            if (fault.kind == RoadFault::Flood) {
                flood(client);
            }
        }
        if (!isDead && !m_isSilent && !client.send(bytes)) {
            break;
        }
    }
    client.shutDown();
}

RoadFault FaultyRoad::faultOfNextReply()
{
    const std::lock_guard lock(m_mutex);
    if (m_replyCount++ != m_fault.reply) {
        return {};
    }
    m_isSilent = m_fault.kind == RoadFault::Silent;
    return m_fault;
}

void FaultyRoad::flood(PeerConnection &client)
{
    constexpr int MostBlocks = 4096;
    const std::string block(MostBytes, '1');
    for (int i = 0; i < MostBlocks && client.send(block); ++i) {
    }
}
