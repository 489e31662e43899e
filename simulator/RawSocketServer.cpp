// SPDX-License-Identifier: Apache-2.0
#include "RawSocketServer.h"

#include "Instrument.h"
#include "Link.h"
#include "sockets.h"

#include <sys/socket.h>

#include <cerrno>
#include <vector>

namespace simulator {
namespace {

constexpr std::size_t BufferSize = 262'144;

// Sends all answers, each as soon as it may leave; false when the connection ended.
bool sendAnswers(Instrument &instrument, Link &link, int fd, std::vector<char> &buffer)
{
    for (;;) {
        OutputQueue::ReadResult result;
        {
            std::unique_lock lock(instrument.mutex());
            if (link.output().isEmpty()) {
                return !link.isDropDue();
            }
            const Instrument::Wait waited = instrument.waitForOutput(
                lock, link, TimePoint::max(), [fd] { return isPeerGone(fd); });
            if (waited != Instrument::Wait::Ready) {
                return false;
            }
            result = link.read(buffer, std::nullopt);
        }
        if (!sendAll(fd, std::as_bytes(std::span(buffer).first(result.count))) ||
            link.isDropDue()) {
            return false;
        }
    }
}

void serve(Instrument &instrument, const std::string &label, int fd)
{
    Link link(instrument, Link::Transport::Raw, label);
    std::vector<char> input(BufferSize);
    std::vector<char> output(BufferSize);
    for (;;) {
        const ssize_t count = ::recv(fd, input.data(), input.size(), 0);
        if (count < 0 && errno == EINTR) {
            continue;
        }
        if (count <= 0) {
            return;
        }
        std::span<const char> rest = std::span(input).first(static_cast<std::size_t>(count));
        while (!rest.empty()) {
            {
                const std::lock_guard lock(instrument.mutex());
                rest = rest.subspan(link.feed(rest, false));
            }
            if (!sendAnswers(instrument, link, fd, output)) {
                return;
            }
        }
    }
}

} // namespace

bool RawSocketServer::open(const std::string &address, std::string &error)
{
    return m_server.open(address, Port, error);
}

void RawSocketServer::start(Instrument &instrument, const std::string &label)
{
    m_server.start([&instrument, label](int fd) { serve(instrument, label, fd); });
}

} // namespace simulator
