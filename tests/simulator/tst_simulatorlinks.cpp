// SPDX-License-Identifier: Apache-2.0
#include "simulator/SimulatorProcess.h"
#include "simulator/Vxi11Client.h"
#include "support/rows.h"

#include <QDir>
#include <QElapsedTimer>
#include <QFile>
#include <QTest>

#include <csignal>
#include <memory>
#include <vector>

// Links, locks and the RPC server itself: clients that misbehave must hurt nobody but themselves.
class TestSimulatorLinks : public QObject
{
    Q_OBJECT

private slots:
    void initTestCase();
    void linkErrors();
    void linksShareTheInstrument();
    void locks();
    void lockWaits();
    void lockEndsWithConnection();
    void abortEndsRead();
    void unknownCalls();
    void hostileBytes();
    void largeWrite();
    void manyConnections();
    void stalledClient();
    void endsWhileClientsWait();

private:
    [[nodiscard]] bool connectTo(Vxi11Client &client, const QString &device = "gpib0,1");
    [[nodiscard]] int countOf(const char *what) const;

    SimulatorProcess m_program;
    int m_idleThreads = 0; ///< of the program before anybody connects
    int m_idleFiles = 0;
};

namespace {

const QString Config = "[a]\nmodel=TGX-870\ngateway=0\ngpib=1\nroot=%ROOT%/a\n"
                       "[b]\nmodel=TGX-820\ngateway=0\ngpib=2\nroot=%ROOT%/b\n";

} // namespace

void TestSimulatorLinks::initTestCase()
{
    QVERIFY2(m_program.startConfig(Config, 2), qPrintable(m_program.errorOutput()));
    QCOMPARE(m_program.gatewayPort(0), m_program.gatewayPort(1));
    m_idleThreads = countOf("task");
    m_idleFiles = countOf("fd");
}

bool TestSimulatorLinks::connectTo(Vxi11Client &client, const QString &device)
{
    return client.open(m_program.gatewayPort()) && client.link(device) == 0;
}

// Entries of a folder in /proc of the program: "fd" or "task".
int TestSimulatorLinks::countOf(const char *what) const
{
    return static_cast<int>(QDir(QString("/proc/%1/%2").arg(m_program.processId()).arg(what))
                                .entryList(QDir::AllEntries | QDir::System | QDir::NoDotAndDotDot)
                                .size());
}

void TestSimulatorLinks::linkErrors()
{
    Vxi11Client client;
    QVERIFY(client.open(m_program.gatewayPort()));
    for (const char *name : {"gpib0,3", "gpib0", "inst0", "", "gpib0,1,1"}) {
        QCOMPARE(client.link(name), 3U);
    }
    QCOMPARE(client.write("*IDN?"), 4U); // no link yet
    QCOMPARE(client.read(10).error, 4U);
    QCOMPARE(client.linkOnly(destroy_link), 4U);
    QCOMPARE(client.link("GPIB0,1"), 0U);
    QVERIFY(client.maxReceiveSize() >= 1024);
    QVERIFY(client.abortPort() != 0);
    QCOMPARE(client.linkOnly(destroy_link), 0U);
    QCOMPARE(client.write("*IDN?"), 4U);

    // A number that another connection got opens nothing here.
    Vxi11Client other;
    QVERIFY(connectTo(other));
    const auto reply =
        client.call(DEVICE_CORE, device_write, words({other.linkId(), 0, 0, 8, 4}) + "*RST");
    QVERIFY(reply && reply->startsWith(QByteArray("\0\0\0\x04", 4)));
}

void TestSimulatorLinks::linksShareTheInstrument()
{
    Vxi11Client a;
    Vxi11Client b;
    Vxi11Client elsewhere;
    QVERIFY(connectTo(a) && connectTo(b) && connectTo(elsewhere, "gpib0,2"));
    QCOMPARE(a.write("*RST;*CLS;FREQ 123456"), 0U);
    // Each link has an answer of its own waiting.
    QCOMPARE(a.write("*IDN?"), 0U);
    QCOMPARE(b.ask("FREQ?"), "123456\n");
    QVERIFY(a.read(100).data.startsWith("Halvorn,TGX-870,"));
    QVERIFY(elsewhere.ask("*IDN?").startsWith("Halvorn,TGX-820,"));
    QCOMPARE(elsewhere.ask("FREQ?"), "1000000000\n");
    // Half a message of one does not mix with that of the other.
    QCOMPARE(a.write("FRE", 0), 0U);
    QCOMPARE(b.ask("SYST:VERS?"), "1999.0\n");
    QCOMPARE(a.ask("Q?"), "123456\n");
    QCOMPARE(a.ask("SYST:ERR:ALL?"), "0,\"No error\"\n");
}

