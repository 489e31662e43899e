// SPDX-License-Identifier: Apache-2.0
#include "ScriptedPeer.h"
#include "VisaFixture.h"
#include "support/rows.h"

#include <QElapsedTimer>
#include <QTest>

/// SCPI lines over a plain TCP port, through the functions of the library.
class TestVisaSocket : public QObject, protected VisaFixture
{
    Q_OBJECT

private slots:
    void init() { configure(""); }
    void cleanup() { closeManager(); }
    void reads();
    void suppressedEnd();
    void writes();
    void clearConnectsAnew();
    void opening();

private:
    ViSession open(const ScriptedPeer &peer, ViUInt32 timeoutMs = 5000);
};

ViSession TestVisaSocket::open(const ScriptedPeer &peer, ViUInt32 timeoutMs)
{
    ViSession session = VI_NULL;
    const QByteArray name = "TCPIP::127.0.0.1::" + QByteArray::number(peer.port()) + "::SOCKET";
    if (viOpen(m_manager, name.data(), 0, 0, &session) != VI_SUCCESS ||
        viSetAttribute(session, VI_ATTR_TMO_VALUE, timeoutMs) != VI_SUCCESS) {
        qFatal("cannot open %s", name.data());
    }
    return session;
}

void TestVisaSocket::reads()
{

    forRows({{"two lines at once", {"a\nb\n"}, 100, -1, {{VI_SUCCESS, "a\n"}, {VI_SUCCESS, "b\n"}}},
             {"count", {"abcdef\n"}, 4, -1, {{VI_SUCCESS_MAX_CNT, "abcd"}, {VI_SUCCESS, "ef\n"}}},
             {"block",
              {QByteArray("#15\n\n\0\n\n", 8) + "\n2\n"},
              100,
              -1,
              {{VI_SUCCESS, QByteArray("#15\n\n\0\n\n", 8) + "\n"}, {VI_SUCCESS, "2\n"}}},
             {"block in bits",
              {"#14\n\n\n\n\n"},
              2,
              -1,
              {{VI_SUCCESS_MAX_CNT, "#1"},
               {VI_SUCCESS_MAX_CNT, "4\n"},
               {VI_SUCCESS_MAX_CNT, "\n\n"},
               {VI_SUCCESS, "\n\n"}}},
             {"other terminator",
              {"a;b\nc"},
              100,
              ';',
              {{VI_SUCCESS_TERM_CHAR, "a;"}, {VI_SUCCESS, "b\n"}, {VI_ERROR_CONN_LOST, "c"}}},
             {"closed", {"abc"}, 100, -1, {{VI_ERROR_CONN_LOST, "abc"}, {VI_ERROR_CONN_LOST, ""}}}},
            [this](QByteArrayList pieces, ViUInt32 size, int terminator, QList<Result> results) {
                const QByteArray all = pieces.join();
                // Whole, and byte by byte.
                for (const bool isTrickled : {false, true}) {
                    const ScriptedPeer peer([&](PeerConnection &connection) {
                        const std::string bytes = all.toStdString();
                        const std::size_t step = isTrickled ? 1 : bytes.size();
                        for (std::size_t i = 0; i < bytes.size(); i += step) {
                            connection.send(bytes.substr(i, step));
                        }
                    });
                    const ViSession session = open(peer);
                    if (terminator >= 0) {
                        QCOMPARE(viSetAttribute(session, VI_ATTR_TERMCHAR, ViAttrState(terminator)),
                                 VI_SUCCESS);
                        QCOMPARE(viSetAttribute(session, VI_ATTR_TERMCHAR_EN, VI_TRUE), VI_SUCCESS);
                    }
                    for (const Result &expected : results) {
                        const Result actual = read(session, size);
                        QCOMPARE(actual.second, expected.second);
                        QCOMPARE(actual.first, expected.first);
                    }
                    QCOMPARE(viClose(session), VI_SUCCESS);
                }
            });
}

void TestVisaSocket::suppressedEnd()
{
    const ScriptedPeer peer([](PeerConnection &connection) {
        connection.send("a\nb\nc");
        connection.waitForClose();
    });
    const ViSession session = open(peer, 300);
    QCOMPARE(viSetAttribute(session, VI_ATTR_SUPPRESS_END_EN, VI_TRUE), VI_SUCCESS);
    QCOMPARE(read(session, 4), std::pair(VI_SUCCESS_MAX_CNT, QByteArray("a\nb\n")));
    QElapsedTimer timer;
    timer.start();
    QCOMPARE(read(session, 4), std::pair(VI_ERROR_TMO, QByteArray("c")));
    QVERIFY2(timer.elapsed() >= 290 && timer.elapsed() < 1300, "the time-out was not kept");
}

