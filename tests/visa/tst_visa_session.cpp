// SPDX-License-Identifier: Apache-2.0
#include "VisaFixture.h"
#include "Vxi11Peer.h"
#include "support/files.h"
#include "support/rows.h"

#include <QDir>
#include <QElapsedTimer>
#include <QTest>

#include <mutex>
#include <thread>

/// Opening, finding and closing instruments, their attributes, and several at a time.
class TestVisaSession : public QObject, protected VisaFixture
{
    Q_OBJECT

private slots:
    void cleanup() { closeManager(); }
    void badOpens();
    void portMapper();
    void gatewayAndFindList();
    void attributes();
    void closeWakesReader();
    void sessionsSideBySide();
    void nothingIsLeftBehind();
    void wrongHandles();
    void configurationFault();
};

void TestVisaSession::badOpens()
{

    forRows({{"no such device", bigEndian({3, 0, 0, 0}), VI_ERROR_RSRC_NFOUND},
             {"locked", bigEndian({11, 0, 0, 0}), VI_ERROR_RSRC_LOCKED},
             {"cut", bigEndian({0, 7}), VI_ERROR_IO},
             {"silent", "", VI_ERROR_TMO}},
            [this](std::string results, ViStatus status) {
                const Vxi11Peer peer([&](PeerConnection &connection, const PeerCall &call) {
                    if (!results.empty()) {
                        connection.send(call.reply(results));
                    }
                    return true;
                });
                configure(
                    "[general]\nopen_timeout_ms = 400\n[TCPIP0::127.0.0.1::inst0::INSTR]\nport = " +
                    QByteArray::number(peer.port()));
                ViSession session = 1;
                QElapsedTimer timer;
                timer.start();
                QCOMPARE(viOpen(m_manager, "TCPIP0::127.0.0.1", 0, 0, &session), status);
                QVERIFY2(timer.elapsed() < 400 + SlackMs, "opening took too long");
                QCOMPARE(session, ViSession{VI_NULL});
            });
}

