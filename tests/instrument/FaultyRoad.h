// SPDX-License-Identifier: Apache-2.0
#pragma once

#include "ScriptedPeer.h"

#include <atomic>
#include <chrono>
#include <condition_variable>
#include <mutex>
#include <string>

/// What becomes of an instrument's replies on a FaultyRoad.
struct RoadFault
{
    enum Kind {
        None,
        Silent, ///< nothing goes either way any more, on this connection or another
        Late,   ///< the reply comes `delay` later
        Reset,  ///< the connection is reset instead
        Half,   ///< half of the reply, then nothing
        Flood,  ///< half of the reply, then bytes without end
    };

    Kind kind = None;
    int reply = 0; ///< which one, counted from 0 since arm(); those before it go through
    std::chrono::milliseconds delay{};
};

/// A TCP road to an instrument that fails at a chosen reply. A reply is what comes at once.
class FaultyRoad
{
public:
    FaultyRoad(const std::string &address, std::string targetAddress, std::uint16_t targetPort);
    ~FaultyRoad();

    [[nodiscard]] std::uint16_t port() const { return m_peer.port(); }

    void arm(const RoadFault &fault);
    /// What was held back by then is lost.
    void heal() { arm({}); }
    /// Since arm().
    [[nodiscard]] int replyCount() const { return m_replyCount; }

private:
    void carry(PeerConnection &client);
    void carryReplies(PeerConnection &target, PeerConnection &client);
    [[nodiscard]] RoadFault faultOfNextReply();
    void flood(PeerConnection &client);

    std::string m_targetAddress;
    std::uint16_t m_targetPort;
    std::mutex m_mutex;
    RoadFault m_fault;
    bool m_isEnding = false;
    std::condition_variable m_end;
    std::atomic<int> m_replyCount{0};
    std::atomic<bool> m_isSilent{false};
    ScriptedPeer m_peer; // last: its threads use the others
};
