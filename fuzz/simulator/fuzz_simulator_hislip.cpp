// SPDX-License-Identifier: Apache-2.0
// A controller's connection for messages, or with a first byte of odd value its other one, from the
// first byte to the last.
#include "protocols/hislip.h"
#include "simulator/HislipSession.h"
#include "simulator/Instrument.h"
#include "simulator/modeltable.h"
#include "support/require.h"

#include <sys/socket.h>
#include <unistd.h>

#include <array>
#include <thread>

namespace {

namespace hislip = protocols::hislip;
using namespace simulator;

Instrument &instrument()
{
    static Instrument made({.model = findModel("TGX-870"), .serial = "1", .firmware = "1"});
    static const bool isStarted = [] {
        std::string error;
        return made.start(error);
    }();
    require(isStarted);
    return made;
}

/// All that comes back must be whole messages, save that the end may cut one.
void checkMessages(int fd)
{
    hislip::Header head;
    std::vector<char> payload;
    while (receiveHead(fd, head)) {
        constexpr std::uint64_t LargestAnswer = 262'144;
        require(head.length <= LargestAnswer && head.type <= hislip::AsyncLockInfoResponse);
        payload.resize(static_cast<std::size_t>(head.length));
        if (!receiveAll(fd, payload)) {
            return;
        }
    }
}

} // namespace

extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t *data, std::size_t size)
{
    std::array<int, 2> ends{};
    if (size == 0 || ::socketpair(AF_UNIX, SOCK_STREAM, 0, ends.data()) != 0) {
        return 0;
    }
    std::thread controller([&] {
        (void)::send(ends[1], data + 1, size - 1, MSG_NOSIGNAL);
        ::shutdown(ends[1], SHUT_WR);
        checkMessages(ends[1]);
    });
    {
        HislipSession session(instrument(), "fuzz", 1, ends[0]);
        if (data[0] % 2 == 0) {
            session.serveMessages();
        } else {
            session.serveRequests(ends[0]);
        }
    }
    ::shutdown(ends[0], SHUT_RDWR);
    controller.join();
    ::close(ends[0]);
    ::close(ends[1]);
    return 0;
}
