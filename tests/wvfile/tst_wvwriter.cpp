// SPDX-License-Identifier: Apache-2.0
#include "WvTestFile.h"
#include "WvWriteRun.h"

#include <QFileInfo>
#include <QSignalSpy>
#include <QTest>

#include <cmath>
#include <limits>

namespace {

/// A job of two samples, with its levels given.
WvWriteJob smallJob()
{
    WvWriteJob job;
    job.clock = 1e6;
    job.markerClock = 5e5;
    job.samples = 2;
    job.rmsOffset = 3.0103;
    job.peakOffset = 0;
    job.levelsValid = true;
    job.iSamples = {1.0F, 0.0F};
    job.qSamples = {-1.0F, 1.5F};
    return job;
}

QByteArray dataBytes(const QList<float> &values)
{
    return "IQF" + QByteArray(reinterpret_cast<const char *>(values.constData()),
                              values.size() * static_cast<qsizetype>(sizeof(float)));
}

const QByteArray headTags = "#DATE#{CLOCK:1000000.000000}{CLOCK MARKER:500000.000000}"
                            "{LEVEL OFFS:3.010300,0.000000}{SAMPLES:2}";
const QByteArray smallBlock = "{WAVEFORM-9: #" + wordBytes({32767, -32766, 0, 32767}) + '}';

QString creating(const QString &path)
{
    return "1|Creating waveform file " + path + "...";
}

} // namespace

class TestWvWriter : public QObject
{
    Q_OBJECT

private slots:
    void bytes_data();
    void bytes();
    void markerTags_data();
    void markerTags();
    void levels_data();
    void levels();
    void logLines();
    void refused_data();
    void refused();
    void failures_data();
    void failures();
    void readWriteReadIdentity();
    void longMarkerLists();
    void progress();
    void cancelSparesWhatStoodThere_data();
    void cancelSparesWhatStoodThere();
};

void TestWvWriter::bytes_data()
{
    QTest::addColumn<int>("type");
    QTest::addColumn<QString>("comment");
    QTest::addColumn<QString>("copyright");
    QTest::addColumn<QByteArray>("tags");
    QTest::addColumn<QByteArray>("head");
    QTest::newRow("TGX") << 1 << ""
                         << "" << QByteArray() << QByteArray("{TYPE: TGX-WV,0}");
    QTest::newRow("TBX") << 2 << ""
                         << "" << QByteArray() << QByteArray("{TYPE: TBX-WV,0}");
    QTest::newRow("TVX") << 3 << ""
                         << "" << QByteArray() << QByteArray("{TYPE: TVX-WV,0}");
    QTest::newRow("any other") << 9 << ""
                               << "" << QByteArray() << QByteArray("{TYPE: TGX-WV,0}");
    QTest::newRow("texts") << 1 << "test"
                           << "me" << QByteArray()
                           << QByteArray("{TYPE: TGX-WV,0}{COMMENT:test}{COPYRIGHT:me}");
    QTest::newRow("a comment of one blank")
        << 1 << " "
        << "" << QByteArray() << QByteArray("{TYPE: TGX-WV,0}{COMMENT: }");
    QTest::newRow("tags") << 1 << ""
                          << "" << QByteArray("{X: y}{Z:}") << QByteArray("{TYPE: TGX-WV,0}");
}

void TestWvWriter::bytes()
{
    QFETCH(int, type);
    QFETCH(QString, comment);
    QFETCH(QString, copyright);
    QFETCH(QByteArray, tags);
    QFETCH(QByteArray, head);
    WvWriteJob job = smallJob();
    job.type = type;
    job.comment = comment;
    job.copyright = copyright;
    const QByteArray expected = head + headTags + tags + smallBlock;
    Filled tagsStream(tags);
    WriteRun fromMemory;
    QVERIFY(
        fromMemory.write(job, nullptr, nullptr, tags.isEmpty() ? nullptr : tagsStream.stream()));
    QCOMPARE(fromMemory.bytes, expected);

    job.iSamples.clear();
    job.qSamples.clear();
    Filled data(dataBytes({1.0F, -1.0F, 0.0F, std::numeric_limits<float>::quiet_NaN()}));
    WriteRun fromStream;
    QVERIFY(fromStream.write(job, data.stream(), nullptr, tagsStream.stream()));
    QCOMPARE(fromStream.bytes, expected);
}

