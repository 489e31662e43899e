// SPDX-License-Identifier: Apache-2.0
#include "import/WavFileAccess.h"
#include "jobs/filebytes.h"
#include "log/Tracer.h"
#include "streams/TempStream.h"

#include <QRegularExpression>
#include <QTemporaryDir>
#include <QTest>

#include <vector>

using namespace filebytes;

class TestWavFileAccess : public QObject
{
    Q_OBJECT

private slots:
    void init();
    void checksHeader_data();
    void checksHeader();
    void convertsEachForm_data();
    void convertsEachForm();
    void tellsHeaderFields();
    void namesWhatACutHeaderLacks();
    void logsTheWalk();
    void convertsFullScale();
    void honoursLimit_data();
    void honoursLimit();
    void convertsAcrossBlocks();
    void failsWhereDataEnds_data();
    void failsWhereDataEnds();
    void cancelEndsReading();
    void opensRegularFilesOnly();

private:
    [[nodiscard]] QString stored(const QByteArray &bytes)
    {
        const QString name = m_folder.filePath("test.wav");
        return store(name, bytes) ? name : QString();
    }

    /// The floats that a data stream holds behind its head.
    static std::vector<float> floatsOf(TempStream &stream)
    {
        std::vector<float> values;
        float value = 0;
        if (stream->checkHeader("IQF")) {
            while (stream->readBlock(sizeof value, &value) == sizeof value) {
                values.push_back(value);
            }
        }
        return values;
    }

    QTemporaryDir m_folder;
};

namespace {

const QByteArray fourSamples = words({1, -1, 2, -2, 3, -3, 4, -4});

} // namespace

void TestWavFileAccess::init()
{
    Tracer::setMask(Tracer::DebugMask);
    (void)Tracer::takeEntries();
}

void TestWavFileAccess::checksHeader_data()
{
    QTest::addColumn<QByteArray>("bytes");
    QTest::addColumn<bool>("valid");
    QTest::addColumn<QString>("error"); // empty: the check comes through
    const QByteArray data = chunk("data", fourSamples);
    const QByteArray list = chunk("LIST", "INFOISFT\x04");
    const auto row = [](const char *name, const QByteArray &bytes, bool valid, const char *error) {
        QTest::newRow(name) << bytes << valid << error;
    };
    row("plain", wavFile(formatChunk() + data), true, "");
    row("LIST before data", wavFile(formatChunk() + list + data), true, "");
    row("LIST before fmt", wavFile(list + formatChunk() + data), true, "");
    row("odd chunk, not padded", wavFile(formatChunk() + chunk("LIST", "123456789") + data), true,
        "");
    row("odd chunk, padded", wavFile(chunk("LIST", "123456789") + '\0' + formatChunk() + data),
        true, "");
    row("data length beyond the end", wavFile(formatChunk() + chunk("data", fourSamples, 1 << 30)),
        true, "");
    row("data of 4 GiB", wavFile(formatChunk() + chunk("data", fourSamples, 0xFFFFFFFF)), true, "");
    row("LIST beyond the end", wavFile(formatChunk() + chunk("LIST", "123456789", 5000) + data),
        false, "");
    row("no data", wavFile(formatChunk()), false, "");
    row("no fmt", wavFile(data), false, "");
    row("no chunks", wavFile({}), false, "The file size seems to be invalid.");
    row("rubbish behind data", wavFile(formatChunk() + data) + "xyz", true, "");
    row("big-endian kind", "RIFX" + wavFile(formatChunk() + data).mid(4), false,
        "This is not a valid RIFF waveform file.");
    row("size below 8", "RIFF" + littleEndian(7) + wavFile(formatChunk() + data).mid(8), false,
        "The file size seems to be invalid.");
    row("size unknown to a pipe's writer",
        "RIFF" + littleEndian(-1) + wavFile(formatChunk() + data).mid(8), true, "");
    row("other RIFF file", chunk("RIFF", "AVI " + formatChunk() + data), false,
        "This is not a valid WAVE waveform file.");
    row("chunk of 8 bytes", wavFile(chunk("LIST", "12345678") + formatChunk() + data), false,
        "No chunk length available in .wav file.");
    row("data of 8 bytes", wavFile(formatChunk() + chunk("data", fourSamples.left(8))), false,
        "No chunk length available in .wav file.");
    row("chunk of 0 bytes", wavFile(chunk("LIST", {}) + formatChunk() + data), false,
        "No chunk length available in .wav file.");
    row("fmt of 18 bytes", wavFile(chunk("fmt ", formatChunk().mid(8) + words({0})) + data), true,
        "");
    row("fmt of 20 bytes", wavFile(chunk("fmt ", formatChunk().mid(8) + words({0, 0})) + data),
        false, "Format chunk has invalid length.");
    row("short fact", wavFile(formatChunk() + chunk("fact", littleEndian(4)) + data), true, "");
    row("sound of telephones", wavFile(formatChunk(6, 2, 8000, 2, 8) + data), false,
        "Data Format must be PCM.");
    row("float of 64 bits", wavFile(formatChunk(3, 2, 48000, 16, 64) + data), false,
        "Data must be 16 bits/sample.");
    row("three channels", wavFile(formatChunk(1, 3, 48000, 6, 16) + data), false,
        "File must contain 2 channels.");
    row("24 bit, alignment 8", wavFile(formatChunk(1, 2, 48000, 8, 24) + data), false,
        "Block alignment must be 4 bytes.");
    row("24 bit, alignment 4", wavFile(formatChunk(1, 2, 48000, 4, 24) + data), false,
        "Data must be 16 bits/sample.");
}

