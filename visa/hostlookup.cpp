// SPDX-License-Identifier: Apache-2.0
#include "hostlookup.h"

#include <netdb.h>

#include <condition_variable>
#include <cstring>
#include <memory>
#include <mutex>
#include <system_error>
#include <thread>

namespace visa {

namespace {

std::vector<HostAddress> resolve(const std::string &host, int flags)
{
    addrinfo hints{};
    hints.ai_family = AF_UNSPEC;
    hints.ai_socktype = SOCK_STREAM;
    hints.ai_flags = flags;
    addrinfo *list = nullptr;
    std::vector<HostAddress> addresses;
    if (getaddrinfo(host.c_str(), nullptr, &hints, &list) != 0) {
        return addresses;
    }
    for (const addrinfo *entry = list; entry != nullptr; entry = entry->ai_next) {
        HostAddress &address = addresses.emplace_back();
        std::memcpy(&address.storage, entry->ai_addr, entry->ai_addrlen);
        address.length = entry->ai_addrlen;
    }
    freeaddrinfo(list);
    return addresses;
}

struct Lookup
{
    std::mutex mutex;
    std::condition_variable finished;
    bool isFinished = false;
    std::vector<HostAddress> addresses;
};

} // namespace

ViStatus lookUpHost(const std::string &host, const Deadline &deadline,
                    std::vector<HostAddress> &addresses)
{
    addresses = resolve(host, AI_NUMERICHOST);
    if (!addresses.empty()) {
        return VI_SUCCESS;
    }

    const auto lookup = std::make_shared<Lookup>();
    try {
        std::thread([lookup, host] {
            std::vector<HostAddress> found;
            try {
                found = resolve(host, 0);
            } catch (const std::bad_alloc &) {
                found.clear();
            }
            const std::lock_guard lock(lookup->mutex);
            lookup->addresses = std::move(found);
            lookup->isFinished = true;
            lookup->finished.notify_all();
        }).detach();
    } catch (const std::system_error &) {
        return VI_ERROR_ALLOC;
    }

    std::unique_lock lock(lookup->mutex);
    while (!lookup->isFinished) {
        if (deadline.isOver()) {
            return VI_ERROR_TMO;
        }
        lookup->finished.wait_for(lock,
                                  std::chrono::milliseconds(deadline.atMost(1000).remainingMs()));
    }
    addresses = std::move(lookup->addresses);
    return addresses.empty() ? VI_ERROR_RSRC_NFOUND : VI_SUCCESS;
}

} // namespace visa