void TestWvWriter::markerTags_data()
{
    QTest::addColumn<QList<int>>("markers");
    QTest::addColumn<QByteArray>("lists");
    QTest::newRow("always low")
        << QList<int>{0, 0, 0}
        << QByteArray(
               "{MARKER LIST 1: 0:0}{MARKER LIST 2: 0:0}{MARKER LIST 3: 0:0}{MARKER LIST 4: 0:0}");
    QTest::newRow("always high")
        << QList<int>{15, 15, 15}
        << QByteArray(
               "{MARKER LIST 1: 0:1}{MARKER LIST 2: 0:1}{MARKER LIST 3: 0:1}{MARKER LIST 4: 0:1}");
    QTest::newRow("one goes down and up")
        << QList<int>{1, 0, 1}
        << QByteArray("{MARKER LIST 1: 0:1;1:0;2:1}{MARKER LIST 2: 0:0}{MARKER LIST 3: 0:0}{MARKER "
                      "LIST 4: 0:0}");
    QTest::newRow("each its own, other bits don't count")
        << QList<int>{8 + 16, 4 + 32, 2 + 64}
        << QByteArray("{MARKER LIST 1: 0:0}{MARKER LIST 2: 0:0;2:1}{MARKER LIST 3: "
                      "0:0;1:1;2:0}{MARKER LIST 4: 0:1;1:0}");
}

void TestWvWriter::markerTags()
{
    QFETCH(QList<int>, markers);
    QFETCH(QByteArray, lists);
    WvWriteJob job = smallJob();
    job.samples = 3;
    job.iSamples = job.qSamples = {0, 0, 0};
    job.markers = markers;
    WriteRun fromMemory;
    QVERIFY(fromMemory.write(job));
    QVERIFY(fromMemory.bytes.contains("{SAMPLES:3}{CONTROL LENGTH:3}" + lists + "{WAVEFORM-13: #"));
    QVERIFY(fromMemory.log.contains("1|Creating marker trace from memory buffer..."));

    QByteArray content;
    for (const int marker : markers) {
        content += static_cast<char>(marker);
    }
    Filled stream(content);
    job.markers.clear();
    WriteRun fromStream;
    QVERIFY(fromStream.write(job, nullptr, stream.stream()));
    QVERIFY(
        fromStream.bytes.contains("{SAMPLES:3}{CONTROL LENGTH: 3}" + lists + "{WAVEFORM-13: #"));
    QVERIFY(fromStream.log.contains("1|Creating marker trace from temporary marker file ..."));

    // With both sources the markers stay out.
    job.markers = markers;
    WriteRun both;
    QVERIFY(both.write(job, nullptr, stream.stream()));
    QVERIFY(both.bytes.contains("{SAMPLES:3}{WAVEFORM-13: #"));
}

void TestWvWriter::levels_data()
{
    QTest::addColumn<QList<float>>("i");
    QTest::addColumn<QList<float>>("q");
    QTest::addColumn<QByteArray>("tag");
    const float nan = std::numeric_limits<float>::quiet_NaN();
    QTest::newRow("silence") << QList<float>{0, 0} << QList<float>{0, 0}
                             << QByteArray("{LEVEL OFFS:100.000000,100.000000}");
    QTest::newRow("full scale") << QList<float>{1, 0} << QList<float>{0, 1}
                                << QByteArray("{LEVEL OFFS:0.000000,0.000000}");
    // 20 lg 2 and 20 lg sqrt(8)
    QTest::newRow("half, half of the time") << QList<float>{0.5F, 0} << QList<float>{0, 0}
                                            << QByteArray("{LEVEL OFFS:9.030900,6.020600}");
    QTest::newRow("beyond full scale") << QList<float>{2, 2} << QList<float>{0, 0}
                                       << QByteArray("{LEVEL OFFS:-6.020600,-6.020600}");
    QTest::newRow("no number is no peak")
        << QList<float>{0.5F, nan} << QList<float>{0, 0} << QByteArray(",6.020600}");
}

