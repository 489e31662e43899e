// SPDX-License-Identifier: Apache-2.0
#include "FakeInstrument.h"
#include "LogRecorder.h"

#include "instrument/OperationControl.h"
#include "instrument/VisaDevice.h"
#include "instrument/VisaLibrary.h"
#include "instrument/reachability.h"
#include "support/rows.h"
#include "visa/visa.h"

#include <QElapsedTimer>
#include <QSignalSpy>
#include <QTcpServer>
#include <QTcpSocket>
#include <QTest>
#include <QTimer>

#include <arpa/inet.h>
#include <array>
#include <sys/socket.h>
#include <unistd.h>
#include <utility>

namespace {

const QString resource = "GPIB0::28::INSTR";
constexpr int information = Tracer::Information;

} // namespace

class TestVisaDevice : public QObject
{
    Q_OBJECT
private slots:
    void init() { (void)takeLog(); }
    void libraryLacksFunction();
    void libraryIsMissing();
    void managerFails();
    void opens();
    void textArrivesAsWritten();
    void openFails();
    void openTwice();
    void hostIsUnreachable();
    void hostIsMute();
    void sendCommand();
    void queryText();
    void lateAnswers();
    void errorQueue();
    void errorQueueFails();
    void charactersOutsideLatin1();
    void openElsewhere();
    void scan();
    void scanFails();
};

void TestVisaDevice::libraryLacksFunction()
{
    const QString words = "4 Cannot resolve functions in VISA Library.";
    FakeInstrument fake;
    VisaDevice device;
    QVERIFY(device.openResource(resource));
    (void)takeLog();
    VisaLibrary &library = VisaLibrary::instance();
    const auto without = [&](auto VisaFunctions::*function, const auto &operation) {
        const auto present = std::exchange(library.editFunctions().*function, nullptr);
        const bool done = operation();
        library.editFunctions().*function = present;
        return !done && takeLog() == QStringList{words};
    };
    QList<VisaDevice *> found;
    quint16 type = 0;
    QVERIFY(without(&VisaFunctions::viRead, [&] { return device.sendCommand("*CLS"); }));
    QVERIFY(without(&VisaFunctions::viPrintf, [&] { return device.checkErrorQueue(); }));
    QVERIFY(without(&VisaFunctions::viGetAttribute, [&] { return device.interfaceType(type); }));
    QVERIFY(without(&VisaFunctions::viFindNext,
                    [&] { return device.scanResources(found, VisaDevice::ScanGpib); }));
    QVERIFY(without(&VisaFunctions::viClear,
                    [&] { return device.readRemoteFile("/var/user/a.wv", "/nonexistent/a.wv"); }));
    QVERIFY(without(&VisaFunctions::viClose, [&] { return device.closeResource(); }));
    QVERIFY(device.isOpen());
    QVERIFY(device.closeResource());
    QVERIFY(without(&VisaFunctions::viSetBuf, [&] { return device.openResource(resource); }));
}

void TestVisaDevice::libraryIsMissing()
{
    const QString notLoaded = "4 VISA Library is not loaded.";
    qputenv("CORVANE_VISA_LIBRARY", "/nonexistent/libvisa.so");
    {
        VisaDevice first;
        QCOMPARE(first.takeLastError(), "The VISA library cannot be loaded.");
        const QStringList log = takeLog();
        QCOMPARE(log.size(), 1);
        QVERIFY2(log.first().contains("/nonexistent/libvisa.so"), qPrintable(log.first()));
        VisaDevice second;
        QCOMPARE(second.takeLastError(), QString());
        QVERIFY(!second.openResource(resource));
        QCOMPARE(takeLog(), QStringList{notLoaded});
        QVERIFY(!second.setTimeoutMs(1000));
        QVERIFY(!second.readRemoteFile("/var/user/a.wv", "/nonexistent/a.wv"));
        QVERIFY(!second.writeRemoteFile("/nonexistent/a.wv", "/var/user/a.wv"));
        QList<VisaDevice *> found;
        QVERIFY(!second.scanResources(found, VisaDevice::ScanUsb));
        QCOMPARE(takeLog(), (QStringList{notLoaded, notLoaded, notLoaded, notLoaded}));
    }
    FakeInstrument fake;
    VisaDevice local(true);
    QCOMPARE(local.takeLastError(), QString());
    // The first object decides for all: this one doesn't load the library either.
    VisaDevice other;
    QVERIFY(!other.openResource(resource));
    QCOMPARE(takeLog(), QStringList{notLoaded});
    QVERIFY(fake.takeCalls().isEmpty());
}