void TestWavFileAccess::convertsEachForm_data()
{
    QTest::addColumn<QByteArray>("chunks");
    QTest::addColumn<std::vector<float>>("values");
    const auto row = [](const char *name, const QByteArray &format, const QByteArray &data,
                        const std::vector<float> &values) {
        QTest::newRow(name) << format + chunk("data", data) << values;
    };
    const auto extensible = [](int tag, int alignment, int bits) {
        return chunk("fmt ", formatChunk(0xFFFE, 2, 48000, alignment, bits).mid(8) +
                                 words({22, bits, 3, 0, tag, 0}) +
                                 QByteArray::fromHex("00001000800000aa00389b71"));
    };
    const QByteArray bytes24 = QByteArray::fromHex("000080ffff7f000040010000");
    const std::vector<float> values24{-1, 8388607.0F / 8388608, 0.5F, 1.0F / 8388608};
    row("8 bit, mono", formatChunk(1, 1, 48000, 1, 8), QByteArray::fromHex("0080ff408080808080"),
        {-1, 0, 0, 0, 127.0F / 128, 0, -0.5F, 0, 0, 0, 0, 0, 0, 0, 0, 0, 0, 0});
    row("16 bit, mono", formatChunk(1, 1, 48000, 2, 16), words({-32768, 16384, 0, 0, 0}),
        {-1, 0, 0.5F, 0, 0, 0, 0, 0, 0, 0});
    row("24 bit", formatChunk(1, 2, 48000, 6, 24), bytes24, values24);
    row("24 bit, extensible", extensible(1, 6, 24), bytes24, values24);
    row("32 bit", formatChunk(1, 2, 48000, 8, 32),
        littleEndian(qint32(-0x7FFFFFFF - 1)) + littleEndian(qint32(0x20000000)) +
            littleEndian(qint32(0)) + littleEndian(qint32(-0x40000000)),
        {-1, 0.25F, 0, -0.5F});
    const QByteArray floats =
        littleEndian(1.5F) + littleEndian(-0.1F) + littleEndian(0.0F) + littleEndian(-2.0F);
    row("float", formatChunk(3, 2, 48000, 8, 32), floats, {1.5F, -0.1F, 0, -2});
    row("float, extensible", extensible(3, 8, 32), floats, {1.5F, -0.1F, 0, -2});
}

void TestWavFileAccess::convertsEachForm()
{
    QFETCH(QByteArray, chunks);
    QFETCH(std::vector<float>, values);
    const auto convert = [&](const QByteArray &bytes) {
        WavFileAccess file;
        TempStream stream;
        return file.open(stored(bytes)) && file.readHeader() && stream.open() &&
                       file.readSamples(stream.stream(), 0)
                   ? floatsOf(stream)
                   : std::vector<float>();
    };
    QCOMPARE(convert(wavFile(chunks)), values);
    // The same as RF64, whose lengths of 32 bits say nothing.
    const auto data = chunks.indexOf("data");
    const QByteArray lengths = littleEndian(qint64(1) << 40) +
                               littleEndian(static_cast<qint64>(chunks.size() - data - 8)) +
                               QByteArray(12, '\0');
    QByteArray longForm = chunks;
    longForm.replace(data + 4, 4, littleEndian(qint32(-1)));
    QCOMPARE(
        convert("RF64" + littleEndian(qint32(-1)) + "WAVE" + chunk("ds64", lengths) + longForm),
        values);
}

