// SPDX-License-Identifier: Apache-2.0
#include "protocols/RpcRecord.h"
#include "protocols/XdrValue.h"
#include "support/require.h"
#include "visa/MessageTracker.h"
#include "visa/ReadReply.h"
#include "visa/RpcReply.h"

#include <vxi11.h>

#include <algorithm>
#include <vector>

using namespace protocols;
using namespace visa;

namespace {

constexpr std::size_t LargestRecord = 4096;

template <typename T>
bool decodes(XdrCode<T> *code, std::span<const std::uint8_t> results)
{
    XdrValue<T> value(code);
    return value.decode(results);
}

void decodeRecord(std::span<const std::uint8_t> record)
{
    std::uint32_t transaction = 0;
    for (const std::uint8_t byte : record.first(std::min<std::size_t>(record.size(), 4))) {
        transaction = transaction << 8U | byte;
    }
    const RpcReply reply = parseRpcReply(record, transaction);
    require(reply.kind != RpcReplyKind::OtherCall || record.size() < 4);
    require(reply.results.size() <= record.size());
    if (reply.kind != RpcReplyKind::Accepted) {
        return;
    }

    // Exactly as large as the target, so that the sanitizer sees a byte behind it.
    std::vector<std::uint8_t> target(reply.results.size() / 2);
    XdrValue<ReadReply> read(decodeReadReply, {.target = target});
    require(read.decode(reply.results) || read->size == 0);
    require(read->size > target.size() || read->size <= reply.results.size());
    XdrValue<Device_ReadResp> generated(xdr_Device_ReadResp);
    if (generated.decode(reply.results) && generated->data.data_len <= target.size()) {
        require(read->size == generated->data.data_len &&
                std::equal(target.begin(), target.begin() + read->size,
                           reinterpret_cast<const std::uint8_t *>(generated->data.data_val)));
    }
    (void)decodes(xdr_Device_WriteResp, reply.results);
    (void)decodes(xdr_Create_LinkResp, reply.results);
    (void)decodes(xdr_Device_Error, reply.results);
}

// A stream that comes in other pieces must give the same messages.
void trackMessages(std::span<const std::uint8_t> bytes, std::size_t pieceSize)
{
    MessageTracker whole;
    MessageTracker cut;
    while (!bytes.empty()) {
        const std::size_t end = whole.advance(bytes);
        std::size_t done = 0;
        do {
            const auto rest = bytes.subspan(done);
            const std::size_t size = cut.advance(rest.first(std::min(rest.size(), pieceSize)));
            require(size > 0);
            done += size;
        } while (!cut.endedMessage() && done < bytes.size());
        require(done == end && whole.endedMessage() == cut.endedMessage());
        bytes = bytes.subspan(end);
    }
}

} // namespace

/// The first byte is the size of the pieces in which the others arrive.
extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t *data, std::size_t size)
{
    if (size == 0) {
        return 0;
    }
    const std::size_t pieceSize = std::size_t{data[0]} + 1;
    const std::span stream(data + 1, size - 1);
    trackMessages(stream, pieceSize);

    RpcRecordReader reader(LargestRecord);
    auto rest = stream;
    while (!rest.empty() && reader.state() != RpcRecordReader::State::Broken) {
        const std::size_t taken = reader.feed(rest.first(std::min(rest.size(), pieceSize)));
        require(taken > 0 && reader.record().size() <= LargestRecord);
        rest = rest.subspan(taken);
        if (reader.state() == RpcRecordReader::State::Complete) {
            decodeRecord(reader.record());
            reader.next();
        }
    }
    return 0;
}
