// SPDX-License-Identifier: Apache-2.0
// The session class, the VISA layer and the simulator together, over real sockets.
#include "LogRecorder.h"

#include "instrument/RemoteDirModel.h"
#include "instrument/VisaDevice.h"
#include "simulator/SimulatorProcess.h"
#include "streams/TempStream.h"

#include <QAbstractItemModelTester>
#include <QDir>
#include <QFile>
#include <QRandomGenerator>
#include <QTest>
#include <QThread>

#include <csignal>

namespace {

const QString unixResource = "GPIB0::28::INSTR";
const QString driveResource = "GPIB0::5::INSTR";

QByteArray randomBytes(qsizetype size, quint32 seed)
{
    QByteArray bytes(size, '\0');
    QRandomGenerator generator(seed);
    for (char &byte : bytes) {
        byte = static_cast<char>(generator.generate());
    }
    return bytes;
}

bool store(const QString &fileName, const QByteArray &bytes)
{
    QFile file(fileName);
    return file.open(QIODevice::WriteOnly) && file.write(bytes) == bytes.size();
}

QByteArray content(const QString &fileName)
{
    QFile file(fileName);
    return file.open(QIODevice::ReadOnly) ? file.readAll() : QByteArray();
}

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
    void bothWays_data();
    void bothWays();
    void fiftyMegabytes();
    void filesAndFolders();
    void faults_data();
    void faults();
    void brokenConnection_data();
    void brokenConnection();
    void cancelledTransfer_data();
    void cancelledTransfer();
    void playsWaveform();
    void scan();
    void twoSessionsAtOnce();
    void leavesNothingBehind();
    void directoryModel();
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

void TestSimulatedInstrument::bothWays_data()
{
    QTest::addColumn<int>("size");
    for (const int size : {1, 1023, 1024, 1025, 32768, 32769, 100'000}) {
        QTest::addRow("%d bytes", size) << size;
    }
}

void TestSimulatedInstrument::bothWays()
{
    QFETCH(const int, size);
    const QByteArray data = randomBytes(size, 1);
    QVERIFY(store(local(), data));
    QVERIFY(m_device->writeRemoteFile(local(), "/var/user/x.wv"));
    QCOMPARE(content(onUnix("var/user/x.wv")), data);
    QVERIFY(m_device->readRemoteFile("/var/user/x.wv", local("back.wv")));
    QCOMPARE(content(local("back.wv")), data);
    QCOMPARE(takeLog(), QStringList{});
}

void TestSimulatedInstrument::fiftyMegabytes()
{
    // 50 MB with a rest that fills no block.
    const QByteArray data = randomBytes(50'000'001, 2);
    QVERIFY(store(local(), data));
    // On an instrument with drives, and over a file that is there.
    VisaDevice device;
    QVERIFY(device.openResource(driveResource));
    QVERIFY(store(m_simulator->root() + "/b/D:/big.wv", "old"));
    QVERIFY(device.writeRemoteFile(local(), "D:\\big.wv"));
    QVERIFY(content(m_simulator->root() + "/b/D:/big.wv") == data);
    QVERIFY(device.readRemoteFile("D:\\big.wv", local("back.wv")));
    QVERIFY(content(local("back.wv")) == data);
    QFile::remove(local("back.wv"));
}

void TestSimulatedInstrument::filesAndFolders()
{
    QVERIFY(m_device->makeDirectory("/var/user", "waves"));
    QVERIFY(m_device->makeDirectory("/var/user/waves", "deep"));
    QVERIFY(store(onUnix("var/user/waves/a,b.wv"), "12345"));
    QVERIFY(store(onUnix("var/user/waves/deep/c.txt"), "123"));
    QList<RemoteFileEntry> entries;
    QVERIFY(m_device->listDirectory(entries, "/var/user/waves"));
    QCOMPARE(entries.size(), 2);
    QVERIFY(m_device->renameEntry("/var/user/waves", "a,b.wv", "n.wv"));
    QCOMPARE(content(onUnix("var/user/waves/n.wv")), "12345");
    QStringList files;
    qint64 size = 0;
    QVERIFY(m_device->listTree(files, size, "/var/user/waves"));
    QCOMPARE(files, (QStringList{"/var/user/waves/deep/c.txt", "/var/user/waves/n.wv"}));
    QCOMPARE(size, 8);
    QVERIFY(m_device->deleteRemoteFile("/var/user/waves/n.wv", false));
    QVERIFY(!QFile::exists(onUnix("var/user/waves/n.wv")));
    QVERIFY(m_device->removeTree("/var/user", "waves"));
    QVERIFY(!QFile::exists(onUnix("var/user/waves")));
    QCOMPARE(takeLog(), QStringList{});
    // Of what fails only the error queue tells.
    QVERIFY(m_device->removeDirectory("/var/user", "waves"));
    QVERIFY(!m_device->checkErrorQueue());
    QVERIFY(m_device->takeLastError().startsWith("-256,"));
}

void TestSimulatedInstrument::faults_data()
{
    QTest::addColumn<QString>("fault");
    QTest::addColumn<QString>("operation");
    QTest::addColumn<bool>("done");
    QTest::addColumn<QString>("words"); // of the log, or of the instrument where they begin with -
    QTest::newRow("error after put") << "'error-after-transfer'"
                                     << "put" << false << "-310,\"System error\"\n";
    QTest::newRow("error after get") << "'error-after-transfer',-250"
                                     << "get" << false << "-250,\"Mass storage error\"\n";
    QTest::newRow("no terminator") << "'no-terminator'"
                                   << "get" << true << "4 No terminating character received.";
    QTest::newRow("short block") << "'short-block',10"
                                 << "get" << false << "4 Reading binary data block failed.";
    QTest::newRow("slow answer") << "'slow-answer',2000"
                                 << "query" << false
                                 << "4 ERROR: The time-out expired before the operation was "
                                    "completed.";
    QTest::newRow("empty folder") << "'empty-dir-469'"
                                  << "list" << true << "";
    QTest::newRow("missing folder")
        << "'queue',0"
        << "list" << false << "4 Cannot read files list from instrument.";
    QTest::newRow("many errors") << "'queue',30"
                                 << "queue" << false << "-310,\"System error\"\n";
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
    QVERIFY(m_device->setTimeoutMs(700));
    setFault(fault);
    QString answer;
    QList<RemoteFileEntry> entries;
    const bool result = operation == "put" ? m_device->writeRemoteFile(local(), "/var/user/p.wv")
                        : operation == "get"
                            ? m_device->readRemoteFile("/var/user/f.wv", local("back.wv"))
                        : operation == "query"  ? m_device->queryText("*OPT?", answer)
                        : operation == "list"   ? m_device->listDirectory(entries, "/var/user/gone")
                        : operation == "queue"  ? m_device->checkErrorQueue()
                        : operation == "folder" ? m_device->makeDirectory("/var/user", "d")
                                                : m_device->startArb("/var/user/f.wv", 2);
    QCOMPARE(result, done);
    const QStringList log = takeLog();
    if (words.startsWith('-')) {
        QVERIFY(m_device->takeLastError().startsWith(words));
        QCOMPARE(log, QStringList{});
    } else {
        QVERIFY2(words.isEmpty() ? log.isEmpty() : log.contains(words), qPrintable(log.join('\n')));
    }
    // The session is still of use.
    QVERIFY(m_device->setTimeoutMs(5000));
    setFault("'slow-answer',0");
    (void)m_device->sendCommand(":SYST:FAUL:CLE");
    (void)m_device->sendCommand("*RST");
    (void)m_device->sendCommand("*CLS");
    const bool again = m_device->writeRemoteFile(local(), "/var/user/again.wv");
    QVERIFY2(again, qPrintable(takeLog().join("\n") + m_device->takeLastError()));
    QVERIFY(content(onUnix("var/user/again.wv")) == content(local()));
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
    QVERIFY(content(onUnix("var/user/p.wv")) == content(local()));
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
    QCOMPARE(content(local("back.wv")), "12345");
    QFile::remove(local("back.wv"));
}

void TestSimulatedInstrument::playsWaveform()
{
    QVERIFY(store(onUnix("var/user/f.wv"), "12345"));
    setFault("'busy',1");
    QVERIFY(m_device->startArb("/var/user/f.wv"));
    QString answer;
    QVERIFY(m_device->queryText("SOUR:BB:ARB:STAT?", answer));
    QCOMPARE(answer, "1");
    QVERIFY(!m_device->startArb("/var/user/none.wv"));
    QVERIFY(m_device->takeLastError().startsWith("-256,"));
}

void TestSimulatedInstrument::scan()
{
    m_device->closeResource();
    QList<VisaDevice *> found;
    QVERIFY(m_device->scanResources(found, VisaDevice::ScanGpib));
    QStringList texts;
    for (const VisaDevice *device : found) {
        texts.append(device->resource() + ' ' + device->model() + ' ' + device->serial());
    }
    qDeleteAll(found);
    QCOMPARE(texts,
             (QStringList{"GPIB0::5::INSTR TGX-810 200002", "GPIB0::28::INSTR TGX-870 100001"}));
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
               content(name) == data;
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

void TestSimulatedInstrument::directoryModel()
{
    QVERIFY(QDir(onUnix("var/user")).mkpath("deep/er"));
    QVERIFY(QDir(onUnix("var/user")).mkpath("empty"));
    for (const QString name : {"c.wv", "a.wv", "b.txt", "deep/er/x.wv"}) {
        QVERIFY(store(onUnix("var/user/" + name), name.toLatin1()));
    }
    RemoteDirModel model;
    const QAbstractItemModelTester tester(&model,
                                          QAbstractItemModelTester::FailureReportingMode::QtTest);
    model.setDevice(m_device.get());
    model.refresh();
    const auto settle = [&] {
        QCoreApplication::processEvents();
        QCoreApplication::processEvents();
    };
    QTRY_COMPARE(model.rowCount(model.index(0, 0)), 5);
    QVERIFY(model.expandPath("/var/user/deep/er/"));
    QVERIFY(model.indexOfPath("/var/user/deep/er/x.wv").isValid());
    model.sort(0, Qt::DescendingOrder);
    settle();
    QCOMPARE(model.index(2, 0, model.index(0, 0)).data().toString(), "c.wv");
    QVERIFY(store(onUnix("var/user/empty/new.wv"), "1"));
    model.refresh(model.indexOfPath("/var/user/empty/"));
    QVERIFY(model.indexOfPath("/var/user/empty/new.wv").isValid());
    // The instrument dies while its folders are shown.
    QVERIFY(m_device->setTimeoutMs(500));
    QCOMPARE(m_simulator->stop(SIGTERM), 0);
    const QModelIndex folder = model.indexOfPath("/var/user/empty/");
    model.refresh(folder);
    QCOMPARE(folder.siblingAtColumn(1).data().toString(), "Read Error");
    m_device->closeResource();
    model.refresh();
    settle();
    QCOMPARE(model.index(0, 0).data().toString(), "no data for ...");
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
    QVERIFY(content(simulator.root() + "/var/user/x.wv") == content(local()));
}

QTEST_GUILESS_MAIN(TestSimulatedInstrument)
#include "tst_simulatedinstrument.moc"
