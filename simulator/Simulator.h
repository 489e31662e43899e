// SPDX-License-Identifier: Apache-2.0
#pragma once

#include "Announcer.h"
#include "HislipServer.h"
#include "Options.h"
#include "PortMapper.h"
#include "RawSocketServer.h"
#include "Vxi11Server.h"

#include <map>
#include <memory>
#include <string>
#include <vector>

namespace simulator {

/// All instruments of one process with the servers in front of them.
class Simulator
{
public:
    ~Simulator();

    /// Opens all ports and begins to serve. False with the reason in `error`.
    [[nodiscard]] bool start(const std::vector<InstrumentPlace> &places, std::string &error);

    /// One line an instrument: where it is reached.
    [[nodiscard]] const std::vector<std::string> &readyLines() const { return m_readyLines; }

    /// Ends all conversations and closes all ports.
    void stop();

private:
    /// The servers of one address.
    struct Host
    {
        PortMapper mapper;
        Vxi11Server vxi11;
        RawSocketServer raw;
        HislipServer hislip;
        Announcer announcer;
    };

    [[nodiscard]] bool addHost(const InstrumentPlace &place, Instrument &instrument,
                               std::string &error);
    [[nodiscard]] static bool openAnnouncer(const InstrumentPlace &place, Host &host,
                                            std::string &error);
    [[nodiscard]] bool addToGateway(const InstrumentPlace &place, Instrument &instrument,
                                    std::string &error);

    std::vector<std::unique_ptr<Instrument>> m_instruments;
    std::vector<std::unique_ptr<Host>> m_hosts;
    std::map<std::uint16_t, std::unique_ptr<Vxi11Server>> m_gateways;
    std::vector<std::string> m_readyLines;
};

} // namespace simulator
