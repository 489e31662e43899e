// SPDX-License-Identifier: Apache-2.0
#pragma once

#include "TcpServer.h"

#include <atomic>
#include <cstddef>
#include <cstdint>
#include <map>
#include <memory>
#include <mutex>
#include <string>
#include <string_view>

namespace simulator {

class Instrument;
class Link;

/// The core and abort channels in front of one or several instruments.
class Vxi11Server
{
public:
    /// The most data that a device_write may carry.
    static constexpr std::uint32_t MaxReceiveSize = 1'048'576;

    /// Opens both channels; `corePort` may be 0, and the abort channel's port is always the
    /// system's choice. False with the reason in `error`.
    [[nodiscard]] bool open(const std::string &address, std::uint16_t corePort, std::string &error);

    /// Puts an instrument behind a device name such as "inst0" or "gpib0,28", in small letters.
    /// The instrument must outlive the server. To be called before `start`.
    void addDevice(const std::string &name, Instrument &instrument);

    /// `label` stands in the log.
    void start(const std::string &label);
    void stop();

    [[nodiscard]] std::uint16_t corePort() const { return m_core.port(); }
    [[nodiscard]] std::uint16_t abortPort() const { return m_abort.port(); }

private:
    friend class Vxi11Session;

    static constexpr std::size_t MaxLinks = 1024;

    [[nodiscard]] Instrument *findDevice(std::string_view name) const;

    /// Gives the link a number; 0 when there are too many.
    [[nodiscard]] std::uint32_t registerLink(const std::shared_ptr<Link> &link,
                                             Instrument &instrument);
    void unregisterLink(std::uint32_t id);
    void serveAbort(int fd);

    struct Entry
    {
        std::shared_ptr<Link> link;
        Instrument *instrument = nullptr;
    };

    TcpServer m_core;
    TcpServer m_abort;
    std::map<std::string, Instrument *, std::less<>> m_devices;
    std::string m_label;
    std::mutex m_mutex; ///< of the links
    std::map<std::uint32_t, Entry> m_links;
    std::uint32_t m_lastLink = 0;
};

} // namespace simulator
