// SPDX-License-Identifier: Apache-2.0
#include "FakeInstrument.h"
#include "LogRecorder.h"

#include "instrument/BlockWriter.h"
#include "instrument/VisaDevice.h"
#include "streams/TempStream.h"
#include "support/files.h"
#include "support/rows.h"

#include <QElapsedTimer>
#include <QFile>
#include <QSignalSpy>
#include <QTemporaryDir>
#include <QTest>

namespace {

const QString remoteName = "/var/user/a.wv";
const QString timeoutReport = "4 ERROR: status BFFF0015";

} // namespace

class TestBlockTransfer : public QObject
{
    Q_OBJECT
private slots:
    void init();
    void cleanup();
    void readFile();
    void readFileOfManyBlocks();
    void readFileRefuses();
    void fetchKeepsOldFile();
    void readStream();
    void writeHeader();
    void writeFile();
    void writeFileFails();
    void writeFileReplaces();
    void writeFileOverGpib();
    void writeFileRefuses();
    void cancel();

private:
    QString local(const QString &name = "local") const { return m_folder.filePath(name); }

    QTemporaryDir m_folder;
    std::unique_ptr<FakeInstrument> m_fake;
    std::unique_ptr<VisaDevice> m_device;
};

void TestBlockTransfer::cleanup()
{
    m_fake.reset();
    m_device.reset();
}

void TestBlockTransfer::init()
{
    m_fake = std::make_unique<FakeInstrument>();
    m_device = std::make_unique<VisaDevice>();
    QVERIFY(m_device->openResource("GPIB0::28::INSTR"));
    QFile::remove(local());
    (void)m_fake->takeCalls();
    (void)m_fake->takeMessages();
    (void)takeLog();
}

void TestBlockTransfer::readFile()
{
    struct Row
    {
        const char *name;
        std::string answer;
        QList<int> limits; ///< of the single reads
        bool done;
        QByteArray file;
        QStringList words;
    };
    const std::string good = "#15he\nlo\n";
    const QString received = "4 viRead(): Received 3 bytes but expected 5 bytes.";
    const QString noBlock =
        "4 Invalid or no character received from instrument. Expected character was '#'.";
    const QString badLength = "4 Invalid length information received from instrument.";
    FakeInstrument &fake = *m_fake;
    forRows<Row>(
        {{"good", good, {}, true, "he\nlo", {}},
         {"no terminator",
          "#15hello",
          {},
          true,
          "hello",
          {"4 No terminating character received.", timeoutReport}},
         {"no answer", "", {}, false, "", {"4 Reading start character failed.", timeoutReport}},
         {"empty file", "#10\n", {}, true, "", {}},
         {"size in brackets", "#(5)he\nlo\n", {}, true, "he\nlo", {}},
         {"no end of brackets",
          "#(1234567890123",
          {},
          false,
          "",
          {"4 The instrument announces a block of '1234567890123...' bytes, which has more than 12 "
           "digits."}},
         {"longer than announced",
          "#13hello\n",
          {},
          false,
          "",
          {"4 The instrument sends more than the 3 bytes that it announced."}},
         {"text", "hello\n", {}, false, "", {noBlock, "4 ERROR: status 3FFF0006"}},
         {"length cut", "#512", {}, false, "", {"4 Invalid length data received from instrument."}},
         {"#0", "#0\n", {}, false, "", {badLength}},
         {"length no number", "#2-5hello\n", {}, false, "", {badLength}},
         {"three short reads", good, {-1, -1, 1, 1, 1}, true, "he\nlo", {}},
         {"four short reads",
          good,
          {-1, -1, 1, 1, 1, 1},
          false,
          "",
          {"4 viRead(): Binary data transfer incomplete.", received, "4 1 bytes received.",
           "4 ERROR: status 0"}},
         {"short block",
          "#15he",
          {},
          false,
          "",
          {"4 Reading binary data block failed.", "4 2 bytes already received.",
           "4 3 bytes remaining.", timeoutReport}}},
        [&](const Row &row) {
            fake->answer = [&](const std::string &message) {
                return message == ":MMEM:DATA? '/var/user/a.wv'" ? row.answer : std::string();
            };
            QFile::remove(local());
            fake->readLimits.assign(row.limits.begin(), row.limits.end());
            QCOMPARE(m_device->readRemoteFile(remoteName, local()), row.done);
            QCOMPARE(takeLog(), row.words);
            QCOMPARE(load(local()), row.file);
            // The data may hold any byte, and whatever fails, the output is cleared.
            const QStringList calls = fake.takeCalls();
            QVERIFY(calls.contains("viSetAttribute 3FFF0038 0"));
            QVERIFY(row.done || calls.contains("viClear"));
        });
}

