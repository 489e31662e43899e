// SPDX-License-Identifier: Apache-2.0
// The session class, the VISA layer and the simulator together, over real sockets.
#include "LogRecorder.h"

#include "instrument/VisaDevice.h"
#include "simulator/SimulatorProcess.h"
#include "support/files.h"
#include "support/rows.h"
#include "support/seed.h"

#include <QDir>
#include <QFile>
#include <QTest>
#include <QThread>

#include <csignal>

namespace {

const QString unixResource = "GPIB0::28::INSTR";
const QString driveResource = "GPIB0::5::INSTR";

qsizetype entryCount(const QString &folder)
{
    return QDir(folder).entryList(QDir::AllEntries | QDir::System | QDir::NoDotAndDotDot).size();
}

/// Leads the VISA layer to the gateway's port; read when the first device is made.
bool writeVisaConfig(const QString &fileName, quint16 port)
{
    qputenv("CORVANE_VISA_CONFIG", fileName.toLocal8Bit());
    return store(
        fileName,
        QString("[GPIB0]\nhost=127.0.0.1\nport=%1\naddresses=5,28\n").arg(port).toLatin1());
}

} // namespace

class TestSimulatedInstrument : public QObject
{
    Q_OBJECT
private slots:
    void init();
    void cleanup();
    void bothWays();
    void faults_data();
    void faults();
    void brokenConnection_data();
    void brokenConnection();
    void cancelledTransfer_data();
    void cancelledTransfer();
    void twoSessionsAtOnce();
    void leavesNothingBehind();
    void overTheNetwork();

private:
    [[nodiscard]] QString local(const QString &name = "local.wv") const
    {
        return m_folder.filePath(name);
    }
    [[nodiscard]] QString onUnix(const QString &path) const
    {
        return m_simulator->root() + "/a/" + path;
    }
    void setFault(const QString &fault) { (void)m_device->sendCommand(":SYST:FAUL " + fault); }

    QTemporaryDir m_folder;
    std::unique_ptr<SimulatorProcess> m_simulator;
    std::unique_ptr<VisaDevice> m_device;
};

void TestSimulatedInstrument::init()
{
    m_simulator = std::make_unique<SimulatorProcess>();
    QVERIFY2(m_simulator->startConfig("[a]\nmodel=TGX-870\nserial=100001\nroot=%ROOT%/a\n"
                                      "gateway=0\ngpib=28\n"
                                      "[b]\nmodel=TGX-810\nserial=200002\nroot=%ROOT%/b\n"
                                      "gateway=0\ngpib=5\n",
                                      2),
             qPrintable(m_simulator->errorOutput()));
    QVERIFY(writeVisaConfig(local("visa.ini"), m_simulator->gatewayPort()));
    m_device = std::make_unique<VisaDevice>();
    QCOMPARE(m_device->takeLastError(), QString());
    QVERIFY(m_device->openResource(unixResource));
    (void)takeLog();
}

void TestSimulatedInstrument::cleanup()
{
    m_device.reset();
    m_simulator.reset();
}

