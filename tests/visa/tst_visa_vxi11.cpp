// SPDX-License-Identifier: Apache-2.0
#include "VisaFixture.h"
#include "Vxi11Peer.h"
#include "support/rows.h"

#include <QElapsedTimer>
#include <QTest>

#include <thread>

namespace {

std::string fragment(std::string_view bytes, bool isLast)
{
    const std::uint32_t mark = isLast ? 0x8000'0000U : 0;
    return bigEndian({static_cast<std::uint32_t>(bytes.size()) | mark}).append(bytes);
}

} // namespace

/// Transfers with instruments on the network that behave, refuse, cut, stall and lie.
class TestVisaVxi11 : public QObject, protected VisaFixture
{
    Q_OBJECT

private slots:
    void cleanup() { closeManager(); }
    void reads();
    void readRequests();
    void longMessageInPieces();
    void writes();
    void deviceErrors();
    void brokenReplies();
    void stalledReplies();
    void trickledReply();
    void lateReplyIsDropped();
    void clearAndRemote();
    void printing();
};

void TestVisaVxi11::reads()
{
    // Replies: error, reason, data.
    using Reply = std::tuple<std::uint32_t, std::uint32_t, QByteArray>;
    using Replies = QList<Reply>;
    constexpr auto Count = Vxi11Peer::ReasonCount, Character = Vxi11Peer::ReasonTerminator,
                   End = Vxi11Peer::ReasonEnd;
    enum Mode { Plain, Terminator, NoEnd };
    forRows(
        {{"end", Plain, 10, {{0, End, "abc"}}, VI_SUCCESS, "abc"},
         {"end and count", Plain, 3, {{0, End | Count, "abc"}}, VI_SUCCESS, "abc"},
         {"without reason", Plain, 3, {{0, 0, "abc"}}, VI_SUCCESS_MAX_CNT, "abc"},
         {"terminator",
          Terminator,
          3,
          {{0, Character | Count, "ab\n"}},
          VI_SUCCESS_TERM_CHAR,
          "ab\n"},
         {"and end", Terminator, 9, {{0, Character | End, "a\n"}}, VI_SUCCESS, "a\n"},
         {"partial",
          Plain,
          10,
          {{0, 0, "ab"}, {0, 0, ""}, {0, Count, "c"}, {0, End, "d"}},
          VI_SUCCESS,
          "abcd"},
         {"end suppressed", NoEnd, 4, {{0, End, "ab"}, {0, End, "cd"}}, VI_SUCCESS_MAX_CNT, "abcd"},
         {"error after data", Plain, 9, {{0, 0, "ab"}, {17, 0, "c"}}, VI_ERROR_IO, "abc"},
         {"timed out there", Plain, 10, {{15, 0, ""}}, VI_ERROR_TMO, ""},
         {"more than asked", Plain, 3, {{0, End, "abcdef"}}, VI_ERROR_IO, ""},
         {"nothing for ever", Plain, 10, Replies(40, {0, 0, ""}), VI_ERROR_IO, ""}},
        [this](Mode mode, ViUInt32 size, Replies replies, ViStatus status, QByteArray data) {
            Replies left = replies;
            const Vxi11Peer peer([&](PeerConnection &connection, const PeerCall &call) {
                if (call.procedure != Vxi11Peer::Read || left.isEmpty()) {
                    return false;
                }
                const auto [error, reason, bytes] = left.takeFirst();
                const std::string text = bytes.toStdString();
                connection.send(call.reply(Vxi11Peer::readReply(error, reason, text)));
                return true;
            });
            const ViSession session = open(peer);
            QCOMPARE(viSetAttribute(session, VI_ATTR_TERMCHAR_EN, mode == Terminator), VI_SUCCESS);
            QCOMPARE(viSetAttribute(session, VI_ATTR_SUPPRESS_END_EN, mode == NoEnd), VI_SUCCESS);
            QCOMPARE(read(session, size), Result(status, data));
            closeManager();
        });
}

void TestVisaVxi11::readRequests()
{
    const Vxi11Peer peer;
    const ViSession session = open(peer, 4321);
    QCOMPARE(read(session, 32767).first, VI_SUCCESS);
    QCOMPARE(viSetAttribute(session, VI_ATTR_TERMCHAR, ';'), VI_SUCCESS);
    QCOMPARE(viSetAttribute(session, VI_ATTR_TERMCHAR_EN, VI_TRUE), VI_SUCCESS);
    QCOMPARE(read(session, 5).first, VI_SUCCESS);
    QCOMPARE(read(session, 0).first, VI_SUCCESS); // without a call
    const auto calls = peer.calls(Vxi11Peer::Read);
    QCOMPARE(calls.size(), std::size_t{2});
    // Link, size, time-out, lock time-out, flags, terminator.
    QCOMPARE(calls[0].word(0), Vxi11Peer::Link);
    QCOMPARE(calls[0].word(1), 32767U);
    QVERIFY(calls[0].word(2) > 3000 && calls[0].word(2) <= 4321);
    QCOMPARE(calls[0].word(4), 0U);
    QCOMPARE(calls[1].word(1), 5U);
    QCOMPARE(calls[1].word(4), 128U);
    QCOMPARE(calls[1].word(5), std::uint32_t{';'});
}

