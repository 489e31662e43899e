// SPDX-License-Identifier: Apache-2.0
#include "Announcer.h"

#include "sockets.h"

#include <protocols/hislip.h>

#include <arpa/inet.h>
#include <netinet/in.h>
#include <poll.h>
#include <sys/eventfd.h>
#include <sys/socket.h>
#include <unistd.h>

#include <algorithm>
#include <array>
#include <cctype>
#include <cerrno>
#include <optional>
#include <system_error>

namespace simulator {
namespace {

constexpr const char *Group = "224.0.0.251";
constexpr std::size_t HeaderSize = 12;
constexpr std::size_t LargestLabel = 63;
constexpr std::uint16_t ClassInternet = 1;
constexpr std::uint16_t ResponseFlag = 0x8000;
constexpr std::uint16_t AuthoritativeFlag = 0x0400;
constexpr std::uint32_t LifeSeconds = 10; // short: a simulator comes and goes
constexpr int MostQuestions = 32;

enum RecordType : std::uint16_t {
    AddressRecord = 1,
    PointerRecord = 12,
    TextRecord = 16,
    ServiceRecord = 33,
    AnyRecord = 255
};

using Labels = std::vector<std::string>;

struct Service
{
    const char *name;
    std::uint16_t port;
};

std::vector<Service> servicesOf(const Announcement &instrument)
{
    constexpr std::uint16_t WebPort = 80; // where the standard has the page of an instrument
    constexpr std::uint16_t MapperPort = 111;
    constexpr std::uint16_t RawPort = 5025;
    std::vector<Service> services{{"_lxi", WebPort}, {"_vxi-11", MapperPort}};
    if (instrument.hislip) {
        services.push_back({"_hislip", protocols::hislip::Port});
    }
    if (instrument.raw) {
        services.push_back({"_scpi-raw", RawPort});
    }
    return services;
}

/// Appends numbers, names and records to a message.
class Writer
{
public:
    explicit Writer(std::vector<std::uint8_t> &bytes)
        : m_bytes(bytes)
    {
    }

    void number(std::uint16_t value)
    {
        m_bytes.push_back(static_cast<std::uint8_t>(value >> 8U));
        m_bytes.push_back(static_cast<std::uint8_t>(value));
    }

    void text(std::string_view text)
    {
        m_bytes.push_back(static_cast<std::uint8_t>(std::min(text.size(), LargestLabel)));
        text = text.substr(0, LargestLabel);
        m_bytes.insert(m_bytes.end(), text.begin(), text.end());
    }

    void name(const Labels &labels)
    {
        for (const std::string &label : labels) {
            text(label);
        }
        m_bytes.push_back(0);
    }