void TestVisaDevice::managerFails()
{
    FakeInstrument fake;
    fake.failCall("viOpenDefaultRM", VI_ERROR_SYSTEM_ERROR);
    VisaDevice device;
    QCOMPARE(device.takeLastError(), "The viOpenDefaultRM() failed: status BFFF0000");
    QVERIFY(!device.openResource(resource));
    QCOMPARE(takeLog(), (QStringList{"4 viOpen(): Cannot open instrument connection.",
                                     "4 ERROR: status BFFF000E",
                                     "4 Check resource string or VISA installation."}));
    QCOMPARE(fake.takeCalls(), QStringList{"viOpenDefaultRM"});
}

void TestVisaDevice::opens()
{
    FakeInstrument fake;
    {
        VisaDevice device;
        QVERIFY(device.openResource(resource));
        QCOMPARE(fake.takeMessages(), (QStringList{"*CLS", "*IDN?", "*OPT?"}));
        QCOMPARE(fake->timeoutMs, 5000U);
        QCOMPARE(device.vendor(), "Halvorn");
        QCOMPARE(device.model(), "TGX-870");
        QCOMPARE(device.serial(), "100001");
        QCOMPARE(device.firmware(), "1.0");
        QCOMPARE(device.interfaceName(), "GPIB0");
        (void)takeLog();
        (void)fake.takeCalls();
        QVERIFY(device.closeResource());
        // One that has gone silent meanwhile holds it up for a moment alone.
        QCOMPARE(fake.takeCalls(),
                 (QStringList{"viSetAttribute 3FFF001A 200", "viGpibControlREN 2", "viClear",
                              "viSetAttribute 3FFF001A 5000", "viClose"}));
        QCOMPARE(takeLog(information), QStringList{"1 Device TGX-870, 100001 closed."});
        // Closed already: nothing happens, the identity stays.
        QVERIFY(device.closeResource());
        QVERIFY(takeLog(information).isEmpty());
        QCOMPARE(device.model(), "TGX-870");
    }
    QCOMPARE(fake.takeCalls(), QStringList{"viClose manager"});
}

/// A library would read "%" and the backslash of a format as its own.
void TestVisaDevice::textArrivesAsWritten()
{
    FakeInstrument fake;
    VisaDevice device;
    QVERIFY(device.openResource(resource));
    const QString query = R"(:MMEM:CAT? 'D:\new\50%n%%')";
    fake->answer = [&](const std::string &message) {
        return message == query.toStdString() ? std::string("1,2\n") : std::string();
    };
    (void)fake.takeMessages();
    QString answer;
    QVERIFY(device.queryText(query, answer));
    QVERIFY(device.sendCommand(query));
    QCOMPARE(fake.takeMessages(), (QStringList{query, query}));
    QCOMPARE(answer, "1,2");
}