void TestSimulatedInstrument::bothWays()
{
    for (const int size : {1, 1024, 1025, 32769, 100'000}) {
        const QByteArray data = randomBytes(size);
        QVERIFY(store(local(), data));
        QVERIFY(m_device->writeRemoteFile(local(), "/var/user/x.wv"));
        QCOMPARE(load(onUnix("var/user/x.wv")), data);
        QVERIFY(m_device->readRemoteFile("/var/user/x.wv", local("back.wv")));
        QCOMPARE(load(local("back.wv")), data);
        QCOMPARE(takeLog(), QStringList{});
    }
}

void TestSimulatedInstrument::faults_data()
{
    QTest::addColumn<QString>("fault");
    QTest::addColumn<QString>("operation");
    QTest::addColumn<bool>("done");
    QTest::addColumn<QString>("words"); // of the log, or of the instrument where they begin with -
    QTest::newRow("error after get") << "'error-after-transfer',-250"
                                     << "get" << false << "-250,\"Mass storage error\"\n";
    QTest::newRow("no terminator") << "'no-terminator'"
                                   << "get" << true << "4 No terminating character received.";
    QTest::newRow("short block") << "'short-block',10"
                                 << "get" << false << "4 Reading binary data block failed.";
    QTest::newRow("missing file") << "'slow-answer',0"
                                  << "get gone" << false << "-256,\"File name not found\"\n";
    QTest::newRow("slow answer") << "'slow-answer',2000"
                                 << "query" << false
                                 << "4 ERROR: The time-out expired before the operation was "
                                    "completed.";
    QTest::newRow("empty folder") << "'empty-dir-469'"
                                  << "list" << true << "";
    QTest::newRow("*OPC? is 0") << "'opc-zero'"
                                << "folder" << false << "4 ERROR : R Unexpected Result from *OPC?";
    QTest::newRow("loads too long") << "'busy',60"
                                    << "run" << false << "4 ARB did not get ready in time.";
}

void TestSimulatedInstrument::faults()
{
    QFETCH(const QString, fault);
    QFETCH(const QString, operation);
    QFETCH(const bool, done);
    QFETCH(const QString, words);
    QVERIFY(store(local(), randomBytes(3000, 3)));
    QVERIFY(store(onUnix("var/user/f.wv"), randomBytes(3000, 4)));
    // Long enough on a busy machine, short enough to be waited out.
    QVERIFY(m_device->setTimeoutMs(500));
    setFault(fault);
    QString answer;
    QList<RemoteFileEntry> entries;
    const bool result =
        operation == "put"        ? m_device->writeRemoteFile(local(), "/var/user/p.wv")
        : operation == "get"      ? m_device->readRemoteFile("/var/user/f.wv", local("back.wv"))
        : operation == "get gone" ? m_device->readRemoteFile("/var/user/gone.wv", local())
        : operation == "query"    ? m_device->queryText("*OPT?", answer)
        : operation == "list"     ? m_device->listDirectory(entries, "/var/user/gone")
        : operation == "queue"    ? m_device->checkErrorQueue()
        : operation == "folder"   ? m_device->makeDirectory("/var/user", "d")
                                  : m_device->startArb("/var/user/f.wv", 2);
    QCOMPARE(result, done);
    const QStringList log = takeLog();
    if (words.startsWith('-')) {
        QVERIFY(m_device->takeLastError().startsWith(words));
        QCOMPARE(log.isEmpty(), operation == "get"); // a missing file is waited for
    } else {
        QVERIFY2(words.isEmpty() ? log.isEmpty() : log.contains(words), qPrintable(log.join('\n')));
    }
    QVERIFY(load(local()) == randomBytes(3000, 3));
    // The session is still of use.
    QVERIFY(m_device->setTimeoutMs(5000));
    setFault("'slow-answer',0");
    (void)m_device->sendCommand(":SYST:FAUL:CLE");
    (void)m_device->sendCommand("*RST");
    (void)m_device->sendCommand("*CLS");
    const bool again = m_device->writeRemoteFile(local(), "/var/user/again.wv");
    QVERIFY2(again, qPrintable(takeLog().join("\n") + m_device->takeLastError()));
    QVERIFY(load(onUnix("var/user/again.wv")) == load(local()));
}

void TestSimulatedInstrument::brokenConnection_data()
{
    QTest::addColumn<bool>("writes");
    QTest::addColumn<QString>("words");
    QTest::newRow("get") << false << "4 Reading binary data block failed.";
    QTest::newRow("put") << true << "";
}

void TestSimulatedInstrument::brokenConnection()
{
    QFETCH(const bool, writes);
    QFETCH(const QString, words);
    QVERIFY(store(local(), randomBytes(100'000, 3)));
    QVERIFY(store(onUnix("var/user/f.wv"), randomBytes(100'000, 4)));
    setFault("'drop-after',50000");
    QElapsedTimer timer;
    timer.start();
    QVERIFY(!(writes ? m_device->writeRemoteFile(local(), "/var/user/p.wv")
                     : m_device->readRemoteFile("/var/user/f.wv", local("back.wv"))));
    const QStringList log = takeLog();
    QVERIFY2(words.isEmpty() || log.contains(words), qPrintable(log.join('\n')));
    QVERIFY2(!log.filter("ERROR: ").isEmpty(), qPrintable(log.join('\n')));
    // No call waits for more than its time-out.
    QVERIFY(timer.elapsed() < 30'000);
    QVERIFY(m_device->closeResource());
    QVERIFY(m_device->openResource(unixResource));
    (void)m_device->sendCommand(":SYST:FAUL:CLE");
    QVERIFY(m_device->writeRemoteFile(local(), "/var/user/p.wv"));
    QVERIFY(load(onUnix("var/user/p.wv")) == load(local()));
}

void TestSimulatedInstrument::cancelledTransfer_data()
{
    QTest::addColumn<bool>("writes");
    QTest::newRow("get") << false;
    QTest::newRow("put") << true;
}

void TestSimulatedInstrument::cancelledTransfer()
{
    QFETCH(const bool, writes);
    // Sparse, and far more than moves within a tenth of a second.
    constexpr qint64 size = 999'999'999;
    QFile source(writes ? local("huge") : onUnix("var/user/huge.wv"));
    QVERIFY(source.open(QIODevice::WriteOnly) && source.resize(size));
    int updates = 0;
    connect(m_device.get(), &VisaDevice::ProgressUpdate, this, [&](int percent) {
        if (++updates > 1) {
            QVERIFY(percent < 100);
            m_device->cancel();
        }
    });
    QVERIFY(!(writes ? m_device->writeRemoteFile(local("huge"), "/var/user/p.wv")
                     : m_device->readRemoteFile("/var/user/huge.wv", local("back.wv"))));
    QCOMPARE(updates, 2);
    QCOMPARE(takeLog(Tracer::Information | Tracer::Error).last(),
             "1 *** Transfer aborted by user.");
    QVERIFY(!QFile::exists(onUnix("var/user/p.wv")));
    m_device->disconnect(this);
    source.remove();
    QVERIFY(m_device->checkErrorQueue());
    QVERIFY(store(local(), "12345"));
    QVERIFY(m_device->writeRemoteFile(local(), "/var/user/p.wv"));
    QVERIFY(m_device->readRemoteFile("/var/user/p.wv", local("back.wv")));
    QCOMPARE(load(local("back.wv")), "12345");
    QFile::remove(local("back.wv"));
}

void TestSimulatedInstrument::twoSessionsAtOnce()
{
    m_device->closeResource();
    const auto work = [this](const QString &resource, const QString &remote, quint32 seed) {
        const QByteArray data = randomBytes(3'000'000, seed);
        const QString name = local(QString("thread%1").arg(seed));
        VisaDevice device;
        return store(name, data) && device.openResource(resource) &&
               device.writeRemoteFile(name, remote) && device.readRemoteFile(remote, name) &&
               load(name) == data;
    };
    bool first = false;
    bool second = false;
    const std::unique_ptr<QThread> thread(
        QThread::create([&] { second = work(driveResource, "D:\\t.wv", 11); }));
    thread->start();
    first = work(unixResource, "/var/user/t.wv", 12);
    QVERIFY(thread->wait(60'000));
    QVERIFY(first && second);
    // And taking turns in one thread.
    VisaDevice other;
    QVERIFY(m_device->openResource(unixResource) && other.openResource(driveResource));
    QString answer;
    QVERIFY(m_device->sendCommand("*OPC") && other.queryText("*IDN?", answer));
    QVERIFY(answer.contains("TGX-810"));
    QVERIFY(m_device->queryText("*IDN?", answer));
    QVERIFY(answer.contains("TGX-870"));
    QVERIFY(other.isOpenElsewhere("TGX-870", "100001"));
}

void TestSimulatedInstrument::leavesNothingBehind()
{
    m_device->closeResource();
    const qsizetype files = entryCount("/proc/self/fd");
    const qsizetype threads = entryCount("/proc/self/task");
    for (int i = 0; i < 20; ++i) {
        QVERIFY(m_device->openResource(i % 2 == 0 ? unixResource : driveResource));
        QVERIFY(m_device->closeResource());
    }
    QCOMPARE(entryCount("/proc/self/fd"), files);
    QCOMPARE(entryCount("/proc/self/task"), threads);
}

void TestSimulatedInstrument::overTheNetwork()
{
    SimulatorProcess simulator;
    if (!simulator.start({"--address", "127.0.0.93", "--root", simulator.root()})) {
        QSKIP("The port mapper's port needs special rights here.");
    }
    QVERIFY(!m_device->openResource("TCPIP::127.0.0.93::INSTR"));
    m_device->closeResource();
    QVERIFY(m_device->openResource("TCPIP::127.0.0.93::INSTR"));
    quint16 type = 0;
    QVERIFY(m_device->interfaceType(type));
    QCOMPARE(type, quint16{6});
    QVERIFY(store(local(), randomBytes(1025, 9)));
    QVERIFY(m_device->writeRemoteFile(local(), "/var/user/x.wv"));
    QVERIFY(load(simulator.root() + "/var/user/x.wv") == load(local()));
}

QTEST_GUILESS_MAIN(TestSimulatedInstrument)
#include "tst_simulatedinstrument.moc"
