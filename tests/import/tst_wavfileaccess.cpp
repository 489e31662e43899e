// SPDX-License-Identifier: Apache-2.0
#include "import/WavFileAccess.h"
#include "importsupport.h"
#include "support/files.h"
#include "support/logreader.h"
#include "support/rows.h"
#include "support/wavbytes.h"

#include <QFile>
#include <QTest>

#include <vector>

class TestWavFileAccess : public QObject
{
    Q_OBJECT

private slots:
    void init() { (void)takeLog(); }
    void checksHeader();
    void convertsEachForm();
    void survivesEachCut();
    void convertsAcrossBlocks();
    void failsWhereDataEnds();
    void cancelEndsReading();
    void opensRegularFilesOnly();

private:
    [[nodiscard]] QString stored(const QByteArray &bytes)
    {
        return m_folder.store("test.wav", bytes) ? m_folder.path("test.wav") : QString();
    }

    TestFolder m_folder;
};

namespace {

const QByteArray fourSamples = words({1, -1, 2, -2, 3, -3, 4, -4});

} // namespace

void TestWavFileAccess::checksHeader()
{
    const QByteArray data = chunk("data", fourSamples);
    const QByteArray list = chunk("LIST", "INFOISFT\x04");
    // Without an error the check comes through.
    forRows(
        {{"plain", wavFile(formatChunk() + data), true, ""},
         {"LIST before data", wavFile(formatChunk() + list + data), true, ""},
         {"LIST before fmt", wavFile(list + formatChunk() + data), true, ""},
         {"odd chunk, not padded", wavFile(formatChunk() + chunk("LIST", "123456789") + data), true,
          ""},
         {"odd chunk, padded", wavFile(chunk("LIST", "123456789") + '\0' + formatChunk() + data),
          true, ""},
         {"no fmt", wavFile(data), false, ""},
         {"data length beyond the end",
          wavFile(formatChunk() + chunk("data", fourSamples, 1 << 30)), true, ""},
         {"data of 4 GiB", wavFile(formatChunk() + chunk("data", fourSamples, 0xFFFFFFFF)), true,
          ""},
         {"LIST beyond the end", wavFile(formatChunk() + chunk("LIST", "123456789", 5000) + data),
          false, ""},
         {"no data", wavFile(formatChunk()), false, ""},
         {"no chunks", wavFile({}), false, "The file size seems to be invalid."},
         {"rubbish behind data", wavFile(formatChunk() + data) + "xyz", true, ""},
         {"size below 8", "RIFF" + littleEndian(7) + wavFile(formatChunk() + data).mid(8), false,
          "The file size seems to be invalid."},
         {"size unknown to a pipe's writer",
          "RIFF" + littleEndian(-1) + wavFile(formatChunk() + data).mid(8), true, ""},
         {"other RIFF file", chunk("RIFF", "AVI " + formatChunk() + data), false,
          "This is not a valid WAVE waveform file."},
         {"data of 8 bytes", wavFile(formatChunk() + chunk("data", fourSamples.left(8))), false,
          "No chunk length available in .wav file."},
         {"chunk of 0 bytes", wavFile(chunk("LIST", {}) + formatChunk() + data), false,
          "No chunk length available in .wav file."},
         {"fmt of 18 bytes", wavFile(chunk("fmt ", formatChunk().mid(8) + words({0})) + data), true,
          ""},
         {"short fact", wavFile(formatChunk() + chunk("fact", littleEndian(4)) + data), true, ""},
         {"sound of telephones", wavFile(formatChunk(6, 2, 8000, 2, 8) + data), false,
          "Data Format must be PCM."},
         {"float of 64 bits", wavFile(formatChunk(3, 2, 48000, 16, 64) + data), false,
          "Data must be 16 bits/sample."},
         {"three channels", wavFile(formatChunk(1, 3, 48000, 6, 16) + data), false,
          "File must contain 2 channels."},
         {"24 bit, alignment 8", wavFile(formatChunk(1, 2, 48000, 8, 24) + data), false,
          "Block alignment must be 4 bytes."}},
        [this](const QByteArray &bytes, bool valid, const QString &error) {
            WavFileAccess file;
            QVERIFY(file.open(stored(bytes)));
            QCOMPARE(file.readHeader(), error.isEmpty());
            QCOMPARE(file.header().valid, valid);
            QCOMPARE(takeMessages(Tracer::Error).value(0), error);
        });
}