void TestWavFileAccess::checksHeader()
{
    QFETCH(QByteArray, bytes);
    QFETCH(QString, error);
    WavFileAccess file;
    QVERIFY(file.open(stored(bytes)));
    QCOMPARE(file.readHeader(), error.isEmpty());
    QTEST(file.header().valid, "valid");
    QCOMPARE(takeLog(Tracer::Error), error.isEmpty() ? QStringList() : QStringList(error));
}

void TestWavFileAccess::tellsHeaderFields()
{
    const QByteArray bytes = wavFile(chunk("LIST", "123456789") + formatChunk(1, 2, 192000) +
                                     chunk("data", fourSamples + "x"));
    WavFileAccess file;
    QVERIFY(file.open(stored(bytes)));
    QVERIFY(file.readHeader());
    const WavHeader &header = file.header();
    QCOMPARE(header.formatTag, qint16(1));
    QCOMPARE(header.channels, qint16(2));
    QCOMPARE(header.sampleRate, 192000);
    QCOMPARE(header.byteRate, 768000);
    QCOMPARE(header.blockAlignment, qint16(4));
    QCOMPARE(header.bitsPerSample, qint16(16));
    QCOMPARE(header.dataPosition, bytes.indexOf("data") + 8);
    QCOMPARE(header.dataLength, 17U);
    QCOMPARE(header.samples(), 4);
    QCOMPARE(header.playTime(), 4.0 / 192000);
}

void TestWavFileAccess::namesWhatACutHeaderLacks()
{
    // The plain header of 44 bytes, cut before each of its bytes.
    struct Part
    {
        int end;
        const char *error; // null: the walk over the chunks ends there
    };
    constexpr Part parts[] = {{4, "This is not a valid RIFF waveform file."},
                              {8, "The file size seems to be invalid."},
                              {12, "This is not a valid WAVE waveform file."},
                              {16, nullptr},
                              {20, "No chunk length available in .wav file."},
                              {22, "Data Format must be PCM."},
                              {24, "File must contain 2 channels."},
                              {36, "Cannot read header information from file."},
                              {40, nullptr},
                              {44, "No chunk length available in .wav file."}};
    const QByteArray bytes = wavFile(formatChunk() + chunk("data", fourSamples));
    int length = 0;
    for (const Part &part : parts) {
        for (; length < part.end; ++length) {
            WavFileAccess file;
            QVERIFY(file.open(stored(bytes.left(length))));
            QVERIFY2(file.readHeader() == (part.error == nullptr),
                     qPrintable(QString::number(length)));
            QVERIFY(!file.header().valid);
            QCOMPARE(takeLog(Tracer::Error).value(0), QString(part.error));
        }
    }
}

void TestWavFileAccess::logsTheWalk()
{
    const QString name =
        stored(wavFile(formatChunk() + chunk("LIST", "123456789") + chunk("data", fourSamples)));
    WavFileAccess file;
    QVERIFY(file.open(name));
    QVERIFY(file.readHeader());
    QCOMPARE(takeLog(Tracer::Information), QStringList{"Reading header data from file " + name});
    QVERIFY(file.readHeader());
    QStringList walk = takeLog(Tracer::Debug);
    // Where a chunk begins, at its head or behind it, is left open by the words.
    walk.replaceInStrings(QRegularExpression("position \\d+"), "position N");
    QCOMPARE(walk,
             (QStringList{"Checking .wav file header.", "Evaluating chunks...",
                          "  Found 'fmt' chunk at position N.",
                          "  Found unknown chunk at position N.", "  - ID is 'LIST'.",
                          "  - Chunk Length is 9 bytes.", "  Found 'data' chunk at position N.",
                          "No more header signatures available in .wav file."}));
}

void TestWavFileAccess::convertsFullScale()
{
    WavFileAccess file;
    QVERIFY(file.open(
        stored(wavFile(formatChunk() + chunk("data", words({0x8000, 0x7FFF, 0, 1, -1, 0x4000}))))));
    QVERIFY(file.readHeader());
    (void)Tracer::takeEntries();
    TempStream stream;
    QVERIFY(stream.open());
    QVERIFY(file.readSamples(stream.stream(), 0));
    QCOMPARE(floatsOf(stream), (std::vector<float>{-1.0F, 0.999969482421875F, 0.0F,
                                                   0.000030517578125F, -0.000030517578125F, 0.5F}));
    QCOMPARE(takeLog(Tracer::Information),
             (QStringList{"Reading data from WAV file.", "  Start position : 44",
                          "  Samples to read : 3"}));
}

