// SPDX-License-Identifier: Apache-2.0
#pragma once

#include "ScriptedPeer.h"

#include <condition_variable>
#include <cstdint>
#include <functional>
#include <initializer_list>
#include <mutex>
#include <string>
#include <vector>

/// Numbers and sizes here are built by hand, not by the XDR functions under test.
std::string bigEndian(std::initializer_list<std::uint32_t> words);
/// Length, bytes and padding of XDR's variable-length opaque data.
std::string opaque(std::string_view bytes);

/// One received RPC call.
struct PeerCall
{
    std::uint32_t transaction = 0;
    std::uint32_t program = 0;
    std::uint32_t procedure = 0;
    std::string arguments;

    std::uint32_t word(std::size_t index) const;
    /// The opaque data that begins at this word.
    std::string data(std::size_t index) const;

    /// A whole record with the accepted reply.
    std::string reply(std::string_view results) const;
};

/// A VXI-11 instrument as bad as a test wants it. Unless a handler answers, calls succeed:
/// create_link gives link 7 and the abort port, a write takes all, a read gives nothing.
class Vxi11Peer
{
public:
    static constexpr std::uint32_t CreateLink = 10, Write = 11, Read = 12, Clear = 15, Remote = 16,
                                   Local = 17, DestroyLink = 23, Abort = 1;
    static constexpr std::uint32_t Link = 7;
    static constexpr std::uint32_t ReasonCount = 1, ReasonTerminator = 2, ReasonEnd = 4;

    /// True when it has dealt with the call itself, else the call gets its usual answer.
    using Handler = std::function<bool(PeerConnection &, const PeerCall &)>;

    explicit Vxi11Peer(Handler handler = {});

    std::uint16_t port() const { return m_core.port(); }
    int connectionCount() const { return m_core.connectionCount(); }

    /// Calls so far with this procedure of the core channel, or Abort of the other.
    std::vector<PeerCall> calls(std::uint32_t procedure) const;
    /// True when `count` such calls came within ten seconds.
    bool waitForCalls(std::uint32_t procedure, std::size_t count) const;

    /// Largest write that create_link will announce.
    std::uint32_t maxReceiveSize = 4096;

    static std::string readReply(std::uint32_t error, std::uint32_t reason, std::string_view data);

private:
    void serve(PeerConnection &connection);
    void answer(PeerConnection &connection, const PeerCall &call) const;

    Handler m_handler;
    mutable std::mutex m_mutex;
    mutable std::condition_variable m_called;
    std::vector<PeerCall> m_calls;
    ScriptedPeer m_abort; // these two last: their threads use the rest
    ScriptedPeer m_core;
};