void TestBlockTransfer::readFileOfManyBlocks()
{
    QByteArray data(100'000, '\0');
    for (qsizetype i = 0; i < data.size(); ++i) {
        data[i] = static_cast<char>(i % 251);
    }
    FakeInstrument &fake = *m_fake;
    fake->answer = [&](const std::string &message) {
        return message.rfind(":MMEM:DATA?", 0) == 0 ? "#6100000" + data.toStdString() + '\n'
                                                    : std::string();
    };
    QVERIFY(m_device->readRemoteFile(remoteName, local()));
    QCOMPARE(load(local()), data);
    const QStringList calls = fake.takeCalls().filter("viRead");
    QCOMPARE(calls, (QStringList{"viRead 2", "viRead 6", "viRead 32768", "viRead 32768",
                                 "viRead 32768", "viRead 1696", "viRead 1", "viRead 1023"}));
    // A disk that is full.
    QVERIFY(!m_device->readRemoteFile(remoteName, "/dev/full"));
    QCOMPARE(takeLog(), QStringList{"4 Writing data to local file failed."});
    // An error that waits in the queue spoils it, though all bytes are there.
    fake->errors = {"-310,\"System error\""};
    QVERIFY(!m_device->readRemoteFile(remoteName, local()));
    QCOMPARE(load(local()), data);
    QCOMPARE(m_device->takeLastError(), "-310,\"System error\"\n");
    // The last six bytes of what came tell where it broke.
    fake->readLimits = {-1, -1, 10, 10, 10, 10};
    (void)takeLog();
    QVERIFY(!m_device->readRemoteFile(remoteName, local()));
    QVERIFY(takeLog().contains("4 Last received data: 22 23 24 25 26 27 "));
}

void TestBlockTransfer::readFileRefuses()
{
    QVERIFY(!m_device->readRemoteFile(remoteName, ""));
    QVERIFY(!m_device->readRemoteFile("", local()));
    QVERIFY(!m_device->readRemoteFile(remoteName, local("no/such/folder")));
    m_fake->failCall("viWrite", VI_ERROR_CONN_LOST);
    QVERIFY(!m_device->readRemoteFile(remoteName, local()));
    QCOMPARE(
        takeLog(),
        (QStringList{"4 Local file name cannot be empty.", "4 Remote file name cannot be empty.",
                     "4 Cannot open local file for writing.", "4 ERROR: status BFFF00A6",
                     "4 Cannot query file from instrument."}));
    QVERIFY(store(local(), "old"));
    m_device->closeResource();
    QVERIFY(!m_device->readRemoteFile(remoteName, local()));
    QCOMPARE(takeLog(),
             (QStringList{"4 Device is not open.", "4 Cannot query file from instrument."}));
    QCOMPARE(load(local()), "old");
}

void TestBlockTransfer::fetchKeepsOldFile()
{
    FakeInstrument &fake = *m_fake;
    std::string answer = "#15he";
    fake->answer = [&](const std::string &message) {
        return message.rfind(":MMEM:DATA?", 0) == 0 ? answer : std::string();
    };
    QVERIFY(store(local(), "old"));
    QVERIFY(!m_device->readRemoteFile(remoteName, local()));
    QCOMPARE(load(local()), "old");
    QCOMPARE(QDir(m_folder.path()).entryList(QDir::Files), QStringList{"local"});
    answer = "#15hello\n";
    QFile::setPermissions(local(), QFile::ReadOwner | QFile::WriteOwner);
    const QFile::Permissions permissions = QFile::permissions(local());
    QVERIFY(QFile::link(local(), local("link")));
    QVERIFY(m_device->readRemoteFile(remoteName, local("link")));
    QCOMPARE(load(local()), "hello");
    QCOMPARE(QFile::permissions(local()), permissions);
    QCOMPARE(QDir(m_folder.path()).entryList(QDir::Files), (QStringList{"link", "local"}));
    QFile::remove(local("link"));
}

void TestBlockTransfer::readStream()
{
    struct Row
    {
        const char *name;
        QByteArray answer;
        QString call; ///< that fails
        bool done;
        QByteArray data;
        QStringList words;
    };
    const QByteArray good = "#216ABCDEFGHIJKLMNOP\n";
    const QByteArray two(4096, 'q');
    FakeInstrument &fake = *m_fake;
    forRows<Row>(
        {{"good", good, "-", true, "ABCDEFGHIJKLMNOP", {}},
         {"two blocks", "#44096" + two + "\n", "-", true, two, {}},
         {"too long", "#44097", "-", false, "", {"4 Data buffer too small."}},
         {"no answer", "", "-", false, "", {"4 Cannot read header length.", timeoutReport}},
         {"text",
          "x",
          "-",
          false,
          "",
          {"4 Invalid character in binary data header. Expected '#'."}},
         {"no length",
          "#2",
          "-",
          false,
          "",
          {"4 Cannot read binary data length information.", timeoutReport}},
         {"data not read", good, "viRead 16", false, "", {"4 Reading failed."}},
         {"no terminator", "#13ABC", "-", false, "", {"4 Cannot read terminating character."}}},
        [&](const Row &row) {
            fake->usesTerminator = true;
            fake->output = row.answer.toStdString();
            fake.failCall(row.call, VI_ERROR_TMO);
            TempStream stream;
            QVERIFY(stream.open());
            QCOMPARE(m_device->readBinaryBlock(stream.stream(), 4096), row.done);
            QCOMPARE(takeLog(), row.words);
            if (row.done) {
                QVERIFY(fake->usesTerminator);
                QVERIFY(stream->checkHeader("IQF"));
                QByteArray read(4096, '\0');
                const int count = stream->readBlock(4096, read.data());
                QCOMPARE(read.left(count), row.data);
            }
        });
    QVERIFY(!m_device->readBinaryBlock(nullptr, 4096));
    QCOMPARE(takeLog(), QStringList{"4 Invalid temporary data buffer."});
}

void TestBlockTransfer::writeHeader()
{
    QCOMPARE(BlockWriter::header("a", 7), ":MMEM:DATA 'a',#17");
    QCOMPARE(BlockWriter::header("a", 10), ":MMEM:DATA 'a',#210");
    QCOMPARE(BlockWriter::header("a", 999'999'999), ":MMEM:DATA 'a',#9999999999");
    QCOMPARE(BlockWriter::header("a", 1'000'000'000), ":MMEM:DATA 'a',#(1000000000)");
}

void TestBlockTransfer::writeFile()
{
    struct Row
    {
        const char *name;
        int size;
        QStringList dataCalls;
    };
    const QString endOn = "viSetAttribute 3FFF0016 1";
    FakeInstrument &fake = *m_fake;
    forRows<Row>({{"1", 1, {endOn, "viWrite 1 END"}},
                  {"a block", 65536, {endOn, "viWrite 65536 END"}},
                  {"more", 65537, {"viWrite 65536", endOn, "viWrite 1 END"}}},
                 [&](const Row &row) {
                     // Line feeds are data like any other.
                     const QByteArray data =
                         QByteArray("\n#*OPC?").repeated(row.size).left(row.size);
                     QVERIFY(store(local(), data));
                     (void)fake.takeCalls();
                     QSignalSpy progress(m_device.get(), &VisaDevice::ProgressUpdate);
                     QVERIFY(m_device->writeRemoteFile(local(), remoteName));
                     QCOMPARE(takeLog(), QStringList{});
                     const QString head = BlockWriter::header(remoteName, row.size);
                     const QStringList calls = fake.takeCalls();
                     const qsizetype first =
                         calls.indexOf(QString("viWrite %1").arg(head.size())) + 1;
                     QVERIFY(first > 0);
                     QCOMPARE(calls.mid(first, row.dataCalls.size()), row.dataCalls);
                     QVERIFY(fake->sendsEnd);
                     QVERIFY(fake.takeMessages().contains(head + QString::fromLatin1(data)));
                     QCOMPARE(progress.first().first().toInt(), 0);
                     QCOMPARE(progress.last().first().toInt(), 100);
                 });
}

void TestBlockTransfer::writeFileFails()
{
    struct Row
    {
        const char *name;
        QString call;
        qint32 status;
        int skipped;
        bool deletes;
        QStringList words;
    };
    const QString lost = "4 ERROR: status BFFF00A6";
    const qint32 gone = VI_ERROR_CONN_LOST;
    // In each the instrument sits in the middle of a block.
    forRows<Row>(
        {{"header", "viWrite 36", gone, 0, false, {lost}},
         {"first block", "viWrite 65536", gone, 0, true, {lost}},
         {"second block with a remark",
          "viWrite 65536",
          VI_SUCCESS_MAX_CNT,
          1,
          true,
          {"4 ERROR: status 3FFF0006"}},
         {"END on", "viSetAttribute 3FFF0016 1", gone, 0, true, {lost}}},
        [this](const Row &row) {
            init();
            FakeInstrument &fake = *m_fake;
            QVERIFY(store(local(), QByteArray(200'000, 'x')));
            // The half-written file shows only in the list that is asked for to delete it.
            fake->answer = [](const std::string &message) {
                return message == ":MMEM:CAT? '/var/user/*.wv'" ? "1,2,\"a.wv,BIN,1024\"\n" : "";
            };
            // Fails once, so that the recovery can work.
            int skipped = row.skipped;
            fake->status = [&](const std::string &call) {
                const bool hit = skipped >= 0 && QString::fromStdString(call).startsWith(row.call);
                return hit && skipped-- == 0 ? row.status : 0;
            };
            QVERIFY(!m_device->writeRemoteFile(local(), remoteName));
            QCOMPARE(takeLog(), row.words);
            const QStringList calls = fake.takeCalls();
            const QStringList messages = fake.takeMessages();
            const auto blank = calls.indexOf("viWrite 1 END");
            QVERIFY(blank >= 0);
            QVERIFY(messages.contains("*CLS"));
            QCOMPARE(messages.contains("MMEM:DEL '/var/user/a.wv'; *OPC?"), row.deletes);
            QCOMPARE(calls.value(blank - 1), "viSetAttribute 3FFF0016 1");
            QCOMPARE(calls.value(blank + 1), "viClear");
            QVERIFY(calls.filter("viOpen").isEmpty());
            QVERIFY(calls.lastIndexOf("viSetAttribute 3FFF0016 1") > blank);
            // The session is of use again.
            fake->status = nullptr;
            QVERIFY(m_device->writeRemoteFile(local(), remoteName));
        });
    // Where the connection is gone, a new one lets the half-written file be removed.
    init();
    FakeInstrument &fake = *m_fake;
    bool isLost = false;
    QVERIFY(store(local(), QByteArray(100'000, 'x')));
    fake->status = [&](const std::string &call) {
        isLost = (isLost || call == "viWrite 65536") && call.rfind("viOpen", 0) != 0;
        return isLost && call.rfind("viClose", 0) != 0 ? gone : 0;
    };
    fake->answer = [](const std::string &message) {
        return message == ":MMEM:CAT? '/var/user/*.wv'" ? "1,2,\"a.wv,BIN,1024\"\n" : "";
    };
    QVERIFY(!m_device->writeRemoteFile(local(), remoteName));
    QVERIFY(fake.takeMessages().contains("MMEM:DEL '/var/user/a.wv'; *OPC?"));
    QVERIFY(m_device->isOpen());
}

void TestBlockTransfer::writeFileReplaces()
{
    FakeInstrument &fake = *m_fake;
    QVERIFY(store(local(), "x"));
    fake->answer = [](const std::string &message) {
        return message == ":MMEM:CAT? '/var/user/'"
                   ? "1,2,\"a.wv,DIR,0\",\"A.wv,BIN,1\",\"a.wv,BIN,5\"\n"
                   : "";
    };
    QVERIFY(m_device->writeRemoteFile(local(), remoteName));
    QCOMPARE(fake.takeMessages().filter("DEL"), QStringList{":MMEM:DEL '/var/user/a.wv'; *OPC?"});
    // Fewer bytes sent than told: nobody knows what the instrument has.
    fake->lostCount = 1;
    (void)takeLog();
    fake->answer = nullptr;
    QVERIFY(!m_device->writeRemoteFile(local(), remoteName));
    QVERIFY(takeLog().contains(
        "4 The number of bytes to send disagrees with the number of bytes sent."));
    fake->lostCount = 0;
    // All moved, yet the instrument complains.
    fake->answer = [&](const std::string &message) {
        if (message.rfind(":MMEM:DATA '", 0) == 0) {
            fake->errors = {"-310,\"System error\""};
        }
        return std::string();
    };
    QVERIFY(!m_device->writeRemoteFile(local(), remoteName));
    QCOMPARE(m_device->takeLastError(), "-310,\"System error\"\n");
}

void TestBlockTransfer::writeFileOverGpib()
{
    FakeInstrument &fake = *m_fake;
    fake->interfaceType = VI_INTF_GPIB;
    QVERIFY(store(local(), QByteArray(1025, 'x')));
    QVERIFY(m_device->writeRemoteFile(local(), remoteName));
    QVERIFY(fake.takeCalls().contains("viWrite 1024"));
    (void)fake.takeMessages();
    QVERIFY(store(local(), "x"));
    QVERIFY(m_device->writeRemoteFile(local(), remoteName));
    const QString eoi = ":SYST:COMM:GPIB:LTER EOI; *OPC?";
    const QString standard = ":SYST:COMM:GPIB:LTER STAN; *OPC?";
    QCOMPARE(fake.takeMessages(), (QStringList{":MMEM:CAT? '/var/user/'", eoi,
                                               ":MMEM:DATA '/var/user/a.wv',#11x", standard}));
    fake->answer = [](const std::string &message) {
        return message.find("LTER EOI") != std::string::npos ? "0\n" : "";
    };
    (void)takeLog();
    QVERIFY(!m_device->writeRemoteFile(local(), remoteName));
    QCOMPARE(takeLog().last(), "4 Cannot set instrument EOI mode.");
    // A broken block ends with the standard mode as well.
    fake->answer = nullptr;
    fake.failCall("viWrite 1 END", VI_ERROR_CONN_LOST);
    (void)fake.takeMessages();
    QVERIFY(!m_device->writeRemoteFile(local(), remoteName));
    QVERIFY(fake.takeMessages().contains(standard));
}

void TestBlockTransfer::writeFileRefuses()
{
    QVERIFY(!m_device->writeRemoteFile("", remoteName));
    QVERIFY(!m_device->writeRemoteFile(local(), ""));
    QVERIFY(!m_device->writeRemoteFile(local(), remoteName));
    QFile big(local());
    QVERIFY(big.open(QIODevice::WriteOnly) && big.resize(qint64{1} << 31));
    QVERIFY(!m_device->writeRemoteFile(local(), remoteName));
    QVERIFY(store(local(), "x"));
    QVERIFY(!m_device->writeRemoteFile(local(), QString::fromUtf8("/var/user/Ω.wv")));
    const QStringList log = takeLog();
    QCOMPARE(log.mid(0, 3),
             (QStringList{"4 Local file name cannot be empty.",
                          "4 Remote file name cannot be empty.", "4 Local file has zero size."}));
    QVERIFY2(log.value(3).contains("2147483648") && log.value(3).contains("2147483647"),
             qPrintable(log.value(3)));
    QVERIFY(m_fake->takeMessages().isEmpty());
}

void TestBlockTransfer::cancel()
{
    for (const bool writes : {false, true}) {
        init();
        FakeInstrument &fake = *m_fake;
        QVERIFY(store(local(), QByteArray(200'000, 'x')));
        // Slow enough for a tick of the progress before the last block.
        QElapsedTimer timer;
        bool isSlow = true;
        fake->status = [&](const std::string &call) {
            const bool isData = call == "viWrite 65536" || call == "viRead 32768";
            timer.start();
            while (isData && isSlow && !timer.hasExpired(110)) {
            }
            return 0;
        };
        fake->answer = [](const std::string &message) -> std::string {
            if (message == ":MMEM:CAT? '/var/user/*.wv'") {
                return "1,2,\"a.wv,BIN,1024\"\n";
            }
            return message.rfind(":MMEM:DATA?", 0) == 0
                       ? "#6100000" + std::string(100'000, 'x') + '\n'
                       : std::string();
        };
        int updates = 0;
        connect(m_device.get(), &VisaDevice::ProgressUpdate, m_device.get(), [&](int) {
            if (++updates == 2) {
                m_device->cancel();
            }
        });
        // A cancel from before the transfer is none of this one.
        m_device->cancel();
        const auto transfer = [&] {
            return writes ? m_device->writeRemoteFile(local(), remoteName)
                          : m_device->readRemoteFile(remoteName, local());
        };
        QVERIFY(!transfer());
        QCOMPARE(updates, 2);
        QVERIFY(takeLog(Tracer::Information).last() == "1 *** Transfer aborted by user.");
        QVERIFY(fake.takeCalls().contains("viClear"));
        const QStringList messages = fake.takeMessages();
        QVERIFY(messages.contains("*CLS"));
        QCOMPARE(messages.contains("MMEM:DEL '/var/user/a.wv'; *OPC?"), writes);
        isSlow = false;
        QVERIFY(transfer());
    }
}

QTEST_GUILESS_MAIN(TestBlockTransfer)
#include "tst_blocktransfer.moc"