void TestWavFileAccess::honoursLimit_data()
{
    QTest::addColumn<qint64>("limit");
    QTest::addColumn<size_t>("samples");
    QTest::newRow("none") << qint64(0) << size_t(4);
    QTest::newRow("one") << qint64(1) << size_t(1);
    QTest::newRow("all but one") << qint64(3) << size_t(3);
    QTest::newRow("beyond the end") << qint64(10000) << size_t(4);
}

void TestWavFileAccess::honoursLimit()
{
    QFETCH(qint64, limit);
    QFETCH(size_t, samples);
    WavFileAccess file;
    QVERIFY(file.open(stored(wavFile(formatChunk() + chunk("data", fourSamples)))));
    QVERIFY(file.readHeader());
    TempStream stream;
    QVERIFY(stream.open());
    QVERIFY(file.readSamples(stream.stream(), limit));
    QCOMPARE(floatsOf(stream).size(), 2 * samples);
}

void TestWavFileAccess::convertsAcrossBlocks()
{
    constexpr int samples = 150001;
    QByteArray data;
    std::vector<float> expected;
    for (int i = 0; i < 2 * samples; ++i) {
        const auto word = static_cast<qint16>(i * 7919);
        data += littleEndian(word);
        expected.push_back(static_cast<float>(word / 32768.0));
    }
    WavFileAccess file;
    QVERIFY(file.open(stored(wavFile(formatChunk() + chunk("data", data)))));
    QVERIFY(file.readHeader());
    TempStream stream;
    QVERIFY(stream.open());
    QVERIFY(file.readSamples(stream.stream(), 0));
    QVERIFY(floatsOf(stream) == expected);
}

void TestWavFileAccess::failsWhereDataEnds_data()
{
    QTest::addColumn<qint64>("stated");
    QTest::newRow("one byte short") << qint64(20);
    QTest::newRow("4 GiB claimed") << qint64(0xFFFFFFFF);
}

void TestWavFileAccess::failsWhereDataEnds()
{
    QFETCH(qint64, stated);
    WavFileAccess file;
    QVERIFY(file.open(stored(wavFile(formatChunk() + chunk("data", fourSamples + "xyz", stated)))));
    QVERIFY(file.readHeader());
    TempStream stream;
    QVERIFY(stream.open());
    QVERIFY(!file.readSamples(stream.stream(), 0));
    QCOMPARE(takeLog(Tracer::Error), QStringList{"Cannot read data from .wav file."});
    // A preview of what is there still works.
    QVERIFY(file.readSamples(stream.stream(), 4));
    QCOMPARE(floatsOf(stream).size(), size_t(8));
}

void TestWavFileAccess::cancelEndsReading()
{
    const QString name = stored(wavFile(formatChunk() + chunk("data", fourSamples, 2'000'000'000)));
    QVERIFY(QFile::resize(name, 2'000'000'044));
    WavFileAccess file;
    QVERIFY(file.open(name));
    QVERIFY(file.readHeader());
    TempStream stream;
    QVERIFY(stream.open());
    // A wish from before doesn't count; one from a tick does, and a further run starts anew.
    file.cancel();
    int ticks = 0;
    connect(&file, &WavFileAccess::ProgressUpdate, &file, [&](int percent) {
        QVERIFY(percent >= 0 && percent < 100);
        ++ticks;
        file.cancel();
    });
    for (int run = 1; run <= 2; ++run) {
        QVERIFY(!file.readSamples(stream.stream(), 0));
        QCOMPARE(ticks, run);
        QCOMPARE(takeLog(Tracer::Error), QStringList{"*** Action aborted by user."});
    }
    QVERIFY(file.readSamples(stream.stream(), 4));
}

void TestWavFileAccess::opensRegularFilesOnly()
{
    WavFileAccess file;
    QVERIFY(!file.open(m_folder.filePath("missing.wav")));
    QVERIFY(!file.open(m_folder.path()));
    QVERIFY(!file.open("/dev/zero"));
    QVERIFY(!file.readHeader());
    TempStream stream;
    QVERIFY(stream.open());
    QVERIFY(!file.readSamples(stream.stream(), 0));
    QCOMPARE(takeLog(Tracer::Error), (QStringList{"File is not open.", "File is not open."}));

    QVERIFY(file.open(stored(wavFile(formatChunk() + chunk("data", fourSamples)))));
    file.close();
    // Without a name the file before is opened once more.
    QVERIFY(file.open({}));
    QVERIFY(file.readHeader());
    QVERIFY(file.header().valid);
}

QTEST_GUILESS_MAIN(TestWavFileAccess)
#include "tst_wavfileaccess.moc"
