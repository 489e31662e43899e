// SPDX-License-Identifier: Apache-2.0
#include "TestDevice.h"

#include "log/CapturedLog.h"
#include "streams/BufferedIO.h"

#include <QTemporaryFile>
#include <QTest>

#include <random>

namespace {

constexpr qint64 mebibyte = 1'048'576;

/// Bytes whose place can be told from them.
QByteArray pattern(qint64 size)
{
    QByteArray bytes(size, Qt::Uninitialized);
    quint32 state = 12345;
    for (char &byte : bytes) {
        state = state * 1664525U + 1013904223U;
        byte = static_cast<char>(state >> 24);
    }
    return bytes;
}

/// The stream as its users know it, with no thought of speed: one window of the file for reading
/// and one piece that waits to be written.
class PlainStream
{
public:
    QByteArray file;

    int read(int length, QByteArray &target)
    {
        target.clear();
        while (target.size() < length) {
            const QByteArray part = m_window.mid(m_taken, length - target.size());
            target += part;
            m_taken += part.size();
            if (target.size() < length) {
                m_window = file.mid(m_readPosition, BufferedIO::BufferSize);
                m_taken = 0;
                m_readPosition += m_window.size();
                if (m_window.isEmpty()) {
                    break;
                }
            }
        }
        return static_cast<int>(target.size());
    }

    void write(const QByteArray &bytes)
    {
        m_waiting += bytes;
        while (m_waiting.size() > BufferedIO::BufferSize) {
            store(m_waiting.left(BufferedIO::BufferSize));
            m_waiting.remove(0, BufferedIO::BufferSize);
        }
    }

    void writeBlock(const QByteArray &bytes)
    {
        store(m_waiting + bytes);
        m_waiting.clear();
    }

    void restart(qint64 position)
    {
        store(m_waiting);
        m_waiting.clear();
        m_writePosition = 0;
        m_window = position < 0 ? file.left(BufferedIO::BufferSize) : QByteArray();
        m_taken = 0;
        m_readPosition = position < 0 ? m_window.size() : position;
    }

private:
    void store(const QByteArray &bytes)
    {
        file.replace(m_writePosition, bytes.size(), bytes);
        m_writePosition += bytes.size();
    }

    QByteArray m_window;
    qsizetype m_taken = 0;
    QByteArray m_waiting;
    qint64 m_readPosition = 0;
    qint64 m_writePosition = 0;
};

} // namespace

class TestBufferedIO : public QObject
{
    Q_OBJECT

private slots:
    void anyBlockSize_data();
    void anyBlockSize();
    void shortEnds();
    void nothingIsReadBeforeARestart();
    void headers();
    void positions();
    void markersRewrittenInPlace();
    void writesDontOvertakeReads();
    void mixedUse();
    void modes_data();
    void modes();
    void releasedAndTakenUpAgain();
    void wordsWithoutInitialisation();
    void wordsInDebug();
    void failingDevice_data();
    void failingDevice();
};

void TestBufferedIO::anyBlockSize_data()
{
    QTest::addColumn<int>("writeSize");
    QTest::addColumn<int>("readSize");
    QTest::addColumn<bool>("atOnce");
    const int buffer = BufferedIO::BufferSize;
    QTest::newRow("write 7, read 8") << 7 << 8 << false;
    for (const int size : {64 * 1024, 256 * 1024 + 1, buffer - 1, buffer, buffer + 1,
                           2 * buffer + 5, 36 * 1024 * 1024}) {
        QTest::addRow("write %d, read 65536", size) << size << 65536 << false;
        QTest::addRow("write 65536, read %d", size) << 65536 << size << false;
        QTest::addRow("write %d at once, read %d", size, size) << size << size << true;
    }
}

