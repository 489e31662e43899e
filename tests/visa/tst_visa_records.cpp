// SPDX-License-Identifier: Apache-2.0
#include "protocols/RpcRecord.h"
#include "support/rows.h"
#include "visa/MessageTracker.h"
#include "visa/RpcReply.h"

#include <QTest>

#include <algorithm>
#include <vector>

using namespace protocols;
using namespace visa;
using Bytes = std::vector<std::uint8_t>;

namespace {

std::span<const std::uint8_t> bytesOf(const QByteArray &text)
{
    return {reinterpret_cast<const std::uint8_t *>(text.data()), std::size_t(text.size())};
}

} // namespace

/// What stands between the sockets and the calls: records of RPC, their reply headers, and the ends
/// of SCPI messages.
class TestVisaRecords : public QObject
{
    Q_OBJECT

private slots:
    void recordsInPieces();
    void announcedLengths();
    void replyHeaders();
    void messageEnds();
};

void TestVisaRecords::recordsInPieces()
{
    // "abc" in one fragment; "defgh" in fragments of 2, 0 and 3; an empty record.
    const QByteArray stream = QByteArray::fromHex("80000003") + "abc" +
                              QByteArray::fromHex("00000002") + "de" +
                              QByteArray::fromHex("00000000") + QByteArray::fromHex("80000003") +
                              "fgh" + QByteArray::fromHex("80000000");
    for (const std::size_t pieceSize : {1U, 2U, 3U, 7U, 64U}) {
        RpcRecordReader reader(5);
        QByteArrayList records;
        auto rest = bytesOf(stream);
        while (!rest.empty()) {
            const auto piece = rest.first(std::min(pieceSize, rest.size()));
            rest = rest.subspan(reader.feed(piece));
            if (reader.state() == RpcRecordReader::State::Complete) {
                const auto record = reader.record();
                records << QByteArray(reinterpret_cast<const char *>(record.data()),
                                      qsizetype(record.size()));
                reader.next();
            }
            QVERIFY(reader.state() != RpcRecordReader::State::Broken);
        }
        QCOMPARE(records, (QByteArrayList{"abc", "defgh", ""}));
    }
}

void TestVisaRecords::announcedLengths()
{

    forRows({{"one fragment", QByteArray::fromHex("80000065")},
             {"2 GiB", QByteArray::fromHex("ffffffff")},
             {"sum of fragments", QByteArray::fromHex("00000063") + QByteArray(99, 'x') +
                                      QByteArray::fromHex("80000002")}},
            [](QByteArray stream) {
                RpcRecordReader reader(100);
                QCOMPARE(reader.feed(bytesOf(stream)), std::size_t(stream.size()));
                QVERIFY2(reader.state() == RpcRecordReader::State::Broken, "a length was believed");
                QCOMPARE(reader.feed(bytesOf(stream)), std::size_t{0});
            });
}

void TestVisaRecords::replyHeaders()
{

    forRows(
        {{"success", "0000002a 00000001 00000000 00000000 00000000 00000000 01020304",
          RpcReplyKind::Accepted, 4},
         {"padded verifier", "0000002a 00000001 00000000 00000000 00000002 ffff0000 00000000 01",
          RpcReplyKind::Accepted, 1},
         {"huge verifier", "0000002a 00000001 00000000 00000000 fffffffd 00000000",
          RpcReplyKind::Malformed, 0},
         {"other call", "00000029 00000001 00000000 00000000 00000000 00000000",
          RpcReplyKind::OtherCall, 0},
         {"a call", "0000002a 00000000 00000002", RpcReplyKind::Malformed, 0},
         {"denied", "0000002a 00000001 00000001 00000000", RpcReplyKind::Refused, 0},
         {"no program", "0000002a 00000001 00000000 00000000 00000000 00000001",
          RpcReplyKind::Unavailable, 0},
         {"garbage arguments", "0000002a 00000001 00000000 00000000 00000000 00000004",
          RpcReplyKind::Refused, 0},
         {"three bytes", "000000", RpcReplyKind::Malformed, 0}},
        [](QByteArray hex, RpcReplyKind kind, int resultSize) {
            const QByteArray record = QByteArray::fromHex(hex);
            const RpcReply reply = parseRpcReply(bytesOf(record), 42);
            QCOMPARE(int(reply.kind), int(kind));
            QCOMPARE(int(reply.results.size()), resultSize);
        });
}

void TestVisaRecords::messageEnds()
{

    forRows({{"lines", "1\n\nab\nrest", {"1\n", "\n", "ab\n", "rest"}},
             {"block", "#15a\nb\nc\nnext\n", {"#15a\nb\nc\n", "next\n"}},
             {"two digits",
              QByteArray("#210") + QByteArray(10, '\n') + "\n1\n",
              {QByteArray("#210") + QByteArray(10, '\n') + "\n", "1\n"}},
             {"block without terminator", "#12\n\n", {"#12\n\n"}},
             {"no block inside text", "1,#15a\nbcd\n", {"1,#15a\n", "bcd\n"}},
             {"letter in the length", "#21a\nb\n", {"#21a\n", "b\n"}}},
            [](QByteArray stream, QByteArrayList messages) {
                for (const std::size_t pieceSize : {1U, 2U, 3U, 1000U}) {
                    MessageTracker tracker;
                    QByteArrayList actual{QByteArray()};
                    auto rest = bytesOf(stream);
                    while (!rest.empty()) {
                        if (tracker.endedMessage() && !actual.back().isEmpty()) {
                            actual << QByteArray();
                        }
                        const std::size_t size =
                            tracker.advance(rest.first(std::min(pieceSize, rest.size())));
                        QVERIFY(size > 0);
                        actual.back() += QByteArray(reinterpret_cast<const char *>(rest.data()),
                                                    qsizetype(size));
                        rest = rest.subspan(size);
                    }
                    QCOMPARE(actual, messages);
                }
            });
}

QTEST_APPLESS_MAIN(TestVisaRecords)
#include "tst_visa_records.moc"