void TestWvWriter::levels()
{
    QFETCH(QList<float>, i);
    QFETCH(QList<float>, q);
    QFETCH(QByteArray, tag);
    WvWriteJob job = smallJob();
    job.levelsValid = false;
    job.iSamples = i;
    job.qSamples = q;
    WriteRun run;
    QVERIFY(run.write(job));
    QVERIFY2(run.bytes.contains(tag), run.bytes.left(200).constData());
    QVERIFY(run.bytes.contains(',' + QByteArray::number(job.peakOffset, 'f', 6) + '}'));
}

void TestWvWriter::logLines()
{
    WvWriteJob job = smallJob();
    job.clock = 1.5;
    WriteRun given;
    QVERIFY(given.write(job));
    const QStringList statistics{
        "1|========== Signal Statistics ==========",
        "1|ARB clock :1.500 Hz",
        "1|MKR clock :500000.000 Hz",
        "1|Samples   :2",
        "1|RMS       : 0.00 (RMS-Offset:  3.01 dBfs)",
        "1|PEAK      : 0.00 (PK-Offset:  0.00 dBfs)",
        "1|Pk/Av     : 3.01 dB",
        "1|=======================================",
    };
    QCOMPARE(given.log, QStringList(creating(given.path)) + statistics +
                            QStringList("1|Waveform file generated."));

    job.levelsValid = false;
    job.iSamples = {0.5F, 0};
    job.qSamples = {0, 0};
    job.markers = {0, 1};
    WriteRun computed;
    QVERIFY(computed.write(job));
    QStringList expected{creating(computed.path),
                         "1|Calculating Peak and RMS data from waveform..."};
    expected += statistics;
    expected[6] = "1|RMS       : 0.35 (RMS-Offset:  9.03 dBfs)";
    expected[7] = "1|PEAK      : 0.50 (PK-Offset:  6.02 dBfs)";
    expected << "1|Creating marker trace from memory buffer..."
             << "1|Waveform file generated.";
    QCOMPARE(computed.log, expected);
}

void TestWvWriter::refused_data()
{
    QTest::addColumn<QString>("fault");
    QTest::addColumn<QString>("words");
    QTest::newRow("no samples") << "samples"
                                << "4|Number of points cannot be zero.";
    QTest::newRow("no name") << "name"
                             << "4|Waveform file name is empty.";
    QTest::newRow("no header") << "header"
                               << "4|Cannot read data stream header.";
    QTest::newRow("marker stream") << "markers"
                                   << "4|Cannot setup buffer for temporary marker file.";
    QTest::newRow("no data") << "data"
                             << "4|Waveform data for 2 samples is not available.";
    QTest::newRow("lists too short") << "short"
                                     << "4|Waveform data for 2 samples is not available.";
    QTest::newRow("lists and stream") << "both"
                                      << "4|Waveform data for 2 samples is not available.";
    QTest::newRow("too few markers") << "few"
                                     << "4|Marker data for 2 samples is not available.";
    QTest::newRow("a folder that isn't there") << "folder"
                                               << "4|Error opening output file.";
}

void TestWvWriter::refused()
{
    QFETCH(QString, fault);
    QFETCH(QString, words);
    WvWriteJob job = smallJob();
    const QTemporaryDir folder;
    QString path = folder.filePath("out.wv");
    Filled data(fault == "header" ? "IQG" : dataBytes({0, 0, 0, 0}));
    Filled markers("ab");
    if (fault == "samples") {
        job.samples = 0;
    } else if (fault == "name") {
        path.clear();
    } else if (fault == "markers") {
        markers.device().canSeek = false;
    } else if (fault == "data") {
        job.iSamples.clear();
        job.qSamples.clear();
    } else if (fault == "short") {
        job.qSamples = {1};
    } else if (fault == "few") {
        job.markers = {1};
    } else if (fault == "folder") {
        path = folder.filePath("none/out.wv");
    }
    const bool useData = fault == "header" || fault == "both";
    CapturedLog log;
    QVERIFY(!HvFileIO().writeWaveform(job, path, useData ? data.stream() : nullptr,
                                      fault == "markers" ? markers.stream() : nullptr, nullptr));
    const QStringList lines = log.take();
    QCOMPARE(lines.first(), creating(path));
    QCOMPARE(lines.last(), words);
    QVERIFY(!QFileInfo::exists(path));
}