void TestBufferedIO::anyBlockSize()
{
    QFETCH(int, writeSize);
    QFETCH(int, readSize);
    QFETCH(bool, atOnce);
    static const QByteArray content = pattern(36 * mebibyte + 13);
    TestDevice device;
    BufferedIO stream;
    QVERIFY(stream.initBuf(&device, BufferedIO::ReadWrite));
    for (qint64 done = 0; done < content.size(); done += writeSize) {
        const int size = static_cast<int>(std::min<qint64>(writeSize, content.size() - done));
        QVERIFY(atOnce ? stream.writeBlock(size, content.constData() + done)
                       : stream.writeBytes(size, content.constData() + done));
    }
    QVERIFY(stream.restartAtBegining());
    QCOMPARE(stream.deviceSize(), content.size());
    QVERIFY(device.bytes == content);

    QByteArray block(readSize, '\0');
    for (qint64 done = 0; done < content.size(); done += readSize) {
        const qint64 size = std::min<qint64>(readSize, content.size() - done);
        block.fill('\0');
        QVERIFY(stream.readBytes(readSize, block.data()));
        QVERIFY(memcmp(block.constData(), content.constData() + done, static_cast<size_t>(size)) ==
                0);
        // Behind the end the caller's bytes stay as they were.
        QVERIFY(size == readSize || block.mid(size) == QByteArray(readSize - size, '\0'));
    }
    QVERIFY(!stream.readBytes(1, block.data()));
    QVERIFY(!stream.readBytes(1, block.data()));
}

void TestBufferedIO::shortEnds()
{
    TestDevice device;
    device.bytes = "0123456789abc";
    BufferedIO stream;
    QVERIFY(stream.initBuf(&device, BufferedIO::ReadWrite));
    char block[8] = {};
    QVERIFY(stream.readBytes(8, block));
    QVERIFY(stream.readBytes(8, block));
    QCOMPARE(QByteArray(block, 8), QByteArray("89abc567"));
    QVERIFY(!stream.readBytes(8, block));
    QCOMPARE(stream.readBlock(8, block), 0);

    QVERIFY(stream.restartAtBegining());
    QVERIFY(!stream.readBytes(0, block));
    QVERIFY(!stream.readBytes(-1, block));
    QVERIFY(!stream.readBytes(4, nullptr));
    QVERIFY(!stream.writeBytes(0, block));
    QVERIFY(!stream.writeBytes(-1, block));
    QVERIFY(!stream.writeBytes(4, nullptr));
    QVERIFY(!stream.writeBlock(0, block));
    QVERIFY(!stream.writeBlock(4, nullptr));
}

void TestBufferedIO::nothingIsReadBeforeARestart()
{
    TestDevice device;
    BufferedIO stream;
    QVERIFY(stream.initBuf(&device, BufferedIO::ReadWrite));
    const QByteArray bytes = pattern(mebibyte);
    const auto size = static_cast<int>(bytes.size());
    QByteArray block(mebibyte, '\0');
    QVERIFY(stream.writeBytes(size, bytes.constData()));
    QVERIFY(!stream.readBytes(size, block.data()));
    QVERIFY(stream.restartAtBegining());
    QVERIFY(stream.readBytes(size, block.data()));
    QVERIFY(block == bytes);
}

void TestBufferedIO::headers()
{
    TestDevice device;
    BufferedIO stream;
    QVERIFY(stream.initBuf(&device, BufferedIO::ReadWrite));
    QVERIFY(!stream.checkHeader("IQF"));
    QVERIFY(stream.writeHeader("IQ"));
    QVERIFY(!stream.checkHeader("IQF"));
    const float record[2] = {0.25F, -0.5F};
    QVERIFY(stream.writeHeader("IQF"));
    QVERIFY(stream.writeBytes(BufferedIO::RecordSize, record));
    QVERIFY(stream.checkHeader("IQF"));
    float back[2] = {};
    QVERIFY(stream.readBytes(BufferedIO::RecordSize, back));
    QCOMPARE(back[0], record[0]);
    QCOMPARE(back[1], record[1]);
    QCOMPARE(device.bytes.size(), qsizetype(BufferedIO::HeaderSize + BufferedIO::RecordSize));
    QVERIFY(!stream.checkHeader("iqf"));
}

