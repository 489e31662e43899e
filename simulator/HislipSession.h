// SPDX-License-Identifier: Apache-2.0
#pragma once

#include "Link.h"

#include <protocols/hislip.h>

#include <atomic>
#include <cstdint>
#include <span>
#include <string>
#include <string_view>
#include <vector>

namespace simulator {

class Instrument;

/// Reads a message's head. False when the connection ended; what is no head gets a fatal error.
[[nodiscard]] bool receiveHead(int fd, protocols::hislip::Header &head);

/// Fills the buffer. False when the connection ended.
[[nodiscard]] bool receiveAll(int fd, std::span<char> buffer);

/// Sends a message. False when the connection ended.
[[nodiscard]] bool sendMessage(int fd, protocols::hislip::Header head,
                               std::span<const char> payload = {});

/// Sends a fatal error with its reason; the connection is to be closed then.
void sendFatal(int fd, protocols::hislip::FatalCode code, std::string_view text);

/// One controller's session: what its two connections share.
class HislipSession
{
public:
    /// `fd` is the connection for messages; the instrument must outlive the session.
    HislipSession(Instrument &instrument, const std::string &label, std::uint16_t id, int fd);
    ~HislipSession();

    [[nodiscard]] std::uint16_t id() const { return m_id; }

    /// Serves the connection for messages until it ends.
    void serveMessages();

    /// Serves the other one; one at a time.
    void serveRequests(int fd);

private:
    using Header = protocols::hislip::Header;

    [[nodiscard]] bool takeMessage(const Header &head);
    [[nodiscard]] bool takeData(const Header &head);
    [[nodiscard]] bool sendAnswers(std::uint32_t messageId);
    [[nodiscard]] bool answerRequest(int fd, const Header &head);
    [[nodiscard]] bool lock(int fd, const Header &head);

    Instrument &m_instrument;
    Link m_link;
    std::uint16_t m_id;
    int m_fd;
    std::atomic<std::uint64_t> m_largestAnswer; ///< payload bytes that the controller takes
    std::atomic<bool> m_isClearing{false};
    std::vector<char> m_input;
    std::vector<char> m_output;
};

} // namespace simulator
