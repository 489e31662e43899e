// SPDX-License-Identifier: Apache-2.0
#include "protocols/RpcRecord.h"
#include "simulator/rpcserver.h"
#include "support/require.h"

#include <algorithm>
#include <array>

using namespace protocols;
using namespace simulator;

namespace {

constexpr std::uint32_t CoreProgram = 0x0607AF;
constexpr std::size_t LargestReply = 4096;

// Reads arguments of all kinds and echoes them, as the procedures of an instrument do.
RpcStatus answer(std::uint32_t procedure, XdrReader &arguments, XdrWriter &results)
{
    results.number(procedure);
    const std::uint32_t requested = arguments.number();
    results.number(arguments.number() != 0 ? 1 : 0);
    const std::string_view name = arguments.text();
    const std::span<const std::uint8_t> data = arguments.opaque();
    if (!arguments.isGood()) {
        return RpcStatus::GarbageArguments;
    }
    const std::span<std::uint8_t> room =
        results.openOpaque(std::min<std::size_t>(requested, LargestReply));
    const std::size_t count = std::min({room.size(), data.size() + name.size()});
    std::fill_n(room.begin(), count, std::uint8_t{'x'});
    std::copy_n(data.begin(), std::min(count, data.size()), room.begin());
    results.closeOpaque(count);
    return RpcStatus::Success;
}

std::uint32_t word(std::span<const std::uint8_t> bytes, std::size_t place)
{
    XdrReader reader(bytes.subspan(place));
    return reader.number();
}

} // namespace

/// One record from a peer; each is answered as a whole record with its number, or not at all.
extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t *data, std::size_t size)
{
    const std::span call(data, size);
    const std::array<RpcProgram, 1> programs{{{CoreProgram, 1, answer}}};
    XdrWriter reply;
    if (!answerRpcCall(call, programs, reply)) {
        return 0;
    }
    const std::span<const std::uint8_t> bytes = reply.bytes();
    constexpr std::size_t SmallestReply = RecordMarkSize + 5 * 4;
    constexpr std::uint32_t LastFragment = 0x80000000U;
    require(bytes.size() >= SmallestReply && bytes.size() % 4 == 0);
    require(word(bytes, 0) == (LastFragment | (bytes.size() - RecordMarkSize)));
    require(word(bytes, RecordMarkSize) == word(call, 0) && word(bytes, RecordMarkSize + 4) == 1);
    return 0;
}