void TestBufferedIO::positions()
{
    const QByteArray content = pattern(20 * mebibyte);
    TestDevice device;
    device.bytes = content;
    BufferedIO stream;
    QVERIFY(stream.initBuf(&device, BufferedIO::ReadWrite));
    QByteArray block(100, '\0');
    for (const qint64 position : {3LL, 0LL, 3LL + 8LL * 1'000'000, 17LL * mebibyte, 5LL}) {
        QVERIFY(stream.restartAtPosition(position));
        QVERIFY(stream.readBytes(100, block.data()));
        QCOMPARE(block, content.mid(position, 100));
    }
    // The position is one of the read side: what is written goes to the start.
    QVERIFY(stream.restartAtPosition(50));
    QVERIFY(stream.writeBytes(4, "new!"));
    QVERIFY(stream.readBytes(100, block.data()));
    QCOMPARE(block, content.mid(50, 100));
    QVERIFY(stream.restartAtBegining());
    QVERIFY(device.bytes == "new!" + content.mid(4));
    QVERIFY(stream.restartAtPosition(content.size()));
    QVERIFY(!stream.readBytes(1, block.data()));
}

void TestBufferedIO::markersRewrittenInPlace()
{
    const QByteArray content = pattern(33 * mebibyte + 7);
    QTemporaryFile file;
    BufferedIO stream;
    QVERIFY(stream.initBuf(&file, BufferedIO::ReadWrite));
    QVERIFY(stream.writeBytes(static_cast<int>(content.size()), content.constData()));
    QVERIFY(stream.restartAtBegining());
    for (qsizetype i = 0; i < content.size(); ++i) {
        char byte = 0;
        if (!stream.readBytes(1, &byte)) {
            QFAIL("read");
        }
        byte = static_cast<char>(byte ^ 5);
        if (!stream.writeBytes(1, &byte)) {
            QFAIL("write");
        }
    }
    QVERIFY(stream.restartAtBegining());
    QByteArray back(content.size(), '\0');
    QVERIFY(stream.readBytes(static_cast<int>(back.size()), back.data()));
    for (char &byte : back) {
        byte = static_cast<char>(byte ^ 5);
    }
    QVERIFY(back == content);
}

/// A read takes a whole buffer out of the file, also one that is long enough to go past the buffer:
/// what is written over that part afterwards is not seen.
void TestBufferedIO::writesDontOvertakeReads()
{
    TestDevice device;
    device.bytes = pattern(40 * mebibyte);
    const QByteArray before = device.bytes;
    BufferedIO stream;
    QVERIFY(stream.initBuf(&device, BufferedIO::ReadWrite));
    QVERIFY(stream.restartAtPosition(0));
    QByteArray block(mebibyte, '\0');
    QVERIFY(stream.readBytes(mebibyte, block.data()));
    const QByteArray fresh(20 * mebibyte, 'x');
    QVERIFY(stream.writeBlock(20 * mebibyte, fresh.constData()));
    block.resize(17 * mebibyte);
    QVERIFY(stream.readBytes(17 * mebibyte, block.data()));
    QVERIFY(block.left(15 * mebibyte) == before.mid(mebibyte, 15 * mebibyte));
    QVERIFY(block.mid(15 * mebibyte) == fresh.left(2 * mebibyte));
}

/// Any order of reads, writes and restarts gives what the plain stream gives.
void TestBufferedIO::mixedUse()
{
    const QString wanted = qEnvironmentVariable("CORVANE_TEST_SEED");
    const unsigned seed = wanted.isEmpty() ? std::random_device{}() : wanted.toUInt();
    qInfo("seed %u", seed);
    std::mt19937 random(seed);
    const QByteArray source = pattern(64 * mebibyte);
    TestDevice device;
    device.bytes = pattern(20 * mebibyte);
    PlainStream plain;
    plain.file = device.bytes;
    BufferedIO stream;
    QVERIFY(stream.initBuf(&device, BufferedIO::ReadWrite));
    plain.restart(-1);
    QByteArray block;
    QByteArray expected;
    for (int i = 0; i < 300; ++i) {
        constexpr int sizes[] = {1, 100, 70'000, 300'000, 1'000'000, 9'000'000, 17'000'000};
        const int size =
            1 + static_cast<int>(random() % static_cast<unsigned>(sizes[random() % 7]));
        const QByteArray piece = source.mid(static_cast<qsizetype>(random() % 40'000'000), size);
        switch (random() % 8) {
        case 0:
            QVERIFY(stream.restartAtBegining());
            plain.restart(-1);
            break;
        case 1: {
            const auto position = static_cast<qint64>(random() % 20'000'000);
            QVERIFY(stream.restartAtPosition(position));
            plain.restart(position);
            break;
        }
        case 2:
            QVERIFY(stream.writeBlock(size, piece.constData()));
            plain.writeBlock(piece);
            break;
        case 3:
        case 4:
            QVERIFY(stream.writeBytes(size, piece.constData()));
            plain.write(piece);
            break;
        default:
            block.fill('\0', size);
            QCOMPARE(stream.readBlock(size, block.data()), plain.read(size, expected));
            QVERIFY(block.left(expected.size()) == expected);
        }
    }
    QVERIFY(stream.releaseBuf());
    plain.restart(-1);
    QVERIFY(device.bytes == plain.file);
}