void TestSimulatorLinks::locks()
{
    Vxi11Client a;
    Vxi11Client b;
    QVERIFY(connectTo(a) && connectTo(b));
    QCOMPARE(a.linkOnly(device_unlock), 12U);
    QCOMPARE(a.lock(), 0U);
    QCOMPARE(a.lock(), 11U);
    QCOMPARE(b.lock(), 11U);
    QCOMPARE(b.write("*IDN?"), 11U);
    QCOMPARE(b.read(10).error, 11U);
    QCOMPARE(b.generic(device_clear), 11U);
    QCOMPARE(b.generic(device_clear, Vxi11Client::WaitLock, 30), 11U);
    QCOMPARE(a.ask("*OPC?"), "1\n");
    Vxi11Client c;
    QVERIFY(c.open(m_program.gatewayPort()));
    QCOMPARE(c.link("gpib0,1", true, 30), 11U);
    QCOMPARE(a.linkOnly(device_unlock), 0U);
    QCOMPARE(c.link("gpib0,1", true, 30), 0U);
    QCOMPARE(b.write("*CLS"), 11U);
    QCOMPARE(c.linkOnly(destroy_link), 0U);
    QCOMPARE(b.ask("*OPC?"), "1\n");
}

void TestSimulatorLinks::lockWaits()
{
    Vxi11Client a;
    Vxi11Client b;
    QVERIFY(connectTo(a) && connectTo(b));
    QCOMPARE(a.lock(), 0U);
    b.sendCall(DEVICE_CORE, device_lock, words({b.linkId(), Vxi11Client::WaitLock, 60000}));
    QVERIFY(!b.socket().waitForReadyRead(50));
    QCOMPARE(a.linkOnly(device_unlock), 0U);
    const auto reply = b.takeReply();
    QVERIFY(reply && *reply == QByteArray(4, '\0'));
    QCOMPARE(b.linkOnly(device_unlock), 0U);
}

void TestSimulatorLinks::lockEndsWithConnection()
{
    auto a = std::make_unique<Vxi11Client>();
    Vxi11Client b;
    QVERIFY(connectTo(*a) && connectTo(b));
    QCOMPARE(a->lock(), 0U);
    a.reset();
    QCOMPARE(b.generic(device_trigger, Vxi11Client::WaitLock, 10000), 0U);
}

void TestSimulatorLinks::abortEndsRead()
{
    Vxi11Client client;
    Vxi11Client abortChannel;
    QVERIFY(connectTo(client));
    QVERIFY(abortChannel.open(client.abortPort()));
    const QByteArray link = words({client.linkId()});
    QElapsedTimer timer;
    timer.start();
    // One that comes while nothing is waited for must not end the next read.
    QVERIFY(abortChannel.call(DEVICE_ASYNC, 1, link));
    QCOMPARE(client.ask("*OPC?"), "1\n");

    client.sendRead(10, 60000);
    while (!client.socket().waitForReadyRead(20)) {
        const auto reply = abortChannel.call(DEVICE_ASYNC, 1, link);
        QVERIFY(reply && *reply == QByteArray(4, '\0'));
    }
    QCOMPARE(client.takeRead().error, 23U);
    QVERIFY(timer.elapsed() < 30000);
    QCOMPARE(client.ask("*OPC?;:SYST:ERR?"), "1;0,\"No error\"\n");

    const auto unknown = abortChannel.call(DEVICE_ASYNC, 1, words({9999}));
    QVERIFY(unknown && unknown->endsWith('\x04'));
}

void TestSimulatorLinks::unknownCalls()
{
    constexpr quint32 Core = DEVICE_CORE;
    const auto call = [&](quint32 program, quint32 version, quint32 procedure) {
        return words({0, 2, program, version, procedure, 0, 0, 0, 0});
    };
    forRows(
        {{"version", call(Core, 7, 10), words({1, 0, 0, 0, 2, 1, 1})},
         {"procedure", call(Core, 1, 99), words({1, 0, 0, 0, 3})},
         {"data length beyond the record", call(Core, 1, 11) + words({1, 0, 0, 8, 0xFFFFFFFFU, 0}),
          words({1, 0, 0, 0, 4})},
         {"RPC version", words({0, 3, Core, 1, 0}), words({1, 1, 0, 2, 2})},
         {"with credentials", words({0, 2, Core, 1, 0, 1, 8, 5, 5, 0, 0}), words({1, 0, 0, 0, 0})},
         {"interrupt channel", call(Core, 1, 25) + words({1, 1, 1, 1, 1}),
          words({1, 0, 0, 0, 0, 8})}},
        [this](QByteArray request, QByteArray reply) {
            const QByteArray record = words({77}) + request;
            QTcpSocket socket;
            socket.connectToHost("127.0.0.1", m_program.gatewayPort());
            QVERIFY(socket.waitForConnected());
            // In two fragments: the mark's bit tells the last one.
            const auto size = static_cast<quint32>(record.size());
            socket.write(words({10}) + record.left(10));
            socket.write(words({0x80000000U | (size - 10)}) + record.mid(10));
            const auto replySize = static_cast<quint32>(reply.size() + 4);
            const QByteArray expected = words({0x80000000U | replySize, 77}) + reply;
            while (socket.bytesAvailable() < expected.size()) {
                QVERIFY(socket.waitForReadyRead());
            }
            QCOMPARE(socket.readAll().toHex(), expected.toHex());
        });
}