void TestWvWriter::failures_data()
{
    QTest::addColumn<QString>("fault");
    QTest::addColumn<bool>("ok");
    QTest::addColumn<QString>("words");
    QTest::newRow("data stream ends early")
        << "data" << false << "4|Error reading waveform data from temporary file.";
    QTest::newRow("marker stream ends early")
        << "markers" << false << "4|Error reading marker data from temporary file.";
    QTest::newRow("marker stream can't be read twice")
        << "twice" << false << "4|Error resetting buffer for temporary marker data.";
    QTest::newRow("tags stream can't be read")
        << "tags" << true << "2|Cannot read the unknown tags. They are not in the file.";
}

void TestWvWriter::failures()
{
    QFETCH(QString, fault);
    QFETCH(bool, ok);
    QFETCH(QString, words);
    /// Seeks this often, then no more.
    class SeekLimited : public TestDevice
    {
    public:
        int seeks = 0;
        bool seek(qint64 position) override { return seeks-- > 0 && TestDevice::seek(position); }
    };
    WvWriteJob job = smallJob();
    Filled data(dataBytes({0, 0, 0, 0}).chopped(5));
    Filled markers(fault == "markers" ? "a" : "ab");
    SeekLimited limited;
    limited.bytes = "ab";
    BufferedIO limitedStream;
    QVERIFY(limitedStream.initBuf(&limited, BufferedIO::Read));
    limited.seeks = fault == "twice" ? 1 : 0;
    BufferedIO *markerStream = fault == "markers" ? markers.stream() : nullptr;
    if (fault == "data") {
        job.iSamples.clear();
        job.qSamples.clear();
    }
    WriteRun run;
    QCOMPARE(run.write(job, fault == "data" ? data.stream() : nullptr,
                       fault == "twice" ? &limitedStream : markerStream,
                       fault == "tags" ? &limitedStream : nullptr),
             ok);
    QVERIFY2(run.log.contains(words), qPrintable(run.log.join('\n')));
    QCOMPARE(run.log.contains("1|Waveform file generated."), ok);
    QVERIFY2(run.bytes.contains("{SAMPLES:2}"), "the part so far stays");
}

/// Samples, markers and unknown tags survive the way through the streams and a new file.
void TestWvWriter::readWriteReadIdentity()
{
    QList<int> words;
    for (int word = -32767; word <= 32767; ++word) {
        words << word << -word;
    }
    const QByteArray source =
        "{TYPE: TVX-WV,0}{COMMENT:c}{CLOCK:1000000}{FREE: text}{SAMPLES:65535}"
        "{MARKER LIST 1: 0:1;100:0;65534:1}{MARKER LIST 2: 0:0;7:1;9:0}{MARKER LIST 4: 0:1;1:0}" +
        sampleBlock(words);
    ReadRun first(source, true);
    QVERIFY2(first.read().ok, qPrintable(first.log.join('\n')));
    WvWriteJob job;
    job.type = typeForFormat(first.info.format);
    job.clock = job.markerClock = first.info.clock;
    job.samples = first.info.samples;
    job.rmsOffset = first.info.rmsOffset;
    job.peakOffset = first.info.peakOffset;
    job.comment = first.info.comment;
    job.levelsValid = true;
    WriteRun run;
    QVERIFY(run.write(job, first.info.dataStream, first.info.markerStream, first.info.tagsStream));
    QVERIFY(run.bytes.startsWith("{TYPE: TVX-WV,0}{COMMENT:c}#DATE#{CLOCK:1000000.000000}"));
    QVERIFY(run.bytes.contains("{SAMPLES:65535}{FREE: text}{CONTROL LENGTH: 65535}"
                               "{MARKER LIST 1: 0:1;100:0;65534:1}{MARKER LIST 2: 0:0;7:1;9:0}"
                               "{MARKER LIST 3: 0:0}{MARKER LIST 4: 0:1;1:0}" +
                               sampleBlock(words)));
    ReadRun second(run.bytes, true);
    QVERIFY(second.read().ok);
    QVERIFY(second.dataDevice.bytes == first.dataDevice.bytes);
    QVERIFY(second.markers() == first.markers());
    QCOMPARE(second.info.rmsOffset, first.info.rmsOffset);
    QCOMPARE(second.info.rmsOffsetTag, QByteArray::number(first.info.rmsOffset, 'f', 6).toDouble());
}

