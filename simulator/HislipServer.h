// SPDX-License-Identifier: Apache-2.0
#pragma once

#include "TcpServer.h"

#include <cstdint>
#include <map>
#include <memory>
#include <mutex>
#include <string>

namespace simulator {

class HislipSession;
class Instrument;

/// HiSLIP (IVI-6.1) in synchronized mode: two connections a session, one for messages and answers,
/// one for device clear, status and locks.
class HislipServer
{
public:
    static constexpr const char *SubAddress = "hislip0";

    HislipServer();
    ~HislipServer();

    /// Opens the port of the protocol. False with the reason in `error`.
    [[nodiscard]] bool open(const std::string &address, std::string &error);

    /// `label` stands in the log; the instrument must outlive the server.
    void start(Instrument &instrument, const std::string &label);
    void stop() { m_server.stop(); }

private:
    void serve(Instrument &instrument, const std::string &label, int fd);
    [[nodiscard]] std::shared_ptr<HislipSession> open(Instrument &instrument,
                                                      const std::string &label, int fd);
    [[nodiscard]] std::shared_ptr<HislipSession> find(std::uint16_t id);

    TcpServer m_server;
    std::mutex m_mutex; ///< of the sessions
    std::map<std::uint16_t, std::shared_ptr<HislipSession>> m_sessions;
    std::uint16_t m_lastId = 0;
};

} // namespace simulator