void TestVisaSession::portMapper()
{
    // The well-known port needs rights that not every tester has.
    std::string answer;
    std::mutex mutex;
    const Vxi11Peer device;
    const ScriptedPeer mapper(
        [&](PeerConnection &connection) {
            const std::string call = connection.receive(4 + 40 + 16);
            const std::lock_guard lock(mutex);
            // Program, version, TCP.
            if (call.substr(44, 12) != bigEndian({0x0607AF, 1, 6})) {
                return;
            }
            connection.send(bigEndian({0x8000'001CU}) + call.substr(4, 4) +
                            bigEndian({1, 0, 0, 0, 0}) + answer);
            connection.waitForClose();
        },
        "127.0.0.9", 111);
    if (mapper.port() == 0) {
        QSKIP("port 111 cannot be opened by this user");
    }
    configure("");
    ViSession session = VI_NULL;
    const auto open = [&](std::uint32_t port) {
        {
            const std::lock_guard lock(mutex);
            answer = bigEndian({port});
        }
        return viOpen(m_manager, "TCPIP::127.0.0.9::INSTR", 0, 1000, &session);
    };
    QCOMPARE(open(0), VI_ERROR_RSRC_NFOUND);
    QCOMPARE(open(70000), VI_ERROR_IO);
    // The device listens on 127.0.0.1 only, so its port is known here but refuses.
    QCOMPARE(open(device.port()), VI_ERROR_RSRC_NFOUND);
    QCOMPARE(device.connectionCount(), 0);
}

void TestVisaSession::gatewayAndFindList()
{
    const Vxi11Peer peer;
    configure("[GPIB0]\nhost = 127.0.0.1\nport = " + QByteArray::number(peer.port()) +
              "\naddresses = 28, 5\n[TCPIP::127.0.0.1::inst0]\n[TCPIP::127.0.0.1::5025::SOCKET]\n");
    const auto find = [&](const char *expression) {
        QByteArrayList found;
        ViFindList list = VI_NULL;
        ViUInt32 count = 0;
        char text[VI_FIND_BUFLEN] = "";
        ViStatus status = viFindRsrc(m_manager, expression, &list, &count, text);
        for (; status == VI_SUCCESS; status = viFindNext(list, text)) {
            found << text;
        }
        if (status != VI_ERROR_RSRC_NFOUND || found.size() != qsizetype(count)) {
            found << "status or count wrong";
        }
        return found;
    };
    QCOMPARE(find("GPIB?*INSTR"), (QByteArrayList{"GPIB0::5::INSTR", "GPIB0::28::INSTR"}));
    QCOMPARE(find("TCPIP?*INSTR"), (QByteArrayList{"TCPIP0::127.0.0.1::inst0::INSTR"}));
    QCOMPARE(find("?*SOCKET"), (QByteArrayList{"TCPIP0::127.0.0.1::5025::SOCKET"}));
    QCOMPARE(find("USB[0-9]::0x7FE3::?*INSTR"), QByteArrayList());
    char text[VI_FIND_BUFLEN] = "";
    QCOMPARE(viFindRsrc(m_manager, "GPIB(", nullptr, nullptr, text), VI_ERROR_INV_EXPR);
    QCOMPARE(viFindRsrc(m_manager, "?*", nullptr, nullptr, text), VI_SUCCESS);

    ViSession session = VI_NULL;
    QCOMPARE(viOpen(m_manager, "GPIB0::28::INSTR", 0, 0, &session), VI_SUCCESS);
    ViUInt16 number = 0;
    QCOMPARE(viGetAttribute(session, VI_ATTR_INTF_TYPE, &number), VI_SUCCESS);
    QCOMPARE(int{number}, VI_INTF_GPIB);
    QCOMPARE(viGetAttribute(session, VI_ATTR_GPIB_PRIMARY_ADDR, &number), VI_SUCCESS);
    QCOMPARE(int{number}, 28);
    QCOMPARE(viOpen(m_manager, "GPIB0::7::96", 0, 0, &session), VI_SUCCESS);
    const auto links = peer.calls(Vxi11Peer::CreateLink);
    QCOMPARE(links[0].data(3), std::string("gpib0,28"));
    QCOMPARE(links[1].data(3), std::string("gpib0,7,96"));
    QCOMPARE(viOpen(m_manager, "GPIB1::28::INSTR", 0, 0, &session), VI_ERROR_INTF_NUM_NCONFIG);
}

void TestVisaSession::attributes()
{
    const Vxi11Peer peer;
    configure("[TCPIP0::127.0.0.1::inst0::INSTR]\nport = " + QByteArray::number(peer.port()));
    ViSession session = VI_NULL;
    QCOMPARE(viOpen(m_manager, "tcpip::127.0.0.1", 0, 0, &session), VI_SUCCESS);

    const auto number = [&](ViAttr attribute, auto start) {
        return viGetAttribute(session, attribute, &start) == VI_SUCCESS ? int(start) : -1;
    };
    // The values at start.
    QCOMPARE(number(VI_ATTR_TMO_VALUE, ViUInt32{9}), 2000);
    QCOMPARE(number(VI_ATTR_SEND_END_EN, ViUInt16{9}), 1);
    QCOMPARE(number(VI_ATTR_TERMCHAR, ViUInt8{9}), 10);
    QCOMPARE(number(VI_ATTR_WR_BUF_OPER_MODE, ViUInt16{9}), VI_FLUSH_WHEN_FULL);
    char text[VI_FIND_BUFLEN] = "";
    QCOMPARE(viGetAttribute(session, VI_ATTR_RSRC_NAME, text), VI_SUCCESS);
    QCOMPARE(text, "TCPIP0::127.0.0.1::inst0::INSTR");

    // The set-up of a session by the workbench, in its order.
    QCOMPARE(viClear(session), VI_SUCCESS);
    QCOMPARE(viSetAttribute(session, VI_ATTR_TMO_VALUE, 5000), VI_SUCCESS);
    QCOMPARE(viSetBuf(session, VI_WRITE_BUF, 2048), VI_SUCCESS);
    QCOMPARE(viSetBuf(session, VI_READ_BUF, 4096), VI_SUCCESS);
    QCOMPARE(viSetAttribute(session, VI_ATTR_WR_BUF_OPER_MODE, 1), VI_SUCCESS);
    QCOMPARE(viSetAttribute(session, VI_ATTR_RD_BUF_OPER_MODE, 1), VI_SUCCESS);
    QCOMPARE(number(VI_ATTR_TMO_VALUE, ViUInt32{9}), 5000);
    QCOMPARE(number(VI_ATTR_WR_BUF_OPER_MODE, ViUInt16{9}), 1);

    QCOMPARE(viSetAttribute(session, VI_ATTR_SEND_END_EN, 2), VI_ERROR_NSUP_ATTR_STATE);
    QCOMPARE(viSetAttribute(session, VI_ATTR_INTF_TYPE, 1), VI_ERROR_ATTR_READONLY);
    QCOMPARE(viSetAttribute(session, 0x3FFF0000U, 1), VI_ERROR_NSUP_ATTR);
    QCOMPARE(viSetBuf(session, 4, 100), VI_ERROR_INV_MASK);
}

void TestVisaSession::closeWakesReader()
{
    const Vxi11Peer peer([](PeerConnection &, const PeerCall &call) {
        return call.procedure == Vxi11Peer::Read; // never answers
    });
    const ViSession session = open(peer, VI_TMO_INFINITE);
    Result result;
    std::thread reader([&] { result = read(session, 100); });
    QVERIFY(peer.waitForCalls(Vxi11Peer::Read, 1));
    QElapsedTimer timer;
    timer.start();
    QCOMPARE(viClose(session), VI_SUCCESS);
    QVERIFY2(timer.elapsed() < 1000 + SlackMs, "closing waited for the reader");
    reader.join();
    QCOMPARE(result, Result(VI_ERROR_ABORT, QByteArray()));
}

void TestVisaSession::sessionsSideBySide()
{
    // One stalls; the other goes on meanwhile, in a thread of its own.
    const Vxi11Peer peer([](PeerConnection &, const PeerCall &call) {
        return call.procedure == Vxi11Peer::Read && call.word(1) == 13;
    });
    const ViSession stalled = open(peer, VI_TMO_INFINITE);
    ViSession other = VI_NULL;
    QCOMPARE(viOpen(m_manager, "TCPIP::127.0.0.1::INSTR", 0, 0, &other), VI_SUCCESS);
    std::thread reader([&] { (void)read(stalled, 13); });
    QVERIFY(peer.waitForCalls(Vxi11Peer::Read, 1));
    for (int i = 0; i < 100; ++i) {
        QCOMPARE(write(other, "*IDN?"), VI_SUCCESS);
        QCOMPARE(read(other, 100).first, VI_SUCCESS);
    }
    // A second call on the stalled session waits for its turn, but not beyond its time-out.
    QCOMPARE(viSetAttribute(stalled, VI_ATTR_TMO_VALUE, 100), VI_SUCCESS);
    QCOMPARE(write(stalled, "*IDN?"), VI_ERROR_TMO);
    QCOMPARE(viClose(stalled), VI_SUCCESS);
    reader.join();
}

void TestVisaSession::nothingIsLeftBehind()
{
    const auto descriptorCount = [] {
        return QDir("/proc/self/fd")
            .entryList(QDir::NoDotAndDotDot | QDir::AllEntries | QDir::System)
            .size();
    };
    const Vxi11Peer peer;
    ViSession session = open(peer);
    QCOMPARE(viClose(session), VI_SUCCESS);
    // The peer keeps its own end of each connection.
    const auto before = descriptorCount() - peer.connectionCount();
    for (int i = 0; i < 20; ++i) {
        QCOMPARE(viOpen(m_manager, "TCPIP::127.0.0.1", 0, 0, &session), VI_SUCCESS);
        QCOMPARE(viClose(session), VI_SUCCESS);
    }
    QCOMPARE(peer.connectionCount(), 21);
    QCOMPARE(descriptorCount() - peer.connectionCount(), before);
    QCOMPARE(peer.calls(Vxi11Peer::DestroyLink).size(), std::size_t{21});
}

void TestVisaSession::wrongHandles()
{
    const Vxi11Peer peer;
    const ViSession session = open(peer);
    char text[VI_FIND_BUFLEN] = "";
    QCOMPARE(viClear(m_manager), VI_ERROR_NSUP_OPER);
    QCOMPARE(viFindNext(session, text), VI_ERROR_INV_OBJECT);
    QCOMPARE(viClose(session + 100), VI_ERROR_INV_OBJECT);
    QCOMPARE(viRead(session, nullptr, 5, nullptr), VI_ERROR_USER_BUF);
    // The manager takes its sessions with it.
    QCOMPARE(viClose(m_manager), VI_SUCCESS);
    m_manager = VI_NULL;
    QCOMPARE(viClear(session), VI_ERROR_INV_OBJECT);
    QCOMPARE(peer.calls(Vxi11Peer::DestroyLink).size(), std::size_t{1});
}

void TestVisaSession::configurationFault()
{
    const QString name = m_folder.filePath("broken.ini");
    QVERIFY(store(name, "[GPIB0]\nhost = a\nport = none\n"));
    qputenv("CORVANE_VISA_CONFIG", name.toUtf8());
    ViSession manager = 1;
    QCOMPARE(viOpenDefaultRM(&manager), VI_ERROR_INV_SETUP);
    QCOMPARE(manager, ViSession{VI_NULL});
    char text[VI_FIND_BUFLEN] = "";
    QCOMPARE(viStatusDesc(manager, VI_ERROR_INV_SETUP, text), VI_SUCCESS);
    QCOMPARE(QByteArray(text), "The configuration file '" + name.toUtf8() +
                                   "' has a fault in line 3: port 'none' is not 1 to 65535.");
    QCOMPARE(viStatusDesc(VI_NULL, VI_ERROR_TMO, text), VI_SUCCESS);
    QCOMPARE(text, "The time-out expired before the operation was completed.");
    QCOMPARE(viStatusDesc(VI_NULL, 0x12345678, text), VI_WARN_UNKNOWN_STATUS);
    QCOMPARE(text, "Unknown status code 0x12345678.");
}

QTEST_APPLESS_MAIN(TestVisaSession)
#include "tst_visa_session.moc"
