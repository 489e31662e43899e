// SPDX-License-Identifier: Apache-2.0
#include "simulator/SimulatorProcess.h"
#include "simulator/Vxi11Client.h"
#include "support/rows.h"
#include "support/seed.h"

#include <QCoreApplication>
#include <QFile>
#include <QProcess>
#include <QStandardPaths>
#include <QTest>
#include <QUdpSocket>

#include <csignal>

// An instrument on an address of its own with the well-known ports 111 and 5025.
class TestSimulatorAddress : public QObject
{
    Q_OBJECT

private slots:
    void initTestCase();
    void portMapper();
    void portMapperOverUdp();
    void rawSocket();
    void rawFiles();
    void lxiTools();
    void portInUse();
    void closedPorts();
    void temporaryFolderGoes();

private:
    [[nodiscard]] static QString address(int last)
    {
        // Tests of several builds may run on one machine at once.
        const qint64 id = QCoreApplication::applicationPid();
        return QString("127.%1.%2.%3").arg(100 + id / 250 % 100).arg(id % 250).arg(last);
    }
    [[nodiscard]] static quint16 mappedPort(const QByteArray &reply)
    {
        return reply.size() >= 4 ? static_cast<quint16>(static_cast<quint8>(reply[2]) << 8 |
                                                        static_cast<quint8>(reply[3]))
                                 : 0;
    }
    [[nodiscard]] bool openRaw(QTcpSocket &socket) const;
    [[nodiscard]] static QByteArray askRaw(QTcpSocket &socket, const QByteArray &command);

    SimulatorProcess m_program;
    QString m_address;
};

namespace {

constexpr quint16 MapperPort = 111;
constexpr quint16 RawPort = 5025;
constexpr quint32 MapperProgram = 100000;
constexpr quint32 GetPort = 3;
constexpr quint32 Tcp = 6;
constexpr quint32 Udp = 17;

QByteArray getPortArguments(quint32 program, quint32 version, quint32 protocol)
{
    return words({program, version, protocol, 0});
}

} // namespace

void TestSimulatorAddress::initTestCase()
{
    m_address = address(1);
    if (!m_program.start({"--address", m_address, "--root", m_program.root()})) {
        if (m_program.errorOutput().contains("Permission denied")) {
            QSKIP("the ports 111 and 5025 may not be opened by this user, so an instrument on an "
                  "address of its own cannot be tried");
        }
        QFAIL(qPrintable(m_program.errorOutput()));
    }
    QCOMPARE(m_program.ready(), QStringList(m_address));
}

void TestSimulatorAddress::portMapper()
{
    constexpr quint32 Core = DEVICE_CORE;
    forRows({{"core", Core, 1, Tcp, true},
             {"abort", DEVICE_ASYNC, 1, Tcp, true},
             {"core over UDP", Core, 1, Udp, false},
             {"core version 2", Core, 2, Tcp, false},
             {"itself", MapperProgram, 2, Tcp, true}},
            [this](quint32 program, quint32 version, quint32 protocol, bool isKnown) {
                Vxi11Client mapper;
                QVERIFY(mapper.open(MapperPort, m_address));
                const auto reply = mapper.call(MapperProgram, GetPort,
                                               getPortArguments(program, version, protocol), 2);
                QVERIFY(reply);
                QCOMPARE(mappedPort(*reply) != 0, isKnown);
                if (isKnown) {
                    Vxi11Client client;
                    QVERIFY(client.open(mappedPort(*reply), m_address));
                    QVERIFY(client.call(program, 0, {}, version)); // the null procedure
                }
                if (program == Core && isKnown) {
                    Vxi11Client client;
                    QVERIFY(client.open(mappedPort(*reply), m_address));
                    QCOMPARE(client.link("gpib0,1"), 3U);
                    QCOMPARE(client.link("inst0"), 0U);
                    QCOMPARE(client.ask("*IDN?"), "Halvorn,TGX-870,TGX870/100001/01,1.0\n");
                }
            });
}

void TestSimulatorAddress::portMapperOverUdp()
{
    const QByteArray call = words({5, 0, 2, MapperProgram, 2, GetPort, 0, 0, 0, 0});
    const QByteArray arguments = getPortArguments(DEVICE_CORE, 1, Tcp);
    QUdpSocket socket;
    QVERIFY(socket.bind(QHostAddress(m_address), 0));
    const QHostAddress host(m_address);
    socket.writeDatagram("nonsense", host, MapperPort); // unanswered
    socket.writeDatagram(call + arguments, host, MapperPort);
    while (!socket.hasPendingDatagrams()) {
        QVERIFY(socket.waitForReadyRead(10000));
    }
    QByteArray reply(100, '\0');
    reply.truncate(socket.readDatagram(reply.data(), reply.size()));
    QCOMPARE(reply.size(), 28);
    Vxi11Client mapper;
    QVERIFY(mapper.open(MapperPort, m_address));
    QCOMPARE(mapper.call(MapperProgram, GetPort, arguments, 2).value_or(QByteArray()),
             reply.mid(24));
}

bool TestSimulatorAddress::openRaw(QTcpSocket &socket) const
{
    socket.connectToHost(m_address, RawPort);
    return socket.waitForConnected(10000);
}

