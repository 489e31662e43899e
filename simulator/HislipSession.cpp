// SPDX-License-Identifier: Apache-2.0
#include "HislipSession.h"

#include "Instrument.h"
#include "sockets.h"

#include <sys/socket.h>

#include <algorithm>
#include <array>
#include <cerrno>

namespace simulator {
namespace {

namespace hislip = protocols::hislip;

constexpr std::size_t BufferSize = 262'144;
constexpr std::uint64_t LargestMessage = 1U << 20U;
constexpr std::uint64_t LargestRequest = 4096; ///< payload on the connection for requests

} // namespace

bool receiveAll(int fd, std::span<char> buffer)
{
    while (!buffer.empty()) {
        const ssize_t count = ::recv(fd, buffer.data(), buffer.size(), 0);
        if (count < 0 && errno == EINTR) {
            continue;
        }
        if (count <= 0) {
            return false;
        }
        buffer = buffer.subspan(static_cast<std::size_t>(count));
    }
    return true;
}

bool receiveHead(int fd, hislip::Header &head)
{
    std::array<char, hislip::HeaderSize> bytes{};
    if (!receiveAll(fd, bytes)) {
        return false;
    }
    const std::span<const std::uint8_t, hislip::HeaderSize> values(
        reinterpret_cast<const std::uint8_t *>(bytes.data()), bytes.size());
    if (!hislip::decode(values, head)) {
        sendFatal(fd, hislip::PoorlyFormedHeader, "Poorly formed message header");
        return false;
    }
    return true;
}

bool sendMessage(int fd, hislip::Header head, std::span<const char> payload)
{
    head.length = payload.size();
    const auto bytes = hislip::encode(head);
    return sendAll(fd, std::as_bytes(std::span(bytes))) && sendAll(fd, std::as_bytes(payload));
}

void sendFatal(int fd, hislip::FatalCode code, std::string_view text)
{
    (void)sendMessage(fd, {hislip::FatalError, code, 0, 0}, text);
}

HislipSession::HislipSession(Instrument &instrument, const std::string &label, std::uint16_t id,
                             int fd)
    : m_instrument(instrument)
    , m_link(instrument, Link::Transport::Vxi11, label)
    , m_id(id)
    , m_fd(fd)
    , m_largestAnswer(BufferSize)
    , m_input(BufferSize)
    , m_output(BufferSize)
{
}

HislipSession::~HislipSession()
{
    const std::lock_guard lock(m_instrument.mutex());
    if (m_instrument.access() == &m_link) {
        m_instrument.releaseAccess();
    }
    m_link.clear();
}

void HislipSession::serveMessages()
{
    Header head;
    while (receiveHead(m_fd, head) && takeMessage(head)) {
    }
}

bool HislipSession::takeMessage(const Header &head)
{
    switch (head.type) {
    case hislip::Data:
    case hislip::DataEnd:
        if (head.length > LargestMessage) {
            sendFatal(m_fd, hislip::UnidentifiedFatal, "Message too large");
            return false;
        }
        return takeData(head);
    case hislip::Trigger: {
        const std::lock_guard lock(m_instrument.mutex());
        m_instrument.trigger();
        return true;
    }
    case hislip::DeviceClearComplete: {
        {
            const std::lock_guard lock(m_instrument.mutex());
            (void)m_link.takeAbort();
            m_link.clear();
            m_instrument.clearPendingCompletion();
        }
        m_isClearing = false;
        return sendMessage(m_fd, {hislip::DeviceClearAcknowledge, 0, 0, 0});
    }
    default:
        break;
    }
    if (head.length > LargestMessage) {
        return false;
    }
    std::vector<char> ignored(static_cast<std::size_t>(head.length));
    return receiveAll(m_fd, ignored) &&
           sendMessage(m_fd, {hislip::Error, hislip::UnrecognizedType, 0, 0},
                       std::string_view("Unrecognized message type"));
}

bool HislipSession::takeData(const Header &head)
{
    std::uint64_t left = head.length;
    do {
        const auto count = static_cast<std::size_t>(std::min<std::uint64_t>(left, m_input.size()));
        std::span<char> bytes = std::span(m_input).first(count);
        if (!receiveAll(m_fd, bytes)) {
            return false;
        }
        left -= count;
        if (m_isClearing) {
            continue; // the message is given up
        }
        const bool end = head.type == hislip::DataEnd && left == 0;
        do {
            {
                const std::lock_guard lock(m_instrument.mutex());
                bytes = bytes.subspan(m_link.feed(bytes, end));
            }
            if (!sendAnswers(head.parameter)) {
                return false;
            }
        } while (!bytes.empty());
    } while (left > 0);
    return true;
}

/// Sends what the message that was just taken has brought about, as soon as it may leave.
bool HislipSession::sendAnswers(std::uint32_t messageId)
{
    for (;;) {
        OutputQueue::ReadResult result;
        {
            std::unique_lock lock(m_instrument.mutex());
            if (m_link.output().isEmpty() || m_isClearing) {
                return !m_link.isDropDue();
            }
            const Instrument::Wait waited = m_instrument.waitForOutput(
                lock, m_link, TimePoint::max(), [this] { return isPeerGone(m_fd); });
            if (waited == Instrument::Wait::Aborted) {
                return true; // a device clear is on its way
            }
            if (waited != Instrument::Wait::Ready) {
                return false;
            }
            const auto room =
                static_cast<std::size_t>(std::min<std::uint64_t>(m_largestAnswer, m_output.size()));
            result = m_link.read(std::span(m_output).first(room), std::nullopt);
        }
        const std::uint8_t type = result.messageEnd ? hislip::DataEnd : hislip::Data;
        if (!sendMessage(m_fd, {type, 0, messageId, 0}, std::span(m_output).first(result.count)) ||
            m_link.isDropDue()) {
            return false;
        }
    }
}

void HislipSession::serveRequests(int fd)
{
    Header head;
    while (receiveHead(fd, head) && answerRequest(fd, head)) {
    }
}

bool HislipSession::answerRequest(int fd, const Header &head)
{
    if (head.length > LargestRequest) {
        sendFatal(fd, hislip::UnidentifiedFatal, "Message too large");
        return false;
    }
    std::vector<char> payload(static_cast<std::size_t>(head.length));
    if (!receiveAll(fd, payload)) {
        return false;
    }
    switch (head.type) {
    case hislip::AsyncMaximumMessageSize: {
        std::array<std::uint8_t, sizeof(std::uint64_t)> size{};
        if (payload.size() != size.size()) {
            break;
        }
        std::copy(payload.begin(), payload.end(), size.begin());
        m_largestAnswer = std::max<std::uint64_t>(hislip::get<std::uint64_t>(size.data()), 1);
        hislip::put(LargestMessage, size.data());
        return sendMessage(fd, {hislip::AsyncMaximumMessageSizeResponse, 0, 0, 0},
                           std::span(reinterpret_cast<const char *>(size.data()), size.size()));
    }
    case hislip::AsyncDeviceClear:
        m_isClearing = true;
        m_link.abort();
        m_instrument.notify();
        return sendMessage(fd, {hislip::AsyncDeviceClearAcknowledge, 0, 0, 0});
    case hislip::AsyncStatusQuery: {
        unsigned status = 0;
        {
            const std::lock_guard lock(m_instrument.mutex());
            status = m_instrument.statusByte(m_link);
        }
        return sendMessage(fd,
                           {hislip::AsyncStatusResponse, static_cast<std::uint8_t>(status), 0, 0});
    }
    case hislip::AsyncRemoteLocalControl:
        return sendMessage(fd, {hislip::AsyncRemoteLocalResponse, 0, 0, 0});
    case hislip::AsyncLock:
        return lock(fd, head);
    case hislip::AsyncLockInfo: {
        const std::lock_guard guard(m_instrument.mutex());
        const bool isLocked = m_instrument.access() != nullptr;
        return sendMessage(
            fd, {hislip::AsyncLockInfoResponse, static_cast<std::uint8_t>(isLocked ? 1 : 0), 0, 0});
    }
    default:
        break;
    }
    return sendMessage(fd, {hislip::Error, hislip::UnrecognizedType, 0, 0},
                       std::string_view("Unrecognized message type"));
}

/// An exclusive lock, with control 1, or its release, with control 0.
bool HislipSession::lock(int fd, const Header &head)
{
    enum Answer : std::uint8_t { Failure = 0, Success = 1, Invalid = 3 };
    Answer answer = Failure;
    {
        std::unique_lock guard(m_instrument.mutex());
        if (head.control == 0) {
            answer = m_instrument.access() == &m_link ? Success : Invalid;
            if (answer == Success) {
                m_instrument.releaseAccess();
            }
        } else if (m_instrument.access() == &m_link) {
            answer = Invalid;
        } else {
            const TimePoint deadline = Clock::now() + std::chrono::milliseconds(head.parameter);
            const Instrument::Wait waited = m_instrument.waitForAccess(
                guard, m_link, deadline, [fd] { return isPeerGone(fd); });
            if (waited == Instrument::Wait::Ready) {
                m_instrument.setAccess(&m_link);
                answer = Success;
            }
        }
    }
    return sendMessage(fd, {hislip::AsyncLockResponse, answer, 0, 0});
}

} // namespace simulator
