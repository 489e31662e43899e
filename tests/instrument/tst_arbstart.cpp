// SPDX-License-Identifier: Apache-2.0
#include "FakeInstrument.h"
#include "LogRecorder.h"

#include "instrument/ArbControl.h"
#include "instrument/VisaDevice.h"
#include "support/rows.h"

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
    void arbWait();
    void arbStart();
    void arbCancel();
};

void TestArbStart::arbWait()
{
    struct Row
    {
        const char *name;
        QString model;
        QStringList conditions; ///< a word of four letters: the query at which it complains
        int seconds;
        bool ready;
        QStringList words;
    };
    forRows<Row>(
        {{"no time", "TGX-870", {}, 0, false, {}},
         {"other bits", "TGX-870", {"5"}, 3, true, {}},
         {"busy, then ready", "TGX-840", {"2", "4"}, 20, true, {}},
         {"busy too long",
          "TGX-840",
          QStringList(99, "2"),
          2,
          false,
          {"4 ARB did not get ready in time."}},
         {"nonsense", "TGX-870", {"abc"}, 3, false, {"4 Invalid instrument response."}},
         {"no progress", "TGX-870", {"MCOD"}, 3, false, {"4 Cannot read MCOD progress."}},
         {"no condition", "TGX-870", {"COND"}, 3, false, {"4 Cannot read instrument status."}}},
        [](const Row &row) {
            FakeInstrument fake;
            fake->identity = "Halvorn," + row.model.toStdString() + ",x/1/2,1.0";
            VisaDevice device;
            QVERIFY(device.openResource(resource));
            device.setArbIntervals(Short);
            QStringList conditions = row.conditions;
            const QString failing = conditions.value(0).size() == 4 ? conditions.first() : "-";
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
            QCOMPARE(device.waitForArbReady(row.seconds), row.ready);
            QCOMPARE(takeLog(), row.words);
            QCOMPARE(fake.takeMessages().contains("SOUR:BB:PROG:MCOD?"),
                     row.model == "TGX-870" && row.seconds > 0);
            if (row.ready) {
                QCOMPARE(progress.last().first().toInt(), 100);
            }
        });
}

void TestArbStart::arbStart()
{
    struct Row
    {
        const char *name;
        QStringList messages;
    };
    forRows<Row>(
        {{"TGX-870",
          {"SOUR:BB:ARB:WAV:SEL '/var/user/a.wv'", "SOUR:BB:PROG:MCOD?", "STAT:OPER:COND?",
           "SOUR:BB:ARB:STAT ON; *OPC?"}},
         {"TGX-840", {"SOUR:WAV:SEL '/var/user/a.wv'", "STAT:OPER:COND?", "SOUR:STAT ON; *OPC?"}}},
        [](const Row &row) {
            FakeInstrument fake;
            fake->identity = "Halvorn," + std::string(row.name) + ",x/1/2,1.0";
            VisaDevice device;
            QVERIFY(device.openResource(resource));
            device.setArbIntervals(Short);
            fake->answer = [](const std::string &message) {
                return message == "STAT:OPER:COND?" || message == "SOUR:BB:PROG:MCOD?" ? "0\n" : "";
            };
            // An old error is no error of this start.
            fake->errors = {"-1,\"Old\""};
            (void)fake.takeMessages();
            QVERIFY(device.startArb("/var/user/a.wv"));
            QCOMPARE(fake.takeMessages(), row.messages);
        });
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
    connect(&device, &VisaDevice::ProgressUpdate, &device, &VisaDevice::cancel);
    QVERIFY(!device.waitForArbReady(100));
    QVERIFY(timer.elapsed() < 5000);
    QCOMPARE(takeLog(), QStringList{"4 *** User break."});
    // One left over from before is none of the next wait.
    device.disconnect();
    fake->answer = [](const std::string &message) {
        return message == "STAT:OPER:COND?" || message == "SOUR:BB:PROG:MCOD?" ? "0\n" : "";
    };
    QVERIFY(device.waitForArbReady(100));
}

QTEST_GUILESS_MAIN(TestArbStart)
#include "tst_arbstart.moc"
