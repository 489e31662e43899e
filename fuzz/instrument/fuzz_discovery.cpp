// SPDX-License-Identifier: Apache-2.0
// What comes from the network while instruments are sought: answers of multicast DNS and of port
// mappers, and the simulator's answer to a query, which the search must understand.
#include "instrument/dnsmessage.h"
#include "instrument/portmapmessage.h"
#include "simulator/Announcer.h"
#include "support/require.h"

#include <cstdint>
#include <span>

namespace {

void checkRecords(const QByteArray &message)
{
    constexpr qsizetype SmallestRecord = 1 + 2 + 6 + 2;
    const auto records = dnsRecords(message);
    require(!records || records->size() * SmallestRecord <= message.size());
    for (const DnsRecord &record : records.value_or(QList<DnsRecord>())) {
        require(record.port == 0 || record.type == DnsRecord::Service);
        require(record.target.isEmpty() || record.type == DnsRecord::Service ||
                record.type == DnsRecord::Pointer);
    }
}

void checkAnswer(std::span<const std::uint8_t> query, bool repeats)
{
    const simulator::Announcement instrument{"127.0.0.2", "TGX-870", "1", "1.0"};
    const std::vector<std::uint8_t> answer = simulator::answerTo(query, instrument, repeats);
    if (answer.empty()) {
        return;
    }
    const auto records = dnsRecords(
        {reinterpret_cast<const char *>(answer.data()), static_cast<qsizetype>(answer.size())});
    require(records && !records->isEmpty());
    require(records->first().type == DnsRecord::Pointer &&
            records->first().target.startsWith("TGX-870 1."));
}

} // namespace

extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t *data, std::size_t size)
{
    const QByteArray message(reinterpret_cast<const char *>(data), static_cast<qsizetype>(size));
    checkRecords(message);
    constexpr quint32 Id = 0x31323334; // "1234"
    const std::optional<quint16> port = coreChannelPort(message, Id);
    require(!port || message.startsWith("1234"));
    checkAnswer({data, size}, size % 2 == 0);
    return 0;
}
