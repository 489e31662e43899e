// SPDX-License-Identifier: Apache-2.0
#include "import/RiqFileAccess.h"
#include "importsupport.h"
#include "support/files.h"
#include "support/logreader.h"
#include "support/rows.h"

#include <QTest>
#include <QtEndian>

namespace {

template <typename T>
void put(QByteArray &bytes, int offset, T value, bool little = false)
{
    if (little) {
        qToLittleEndian(value, bytes.data() + offset);
    } else {
        qToBigEndian(value, bytes.data() + offset);
    }
}

struct Block
{
    QList<qint16> trace{1, -1, 2, -2};
    bool little = false;
    int optionalLength = 56;
    qint32 sampleRate = 2'000'000;
    qint64 timeNs = 1'700'000'000'123'456'789;

    [[nodiscard]] QByteArray bytes() const
    {
        QByteArray head(28 + optionalLength, '\0');
        put<quint32>(head, 0, 0x000C4D70);
        put<qint16>(head, 4, 1);
        put<qint16>(head, 16, 901);
        put<qint16>(head, 20, static_cast<qint16>(trace.size() / 2));
        head[23] = static_cast<char>(optionalLength);
        put<quint32>(head, 24, little ? 0xA0000000U : 0x80000000U);
        put<qint16>(head, 30, 4, little);
        put<qint32>(head, 32, sampleRate, little);
        put<quint32>(head, 36, 0x80000001U, little);
        put<qint32>(head, 40, 150'000, little);
        put<quint32>(head, 68, 3, little);
        put<qint64>(head, 76, timeNs, little);
        QByteArray words(2 * trace.size(), '\0');
        for (int i = 0; i < trace.size(); ++i) {
            put(words, 2 * i, trace[i], little);
        }
        return head + words;
    }

    /// With one number in the headers replaced.
    template <typename T>
    [[nodiscard]] QByteArray with(int offset, T value) const
    {
        QByteArray changed = bytes();
        put(changed, offset, value);
        return changed;
    }
};

} // namespace

class TestRiqFileAccess : public QObject
{
    Q_OBJECT

private slots:
    void tellsWhatHeadersSay();
    void groupsBlocks();
    void refusesWithItsWords();
    void readsSamples();
    void meetsAFileThatHasChanged();
    void cancelEndsReading();

private:
    TestFolder m_folder;
};

void TestRiqFileAccess::tellsWhatHeadersSay()
{
    forRows({{"big endian", false, 56}, {"little endian", true, 56}, {"long header", true, 100}},
            [this](bool little, int optionalLength) {
                Block block;
                block.little = little;
                block.optionalLength = optionalLength;
                QVERIFY(m_folder.store("a.riq", block.bytes()));
                RiqFileAccess file;
                QVERIFY(file.open(m_folder.path("a.riq")) && file.readDirectory());
                QCOMPARE(file.entries().size(), 1);
                const RiqEntry entry = file.entry(0);
                QVERIFY(entry.valid);
                QCOMPARE(entry.sampleRate, 2'000'000);
                QCOMPARE(entry.ifBandwidth, 150'000);
                // 3 * 65536 + 0x80000001, both without a sign.
                QCOMPARE(entry.ifFrequency, 2147680257.0);
                QCOMPARE(entry.timeStamp.toMSecsSinceEpoch(), 1'700'000'000'123);
                QCOMPARE(entry.samples, 2);
                QCOMPARE(entry.playTime(), 1e-6);
                QVERIFY(!file.entry(1).valid && !file.entry(-1).valid);
            });
}

void TestRiqFileAccess::groupsBlocks()
{
    const Block block;
    Block later = block;
    later.timeNs += 1'000'000'000;
    later.trace = {5, 6, 7, 8, 9, 10};
    Block faster = block;
    faster.sampleRate *= 2;
    const QByteArray one = block.bytes();
    const auto cut = [&one](int bytes) { return one + one.left(bytes); };
    // Each row: the file, and the samples of its entries.
    forRows({{"nothing", QByteArray(), QList<int>{}},
             {"time and length differ", one + later.bytes() + one, {7}},
             {"another rate", one + faster.bytes() + one, {2, 2, 2}},
             {"cut in the fixed header", cut(20), {2}},
             {"cut in the optional header", cut(60), {2}},
             {"cut in the trace", cut(static_cast<int>(one.size()) - 1), {2}}},
            [this](const QByteArray &bytes, const QList<int> &samples) {
                QVERIFY(m_folder.store("b.riq", bytes));
                RiqFileAccess file;
                QVERIFY(file.open(m_folder.path("b.riq")) && file.readDirectory());
                QList<int> found;
                for (const RiqEntry &entry : file.entries()) {
                    found += static_cast<int>(entry.samples);
                }
                QCOMPARE(found, samples);
            });
}

void TestRiqFileAccess::refusesWithItsWords()
{
    const Block block;
    const auto at = [&block](const QString &text) {
        return text + QString(" block starting at positon %1.").arg(block.bytes().size());
    };
    forRows({{"magic", block.with<qint32>(0, 0x12345678), "Invalid magic number in common header."},
             {"tag", block.with<qint16>(16, 902), "Invalid attribute tag in common header."},
             {"no header", block.with<quint32>(24, 0x20000000), at("No optional header in data")},
             {"negative", block.with<qint16>(20, -1), at("Invalid trace length set in data")},
             {"short header", block.with<qint8>(23, 55),
              at("Invalid opt. data block length found in data")},
             {"negative header", block.with<qint8>(23, -1),
              at("Invalid opt. data block length found in data")},
             {"rate", block.with<qint32>(32, 0), at("Invalid sample rate set in data")},
             {"bandwidth", block.with<qint32>(40, 0), at("Invalid IF bandwidth set in data")}},
            [this, &block](const QByteArray &second, const QString &words) {
                QVERIFY(m_folder.store("c.riq", block.bytes() + second));
                RiqFileAccess file;
                static_cast<void>(takeLog());
                QVERIFY(file.open(m_folder.path("c.riq")) && !file.readDirectory());
                QCOMPARE(takeMessages(Tracer::Error).value(0), words);
                QVERIFY(!file.entry(0).valid);
            });
}

void TestRiqFileAccess::readsSamples()
{
    Block block;
    block.little = true;
    block.trace = {-32768, 32767, 16384, -1};
    Block second = block;
    second.trace = {1, 2};
    QVERIFY(m_folder.store("d.riq", block.bytes() + second.bytes()));
    const float lsb = 1.0F / 32768;
    const std::vector<float> all{-1, 0.999969482421875F, 0.5F, -lsb, lsb, 2 * lsb};
    forRows({{"all", 0, 6}, {"one", 1, 2}, {"first block", 2, 4}, {"beyond", 100, 6}},
            [&](int limit, int floats) {
                RiqFileAccess file;
                TempStream stream;
                QVERIFY(file.open(m_folder.path("d.riq")) && file.readDirectory() && stream.open());
                QVERIFY(file.readSamples(0, stream.stream(), limit));
                QCOMPARE(floatsOf(stream), std::vector<float>(all.begin(), all.begin() + floats));
            });
    RiqFileAccess file;
    TempStream stream;
    QVERIFY(stream.open() && file.open(m_folder.path("d.riq")));
    static_cast<void>(takeLog());
    QVERIFY(!file.readSamples(0, stream.stream(), 0));
    QVERIFY(file.readDirectory() && !file.readSamples(1, stream.stream(), 0));
    file.close();
    QVERIFY(!file.readSamples(0, stream.stream(), 0));
    QCOMPARE(takeMessages(Tracer::Error),
             (QStringList{"Directory structure is invalid.", "Invalid data block.",
                          "File is not open."}));
}

void TestRiqFileAccess::meetsAFileThatHasChanged()
{
    const Block block;
    const QByteArray one = block.bytes();
    forRows({{"shorter than the block", one + one.left(one.size() - 1),
              "Cannot read data from .riq file."},
             {"ends at the block", one + one.left(10), "Invalid trace length in UDP block 1."},
             {"ends before it", one.left(one.size() - 2), "Cannot read data from .riq file."},
             {"negative length", one + block.with<qint16>(20, -1),
              "Invalid trace length in UDP block 1."},
             {"no trace", one + block.with<qint16>(20, 0), ""}},
            [&](const QByteArray &bytes, const QString &words) {
                QVERIFY(m_folder.store("e.riq", one + one));
                RiqFileAccess file;
                TempStream stream;
                QVERIFY(file.open(m_folder.path("e.riq")) && file.readDirectory() && stream.open());
                QVERIFY(m_folder.store("e.riq", bytes));
                static_cast<void>(takeLog());
                QCOMPARE(file.readSamples(0, stream.stream(), 0), words.isEmpty());
                QCOMPARE(takeMessages(Tracer::Error).value(0), words);
            });
}

void TestRiqFileAccess::cancelEndsReading()
{
    // Long enough for a tick of 100 ms on any machine.
    Block block;
    block.trace = QList<qint16>(2);
    const QByteArray one = block.bytes();
    QByteArray bytes;
    bytes.reserve(one.size() * 1'000'000);
    for (int i = 0; i < 1'000'000; ++i) {
        bytes += one;
    }
    QVERIFY(m_folder.store("f.riq", bytes));
    RiqFileAccess file;
    QVERIFY(file.open(m_folder.path("f.riq")));
    connect(&file, &RiqFileAccess::ProgressUpdate, &file, &RiqFileAccess::cancel);
    static_cast<void>(takeLog());
    QVERIFY(!file.readDirectory());
    QCOMPARE(takeMessages(Tracer::Error), QStringList("*** Action aborted by user."));
    QVERIFY(file.entries().isEmpty());
}

QTEST_GUILESS_MAIN(TestRiqFileAccess)
#include "tst_riqfileaccess.moc"
