// SPDX-License-Identifier: Apache-2.0
#include "FakeInstrument.h"
#include "LogRecorder.h"

#include "instrument/ArbControl.h"
#include "instrument/VisaDevice.h"

#include <QElapsedTimer>
#include <QSignalSpy>
#include <QTest>

namespace {

const QString resource = "GPIB0::28::INSTR";
constexpr ArbIntervals Short{.second = 10, .poll = 5, .settle = 0};

} // namespace

class TestArbStart : public QObject
{
    Q_OBJECT
private slots:
    void init() { (void)takeLog(); }
    void arbWait_data();
    void arbWait();
    void arbStart_data();
    void arbStart();
    void arbCancel();
};

void TestArbStart::arbWait_data()
{
    QTest::addColumn<QString>("model");
    QTest::addColumn<QStringList>("conditions");
    QTest::addColumn<int>("seconds");
    QTest::addColumn<bool>("ready");
    QTest::addColumn<QStringList>("words");
    QTest::newRow("no time") << "TGX-870" << QStringList{} << 0 << false << QStringList{};
    QTest::newRow("ready") << "TGX-870" << QStringList{"0"} << 3 << true << QStringList{};
    QTest::newRow("other bits") << "TGX-870" << QStringList{"5"} << 3 << true << QStringList{};
    QTest::newRow("busy, then ready")
        << "TGX-840" << QStringList{"2", "4"} << 4 << true << QStringList{};
    QTest::newRow("busy too long") << "TGX-840" << QStringList(20, "2") << 2 << false
                                   << QStringList{"4 ARB did not get ready in time."};
    QTest::newRow("nonsense") << "TGX-870" << QStringList{"abc"} << 3 << false
                              << QStringList{"4 Invalid instrument response."};
    QTest::newRow("no progress") << "TGX-870" << QStringList{"MCOD"} << 3 << false
                                 << QStringList{"4 Cannot read MCOD progress."};
    QTest::newRow("no condition") << "TGX-870" << QStringList{"COND"} << 3 << false
                                  << QStringList{"4 Cannot read instrument status."};
}

void TestArbStart::arbWait()
{
    QFETCH(const QString, model);
    QFETCH(QStringList, conditions);
    QFETCH(const int, seconds);
    QFETCH(const bool, ready);
    QFETCH(const QStringList, words);
    FakeInstrument fake;
    fake->identity = "Halvorn," + model.toStdString() + ",x/1/2,1.0";
    VisaDevice device;
    QVERIFY(device.openResource(resource));
    device.setArbIntervals(Short);
    // A word among the numbers stands for the query at which the instrument complains.
    const QString failing = conditions.value(0).size() == 4 ? conditions.first() : QString("-");
    fake->answer = [&](const std::string &message) -> std::string {
        if (QString::fromStdString(message).contains(failing)) {
            fake->errors = {"-300,\"Device-specific error\""};
        }
        if (message == "SOUR:BB:PROG:MCOD?") {
            return "37\n";
        }
        return message == "STAT:OPER:COND?" ? conditions.takeFirst().toStdString() + "\n"
                                            : std::string();
    };
    (void)fake.takeMessages();
    (void)takeLog();
    QSignalSpy progress(&device, &VisaDevice::ProgressUpdate);
    QCOMPARE(device.waitForArbReady(seconds), ready);
    QCOMPARE(takeLog(), words);
    const bool asksProgress = model == "TGX-870" && seconds > 0;
    QCOMPARE(fake.takeMessages().contains("SOUR:BB:PROG:MCOD?"), asksProgress);
    if (ready) {
        QCOMPARE(progress.last().first().toInt(), 100);
    }
}

void TestArbStart::arbStart_data()
{
    QTest::addColumn<QString>("model");
    QTest::addColumn<QStringList>("messages");
    QTest::newRow("with a coder") << "TGX-870"
                                  << QStringList{"SOUR:BB:ARB:WAV:SEL '/var/user/a.wv'",
                                                 "SOUR:BB:PROG:MCOD?", "STAT:OPER:COND?",
                                                 "SOUR:BB:ARB:STAT ON; *OPC?"};
    QTest::newRow("without") << "TGX-840"
                             << QStringList{"SOUR:WAV:SEL '/var/user/a.wv'", "STAT:OPER:COND?",
                                            "SOUR:STAT ON; *OPC?"};
}

void TestArbStart::arbStart()
{
    QFETCH(const QString, model);
    QFETCH(const QStringList, messages);
    FakeInstrument fake;
    fake->identity = "Halvorn," + model.toStdString() + ",x/1/2,1.0";
    VisaDevice device;
    QVERIFY(device.openResource(resource));
    device.setArbIntervals(Short);
    fake->answer = [&](const std::string &message) {
        return message == "STAT:OPER:COND?" || message == "SOUR:BB:PROG:MCOD?" ? std::string("0\n")
                                                                               : std::string();
    };
    // An old error is no error of this start.
    fake->errors = {"-1,\"Old\""};
    (void)fake.takeMessages();
    QVERIFY(device.startArb("/var/user/a.wv"));
    QCOMPARE(fake.takeMessages(), messages);
}

void TestArbStart::arbCancel()
{
    FakeInstrument fake;
    VisaDevice device;
    QVERIFY(device.openResource(resource));
    device.setArbIntervals(Short);
    (void)takeLog();
    QElapsedTimer timer;
    timer.start();
    // One left over from before ends the wait as well.
    device.cancel();
    QVERIFY(!device.waitForArbReady(100));
    QVERIFY(timer.elapsed() < 5000);
    QCOMPARE(takeLog(), QStringList{"4 *** User break."});
}

QTEST_GUILESS_MAIN(TestArbStart)
#include "tst_arbstart.moc"
