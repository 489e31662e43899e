// SPDX-License-Identifier: Apache-2.0
#include "streams/BufferedIO.h"
#include "streams/RunLengthDevice.h"
#include "streams/levels.h"
#include "support/TestDevice.h"
#include "support/logreader.h"
#include "support/rows.h"
#include "support/seed.h"

#include <QTest>

#include <algorithm>
#include <vector>

namespace {

constexpr int Buffer = 1000;

/// The stream as its users know it, with no thought of speed: one window of the file for reading
/// and one piece that waits to be written.
class PlainStream
{
public:
    QByteArray file;

    explicit PlainStream(int bufferSize)
        : m_bufferSize(bufferSize)
    {
    }

    int read(int length, QByteArray &target)
    {
        target.clear();
        while (target.size() < length) {
            const QByteArray part = m_window.mid(m_taken, length - target.size());
            target += part;
            m_taken += part.size();
            if (target.size() < length) {
                m_window = file.mid(m_readPosition, m_bufferSize);
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
        while (m_waiting.size() > m_bufferSize) {
            store(m_waiting.left(m_bufferSize));
            m_waiting.remove(0, m_bufferSize);
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
        m_window = position < 0 ? file.left(m_bufferSize) : QByteArray();
        m_taken = 0;
        m_readPosition = position < 0 ? m_window.size() : position;
    }

private:
    void store(const QByteArray &bytes)
    {
        file.replace(m_writePosition, bytes.size(), bytes);
        m_writePosition += bytes.size();
    }

    const int m_bufferSize;
    QByteArray m_window;
    qsizetype m_taken = 0;
    QByteArray m_waiting;
    qint64 m_readPosition = 0;
    qint64 m_writePosition = 0;
};

} // namespace

class TestStreams : public QObject
{
    Q_OBJECT

private slots:
    void anyOrderOfCalls();
    void modes();
    void failingDevice();
    void runLengths();
    void levelsInOrder();
};

/// Any order of reads, writes and restarts gives what the plain stream gives.
void TestStreams::anyOrderOfCalls()
{
    std::mt19937 random = randomGenerator();
    const auto below = [&random](int limit) {
        return static_cast<int>(random() % static_cast<unsigned>(limit));
    };
    // Blocks from 256 KiB on may go past the buffer.
    forRows({{"a byte", 1, 5, 2000},
             {"some bytes", 1000, 5000, 2000},
             {"below the large blocks", 100'000, 600'000, 500},
             {"above them", 500'000, 900'000, 1000}},
            [&](int bufferSize, int largest, int calls) {
                const QByteArray source = randomBytes(2 * largest);
                TestDevice device;
                device.bytes = randomBytes(largest, 2);
                PlainStream plain(bufferSize);
                plain.file = device.bytes;
                BufferedIO stream(bufferSize);
                QVERIFY(stream.initBuf(&device, BufferedIO::ReadWrite));
                plain.restart(-1);
                QByteArray expected;
                for (int i = 0; i < calls; ++i) {
                    // Often short, and often near the start, where writes begin.
                    const int size = 1 + below(below(2) == 0 ? largest : 1 + below(largest));
                    const QByteArray piece = source.mid(below(largest), size);
                    switch (below(8)) {
                    case 0:
                        QVERIFY(stream.restartAtBegining());
                        plain.restart(-1);
                        QCOMPARE(stream.deviceSize(), plain.file.size());
                        break;
                    case 1: {
                        const int position = below(1 + below(largest));
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
                        QByteArray block = piece;
                        const int got = plain.read(size, expected);
                        if (below(2) == 0) {
                            QCOMPARE(stream.readBlock(size, block.data()), got);
                        } else {
                            QCOMPARE(stream.readBytes(size, block.data()), got > 0);
                        }
                        // Behind the end the caller's bytes stay as they were.
                        QVERIFY(block == expected + piece.mid(got));
                    }
                }
                QVERIFY(stream.releaseBuf());
                plain.restart(-1);
                QVERIFY(device.bytes == plain.file);
            });
}

void TestStreams::modes()
{
    forRows({{"neither", 0, false},
             {"read", BufferedIO::Read, true},
             {"write", BufferedIO::Write, true},
             {"both", BufferedIO::ReadWrite, true}},
            [](int mode, bool starts) {
                TestDevice device;
                device.bytes = "content";
                BufferedIO stream;
                QCOMPARE(stream.initBuf(&device, mode), starts);
                QCOMPARE(stream.isInitialised() && device.isOpen(), starts);
                char block[4] = {};
                QCOMPARE(stream.readBytes(4, block), (mode & BufferedIO::Read) != 0);
                QCOMPARE(stream.writeBytes(3, "new"), (mode & BufferedIO::Write) != 0);
                QCOMPARE(stream.releaseBuf(), starts);
                QVERIFY(!device.isOpen());
                // A released stream goes on where the bytes are.
                QCOMPARE(stream.reinitBuf(), starts);
                QCOMPARE(device.bytes, (mode & BufferedIO::Write) != 0 ? "newtent" : "content");
                QVERIFY2(!stream.initBuf(&device, mode), "a second time without a release");
            });
}

/// Long stretches, changes at each byte, which go to the disk, and gaps, in any order.
void TestStreams::runLengths()
{
    constexpr int Page = 65536;
    std::mt19937 generator = randomGenerator();
    const auto below = [&](int count) {
        return static_cast<int>(generator() % static_cast<unsigned>(count));
    };
    for (int round = 0; round < 30; ++round) {
        RunLengthDevice device;
        QVERIFY(device.open(QIODevice::ReadWrite | QIODevice::Unbuffered));
        QByteArray plain;
        const auto extend = [&plain](qsizetype length) {
            const char last = plain.isEmpty() ? '\0' : plain.back();
            plain.append(std::max<qsizetype>(length - plain.size(), 0), last);
        };
        for (int call = 0; call < 20; ++call) {
            const int size = below(4) == 0 ? Page : 1 + below(below(2) == 0 ? 10 : 2 * Page);
            // Now and then a whole page, or up to the last byte of one.
            const int position = below(3) == 0 ? Page * below(5) : below(5 * Page);
            switch (below(4)) {
            case 0:
                device.extendTo(position);
                extend(position);
                break;
            case 1:
            case 2: {
                const QByteArray bytes = below(3) == 0
                                             ? randomBytes(size, static_cast<unsigned>(below(1000)))
                                             : QByteArray(size, static_cast<char>(below(3)));
                QVERIFY(device.seek(position));
                QCOMPARE(device.write(bytes), size);
                extend(position);
                plain.replace(position, size, bytes);
                break;
            }
            default:
                QVERIFY(device.seek(position));
                QVERIFY(device.read(size) == plain.mid(position, size));
            }
            QCOMPARE(device.size(), plain.size());
        }
        QVERIFY(device.seek(0) && device.readAll() == plain);
    }
}

void TestStreams::failingDevice()
{
    CapturedLog log;
    QByteArray block(2 * Buffer, 'x');
    const int size = 2 * Buffer;
    {
        TestDevice device;
        BufferedIO stream(Buffer);
        device.canOpen = false;
        QVERIFY(!stream.initBuf(&device, BufferedIO::ReadWrite));
        device.canOpen = true;
        device.unreadableFrom = 0;
        QVERIFY(!stream.initBuf(&device, BufferedIO::ReadWrite) && !stream.isInitialised());
    }
    {
        TestDevice device;
        device.bytes = randomBytes(size);
        BufferedIO stream(Buffer);
        QVERIFY(stream.initBuf(&device, BufferedIO::ReadWrite));
        device.unreadableFrom = Buffer;
        QVERIFY(!stream.readBytes(size, block.data()));
        QCOMPARE(stream.readBlock(size, block.data()), -1);
        device.unreadableFrom = -1;
        QVERIFY(stream.restartAtBegining());
        QVERIFY(stream.readBytes(size, block.data()));
        QVERIFY(block == device.bytes);
        device.canSeek = false;
        QVERIFY(!stream.restartAtBegining());
        QVERIFY(!stream.restartAtPosition(3));
        QVERIFY(!stream.writeBytes(size, block.data()));
        QVERIFY(!stream.writeBlock(size, block.data()));
    }
    for (const int capacity : {0, Buffer + 1}) {
        TestDevice device;
        BufferedIO stream(Buffer);
        QVERIFY(stream.initBuf(&device, BufferedIO::ReadWrite));
        device.capacity = capacity;
        // What fits the buffer fails no earlier than its way to the device.
        QVERIFY(stream.writeBytes(100, block.data()));
        QCOMPARE(stream.restartAtBegining(), capacity > 0);
        QVERIFY(!stream.writeBlock(size, block.data()));
        QVERIFY(stream.writeBytes(size, block.data()) || capacity == 0);
        QVERIFY(!stream.restartAtBegining());
        QVERIFY(!stream.releaseBuf());
        QVERIFY(stream.isInitialised());
    }
    QCOMPARE(log.take(), QStringList());
}

void TestStreams::levelsInOrder()
{
    std::mt19937 random = randomGenerator();
    std::uniform_real_distribution<float> around(-2, 2);
    std::vector<float> values(20'014);
    for (float &value : values) {
        value = around(random);
    }
    LevelSums expected;
    for (size_t i = 0; i < values.size(); i += 2) {
        const double power =
            static_cast<double>(values[i]) * static_cast<double>(values[i]) +
            static_cast<double>(values[i + 1]) * static_cast<double>(values[i + 1]);
        expected.sum += power;
        expected.peak = std::max(expected.peak, power);
    }
    for (const size_t block : {2U, 6U, 14U, 512U, 514U, 20014U}) {
        LevelSums sums;
        for (size_t done = 0; done < values.size(); done += block) {
            addLevels(std::span(values).subspan(done, std::min(block, values.size() - done)), sums);
        }
        // Bit by bit: the order of the additions is part of the result.
        QVERIFY(sums.sum == expected.sum && sums.peak == expected.peak);
    }
}

QTEST_GUILESS_MAIN(TestStreams)
#include "tst_streams.moc"