void TestVisaDevice::openFails()
{
    struct Row
    {
        const char *name;
        QString call;
        qint32 status;
        std::string identity;
        QString words;
    };
    const std::string good = "Halvorn,TGX-870,TGX870/100001/01,1.0";
    const QString report = "4 ERROR: status BFFF0015";
    forRows<Row>(
        {{"viOpen with a remark", "viOpen G", VI_SUCCESS_MAX_CNT, good, "4 ERROR: status 3FFF0006"},
         {"clear", "viClear", VI_ERROR_TMO, good, report},
         {"*CLS", "viWrite", VI_ERROR_TMO, good, report},
         {"*IDN?", "viWrite 5 END", VI_ERROR_TMO, good, report},
         {"other maker", "-", 0, "Acme,TGX-870,TGX870/100001/01,1.0",
          "4 This device is not a Halvorn instrument."},
         {"unknown model", "-", 0, "Halvorn,QQQ-1,x/1/2,1.0",
          "4 The device 'QQQ-1' is not supported."}},
        [](const Row &row) {
            FakeInstrument fake;
            VisaDevice device;
            fake->identity = row.identity;
            fake.failCall(row.call, row.status);
            QVERIFY(!device.openResource(resource));
            const QStringList log = takeLog();
            QVERIFY2(log.contains(row.words), qPrintable(log.join('\n')));
            QVERIFY(!device.isOpen());
            QCOMPARE(fake->openSessions, 0U);
            // Nothing of the failure stays behind.
            fake->status = nullptr;
            fake->identity = "halvorn,TGX-870,TGX870/100001/01,1.0";
            QVERIFY(device.openResource(resource));
        });
}

void TestVisaDevice::openTwice()
{
    FakeInstrument fake;
    VisaDevice device;
    QVERIFY(device.openResource(resource));
    QVERIFY(!device.openResource("GPIB0::5::INSTR"));
    QCOMPARE(takeLog(), QStringList{"4 Device is already open."});
    QVERIFY(device.isOpen());
    QCOMPARE(device.resource(), resource);
}

void TestVisaDevice::hostIsUnreachable()
{
    FakeInstrument fake;
    VisaDevice device;
    QTcpServer plainScpi;
    QVERIFY2(plainScpi.listen(QHostAddress("127.0.0.87"), 5025),
             qPrintable(plainScpi.errorString()));
    (void)fake.takeCalls();
    // Written small, it is tested all the same; one port of two is not enough.
    QVERIFY(!device.openResource("tcpip0::127.0.0.87::instr"));
    QCOMPARE(takeLog(information | Tracer::Warning | Tracer::Error),
             (QStringList{"1 Using VISA library '" + FakeInstrument::libraryName() + "'",
                          "1 Opening VISA device 'tcpip0::127.0.0.87::instr'",
                          "1 Trying to access device '127.0.0.87'",
                          "2 Port 111 is not accessible. Check your firewall settings.",
                          "1 Port 5025 is accessible."}));
    QVERIFY(!device.openResource("TCPIP::no-such-host.invalid::INSTR"));
    QVERIFY(takeLog().first().startsWith("4 No host address found. "));
    QVERIFY(fake.takeCalls().isEmpty());
}

/// A host that swallows what is sent to it, as one that is switched off: a listener whose queue is
/// full.
void TestVisaDevice::hostIsMute()
{
    const int listener = ::socket(AF_INET, SOCK_STREAM, 0);
    sockaddr_in address{};
    address.sin_family = AF_INET;
    address.sin_addr.s_addr = htonl(INADDR_LOOPBACK);
    socklen_t length = sizeof address;
    auto *generic = reinterpret_cast<sockaddr *>(&address);
    QCOMPARE(::bind(listener, generic, length), 0);
    QCOMPARE(::listen(listener, 0), 0);
    QCOMPARE(::getsockname(listener, generic, &length), 0);
    std::array<QTcpSocket, 3> waiting;
    for (QTcpSocket &socket : waiting) {
        socket.connectToHost(QHostAddress::LocalHost, ntohs(address.sin_port));
        (void)socket.waitForConnected(100);
    }
    OperationControl control;
    control.report = [](int) {};
    const auto elapsedMs = [&](int timeoutMs) {
        QElapsedTimer timer;
        timer.start();
        const QList<bool> found =
            openPorts({QHostAddress::LocalHost}, {ntohs(address.sin_port)}, control, timeoutMs);
        return found == QList<bool>{false} ? timer.elapsed() : -1;
    };
    const qint64 whole = elapsedMs(400);
    QVERIFY2(whole >= 390 && whole < 900, qPrintable(QString::number(whole)));
    QTimer::singleShot(100, this, [&control] { control.cancelled = true; });
    const qint64 cancelled = elapsedMs(ConnectTimeoutMs);
    QVERIFY2(cancelled >= 0 && cancelled < 1000, qPrintable(QString::number(cancelled)));
    ::close(listener);
}