void TestBufferedIO::modes_data()
{
    QTest::addColumn<int>("mode");
    QTest::addColumn<bool>("starts");
    QTest::newRow("neither") << 0 << false;
    QTest::newRow("unknown bit") << 4 << false;
    QTest::newRow("read") << int(BufferedIO::Read) << true;
    QTest::newRow("write") << int(BufferedIO::Write) << true;
    QTest::newRow("both") << int(BufferedIO::ReadWrite) << true;
}

void TestBufferedIO::modes()
{
    QFETCH(int, mode);
    QFETCH(bool, starts);
    TestDevice device;
    device.bytes = "content";
    BufferedIO stream;
    QCOMPARE(stream.initBuf(&device, mode), starts);
    QCOMPARE(stream.isInitialised(), starts);
    QCOMPARE(device.isOpen(), starts);
    if (!starts) {
        QVERIFY(!stream.initBuf(nullptr, BufferedIO::ReadWrite));
        return;
    }
    QVERIFY2(!stream.initBuf(&device, mode), "a second time without a release");
    char block[4] = {};
    QCOMPARE(stream.readBytes(4, block), (mode & BufferedIO::Read) != 0);
    QCOMPARE(stream.writeBytes(3, "new"), (mode & BufferedIO::Write) != 0);
    QVERIFY(stream.restartAtBegining());
    QCOMPARE(device.bytes, QByteArray(mode == BufferedIO::Read ? "content" : "newtent"));
    QVERIFY(stream.releaseBuf());
    QVERIFY(!device.isOpen());
}

void TestBufferedIO::releasedAndTakenUpAgain()
{
    QTemporaryFile file;
    BufferedIO stream;
    QVERIFY(!stream.reinitBuf());
    QVERIFY(stream.initBuf(&file, BufferedIO::ReadWrite));
    const QString name = file.fileName();
    QVERIFY(stream.writeBytes(5, "bytes"));
    QVERIFY(stream.releaseBuf());
    QVERIFY(!stream.isInitialised());
    QVERIFY(stream.reinitBuf());
    QCOMPARE(file.fileName(), name);
    char back[5] = {};
    QVERIFY(stream.readBytes(5, back));
    QCOMPARE(QByteArray(back, 5), QByteArray("bytes"));
}

void TestBufferedIO::wordsWithoutInitialisation()
{
    CapturedLog log;
    TestDevice device;
    BufferedIO stream;
    char byte = 0;
    QVERIFY(!stream.readBytes(1, &byte));
    QVERIFY(!stream.writeBytes(1, &byte));
    QVERIFY(!stream.writeBlock(1, &byte));
    QVERIFY(!stream.restartAtBegining());
    QVERIFY(!stream.restartAtPosition(3));
    QVERIFY(!stream.checkHeader("IQF"));
    QVERIFY(!stream.writeHeader("IQF"));
    QVERIFY(!stream.releaseBuf());
    QStringList expected(7, "4|Library not initialized.");
    expected << "4|Buffer not initialized.";
    QCOMPARE(log.take(), expected);

    // All other failures are the caller's to name.
    QVERIFY(!stream.initBuf(&device, 0));
    QVERIFY(stream.initBuf(&device, BufferedIO::ReadWrite));
    QVERIFY(!stream.initBuf(&device, BufferedIO::ReadWrite));
    QVERIFY(!stream.readBytes(1, &byte));
    QCOMPARE(log.take(), QStringList());
}

