// SPDX-License-Identifier: Apache-2.0
#pragma once

#include "TcpServer.h"

#include <cstdint>
#include <string>

namespace simulator {

class Instrument;

/// SCPI over a plain TCP connection: messages and answers end with a line feed.
class RawSocketServer
{
public:
    static constexpr std::uint16_t Port = 5025;

    /// False with the reason in `error`.
    [[nodiscard]] bool open(const std::string &address, std::string &error);

    /// `label` stands in the log; the instrument must outlive the server.
    void start(Instrument &instrument, const std::string &label);
    void stop() { m_server.stop(); }

private:
    TcpServer m_server;
};

} // namespace simulator