// The connection is closed at once, and others are served as before.
void TestSimulatorLinks::hostileBytes()
{

    forRows({{"record of 2 GB", QByteArray("\xFF\xFF\xFF\xFF", 4)},
             {"fragment of 2 GB", QByteArray("\x7F\xFF\xFF\xFF\0\0\0\0", 8)},
             {"empty fragment", QByteArray("\0\0\0\0", 4)},
             {"reply instead of a call", QByteArray("\x80\0\0\x08\0\0\0\x01\0\0\0\x01", 12)},
             {"huge credentials",
              QByteArray("\x80\0\0\x20\0\0\0\1\0\0\0\0\0\0\0\2\0\6\7\xAF\0\0\0\1\0\0\0\0\0\0\0\1"
                         "\xFF\xFF\xFF\xFF",
                         36)},
             {"text", QByteArray("GET / HTTP/1.1\r\n\r\n")}},
            [this](QByteArray bytes) {
                Vxi11Client witness;
                QVERIFY(connectTo(witness));
                QTcpSocket socket;
                socket.connectToHost("127.0.0.1", m_program.gatewayPort());
                QVERIFY(socket.waitForConnected());
                socket.write(bytes);
                QVERIFY(socket.waitForDisconnected(10000));
                QCOMPARE(socket.readAll(), "");
                QCOMPARE(witness.ask("*OPC?"), "1\n");
            });
}

// A piece of the greatest permitted size goes through, one that is larger ends the connection.
void TestSimulatorLinks::largeWrite()
{
    Vxi11Client client;
    QVERIFY(connectTo(client));
    const auto size = static_cast<qsizetype>(client.maxReceiveSize());
    const QByteArray head =
        "MMEM:DATA '/var/user/large',#8" + QByteArray::number(size + 10'000'000);
    QCOMPARE(client.write(head, 0), 0U);
    QCOMPARE(client.write(QByteArray(size, 'x'), 0), 0U);
    QCOMPARE(client.write(QByteArray(size + 10000, 'x'), 0), Vxi11Client::NoReply);
    Vxi11Client next;
    QVERIFY(connectTo(next));
    QTRY_COMPARE(QFile(m_program.root() + "/a/var/user/large").size(), size);
}

// Half of the connections are closed properly, half are just dropped in the middle of a query;
// nothing of them stays behind.
void TestSimulatorLinks::manyConnections()
{
    constexpr int Count = 60;
    for (int round = 0; round < 3; ++round) {
        std::vector<std::unique_ptr<Vxi11Client>> clients;
        for (int i = 0; i < Count; ++i) {
            clients.push_back(std::make_unique<Vxi11Client>());
            QVERIFY(connectTo(*clients.back(), i % 3 == 0 ? "gpib0,2" : "gpib0,1"));
        }
        QVERIFY(countOf("task") >= Count);
        for (const auto &client : clients) {
            QCOMPARE(client->ask("*OPC?"), "1\n");
        }
        for (std::size_t i = 0; i < clients.size(); ++i) {
            if (i % 2 == 0) {
                QCOMPARE(clients[i]->linkOnly(destroy_link), 0U);
            } else {
                clients[i]->sendRead(9, 600000);
            }
        }
    }
    QTRY_COMPARE(countOf("task"), m_idleThreads);
    QTRY_COMPARE(countOf("fd"), m_idleFiles);
}

// A client that sends half a record and falls silent holds up nobody.
void TestSimulatorLinks::stalledClient()
{
    Vxi11Client stalled;
    QVERIFY(connectTo(stalled));
    QCOMPARE(stalled.write("MMEM:DATA '/var/user/stalled',#41000abc", 0), 0U);
    stalled.socket().write(QByteArray("\x80\0\1\0half", 8));
    QVERIFY(stalled.socket().waitForBytesWritten());
    Vxi11Client client;
    QVERIFY(connectTo(client));
    QCOMPARE(client.ask("*OPC?"), "1\n");
}

void TestSimulatorLinks::endsWhileClientsWait()
{

    forRows({{"SIGINT", SIGINT}, {"SIGTERM", SIGTERM}}, [](int signalNumber) {
        SimulatorProcess program;
        QVERIFY(program.startConfig(Config, 2));
        Vxi11Client reading;
        Vxi11Client sending;
        Vxi11Client locked;
        for (Vxi11Client *client : {&reading, &sending, &locked}) {
            QVERIFY(client->open(program.gatewayPort()) && client->link("gpib0,1") == 0);
        }
        QCOMPARE(sending.write("MMEM:DATA '/var/user/x',#41000abc", 0), 0U);
        reading.sendRead(9, 600000);
        QCOMPARE(sending.lock(), 0U);
        locked.sendCall(DEVICE_CORE, device_lock,
                        words({locked.linkId(), Vxi11Client::WaitLock, 600000}));
        QVERIFY(locked.socket().waitForBytesWritten());
        QCOMPARE(program.stop(signalNumber), 0);
        QCOMPARE(program.errorOutput(), "");
    });
}

QTEST_GUILESS_MAIN(TestSimulatorLinks)
#include "tst_simulatorlinks.moc"