void TestVisaSocket::writes()
{

    forRows({{"line feed added", QByteArrayList{"*IDN?"}, QByteArray("*IDN?\n")},
             {"in parts", QByteArrayList{"*ID", "N?"}, QByteArray("*IDN?\n")},
             {"block in parts", QByteArrayList{":MMEM:DATA 'a',#12", "x\n"},
              QByteArray(":MMEM:DATA 'a',#12x\n\n")}},
            [this](QByteArrayList parts, QByteArray stream) {
                std::string received;
                {
                    const ScriptedPeer peer([&](PeerConnection &connection) {
                        received = connection.receive(std::size_t(stream.size()));
                        connection.send(received.size() == std::size_t(stream.size()) ? "all\n"
                                                                                      : "cut\n");
                        received += connection.receive(1);
                    });
                    const ViSession session = open(peer);
                    for (const QByteArray &part : parts) {
                        const bool isLast = &part == &parts.constLast();
                        QCOMPARE(viSetAttribute(session, VI_ATTR_SEND_END_EN,
                                                isLast ? VI_TRUE : VI_FALSE),
                                 VI_SUCCESS);
                        ViUInt32 count = 0;
                        QCOMPARE(viWrite(session, reinterpret_cast<const ViByte *>(part.data()),
                                         ViUInt32(part.size()), &count),
                                 VI_SUCCESS);
                        QCOMPARE(count, ViUInt32(part.size()));
                    }
                    QCOMPARE(read(session, 100),
                             std::pair(ViStatus{VI_SUCCESS}, QByteArray("all\n")));
                    QCOMPARE(viClose(session), VI_SUCCESS);
                }
                QCOMPARE(QByteArray::fromStdString(received), stream);
            });
}

void TestVisaSocket::clearConnectsAnew()
{
    const ScriptedPeer peer([](PeerConnection &connection) {
        const std::string command = connection.receiveUntil('\n');
        // Announces more than it sends, so that all that follows would be taken for data.
        connection.send(command == "bad?\n" ? "#9999999999half" : "good\n");
        connection.waitForClose();
    });
    const ViSession session = open(peer, 200);
    QCOMPARE(viClear(session), VI_SUCCESS); // a fresh connection needs no other
    QCOMPARE(viPrintf(session, "bad?"), VI_SUCCESS);
    QCOMPARE(read(session, 100), std::pair(VI_ERROR_TMO, QByteArray("#9999999999half")));
    QCOMPARE(viClear(session), VI_SUCCESS);
    QCOMPARE(viPrintf(session, "good?"), VI_SUCCESS);
    QCOMPARE(read(session, 100), std::pair(ViStatus{VI_SUCCESS}, QByteArray("good\n")));
    QCOMPARE(peer.connectionCount(), 2);
}

void TestVisaSocket::opening()
{
    ViSession session = 1;
    const auto open = [&](const char *name, ViUInt32 timeout) {
        return viOpen(m_manager, name, VI_NO_LOCK, timeout, &session);
    };
    // Nothing listens where a peer was a moment ago.
    std::uint16_t port = 0;
    {
        const ScriptedPeer peer([](PeerConnection &) {});
        port = peer.port();
    }
    const QByteArray refused = "TCPIP::127.0.0.1::" + QByteArray::number(port) + "::SOCKET";
    QCOMPARE(open(refused.data(), 0), VI_ERROR_RSRC_NFOUND);
    QCOMPARE(session, ViSession{VI_NULL});
    QCOMPARE(open("TCPIP::no-such-host.invalid::5025::SOCKET", 3000), VI_ERROR_RSRC_NFOUND);
    QCOMPARE(open("TCPIP::127.0.0.1::5025::SOCKETS", 0), VI_ERROR_INV_RSRC_NAME);
    QCOMPARE(viOpen(m_manager, refused.data(), 1, 0, &session), VI_ERROR_INV_ACC_MODE);
    QCOMPARE(viOpen(m_manager + 100, refused.data(), 0, 0, &session), VI_ERROR_INV_OBJECT);

    // A name with several addresses, of which one may refuse.
    const ScriptedPeer peer([](PeerConnection &connection) { connection.waitForClose(); });
    const QByteArray local = "TCPIP::localhost::" + QByteArray::number(peer.port()) + "::SOCKET";
    QCOMPARE(open(local.data(), 0), VI_SUCCESS);
}

QTEST_APPLESS_MAIN(TestVisaSocket)
#include "tst_visa_socket.moc"