void TestVisaDevice::sendCommand()
{
    FakeInstrument fake;
    VisaDevice device;
    QVERIFY(!device.sendCommand("*CLS"));
    QCOMPARE(takeLog(), QStringList{"4 Device is not open."});
    QVERIFY(device.openResource(resource));
    std::string answer;
    fake->answer = [&](const std::string &message) {
        return message == "DO; *OPC?" ? answer : std::string();
    };
    (void)takeLog();
    for (const char *done : {"1\n", " \t+1 \r\n"}) {
        answer = done;
        QVERIFY(device.sendCommand("DO; *OPC?"));
    }
    for (const char *other : {"0\n", "ready  now\n", "1 1\n"}) {
        answer = other;
        QVERIFY(!device.sendCommand("DO; *OPC?"));
        QCOMPARE(takeLog(), (QStringList{"4 ERROR : R Unexpected Result from *OPC?",
                                         "4 VISA << '" + QString(other).simplified() + "'"}));
    }
    // Without the question nothing is read, and it is one in this spelling only.
    (void)fake.takeCalls();
    QVERIFY(device.sendCommand("*opc?"));
    QCOMPARE(fake.takeCalls(), QStringList{"viWrite 5 END"});
    fake.failCall("viWrite", VI_SUCCESS_MAX_CNT);
    QVERIFY(!device.sendCommand("DO"));
    QCOMPARE(takeLog(), QStringList{"4 ERROR: status 3FFF0006"});
}

void TestVisaDevice::queryText()
{
    FakeInstrument fake;
    VisaDevice device;
    QVERIFY(device.openResource(resource));
    const std::string longText(201, 'x');
    fake->answer = [&](const std::string &message) {
        return message == "LONG?" ? " a\t\r\n " + longText + "\n" : std::string();
    };
    (void)takeLog();
    QString answer;
    QVERIFY(device.queryText("LONG?", answer));
    QCOMPARE(answer, "a " + QString(201, 'x'));
    QCOMPARE(takeLog(information),
             (QStringList{"1 VISA >> 'LONG?'", "1 VISA << 'a " + QString(198, 'x') + "..."}));
    // An answer counts as failed while the queue holds an error, but is delivered.
    fake->errors = {"-221,\"Settings conflict\""};
    QVERIFY(!device.queryText("LONG?", answer));
    QCOMPARE(answer.size(), 203);
    QCOMPARE(device.takeLastError(), "-221,\"Settings conflict\"\n");
    QCOMPARE(device.takeLastError(), QString());
    // A positive status is as good as 0 here.
    fake.failCall("viRead 32767", VI_SUCCESS_TERM_CHAR);
    QVERIFY(device.queryText("LONG?", answer));
    (void)takeLog();
    // Nothing is sent for an empty query, and no answer is no empty answer.
    (void)fake.takeMessages();
    fake->status = nullptr;
    QVERIFY(!device.queryText("", answer));
    QVERIFY(fake.takeMessages().isEmpty());
    QCOMPARE(takeLog(), QStringList{"4 ERROR: status BFFF0015"});
}

