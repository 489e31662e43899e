// SPDX-License-Identifier: Apache-2.0
#include "AvahiSearch.h"

#include <QtEndian>

#include <avahi-client/client.h>
#include <avahi-client/lookup.h>
#include <avahi-common/simple-watch.h>

#include <utility>

namespace {

struct FreePoll
{
    void operator()(AvahiSimplePoll *poll) const { avahi_simple_poll_free(poll); }
};

/// Takes its browsers and resolvers along.
struct FreeClient
{
    void operator()(AvahiClient *client) const { avahi_client_free(client); }
};

class DaemonSearch : public AvahiSearch
{
public:
    explicit DaemonSearch(Found found)
        : m_found(std::move(found))
    {
    }

    [[nodiscard]] bool browse(const QStringList &services)
    {
        m_poll.reset(avahi_simple_poll_new());
        if (!m_poll) {
            return false;
        }
        m_client.reset(avahi_client_new(avahi_simple_poll_get(m_poll.get()), AvahiClientFlags{},
                                        ignoreState, nullptr, nullptr));
        if (!m_client) {
            return false;
        }
        for (const QString &service : services) {
            const QByteArray type = service.section('.', 0, 1).toUtf8();
            if (avahi_service_browser_new(m_client.get(), AVAHI_IF_UNSPEC, AVAHI_PROTO_INET,
                                          type.constData(), nullptr, AvahiLookupFlags{}, resolve,
                                          this) == nullptr) {
                return false;
            }
        }
        return true;
    }

    void takeAnswers() override
    {
        // An instance takes a turn each for its name, its host and its address.
        constexpr int Turns = 32;
        for (int turn = 0; turn < Turns && avahi_simple_poll_iterate(m_poll.get(), 0) == 0;
             ++turn) {
        }
    }

private:
    static void ignoreState(AvahiClient * /*client*/, AvahiClientState /*state*/, void * /*self*/)
    {
    }

    static void resolve(AvahiServiceBrowser * /*browser*/, AvahiIfIndex interface,
                        AvahiProtocol protocol, AvahiBrowserEvent event, const char *name,
                        const char *type, const char *domain, AvahiLookupResultFlags /*flags*/,
                        void *self)
    {
        if (event == AVAHI_BROWSER_NEW) {
            (void)avahi_service_resolver_new(static_cast<DaemonSearch *>(self)->m_client.get(),
                                             interface, protocol, name, type, domain,
                                             AVAHI_PROTO_INET, AvahiLookupFlags{}, take, self);
        }
    }

    static void take(AvahiServiceResolver *resolver, AvahiIfIndex /*interface*/,
                     AvahiProtocol /*protocol*/, AvahiResolverEvent event, const char *name,
                     const char *type, const char *domain, const char *host,
                     const AvahiAddress *address, std::uint16_t port, AvahiStringList * /*text*/,
                     AvahiLookupResultFlags /*flags*/, void *self)
    {
        if (event == AVAHI_RESOLVER_FOUND && address->proto == AVAHI_PROTO_INET) {
            const QString instance = QString("%1.%2.%3")
                                         .arg(QString::fromUtf8(name), QString::fromUtf8(type),
                                              QString::fromUtf8(domain));
            static_cast<DaemonSearch *>(self)->m_found(
                QHostAddress(qFromBigEndian(address->data.ipv4.address)),
                {instance, DnsRecord::Service, QString::fromUtf8(host), port});
        }
        avahi_service_resolver_free(resolver);
    }

    Found m_found;
    std::unique_ptr<AvahiSimplePoll, FreePoll> m_poll;
    std::unique_ptr<AvahiClient, FreeClient> m_client; // ends before the poll it works with
};

} // namespace

std::unique_ptr<AvahiSearch> AvahiSearch::open(const QStringList &services, Found found)
{
    auto search = std::make_unique<DaemonSearch>(std::move(found));
    return search->browse(services) ? std::move(search) : nullptr;
}
