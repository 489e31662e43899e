// SPDX-License-Identifier: Apache-2.0
#include "FakeInstrument.h"
#include "LogRecorder.h"

#include "instrument/VisaDevice.h"
#include "streams/TempStream.h"
#include "visa/visa.h"

#include <QTest>

#include <memory>

namespace {

const QString timeoutReport = "4 ERROR: status BFFF0015";

} // namespace

class TestBlockStream : public QObject
{
    Q_OBJECT
private slots:
    void init();
    void cleanup();
    void readStream_data();
    void readStream();

private:
    std::unique_ptr<FakeInstrument> m_fake;
    std::unique_ptr<VisaDevice> m_device;
};

void TestBlockStream::init()
{
    m_fake = std::make_unique<FakeInstrument>();
    m_device = std::make_unique<VisaDevice>();
    QVERIFY(m_device->openResource("GPIB0::28::INSTR"));
    (void)takeLog();
}

void TestBlockStream::cleanup()
{
    m_fake.reset();
    m_device.reset();
}

void TestBlockStream::readStream_data()
{
    QTest::addColumn<QByteArray>("answer");
    QTest::addColumn<Fault>("fault");
    QTest::addColumn<bool>("done");
    QTest::addColumn<QByteArray>("data");
    QTest::addColumn<QStringList>("words");
    const QByteArray long16(4096, 'q');
    const Fault none;
    const QByteArray good = "#216ABCDEFGHIJKLMNOP\n";
    const QByteArray all = "ABCDEFGHIJKLMNOP";
    const qint32 timeout = VI_ERROR_TMO;
    QTest::newRow("good") << good << none << true << all << QStringList{};
    QTest::newRow("two blocks") << "#44096" + long16 + "\n"
                                << none << true << long16 << QStringList{};
    QTest::newRow("empty") << QByteArray("#0\n") << none << true << QByteArray() << QStringList{};
    QTest::newRow("too long") << QByteArray("#44097") << none << false << QByteArray()
                              << QStringList{"4 Data buffer too small."};
    QTest::newRow("no answer") << QByteArray() << none << false << QByteArray()
                               << QStringList{"4 Cannot read header length.", timeoutReport};
    QTest::newRow("text") << QByteArray("x") << none << false << QByteArray()
                          << QStringList{
                                 "4 Invalid character in binary data header. Expected '#'."};
    QTest::newRow("no digit") << QByteArray("#x") << none << false << QByteArray()
                              << QStringList{"4 Cannot read header length.", "4 ERROR: status 0"};
    QTest::newRow("no length") << QByteArray("#2") << none << false << QByteArray()
                               << QStringList{"4 Cannot read binary data length information.",
                                              timeoutReport};
    QTest::newRow("attribute not read") << good << Fault{"viGetAttribute 3FFF0038", 1, 0} << false
                                        << QByteArray() << QStringList{"4 ERROR: status 1"};
    QTest::newRow("attribute not set") << good << Fault{"viSetAttribute 3FFF0038 0", 1, 0} << false
                                       << QByteArray() << QStringList{"4 ERROR: status 1"};
    QTest::newRow("attribute not restored") << good << Fault{"viSetAttribute 3FFF0038 1", 1, 0}
                                            << false << all << QStringList{"4 ERROR: status 1"};
    QTest::newRow("data not read") << good << Fault{"viRead 16", timeout, 0} << false
                                   << QByteArray() << QStringList{"4 Reading failed."};
    QTest::newRow("no terminator") << QByteArray("#13ABC") << none << false << QByteArray("ABC")
                                   << QStringList{"4 Cannot read terminating character."};
}

void TestBlockStream::readStream()
{
    QFETCH(const QByteArray, answer);
    QFETCH(const Fault, fault);
    QFETCH(const bool, done);
    QFETCH(const QByteArray, data);
    FakeInstrument &fake = *m_fake;
    fake->usesTerminator = true;
    fake->output = answer.toStdString();
    fake.fail(fault);
    TempStream stream;
    QVERIFY(stream.open());
    QCOMPARE(m_device->readBinaryBlock(stream.stream(), 4096), done);
    QTEST(takeLog(), "words");
    if (done) {
        QVERIFY(fake->usesTerminator);
        QVERIFY(stream->checkHeader("IQF"));
        QByteArray read(4096, '\0');
        const int count = stream->readBlock(4096, read.data());
        QCOMPARE(read.left(count), data);
    }
    QVERIFY(!m_device->readBinaryBlock(nullptr, 4096));
    QCOMPARE(takeLog(), QStringList{"4 Invalid temporary data buffer."});
}

QTEST_GUILESS_MAIN(TestBlockStream)
#include "tst_blockstream.moc"