/// After an answer that came too late, or only in part, the next query gets its own.
void TestVisaDevice::lateAnswers()
{
    FakeInstrument fake;
    VisaDevice device;
    QVERIFY(device.openResource(resource));
    const std::string longText = " first,\"two  blanks\" " + std::string(100'000, 'x') + "\n";
    fake->answer = [&](const std::string &message) {
        return message == "LONG?" ? longText : std::string();
    };
    QString answer;
    QVERIFY(device.queryText("LONG?", answer));
    QCOMPARE(answer.size(), static_cast<qsizetype>(longText.size()) - 3);
    fake.failCall("viRead 65534", VI_ERROR_TMO);
    QVERIFY(!device.queryText("LONG?", answer));
    QVERIFY(answer.isEmpty());
    fake->status = nullptr;
    QVERIFY(device.queryText("*IDN?", answer));
    QVERIFY2(answer.startsWith("Halvorn"), qPrintable(answer));
    // One that takes no notice of being cleared has gone, and nothing waits for it again.
    fake->status = [](const std::string &call) {
        const bool isOut = call.rfind("viRead", 0) == 0 || call == "viClear";
        return isOut ? VI_ERROR_TMO : VI_SUCCESS;
    };
    QVERIFY(!device.sendCommand("DO; *OPC?"));
    (void)fake.takeCalls();
    QVERIFY(!device.queryText("*IDN?", answer));
    QVERIFY(!device.checkErrorQueue());
    QVERIFY(device.closeResource());
    QCOMPARE(fake.takeCalls(), QStringList{"viClose"});
    fake->status = nullptr;
    QVERIFY(device.openResource(resource));
}

void TestVisaDevice::errorQueue()
{
    FakeInstrument fake;
    VisaDevice device;
    QVERIFY(device.openResource(resource));
    for (int i = 1; i <= 21; ++i) {
        fake->errors.push_back(std::to_string(-i) + ",\"Error\"");
    }
    (void)takeLog();
    QVERIFY(!device.checkErrorQueue());
    QCOMPARE(fake->errors.size(), size_t{1});
    const QStringList log = takeLog(information);
    QCOMPARE(log.size(), 20);
    QCOMPARE(log.first(), "1 Instrument reports '-1,\"Error\"'");
    QCOMPARE(device.takeLastError().count('\n'), 20);
    QVERIFY(!device.checkErrorQueue());
    QVERIFY(device.checkErrorQueue());
    // What is no number ends the reading like the number 0.
    fake->errors = {"no number", "-5,\"Error\""};
    QVERIFY(device.checkErrorQueue());
    QCOMPARE(fake->errors.size(), size_t{1});
}

void TestVisaDevice::errorQueueFails()
{
    FakeInstrument fake;
    VisaDevice device;
    QVERIFY(device.openResource(resource));
    (void)takeLog();
    fake.failCall("viPrintf", VI_SUCCESS_TERM_CHAR);
    QVERIFY(!device.checkErrorQueue());
    fake.failCall("viRead", VI_SUCCESS_MAX_CNT);
    QVERIFY(!device.checkErrorQueue());
    QCOMPARE(takeLog(), (QStringList{"4 :SYST:ERR? Command failed.", "4 ERROR: status 3FFF0005",
                                     "4 No response from :SYST:ERR?", "4 ERROR: status 3FFF0006"}));
}

void TestVisaDevice::charactersOutsideLatin1()
{
    FakeInstrument fake;
    VisaDevice device;
    QVERIFY(device.openResource(resource));
    (void)fake.takeMessages();
    QVERIFY(device.sendCommand(QString::fromUtf8("MMEM:CDIR 'ä'")));
    QCOMPARE(fake.takeMessages(), QStringList{QString::fromUtf8("MMEM:CDIR 'ä'")});
    (void)takeLog();
    // A "?" in the place of the letter would delete other files.
    QVERIFY(!device.sendCommand(QString::fromUtf8("MMEM:DEL 'Ω.wv'")));
    QVERIFY(fake.takeMessages().isEmpty());
    QCOMPARE(takeLog().size(), 1);
}

void TestVisaDevice::openElsewhere()
{
    FakeInstrument fake;
    VisaDevice first;
    VisaDevice second;
    QVERIFY(first.openResource(resource));
    QVERIFY(second.isOpenElsewhere("TGX-870", "100001"));
    QVERIFY(!first.isOpenElsewhere("TGX-870", "100001"));
    QVERIFY(!second.isOpenElsewhere("TGX-870", "100002"));
    QVERIFY(!second.isOpenElsewhere("", ""));
    first.closeResource();
    QVERIFY(!second.isOpenElsewhere("TGX-870", "100001"));
}

void TestVisaDevice::scan()
{
    FakeInstrument fake;
    VisaDevice device;
    fake->resources = {"GPIB0::1::INSTR", "GPIB0::2::INSTR", "GPIB0::3::INSTR"};
    // The second of the three answers, but is of another make.
    int identities = 0;
    fake->answer = [&](const std::string &message) {
        const bool isForeign = message == "*IDN?" && ++identities == 2;
        return isForeign ? std::string("Acme,1,2,3\n") : std::string();
    };
    QSignalSpy progress(&device, &VisaDevice::ProgressUpdate);
    QList<VisaDevice *> found;
    QVERIFY(device.scanResources(found, VisaDevice::ScanGpib));
    QCOMPARE(found.size(), 2);
    QCOMPARE(found.at(0)->resource(), "GPIB0::1::INSTR");
    QCOMPARE(found.at(1)->resource(), "GPIB0::3::INSTR");
    QVERIFY(!found.at(1)->isOpen());
    QCOMPARE(found.at(1)->serial(), "100001");
    qDeleteAll(found);
    QList<int> percents;
    for (const QList<QVariant> &arguments : progress) {
        percents.append(arguments.first().toInt());
    }
    QCOMPARE(percents, (QList<int>{0, 10, 43, 76, 100, 100}));
    QVERIFY(fake.takeCalls().contains("viFindRsrc GPIB?*INSTR"));
    QCOMPARE(fake->openSessions, 0U);
}

void TestVisaDevice::scanFails()
{
    FakeInstrument fake;
    VisaDevice device;
    QList<VisaDevice *> found;
    QVERIFY(!device.scanResources(found, 2));
    // None is an answer, too.
    QVERIFY(device.scanResources(found, VisaDevice::ScanUsb));
    fake.failCall("viFindRsrc", VI_ERROR_SYSTEM_ERROR);
    QVERIFY(!device.scanResources(found, VisaDevice::ScanUsb));
    fake->status = nullptr;
    QCOMPARE(takeLog(), (QStringList{"4 Invalid remte control interface type.",
                                     "4 No devices found. viFindRsrc() returned an error.",
                                     "4 ERROR: status BFFF0000"}));
    QVERIFY(fake.takeCalls().contains("viFindRsrc USB[0-9]::0x7FE3::?*INSTR"));
    fake->resources = {"USB0::0x7FE3::1::2::INSTR", "USB0::0x7FE3::1::3::INSTR"};
    connect(&device, &VisaDevice::ProgressUpdate, &device, [&device](int percent) {
        if (percent > 10) {
            device.cancel();
        }
    });
    QVERIFY(!device.scanResources(found, VisaDevice::ScanUsb));
    QCOMPARE(found.size(), 1);
    qDeleteAll(found);
    // An instrument that a pane works with is left alone, however its resource is written.
    device.disconnect();
    found.clear();
    VisaDevice pane;
    QVERIFY(pane.openResource("gpib::28"));
    fake->resources = {"GPIB0::28::INSTR"};
    (void)fake.takeCalls();
    QVERIFY(device.scanResources(found, VisaDevice::ScanGpib));
    QVERIFY(fake.takeCalls().filter("viOpen").isEmpty());
}

QTEST_GUILESS_MAIN(TestVisaDevice)
#include "tst_visadevice.moc"
