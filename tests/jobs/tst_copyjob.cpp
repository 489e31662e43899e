// SPDX-License-Identifier: Apache-2.0
// What a copy does with names that a well-behaved peer would not have. The copies themselves are
// tested through the window, with simulated instruments.
#include "instrument/FakeInstrument.h"
#include "instrument/LogRecorder.h"
#include "instrument/VisaDevice.h"
#include "jobs/instrument/CopyJob.h"

#include <QDir>
#include <QFile>
#include <QTemporaryDir>
#include <QTest>

class TestCopyJob : public QObject
{
    Q_OBJECT

private slots:
    void staysInTheTargetFolder_data();
    void staysInTheTargetFolder();
    void sendsNoCommandCharacters_data();
    void sendsNoCommandCharacters();
    void refusesTwoLocalEnds();
};

void TestCopyJob::staysInTheTargetFolder_data()
{
    QTest::addColumn<QString>("name");
    QTest::newRow("up again") << "a/../../evil.wv";
    QTest::newRow("absolute") << "a//etc/evil.wv";
}

void TestCopyJob::staysInTheTargetFolder()
{
    QFETCH(const QString, name);
    const FakeInstrument fake;
    VisaDevice device;
    QVERIFY(device.openResource("GPIB0::28::INSTR"));
    fake->answer = [&](const std::string &message) -> std::string {
        return message.rfind(":MMEM:CAT?", 0) == 0 ? "1,2,\"" + name.toStdString() + ",BIN,5\"\n"
                                                   : std::string();
    };
    const QTemporaryDir folder;
    QVERIFY(QDir(folder.path()).mkpath("a/target"));
    (void)takeLog();
    (void)fake.takeMessages();
    CopyJob job({.sourceDevice = &device,
                 .source = "/var/user/",
                 .targetFolder = folder.filePath("a/target/")});
    QVERIFY(job.run() != JobOutcome::Finished);
    QCOMPARE(takeLog().last(), "4 The instrument lists a file '" + name +
                                   "', whose name leads out of the folder that is copied.");
    QVERIFY(fake.takeMessages().filter(":MMEM:DATA").isEmpty());
}

void TestCopyJob::sendsNoCommandCharacters_data()
{
    QTest::addColumn<QString>("name");
    QTest::addColumn<QChar>("character");
    QTest::newRow("end of a name") << "it's.wv" << QChar('\'');
    QTest::newRow("all files") << "*.wv" << QChar('*');
    QTest::newRow("any letter") << "what?.wv" << QChar('?');
    QTest::newRow("folder on a drive") << "a\\b.wv" << QChar('\\');
    QTest::newRow("end of a catalogue entry") << "5\".wv" << QChar('"');
}

void TestCopyJob::sendsNoCommandCharacters()
{
    QFETCH(const QString, name);
    QFETCH(const QChar, character);
    const FakeInstrument fake;
    VisaDevice device;
    QVERIFY(device.openResource("GPIB0::28::INSTR"));
    const QTemporaryDir folder;
    QFile file(folder.filePath(name));
    QVERIFY(file.open(QIODevice::WriteOnly) && file.write("data") == 4);
    file.close();
    (void)takeLog();
    (void)fake.takeMessages();
    CopyJob job({.source = file.fileName(), .targetDevice = &device, .targetFolder = "/var/user/"});
    QVERIFY(job.run() != JobOutcome::Finished);
    QCOMPARE(takeLog(),
             QStringList({"4 The name \"" + name + "\" holds the character " + character +
                              ", which has a meaning in the commands of an instrument.",
                          "4 Sending file to instrument failed."}));
    QVERIFY(fake.takeMessages().isEmpty());
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