QByteArray TestSimulatorAddress::askRaw(QTcpSocket &socket, const QByteArray &command)
{
    socket.write(command + '\n');
    while (!socket.canReadLine()) {
        if (!socket.waitForReadyRead(10000)) {
            return {};
        }
    }
    return socket.readLine();
}

void TestSimulatorAddress::rawSocket()
{
    QTcpSocket socket;
    QVERIFY(openRaw(socket));
    // A line in two pieces.
    socket.write("*RST;*CLS\r\n*ID");
    QVERIFY(socket.waitForBytesWritten());
    QVERIFY(!socket.waitForReadyRead(20));
    socket.write("N?\n");
    // Answers to several lines come in their order; none is lost for being late.
    socket.write("*OPC?\nFOO\nSYST:ERR?\n");
    QByteArray answers;
    while (answers.count('\n') < 3) {
        QVERIFY(socket.bytesAvailable() > 0 || socket.waitForReadyRead(10000));
        answers += socket.readAll();
    }
    QCOMPARE(answers, "Halvorn,TGX-870,TGX870/100001/01,1.0\n1\n-113,\"Undefined header\"\n");
}

void TestSimulatorAddress::rawFiles()
{
    const QByteArray content = randomBytes(500'000);
    QTcpSocket socket;
    QVERIFY(openRaw(socket));
    QCOMPARE(askRaw(socket, "MMEM:DATA '/var/user/raw.wv',#6500000" + content + ";*OPC?"), "1\n");
    QFile file(m_program.root() + "/var/user/raw.wv");
    QVERIFY(file.open(QIODevice::ReadOnly));
    QVERIFY(file.readAll() == content);
    socket.write("MMEM:DATA? '/var/user/raw.wv'\n");
    const QByteArray expected = "#6500000" + content + '\n';
    QByteArray answer;
    while (answer.size() < expected.size()) {
        QVERIFY(socket.bytesAvailable() > 0 || socket.waitForReadyRead(10000));
        answer += socket.readAll();
    }
    QVERIFY(answer == expected);
    QCOMPARE(askRaw(socket, "SYST:ERR?"), "0,\"No error\"\n");
}

// A controller that nobody of this project wrote: identification, a file both ways, a catalog.
void TestSimulatorAddress::lxiTools()
{
    const QString program = QStandardPaths::findExecutable("lxi");
    if (program.isEmpty()) {
        QSKIP("the program lxi of lxi-tools is not installed");
    }
    bool isRaw = false;
    const auto lxi = [&](const QString &command) {
        QStringList arguments{"scpi", "-a", m_address, command};
        if (isRaw) {
            arguments = {"scpi", "-r", "-a", m_address, "-p", QString::number(RawPort), command};
        }
        QProcess process;
        process.start(program, arguments);
        process.waitForFinished(20000);
        return QString::fromLatin1(process.readAllStandardOutput()).trimmed();
    };
    for (const bool raw : {false, true}) {
        isRaw = raw;
        QCOMPARE(lxi("*IDN?"), "Halvorn,TGX-870,TGX870/100001/01,1.0");
        QCOMPARE(lxi("MMEM:DATA '/var/user/lxi.txt',#15Hallo"), "");
        QFile file(m_program.root() + "/var/user/lxi.txt");
        QTRY_COMPARE(file.size(), 5);
        QVERIFY(lxi("MMEM:CAT? '/var/user/'").contains(",\"lxi.txt,ASC,5\""));
        QCOMPARE(lxi("MMEM:DATA? '/var/user/lxi.txt'"), "#15Hallo");
        QCOMPARE(lxi("MMEM:DEL '/var/user/lxi.txt';*OPC?"), "1");
        QVERIFY(!file.exists());
        QCOMPARE(lxi("SYST:ERR?"), "0,\"No error\"");
    }
}

void TestSimulatorAddress::portInUse()
{
    SimulatorProcess second;
    QVERIFY(!second.start({"--address", m_address}));
    QCOMPARE(second.exitCode(), 1);
    QVERIFY2(second.errorOutput().contains("the RPC port mapper, " + m_address + ":111: "),
             qPrintable(second.errorOutput()));
}

void TestSimulatorAddress::closedPorts()
{
    SimulatorProcess program;
    const QString other = address(2);
    QVERIFY(program.start({"--address", other, "--fault", "no-portmapper"}));
    QTcpSocket socket;
    socket.connectToHost(other, MapperPort);
    QVERIFY(!socket.waitForConnected(5000));
    socket.connectToHost(other, RawPort);
    QVERIFY(socket.waitForConnected(5000));
    QVERIFY(askRaw(socket, "*IDN?").startsWith("Halvorn,"));
}

void TestSimulatorAddress::temporaryFolderGoes()
{
    const QStringList names{"corvane-simulator-*"};
    QTemporaryDir folder;
    qputenv("TMPDIR", folder.path().toLocal8Bit());
    SimulatorProcess program;
    QVERIFY(program.start({"--address", address(3)}));
    qunsetenv("TMPDIR");
    QCOMPARE(QDir(folder.path()).entryList(names, QDir::Dirs).size(), 1);
    QCOMPARE(program.stop(SIGINT), 0);
    QCOMPARE(QDir(folder.path()).entryList(names, QDir::Dirs).size(), 0);
}

QTEST_GUILESS_MAIN(TestSimulatorAddress)
#include "tst_simulatoraddress.moc"
