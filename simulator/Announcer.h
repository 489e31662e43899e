// SPDX-License-Identifier: Apache-2.0
#pragma once

#include "UniqueFd.h"

#include <cstdint>
#include <span>
#include <string>
#include <string_view>
#include <thread>
#include <vector>

namespace simulator {

/// What an instrument says of itself on its network.
struct Announcement
{
    std::string address; ///< IPv4
    std::string model;
    std::string serial;
    std::string firmware;
    bool hislip = true;
    bool raw = true;
};

/// The answer to a query of multicast DNS (RFC 6762) for the services "_lxi._tcp", "_vxi-11._tcp",
/// "_hislip._tcp" and "_scpi-raw._tcp"; empty when it asks for none of them or is broken. With
/// `repeats`, number and questions of the query stand in it, as those want it who ask by a port of
/// their own.
[[nodiscard]] std::vector<std::uint8_t> answerTo(std::span<const std::uint8_t> query,
                                                 const Announcement &instrument, bool repeats);

/// Answers queries of multicast DNS on the interface of the instrument's address.
class Announcer
{
public:
    static constexpr std::uint16_t Port = 5353;

    Announcer() = default;
    ~Announcer();
    Announcer(const Announcer &) = delete;
    Announcer &operator=(const Announcer &) = delete;

    /// False with the reason in `error`.
    [[nodiscard]] bool open(Announcement instrument, std::string &error);
    void start();
    void stop();

private:
    void serve();

    Announcement m_instrument;
    UniqueFd m_socket; ///< hears the queries
    UniqueFd m_sender; ///< of the own address, so that answers come from there
    UniqueFd m_wake;   ///< an event that ends the thread
    std::thread m_thread;
};

} // namespace simulator