void TestVisaVxi11::longMessageInPieces()
{
    constexpr ViUInt32 Piece = 2048;
    QByteArray message;
    for (int i = 0; i < 100'000; ++i) {
        message += char(11 + i % 241);
    }
    message[40'000] = '\n';
    std::size_t sent = 0;
    const Vxi11Peer peer([&](PeerConnection &connection, const PeerCall &call) {
        if (call.procedure == Vxi11Peer::Write || call.procedure == Vxi11Peer::Clear) {
            sent = 0;
        } else if (call.procedure == Vxi11Peer::Read) {
            // Some replies are shorter than asked, as those of a busy instrument.
            const std::size_t most = call.word(1) > 30'000 ? 29'000 : call.word(1);
            const std::string part = message.mid(qsizetype(sent), qsizetype(most)).toStdString();
            sent += part.size();
            connection.send(call.reply(Vxi11Peer::readReply(
                0, sent == std::size_t(message.size()) ? Vxi11Peer::ReasonEnd : 0, part)));
            return true;
        }
        return false;
    });
    const ViSession session = open(peer);
    QByteArray received;
    Result last{VI_SUCCESS_MAX_CNT, {}};
    while (last.first == VI_SUCCESS_MAX_CNT) {
        last = read(session, Piece);
        received += last.second;
    }
    QCOMPARE(last.first, VI_SUCCESS);
    QVERIFY(received == message);
    QVERIFY(peer.calls(Vxi11Peer::Read).size() < 12); // of 49 pieces

    // What was read ahead goes with the message that it belongs to.
    QCOMPARE(write(session, "*IDN?"), VI_SUCCESS);
    for (const bool clears : {false, true}) {
        for (int i = 0; i < 4; ++i) {
            QCOMPARE(read(session, Piece).first, VI_SUCCESS_MAX_CNT);
        }
        QCOMPARE(clears ? viClear(session) : write(session, "*IDN?"), VI_SUCCESS);
        QCOMPARE(read(session, 3), Result(VI_SUCCESS_MAX_CNT, message.left(3)));
        QCOMPARE(write(session, "*IDN?"), VI_SUCCESS);
    }
    for (int i = 0; i < 19; ++i) {
        QCOMPARE(read(session, Piece).first, VI_SUCCESS_MAX_CNT);
    }
    // A terminator set meanwhile ends the read of what is here already.
    QCOMPARE(viSetAttribute(session, VI_ATTR_TERMCHAR_EN, VI_TRUE), VI_SUCCESS);
    QCOMPARE(read(session, 10'000),
             Result(VI_SUCCESS_TERM_CHAR, message.mid(19 * Piece, 40'001 - 19 * Piece)));
}

void TestVisaVxi11::writes()
{
    // Takes 100 bytes of the second call only, and refuses the tenth and all behind it.
    int writeCount = 0;
    Vxi11Peer peer([&](PeerConnection &connection, const PeerCall &call) {
        if (call.procedure != Vxi11Peer::Write) {
            return false;
        }
        ++writeCount;
        const std::uint32_t error = writeCount < 10 ? 0 : 15;
        const std::uint32_t taken = writeCount == 2 ? 100 : (writeCount == 10 ? 5 : call.word(4));
        connection.send(call.reply(bigEndian({error, taken})));
        return true;
    });
    peer.maxReceiveSize = 1000;
    const ViSession session = open(peer);
    QByteArray data;
    for (int i = 0; i < 2500; ++i) {
        data += char(i);
    }
    ViUInt32 count = 0;
    QCOMPARE(write(session, data, &count), VI_SUCCESS);
    QCOMPARE(count, 2500U);

    std::string received;
    QList<std::uint32_t> flags;
    for (const PeerCall &call : peer.calls(Vxi11Peer::Write)) {
        received += call.data(4).substr(0, flags.size() == 1 ? 100 : std::string::npos);
        flags << call.word(3);
    }
    QCOMPARE(QByteArray::fromStdString(received), data);
    // 1000, 100 of 1000, 1000, the last 400 with END.
    QCOMPARE(flags, (QList<std::uint32_t>{0, 0, 0, 8}));

    QCOMPARE(viSetAttribute(session, VI_ATTR_SEND_END_EN, VI_FALSE), VI_SUCCESS);
    QCOMPARE(write(session, "no end"), VI_SUCCESS);
    QCOMPARE(peer.calls(Vxi11Peer::Write).back().word(3), 0U);
    QCOMPARE(write(session, ""), VI_SUCCESS);
    QCOMPARE(peer.calls(Vxi11Peer::Write).size(), std::size_t{5});

    QCOMPARE(write(session, data, &count), VI_SUCCESS);
    QCOMPARE(write(session, QByteArray(2500, 'x'), &count), VI_ERROR_TMO);
    QCOMPARE(count, 1005U); // the ninth and five bytes of the tenth
}

void TestVisaVxi11::deviceErrors()
{

    forRows({{"invalid link", 4U, VI_ERROR_CONN_LOST},
             {"time-out", 15U, VI_ERROR_TMO},
             {"unknown", 0xFFFF'FFFFU, VI_ERROR_IO}},
            [this](std::uint32_t error, ViStatus status) {
                const Vxi11Peer peer([&](PeerConnection &connection, const PeerCall &call) {
                    if (call.procedure != Vxi11Peer::Clear && call.procedure != Vxi11Peer::Write) {
                        return false;
                    }
                    connection.send(call.reply(bigEndian({error, 0})));
                    return true;
                });
                const ViSession session = open(peer);
                QCOMPARE(viClear(session), status);
                QCOMPARE(write(session, "*CLS"), status);
            });
}

void TestVisaVxi11::brokenReplies()
{
    const char *accepted = "%T 00000001 00000000 00000000 00000000 00000000 ";
    forRows(
        {{"closed at once", "", VI_ERROR_CONN_LOST},
         {"closed in the record", "80000040 %T 00000001", VI_ERROR_CONN_LOST},
         {"closed between fragments", "00000004 %T", VI_ERROR_CONN_LOST},
         {"2 GiB announced", "ffffffff %T 00000001", VI_ERROR_IO},
         {"2 GiB in a second fragment", "00000004 %T 7fffffff", VI_ERROR_IO},
         {"no such procedure", "80000018 %T 00000001 00000000 00000000 00000000 00000003",
          VI_ERROR_NSUP_OPER},
         {"data cut",
          QByteArray("80000028 ").append(accepted).append("00000000 00000004 00000008 61626364"),
          VI_ERROR_IO},
         {"data of 4 GiB",
          QByteArray("80000028 ").append(accepted).append("00000000 00000004 ffffffff 61626364"),
          VI_ERROR_IO},
         {"data of 16 MiB",
          QByteArray("80000028 ").append(accepted).append("00000000 00000004 01000000 61626364"),
          VI_ERROR_IO}},
        [this](QByteArray bytes, ViStatus status) {
            const Vxi11Peer peer([&](PeerConnection &connection, const PeerCall &call) {
                if (call.procedure != Vxi11Peer::Read) {
                    return false;
                }
                const QByteArray transaction =
                    QByteArray::fromStdString(bigEndian({call.transaction}));
                const QByteArray hex = QByteArray(bytes).replace("%T", transaction.toHex());
                connection.send(QByteArray::fromHex(hex).toStdString());
                connection.shutDown();
                return true;
            });
            const ViSession session = open(peer);
            QElapsedTimer timer;
            timer.start();
            QCOMPARE(read(session, 100), Result(status, QByteArray()));
            QVERIFY2(timer.elapsed() < 4000, "the call waited for more than the peer could send");
            QCOMPARE(read(session, 100), Result(VI_ERROR_CONN_LOST, QByteArray()));
            QCOMPARE(viClear(session), VI_ERROR_CONN_LOST);
            QCOMPARE(viClose(session), VI_SUCCESS);
        });
}

void TestVisaVxi11::stalledReplies()
{

    forRows({{"silent", QByteArray()},
             {"stops in the record", QByteArray::fromHex("8000004000")},
             {"empty fragments", QByteArray(4000, '\0')}},
            [this](QByteArray bytes) {
                const Vxi11Peer peer([&](PeerConnection &connection, const PeerCall &call) {
                    if (call.procedure == Vxi11Peer::CreateLink || call.program != 0x0607AF) {
                        return false;
                    }
                    connection.send(bytes.toStdString());
                    return true;
                });
                const ViSession session = open(peer, 300);
                QElapsedTimer timer;
                timer.start();
                QCOMPARE(read(session, 100), Result(VI_ERROR_TMO, QByteArray()));
                QVERIFY2(timer.elapsed() >= 290, "the call gave up too soon");
                QVERIFY2(timer.elapsed() < 300 + SlackMs, "the call took too long");
                // The instrument is told that nobody waits any more.
                QVERIFY(peer.waitForCalls(Vxi11Peer::Abort, 1));
                QCOMPARE(peer.calls(Vxi11Peer::Abort).front().word(0), Vxi11Peer::Link);
                QCOMPARE(peer.calls(Vxi11Peer::Abort).front().program, 0x0607B0U);
                timer.restart();
                QCOMPARE(viClose(session), VI_SUCCESS);
                QVERIFY2(timer.elapsed() < 1000 + SlackMs, "closing took too long");
            });
}

void TestVisaVxi11::trickledReply()
{
    // Bytes come all the time, but the reply never gets complete: the time-out is for the whole.
    const Vxi11Peer peer([&](PeerConnection &connection, const PeerCall &call) {
        if (call.procedure != Vxi11Peer::Read) {
            return false;
        }
        connection.send(bigEndian({0x800F'0000U}));
        while (connection.send("x")) {
            std::this_thread::yield();
        }
        return true;
    });
    const ViSession session = open(peer, 300);
    QElapsedTimer timer;
    timer.start();
    const Result result = read(session, 100);
    QVERIFY(result.first == VI_ERROR_TMO || result.first == VI_ERROR_IO);
    QVERIFY2(timer.elapsed() < 300 + SlackMs, "the call took too long");
}

void TestVisaVxi11::lateReplyIsDropped()
{
    // The first read is answered only when the second comes, in two fragments, with its answer.
    std::string late;
    const Vxi11Peer peer([&](PeerConnection &connection, const PeerCall &call) {
        if (call.procedure != Vxi11Peer::Read) {
            return false;
        }
        const std::string reply = call.reply(Vxi11Peer::readReply(0, 4, late.empty() ? "1" : "2"));
        if (late.empty()) {
            late = fragment(reply.substr(4, 10), false) + fragment(reply.substr(14), true);
            connection.send(late.substr(0, 9)); // the reader stops in the middle of a record
            late.erase(0, 9);
        } else {
            connection.send(late + reply);
        }
        return true;
    });
    const ViSession session = open(peer, 200);
    QCOMPARE(read(session, 100), Result(VI_ERROR_TMO, QByteArray()));
    QCOMPARE(viSetAttribute(session, VI_ATTR_TMO_VALUE, 5000), VI_SUCCESS);
    QCOMPARE(read(session, 100), Result(VI_SUCCESS, "2"));
}

void TestVisaVxi11::clearAndRemote()
{
    const Vxi11Peer peer;
    const ViSession session = open(peer);
    QCOMPARE(viClear(session), VI_SUCCESS);
    QCOMPARE(peer.calls(Vxi11Peer::Clear).size(), std::size_t{1});
    QCOMPARE(peer.calls(Vxi11Peer::Clear)[0].word(0), Vxi11Peer::Link);
    QCOMPARE(viGpibControlREN(session, VI_GPIB_REN_DEASSERT_GTL), VI_SUCCESS);
    QCOMPARE(peer.calls(Vxi11Peer::Local).size(), std::size_t{1});
    QCOMPARE(viGpibControlREN(session, VI_GPIB_REN_ASSERT_ADDRESS_LLO), VI_SUCCESS);
    QCOMPARE(peer.calls(Vxi11Peer::Remote).size(), std::size_t{1});
    QCOMPARE(viGpibControlREN(session, 7), VI_ERROR_INV_MODE);
    QCOMPARE(viClose(session), VI_SUCCESS);
    QCOMPARE(peer.calls(Vxi11Peer::DestroyLink).size(), std::size_t{1});
    QCOMPARE(viClear(session), VI_ERROR_INV_OBJECT);
}

void TestVisaVxi11::printing()
{
    const Vxi11Peer peer;
    const ViSession session = open(peer);
    QCOMPARE(viPrintf(session, ":SYST:ERR?"), VI_SUCCESS);
    QCOMPARE(viPrintf(session, "LEV 5%%\\nFREQ?"), VI_SUCCESS);
    QCOMPARE(viPrintf(session, "LEV %d", 5), VI_ERROR_INV_FMT);
    QByteArrayList messages;
    for (const PeerCall &call : peer.calls(Vxi11Peer::Write)) {
        QCOMPARE(call.word(3), 8U);
        messages << QByteArray::fromStdString(call.data(4));
    }
    QCOMPARE(messages, (QByteArrayList{":SYST:ERR?", "LEV 5%\n", "FREQ?"}));
}

QTEST_APPLESS_MAIN(TestVisaVxi11)
#include "tst_visa_vxi11.moc"
