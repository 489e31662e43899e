// SPDX-License-Identifier: Apache-2.0
#include "protocols/RpcRecord.h"
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
    void recordsInPieces_data();
    void recordsInPieces();
    void announcedLengths_data();
    void announcedLengths();
    void replyHeaders_data();
    void replyHeaders();
    void messageEnds_data();
    void messageEnds();
};

void TestVisaRecords::recordsInPieces_data()
{
    QTest::addColumn<std::size_t>("pieceSize");
    for (const std::size_t size : {1U, 2U, 3U, 7U, 64U})
        QTest::addRow("%zu bytes", size) << size;
}

void TestVisaRecords::recordsInPieces()
{
    QFETCH(std::size_t, pieceSize);
    // "abc" in one fragment; "defgh" in fragments of 2, 0 and 3; an empty record.
    const QByteArray stream = QByteArray::fromHex("80000003") + "abc" +
                              QByteArray::fromHex("00000002") + "de" +
                              QByteArray::fromHex("00000000") + QByteArray::fromHex("80000003") +
                              "fgh" + QByteArray::fromHex("80000000");
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

void TestVisaRecords::announcedLengths_data()
{
    QTest::addColumn<QByteArray>("stream");
    QTest::newRow("one fragment") << QByteArray::fromHex("80000065");
    QTest::newRow("2 GiB") << QByteArray::fromHex("ffffffff");
    QTest::newRow("sum of fragments")
        << QByteArray::fromHex("00000063") + QByteArray(99, 'x') + QByteArray::fromHex("80000002");
}

void TestVisaRecords::announcedLengths()
{
    QFETCH(QByteArray, stream);
    RpcRecordReader reader(100);
    QCOMPARE(reader.feed(bytesOf(stream)), std::size_t(stream.size()));
    QVERIFY2(reader.state() == RpcRecordReader::State::Broken, "a length was believed");
    QCOMPARE(reader.feed(bytesOf(stream)), std::size_t{0});
}

void TestVisaRecords::replyHeaders_data()
{
    QTest::addColumn<QByteArray>("hex");
    QTest::addColumn<RpcReplyKind>("kind");
    QTest::addColumn<int>("resultSize");

    const auto row = [](const char *name, const char *hex, RpcReplyKind kind, int size = 0) {
        QTest::newRow(name) << QByteArray(hex) << kind << size;
    };
    // Transaction 0000002a; reply 1; accepted 0; verifier flavor and size; accept status.
    row("success", "0000002a 00000001 00000000 00000000 00000000 00000000 01020304",
        RpcReplyKind::Accepted, 4);
    row("padded verifier", "0000002a 00000001 00000000 00000000 00000002 ffff0000 00000000 01",
        RpcReplyKind::Accepted, 1);
    row("cut verifier", "0000002a 00000001 00000000 00000000 00000002 ffff",
        RpcReplyKind::Malformed);
    row("huge verifier", "0000002a 00000001 00000000 00000000 fffffffd 00000000",
        RpcReplyKind::Malformed);
    row("other call", "00000029 00000001 00000000 00000000 00000000 00000000",
        RpcReplyKind::OtherCall);
    row("a call", "0000002a 00000000 00000002", RpcReplyKind::Malformed);
    row("denied", "0000002a 00000001 00000001 00000000", RpcReplyKind::Refused);
    row("neither accepted nor denied", "0000002a 00000001 00000002", RpcReplyKind::Malformed);
    row("no program", "0000002a 00000001 00000000 00000000 00000000 00000001",
        RpcReplyKind::Unavailable);
    row("no version", "0000002a 00000001 00000000 00000000 00000000 00000002",
        RpcReplyKind::Unavailable);
    row("no procedure", "0000002a 00000001 00000000 00000000 00000000 00000003",
        RpcReplyKind::Unavailable);
    row("garbage arguments", "0000002a 00000001 00000000 00000000 00000000 00000004",
        RpcReplyKind::Refused);
    row("unknown accept status", "0000002a 00000001 00000000 00000000 00000000 00000006",
        RpcReplyKind::Malformed);
    row("no accept status", "0000002a 00000001 00000000 00000000 00000000",
        RpcReplyKind::Malformed);
    row("empty", "", RpcReplyKind::Malformed);
    row("three bytes", "000000", RpcReplyKind::Malformed);
}

void TestVisaRecords::replyHeaders()
{
    QFETCH(QByteArray, hex);
    QFETCH(RpcReplyKind, kind);
    QFETCH(int, resultSize);
    const QByteArray record = QByteArray::fromHex(hex);
    const RpcReply reply = parseRpcReply(bytesOf(record), 42);
    QCOMPARE(int(reply.kind), int(kind));
    QCOMPARE(int(reply.results.size()), resultSize);
}

void TestVisaRecords::messageEnds_data()
{
    QTest::addColumn<QByteArray>("stream");
    QTest::addColumn<QByteArrayList>("messages");

    const auto row = [](const char *name, const QByteArray &stream,
                        const QByteArrayList &messages) {
        QTest::newRow(name) << stream << messages;
    };
    row("lines", "1\n\nab\nrest", {"1\n", "\n", "ab\n", "rest"});
    row("block", "#15a\nb\nc\nnext\n", {"#15a\nb\nc\n", "next\n"});
    row("two digits", QByteArray("#210") + QByteArray(10, '\n') + "\n1\n",
        {QByteArray("#210") + QByteArray(10, '\n') + "\n", "1\n"});
    row("block without terminator", "#12\n\n", {"#12\n\n"});
    row("two blocks in turn", "#11\n\n#11\n\n", {"#11\n\n", "#11\n\n"});
    row("empty block", "#10\nx\n", {"#10\n", "x\n"});
    row("no block inside text", "1,#15a\nbcd\n", {"1,#15a\n", "bcd\n"});
    row("no length", "#a\nb\n", {"#a\n", "b\n"});
    row("zero digits", "#0ab\nc\n", {"#0ab\n", "c\n"});
    row("letter in the length", "#21a\nb\n", {"#21a\n", "b\n"});
    row("line feed in the length", "#2\nb\n", {"#2\n", "b\n"});
}

void TestVisaRecords::messageEnds()
{
    QFETCH(QByteArray, stream);
    QFETCH(QByteArrayList, messages);
    for (const std::size_t pieceSize : {1U, 2U, 3U, 1000U}) {
        MessageTracker tracker;
        QByteArrayList actual{QByteArray()};
        auto rest = bytesOf(stream);
        while (!rest.empty()) {
            if (tracker.endedMessage() && !actual.back().isEmpty())
                actual << QByteArray();
            const std::size_t size = tracker.advance(rest.first(std::min(pieceSize, rest.size())));
            QVERIFY(size > 0);
            actual.back() +=
                QByteArray(reinterpret_cast<const char *>(rest.data()), qsizetype(size));
            rest = rest.subspan(size);
        }
        QCOMPARE(actual, messages);
    }
}

QTEST_APPLESS_MAIN(TestVisaRecords)
#include "tst_visa_records.moc"