    template <typename Content>
    void record(const Labels &owner, RecordType type, const Content &content)
    {
        name(owner);
        number(type);
        number(ClassInternet);
        number(0);
        number(LifeSeconds);
        const std::size_t place = m_bytes.size();
        number(0);
        content();
        const std::size_t size = m_bytes.size() - place - 2;
        m_bytes[place] = static_cast<std::uint8_t>(size >> 8U);
        m_bytes[place + 1] = static_cast<std::uint8_t>(size);
    }

private:
    std::vector<std::uint8_t> &m_bytes;
};

std::uint16_t numberAt(std::span<const std::uint8_t> bytes, std::size_t place)
{
    return static_cast<std::uint16_t>((bytes[place] << 8U) | bytes[place + 1]);
}

/// A question's name in lower case, and the place behind it. A name may end with a pointer to what
/// stands before it, as queries for several services have it.
std::optional<std::string> questionName(std::span<const std::uint8_t> query, std::size_t &place)
{
    constexpr int MostPointers = 16;
    constexpr std::uint8_t PointerMark = 0xC0;
    std::string name;
    std::size_t reader = place;
    std::size_t end = 0; // behind the first pointer
    for (int pointers = 0; reader < query.size() && query[reader] != 0;) {
        const std::size_t size = query[reader];
        if (size >= PointerMark) {
            if (reader + 2 > query.size() || ++pointers > MostPointers) {
                return std::nullopt;
            }
            const std::size_t target = numberAt(query, reader) & (0xFFFFU ^ (PointerMark << 8U));
            if (target < HeaderSize || target >= reader) {
                return std::nullopt;
            }
            end = end == 0 ? reader + 2 : end;
            reader = target;
            continue;
        }
        if (size > LargestLabel || reader + 1 + size > query.size()) {
            return std::nullopt;
        }
        for (const std::uint8_t byte : query.subspan(reader + 1, size)) {
            name.push_back(static_cast<char>(std::tolower(byte)));
        }
        name.push_back('.');
        reader += 1 + size;
    }
    place = end == 0 ? reader + 1 : end;
    return place + 4 <= query.size() ? std::optional(name) : std::nullopt;
}

void appendRecords(Writer &writer, const Announcement &instrument, const Service &service)
{
    const Labels kind{service.name, "_tcp", "local"};
    const Labels host{instrument.model + '-' + instrument.serial, "local"};
    Labels instance{instrument.model + ' ' + instrument.serial};
    instance.insert(instance.end(), kind.begin(), kind.end());
    writer.record(kind, PointerRecord, [&] { writer.name(instance); });
    writer.record(instance, ServiceRecord, [&] {
        writer.number(0); // priority
        writer.number(0); // weight
        writer.number(service.port);
        writer.name(host);
    });
    writer.record(instance, TextRecord, [&] {
        writer.text("txtvers=1");
        writer.text("Manufacturer=Halvorn");
        writer.text("Model=" + instrument.model);
        writer.text("SerialNumber=" + instrument.serial);
        writer.text("FirmwareVersion=" + instrument.firmware);
    });
    writer.record(host, AddressRecord, [&] {
        in_addr address{};
        (void)::inet_pton(AF_INET, instrument.address.c_str(), &address);
        const std::uint32_t value = ntohl(address.s_addr);
        writer.number(static_cast<std::uint16_t>(value >> 16U));
        writer.number(static_cast<std::uint16_t>(value));
    });
}

} // namespace

std::vector<std::uint8_t> answerTo(std::span<const std::uint8_t> query,
                                   const Announcement &instrument, bool repeats)
{
    constexpr std::uint16_t RecordsEach = 4;
    if (query.size() < HeaderSize || (numberAt(query, 2) & ResponseFlag) != 0) {
        return {};
    }
    const std::vector<Service> services = servicesOf(instrument);
    std::vector<const Service *> wanted;
    std::size_t place = HeaderSize;
    const int questions = std::min<int>(numberAt(query, 4), MostQuestions);
    for (int k = 0; k < questions; ++k) {
        const std::optional<std::string> name = questionName(query, place);
        if (!name) {
            return {};
        }
        const std::uint16_t type = numberAt(query, place);
        place += 4;
        for (const Service &service : services) {
            if (*name == std::string(service.name) + "._tcp.local." &&
                (type == PointerRecord || type == AnyRecord)) {
                wanted.push_back(&service);
            }
        }
    }
    if (wanted.empty()) {
        return {};
    }
    std::vector<std::uint8_t> answer;
    Writer writer(answer);
    writer.number(repeats ? numberAt(query, 0) : std::uint16_t{0});
    writer.number(ResponseFlag | AuthoritativeFlag);
    writer.number(repeats ? static_cast<std::uint16_t>(questions) : std::uint16_t{0});
    writer.number(static_cast<std::uint16_t>(RecordsEach * wanted.size()));
    writer.number(0);
    writer.number(0);
    if (repeats) {
        const auto asked = query.subspan(HeaderSize, place - HeaderSize);
        answer.insert(answer.end(), asked.begin(), asked.end());
    }
    for (const Service *service : wanted) {
        appendRecords(writer, instrument, *service);
    }
    return answer;
}

Announcer::~Announcer()
{
    stop();
}

bool Announcer::open(Announcement instrument, std::string &error)
{
    m_instrument = std::move(instrument);
    m_socket = bindSharedUdp(Port, error);
    m_sender = bindUdp(m_instrument.address, Port, error);
    if (!m_socket.isValid() || !m_sender.isValid()) {
        return false;
    }
    ip_mreq membership{};
    (void)::inet_pton(AF_INET, Group, &membership.imr_multiaddr);
    (void)::inet_pton(AF_INET, m_instrument.address.c_str(), &membership.imr_interface);
    // What came from another network would have a smaller one, and is dropped by some.
    constexpr int TimeToLive = 255;
    (void)::setsockopt(m_sender.get(), IPPROTO_IP, IP_MULTICAST_TTL, &TimeToLive,
                       sizeof(TimeToLive));
    if (::setsockopt(m_socket.get(), IPPROTO_IP, IP_ADD_MEMBERSHIP, &membership,
                     sizeof(membership)) != 0 ||
        ::setsockopt(m_sender.get(), IPPROTO_IP, IP_MULTICAST_IF, &membership.imr_interface,
                     sizeof(membership.imr_interface)) != 0) {
        error = std::generic_category().message(errno);
        return false;
    }
    return true;
}

void Announcer::start()
{
    m_wake = UniqueFd(::eventfd(0, EFD_CLOEXEC));
    m_thread = std::thread([this] { serve(); });
}

void Announcer::stop()
{
    if (m_thread.joinable()) {
        const std::uint64_t one = 1;
        (void)!::write(m_wake.get(), &one, sizeof(one));
        m_thread.join();
    }
    m_socket.reset();
    m_sender.reset();
}

void Announcer::serve()
{
    std::array<std::uint8_t, 9000> buffer{};
    for (;;) {
        std::array<pollfd, 2> events{{{m_wake.get(), POLLIN, 0}, {m_socket.get(), POLLIN, 0}}};
        if (::poll(events.data(), events.size(), -1) < 0 && errno != EINTR) {
            return;
        }
        if (events[0].revents != 0) {
            return;
        }
        sockaddr_in peer{};
        socklen_t length = sizeof(peer);
        const ssize_t count = ::recvfrom(m_socket.get(), buffer.data(), buffer.size(), MSG_DONTWAIT,
                                         reinterpret_cast<sockaddr *>(&peer), &length);
        if (count <= 0) {
            continue;
        }
        const bool ownPort = ntohs(peer.sin_port) != Port;
        const auto query = std::span(buffer).first(static_cast<std::size_t>(count));
        const std::vector<std::uint8_t> answer = answerTo(query, m_instrument, ownPort);
        if (answer.empty()) {
            continue;
        }
        if (!ownPort) {
            (void)::inet_pton(AF_INET, Group, &peer.sin_addr);
        }
        (void)::sendto(m_sender.get(), answer.data(), answer.size(), MSG_NOSIGNAL,
                       reinterpret_cast<const sockaddr *>(&peer), sizeof(peer));
    }
}

} // namespace simulator