/// Lists longer than one block of text, and transitions at the seams of the blocks.
void TestWvWriter::longMarkerLists()
{
    constexpr int samples = 200'000;
    QByteArray markers(samples, '\0');
    QByteArray expected = "{MARKER LIST 1: ";
    for (int i = 0; i < samples; ++i) {
        // Marker 1 changes at each sample, marker 2 in the middle of a wide compare.
        markers[i] = static_cast<char>((i % 2) | (i >= 65537 + 3 ? 2 : 0));
        expected += (i > 0 ? ";" : "") + QByteArray::number(i) + ':' + QByteArray::number(i % 2);
    }
    expected += "}{MARKER LIST 2: 0:0;65540:1}{MARKER LIST 3: 0:0}";
    Filled stream(markers);
    WvWriteJob job = smallJob();
    job.samples = samples;
    job.iSamples = job.qSamples = QList<float>(samples, 0.0F);
    WriteRun run;
    QVERIFY(run.write(job, nullptr, stream.stream()));
    QVERIFY(run.bytes.contains(expected));
}

void TestWvWriter::progress()
{
    HvFileIO io;
    QSignalSpy updates(&io, &HvFileIO::ProgressUpdate);
    WvWriteJob job = smallJob();
    const QTemporaryDir folder;
    CapturedLog log;
    QVERIFY(io.writeWaveform(job, folder.filePath("out.wv"), nullptr, nullptr, nullptr));
    QList<int> values;
    for (const QList<QVariant> &update : updates) {
        values << update.at(0).toInt();
    }
    QCOMPARE(values, QList<int>({0, 10, 50, 100}));
}

void TestWvWriter::cancelSparesWhatStoodThere_data()
{
    QTest::addColumn<QByteArray>("before");
    QTest::newRow("no file") << QByteArray();
    QTest::newRow("a file") << QByteArray("what stood there");
}

void TestWvWriter::cancelSparesWhatStoodThere()
{
    QFETCH(QByteArray, before);
    /// Lets a tick of the clock pass with each read.
    class SlowDevice : public TestDevice
    {
    protected:
        qint64 readData(char *data, qint64 length) override
        {
            const QDeadlineTimer tick(150);
            while (!tick.hasExpired()) {
            }
            return TestDevice::readData(data, length);
        }
    };
    constexpr qsizetype samples = 3'000'000;
    SlowDevice device;
    device.bytes = dataBytes(QList<float>(2 * samples, 0.25F));
    BufferedIO data;
    QVERIFY(data.initBuf(&device, BufferedIO::ReadWrite));
    WvWriteJob job = smallJob();
    job.samples = samples;
    job.iSamples.clear();
    job.qSamples.clear();
    HvFileIO io;
    connect(&io, &HvFileIO::ProgressUpdate, &io, [&](int percent) {
        if (percent > 50) {
            io.cancel();
        }
    });
    const QTemporaryDir folder;
    QFile file(folder.filePath("out.wv"));
    if (!before.isEmpty()) {
        QVERIFY(file.open(QIODevice::WriteOnly) && file.write(before) == before.size());
        file.close();
    }
    CapturedLog log;
    QVERIFY(!io.writeWaveform(job, file.fileName(), &data, nullptr, nullptr));
    QCOMPARE(log.take().last(), QString("4|Action aborted by user."));
    QCOMPARE(QDir(folder.path()).entryList(QDir::Files | QDir::Hidden), QStringList("out.wv"));
    QVERIFY(file.open(QIODevice::ReadOnly));
    if (before.isEmpty()) {
        QVERIFY(file.size() > 0 && file.size() < 4 * samples); // the part so far
    } else {
        QCOMPARE(file.readAll(), before);
    }
}

QTEST_GUILESS_MAIN(TestWvWriter)
#include "tst_wvwriter.moc"
