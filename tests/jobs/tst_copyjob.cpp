// SPDX-License-Identifier: Apache-2.0
// What a copy does with names that a well-behaved peer would not have. The copies themselves are
// tested through the window, with simulated instruments.
#include "instrument/FakeInstrument.h"
#include "instrument/LogRecorder.h"
#include "instrument/VisaDevice.h"
#include "jobs/instrument/CopyJob.h"
#include "support/files.h"
#include "support/rows.h"

#include <QDir>
#include <QTest>

class TestCopyJob : public QObject
{
    Q_OBJECT

private slots:
    void staysInTheTargetFolder();
    void sendsNoCommandCharacters();
    void refusesTwoLocalEnds();
};

void TestCopyJob::staysInTheTargetFolder()
{
    for (const std::string name : {"a/../../evil.wv", "a//etc/evil.wv"}) {
        const FakeInstrument fake;
        VisaDevice device;
        QVERIFY(device.openResource("GPIB0::28::INSTR"));
        fake->answer = [&](const std::string &message) -> std::string {
            return message.rfind(":MMEM:CAT?", 0) == 0 ? "1,2,\"" + name + ",BIN,5\"\n"
                                                       : std::string();
        };
        const TestFolder folder;
        QVERIFY(QDir(folder.path()).mkpath("a/target"));
        (void)takeLog();
        (void)fake.takeMessages();
        CopyJob job({.sourceDevice = &device,
                     .source = "/var/user/",
                     .targetFolder = folder.path("a/target/")});
        QVERIFY(job.run() != JobOutcome::Finished);
        QCOMPARE(takeLog().last(), "4 The instrument lists a file '" +
                                       QString::fromStdString(name) +
                                       "', whose name leads out of the folder that is copied.");
        QVERIFY(fake.takeMessages().filter(":MMEM:DATA").isEmpty());
    }
}

void TestCopyJob::sendsNoCommandCharacters()
{
    forRows({{"end of a name", "it's.wv", '\''},
             {"all files", "*.wv", '*'},
             {"any letter", "what?.wv", '?'},
             {"folder on a drive", "a\\b.wv", '\\'},
             {"end of a catalogue entry", "5\".wv", '"'}},
            [](const QString &name, char character) {
                const FakeInstrument fake;
                VisaDevice device;
                QVERIFY(device.openResource("GPIB0::28::INSTR"));
                const TestFolder folder;
                QVERIFY(folder.store(name, "data"));
                (void)takeLog();
                (void)fake.takeMessages();
                CopyJob job({.source = folder.path(name),
                             .targetDevice = &device,
                             .targetFolder = "/var/user/"});
                QVERIFY(job.run() != JobOutcome::Finished);
                QCOMPARE(takeLog().first(),
                         "4 The name \"" + name + "\" holds the character " + character +
                             ", which has a meaning in the commands of an instrument.");
                QVERIFY(fake.takeMessages().isEmpty());
            });
}

void TestCopyJob::refusesTwoLocalEnds()
{
    (void)takeLog();
    CopyJob job({.source = "/tmp/a.wv", .targetFolder = "/tmp/"});
    QVERIFY(job.run() != JobOutcome::Finished);
    QCOMPARE(takeLog().last(), "4 Copy operations between local file systems are not supported.");
}

QTEST_GUILESS_MAIN(TestCopyJob)
#include "tst_copyjob.moc"