void TestBufferedIO::wordsInDebug()
{
    CapturedLog log(Tracer::DebugMask);
    TestDevice device;
    BufferedIO stream;
    stream.setDebug(true);
    QVERIFY(!stream.initBuf(&device, 0));
    QVERIFY(stream.initBuf(&device, BufferedIO::ReadWrite));
    QVERIFY(!stream.initBuf(&device, BufferedIO::ReadWrite));
    QVERIFY(stream.writeBytes(3, "abc"));
    QVERIFY(stream.restartAtBegining());
    char block[4] = {};
    QVERIFY(stream.readBytes(4, block));
    QVERIFY(stream.releaseBuf());
    const QStringList lines = log.take();
    QCOMPARE(lines.value(0), QString("4|Buffered IO must be read, write, or both."));
    QCOMPARE(lines.value(1), QString("16|initBuf() : R indata=0, rpointer=0"));
    QCOMPARE(lines.value(2), QString("4|Buffered IO class is already initialized."));
    for (const char *line : {"16|restartAtBegining()", "16|flush() : W len=3",
                             "16|readBytes() : R remaining len=1, acquiring again",
                             "16|readBytes() : R no more data available", "16|releaseBuf()"}) {
        QVERIFY2(lines.contains(line), line);
    }
}

void TestBufferedIO::failingDevice_data()
{
    QTest::addColumn<QString>("fault");
    QTest::newRow("does not open") << "open";
    QTest::newRow("does not read at the start") << "read 0";
    QTest::newRow("does not read behind the first block") << "read 1";
    QTest::newRow("full at once") << "full 0";
    QTest::newRow("full behind the first block") << "full 1";
    QTest::newRow("does not seek") << "seek";
}

void TestBufferedIO::failingDevice()
{
    QFETCH(QString, fault);
    CapturedLog log;
    TestDevice device;
    device.bytes = pattern(20 * mebibyte);
    BufferedIO stream;
    QByteArray block(20 * mebibyte, '\0');
    const int size = static_cast<int>(block.size());
    if (fault == "open") {
        device.canOpen = false;
        QVERIFY(!stream.initBuf(&device, BufferedIO::ReadWrite));
    } else if (fault == "read 0") {
        device.unreadableFrom = 0;
        QVERIFY(!stream.initBuf(&device, BufferedIO::ReadWrite));
        QVERIFY(!stream.isInitialised());
    } else if (fault == "read 1") {
        QVERIFY(stream.initBuf(&device, BufferedIO::ReadWrite));
        device.unreadableFrom = BufferedIO::BufferSize;
        QVERIFY(!stream.readBytes(size, block.data()));
        QCOMPARE(stream.readBlock(size, block.data()), -1);
        device.unreadableFrom = -1;
        QVERIFY(stream.restartAtBegining());
        QVERIFY(stream.readBytes(size, block.data()));
        QVERIFY(block == device.bytes);
    } else if (fault == "seek") {
        QVERIFY(stream.initBuf(&device, BufferedIO::ReadWrite));
        device.canSeek = false;
        QVERIFY(!stream.restartAtBegining());
        QVERIFY(!stream.restartAtPosition(3));
        QVERIFY(!stream.writeBytes(size, block.data()));
        QVERIFY(!stream.writeBlock(size, block.data()));
    } else {
        QVERIFY(stream.initBuf(&device, BufferedIO::ReadWrite));
        device.capacity = fault == "full 0" ? 0 : BufferedIO::BufferSize + 1;
        // What fits the buffer fails no earlier than its way to the device.
        QVERIFY(stream.writeBytes(100, block.data()));
        QCOMPARE(stream.restartAtBegining(), fault != "full 0");
        QVERIFY(!stream.writeBlock(size, block.data()));
        QVERIFY(stream.writeBytes(size, block.data()) || fault == "full 0");
        QVERIFY(!stream.restartAtBegining());
        QVERIFY(!stream.releaseBuf());
        QVERIFY(stream.isInitialised());
    }
    QCOMPARE(log.take(), QStringList());
}

QTEST_GUILESS_MAIN(TestBufferedIO)
#include "tst_bufferedio.moc"