void TestWavFileAccess::convertsEachForm()
{
    const auto extensible = [](int tag, int alignment, int bits) {
        return chunk("fmt ", formatChunk(0xFFFE, 2, 48000, alignment, bits).mid(8) +
                                 words({22, bits, 3, 0, tag, 0}) +
                                 QByteArray::fromHex("00001000800000aa00389b71"));
    };
    const QByteArray bytes24 = QByteArray::fromHex("000080ffff7f000040010000");
    const std::vector<float> values24{-1, 8388607.0F / 8388608, 0.5F, 1.0F / 8388608};
    const float lsb = 1.0F / 32768;
    const QByteArray floats =
        littleEndian(1.5F) + littleEndian(-0.1F) + littleEndian(0.0F) + littleEndian(-2.0F);
    const auto convert = [this](const QByteArray &bytes) {
        WavFileAccess file;
        TempStream stream;
        return file.open(stored(bytes)) && file.readHeader() && stream.open() &&
                       file.readSamples(stream.stream(), 0)
                   ? floatsOf(stream)
                   : std::vector<float>();
    };
    const auto check = [&](const QByteArray &format, const QByteArray &data,
                           const std::vector<float> &values) {
        QCOMPARE(convert(wavFile(format + chunk("data", data))), values);
        // The same as RF64, whose lengths of 32 bits say nothing.
        const QByteArray lengths = littleEndian(qint64(1) << 40) +
                                   littleEndian(qint64(data.size())) + QByteArray(12, '\0');
        QCOMPARE(convert("RF64" + littleEndian(qint32(-1)) + "WAVE" + chunk("ds64", lengths) +
                         format + chunk("data", data, 0xFFFFFFFF)),
                 values);
    };
    forRows({{"16 bit",
              formatChunk(),
              words({0x8000, 0x7FFF, 0, 1, -1, 0x4000}),
              {-1, 1 - lsb, 0, lsb, -lsb, 0.5F}},
             {"8 bit, mono",
              formatChunk(1, 1, 48000, 1, 8),
              QByteArray::fromHex("0080ff408080808080"),
              {-1, 0, 0, 0, 127.0F / 128, 0, -0.5F, 0, 0, 0, 0, 0, 0, 0, 0, 0, 0, 0}},
             {"16 bit, mono",
              formatChunk(1, 1, 48000, 2, 16),
              words({-32768, 16384, 0, 0, 0}),
              {-1, 0, 0.5F, 0, 0, 0, 0, 0, 0, 0}},
             {"24 bit", formatChunk(1, 2, 48000, 6, 24), bytes24, values24},
             {"24 bit, extensible", extensible(1, 6, 24), bytes24, values24},
             {"32 bit",
              formatChunk(1, 2, 48000, 8, 32),
              littleEndian(qint32(-0x7FFFFFFF - 1)) + littleEndian(qint32(0x20000000)) +
                  littleEndian(qint32(0)) + littleEndian(qint32(-0x40000000)),
              {-1, 0.25F, 0, -0.5F}},
             {"float", formatChunk(3, 2, 48000, 8, 32), floats, {1.5F, -0.1F, 0, -2}},
             {"float, extensible", extensible(3, 8, 32), floats, {1.5F, -0.1F, 0, -2}}},
            check);
}

/// The plain header of 44 bytes, cut before each of its bytes: a failure, or no data.
void TestWavFileAccess::survivesEachCut()
{
    const QByteArray bytes = wavFile(formatChunk() + chunk("data", fourSamples));
    for (int length = 0; length < 44; ++length) {
        WavFileAccess file;
        QVERIFY(file.open(stored(bytes.left(length))));
        const bool read = file.readHeader();
        QCOMPARE(takeLog(Tracer::Error).isEmpty(), read);
        QVERIFY(!file.header().valid);
    }
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

void TestWavFileAccess::failsWhereDataEnds()
{
    for (const qint64 stated : {qint64(20), qint64(0xFFFFFFFF)}) {
        WavFileAccess file;
        QVERIFY(
            file.open(stored(wavFile(formatChunk() + chunk("data", fourSamples + "xyz", stated)))));
        QVERIFY(file.readHeader());
        TempStream stream;
        QVERIFY(stream.open());
        QVERIFY(!file.readSamples(stream.stream(), 0));
        QCOMPARE(takeMessages(Tracer::Error), QStringList{"Cannot read data from .wav file."});
        // A preview of what is there still works.
        for (const int limit : {1, 3, 4}) {
            TempStream preview;
            QVERIFY(preview.open() && file.readSamples(preview.stream(), limit));
            QCOMPARE(floatsOf(preview).size(), size_t(2 * limit));
        }
    }
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
        QCOMPARE(takeMessages(Tracer::Error), QStringList{"*** Action aborted by user."});
    }
    QVERIFY(file.readSamples(stream.stream(), 4));
}

void TestWavFileAccess::opensRegularFilesOnly()
{
    WavFileAccess file;
    QVERIFY(!file.open(m_folder.path("missing.wav")));
    QVERIFY(!file.open(m_folder.path()));
    QVERIFY(!file.open("/dev/zero"));
    QVERIFY(!file.readHeader());
    TempStream stream;
    QVERIFY(stream.open());
    QVERIFY(!file.readSamples(stream.stream(), 0));
    QCOMPARE(takeMessages(Tracer::Error), QStringList(2, "File is not open."));

    QVERIFY(file.open(stored(wavFile(formatChunk() + chunk("data", fourSamples)))));
    file.close();
    // Without a name the file before is opened once more.
    QVERIFY(file.open({}));
    QVERIFY(file.readHeader());
    QVERIFY(file.header().valid);
}

QTEST_GUILESS_MAIN(TestWavFileAccess)
#include "tst_wavfileaccess.moc"
