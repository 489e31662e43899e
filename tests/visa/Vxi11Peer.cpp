// SPDX-License-Identifier: Apache-2.0
#include "Vxi11Peer.h"

#include <algorithm>
#include <chrono>

namespace {

constexpr std::uint32_t LastFragment = 0x8000'0000U;
constexpr std::size_t CallHeaderSize = 40;

std::uint32_t wordAt(std::string_view bytes, std::size_t offset)
{
    std::uint32_t word = 0;
    for (std::size_t i = 0; i < 4 && offset + i < bytes.size(); ++i) {
        word = word << 8U | static_cast<unsigned char>(bytes[offset + i]);
    }
    return word;
}

} // namespace

std::string bigEndian(std::initializer_list<std::uint32_t> words)
{
    std::string bytes;
    for (const std::uint32_t word : words) {
        for (int shift = 24; shift >= 0; shift -= 8) {
            bytes += static_cast<char>(word >> shift);
        }
    }
    return bytes;
}

std::string opaque(std::string_view bytes)
{
    std::string result = bigEndian({static_cast<std::uint32_t>(bytes.size())});
    result += bytes;
    result.append((4 - bytes.size() % 4) % 4, '\0');
    return result;
}

std::uint32_t PeerCall::word(std::size_t index) const
{
    return wordAt(arguments, index * 4);
}

std::string PeerCall::data(std::size_t index) const
{
    return arguments.substr((index + 1) * 4, word(index));
}

std::string PeerCall::reply(std::string_view results) const
{
    // Transaction, reply, accepted, empty verifier, success.
    std::string body = bigEndian({transaction, 1, 0, 0, 0, 0});
    body += results;
    return bigEndian({static_cast<std::uint32_t>(body.size()) | LastFragment}) + body;
}

Vxi11Peer::Vxi11Peer(Handler handler)
    : m_handler(std::move(handler))
    , m_abort([this](PeerConnection &connection) { serve(connection); })
    , m_core([this](PeerConnection &connection) { serve(connection); })
{
}

void Vxi11Peer::serve(PeerConnection &connection)
{
    for (;;) {
        const std::string mark = connection.receive(4);
        if (mark.size() < 4) {
            return;
        }
        const std::string record = connection.receive(wordAt(mark, 0) & ~LastFragment);
        if (record.size() < CallHeaderSize) {
            return;
        }
        PeerCall call{wordAt(record, 0), wordAt(record, 12), wordAt(record, 20),
                      record.substr(CallHeaderSize)};
        {
            const std::lock_guard lock(m_mutex);
            m_calls.push_back(call);
        }
        m_called.notify_all();
        if (!m_handler || !m_handler(connection, call)) {
            answer(connection, call);
        }
    }
}

void Vxi11Peer::answer(PeerConnection &connection, const PeerCall &call) const
{
    switch (call.procedure) {
    case CreateLink:
        connection.send(call.reply(bigEndian({0, Link, m_abort.port(), maxReceiveSize})));
        break;
    case Write:
        connection.send(call.reply(bigEndian({0, call.word(4)})));
        break;
    case Read:
        connection.send(call.reply(readReply(0, ReasonEnd, "")));
        break;
    default:
        connection.send(call.reply(bigEndian({0})));
        break;
    }
}

std::string Vxi11Peer::readReply(std::uint32_t error, std::uint32_t reason, std::string_view data)
{
    return bigEndian({error, reason}) + opaque(data);
}

std::vector<PeerCall> Vxi11Peer::calls(std::uint32_t procedure) const
{
    const std::lock_guard lock(m_mutex);
    std::vector<PeerCall> found;
    std::copy_if(m_calls.begin(), m_calls.end(), std::back_inserter(found),
                 [&](const PeerCall &call) { return call.procedure == procedure; });
    return found;
}

bool Vxi11Peer::waitForCalls(std::uint32_t procedure, std::size_t count) const
{
    std::unique_lock lock(m_mutex);
    return m_called.wait_for(lock, std::chrono::seconds(10), [&] {
        const auto matching =
            std::count_if(m_calls.begin(), m_calls.end(),
                          [&](const PeerCall &call) { return call.procedure == procedure; });
        return static_cast<std::size_t>(matching) >= count;
    });
}
