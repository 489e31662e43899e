// SPDX-License-Identifier: Apache-2.0
#include "WvTestFile.h"
#include "support/rows.h"

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
const QByteArray smallBlock = "{WAVEFORM-9: #" + words({32767, -32766, 0, 32767}) + '}';

QString creating(const QString &path)
{
    return "1|Creating waveform file " + path + "...";
}

} // namespace

class TestWvWriter : public QObject
{
    Q_OBJECT

private slots:
    void bytes();
    void markerTags();
    void levels();
    void logLines();
    void refused();
    void failures();
    void readWriteReadIdentity();
    void longMarkerLists();
    void cancelSparesWhatStoodThere();
};

void TestWvWriter::bytes()
{
    forRows(
        {{"TGX", 1, "", "", {}, "{TYPE: TGX-WV,0}"},
         {"TVX", 3, "", "", {}, "{TYPE: TVX-WV,0}"},
         {"texts", 1, "test", "me", {}, "{TYPE: TGX-WV,0}{COMMENT:test}{COPYRIGHT:me}"},
         {"tags", 1, "", "", "{X: y}{Z:}", "{TYPE: TGX-WV,0}"}},
        [&](int type, const QString &comment, const QString &copyright, const QByteArray &tags,
            const QByteArray &head) {
            WvWriteJob job = smallJob();
            job.type = type;
            job.comment = comment;
            job.copyright = copyright;
            const QByteArray expected = head + headTags + tags + smallBlock;
            Filled tagsStream(tags);
            WriteRun fromMemory;
            QVERIFY(fromMemory.write(job, nullptr, nullptr,
                                     tags.isEmpty() ? nullptr : tagsStream.stream()));
            QCOMPARE(fromMemory.bytes, expected);

            job.iSamples.clear();
            job.qSamples.clear();
            Filled data(dataBytes({1.0F, -1.0F, 0.0F, std::numeric_limits<float>::quiet_NaN()}));
            WriteRun fromStream;
            QVERIFY(fromStream.write(job, data.stream(), nullptr, tagsStream.stream()));
            QCOMPARE(fromStream.bytes, expected);
        });
}

void TestWvWriter::markerTags()
{
    forRows({{"always high", QList<int>{15, 15, 15},
              "{MARKER LIST 1: 0:1}{MARKER LIST 2: 0:1}{MARKER LIST 3: 0:1}{MARKER LIST 4: 0:1}"},
             {"one goes down and up", QList<int>{1, 0, 1},
              "{MARKER LIST 1: 0:1;1:0;2:1}{MARKER LIST 2: 0:0}{MARKER LIST 3: 0:0}{MARKER "
              "LIST 4: 0:0}"},
             {"each its own, other bits don't count", QList<int>{8 + 16, 4 + 32, 2 + 64},
              "{MARKER LIST 1: 0:0}{MARKER LIST 2: 0:0;2:1}{MARKER LIST 3: "
              "0:0;1:1;2:0}{MARKER LIST 4: 0:1;1:0}"}},
            [&](const QList<int> &markers, const QByteArray &lists) {
                WvWriteJob job = smallJob();
                job.samples = 3;
                job.iSamples = job.qSamples = {0, 0, 0};
                job.markers = markers;
                WriteRun fromMemory;
                QVERIFY(fromMemory.write(job));
                QVERIFY(fromMemory.bytes.contains("{SAMPLES:3}{CONTROL LENGTH:3}" + lists +
                                                  "{WAVEFORM-13: #"));
                QByteArray content;
                for (const int marker : markers) {
                    content += static_cast<char>(marker);
                }
                Filled stream(content);
                job.markers.clear();
                WriteRun fromStream;
                QVERIFY(fromStream.write(job, nullptr, stream.stream()));
                QVERIFY(fromStream.bytes.contains("{SAMPLES:3}{CONTROL LENGTH: 3}" + lists +
                                                  "{WAVEFORM-13: #"));
            });
}

void TestWvWriter::levels()
{
    const float nan = std::numeric_limits<float>::quiet_NaN();
    forRows(
        {{"silence", QList<float>{0, 0}, QList<float>{0, 0}, "{LEVEL OFFS:100.000000,100.000000}"},
         {"full scale", QList<float>{1, 0}, QList<float>{0, 1}, "{LEVEL OFFS:0.000000,0.000000}"},
         // 20 lg 2 and 20 lg sqrt(8)
         {"half, half of the time", QList<float>{0.5F, 0}, QList<float>{0, 0},
          "{LEVEL OFFS:9.030900,6.020600}"},
         {"no number is no peak", QList<float>{0.5F, nan}, QList<float>{0, 0}, ",6.020600}"}},
        [&](const QList<float> &i, const QList<float> &q, const QByteArray &tag) {
            WvWriteJob job = smallJob();
            job.levelsValid = false;
            job.iSamples = i;
            job.qSamples = q;
            WriteRun run;
            QVERIFY(run.write(job));
            QVERIFY2(run.bytes.contains(tag), run.bytes.left(200).constData());
            QVERIFY(run.bytes.contains(',' + QByteArray::number(job.peakOffset, 'f', 6) + '}'));
        });
}

void TestWvWriter::logLines()
{
    WvWriteJob job = smallJob();
    job.clock = 1.5;
    job.levelsValid = false;
    job.iSamples = {0.5F, 0};
    job.qSamples = {0, 0};
    job.markers = {0, 1};
    WriteRun run;
    QVERIFY(run.write(job));
    QCOMPARE(run.log,
             QStringList({creating(run.path), "1|Calculating Peak and RMS data from waveform...",
                          "1|========== Signal Statistics ==========", "1|ARB clock :1.500 Hz",
                          "1|MKR clock :500000.000 Hz", "1|Samples   :2",
                          "1|RMS       : 0.35 (RMS-Offset:  9.03 dBfs)",
                          "1|PEAK      : 0.50 (PK-Offset:  6.02 dBfs)", "1|Pk/Av     : 3.01 dB",
                          "1|=======================================",
                          "1|Creating marker trace from memory buffer...",
                          "1|Waveform file generated."}));
    // Levels that were given are taken, and told without a measured value.
    job.levelsValid = true;
    job.rmsOffset = 3.0103;
    QVERIFY(run.write(job));
    QVERIFY(run.log.contains("1|RMS       : 0.00 (RMS-Offset:  3.01 dBfs)"));
}

void TestWvWriter::refused()
{
    const auto refuse = [](const WvWriteJob &job, BufferedIO *data, BufferedIO *markers,
                           const QString &words) {
        WriteRun run;
        WvWriteJob copy = job;
        QVERIFY(!run.write(copy, data, markers));
        QCOMPARE(run.log.last(), words);
        QVERIFY(run.bytes.isNull());
    };
    WvWriteJob none = smallJob();
    none.samples = 0;
    refuse(none, nullptr, nullptr, "4|Number of points cannot be zero.");
    Filled otherHeader("IQG");
    refuse(smallJob(), otherHeader.stream(), nullptr, "4|Cannot read data stream header.");
    Filled unreadable("ab");
    unreadable.device().canSeek = false;
    refuse(smallJob(), nullptr, unreadable.stream(),
           "4|Cannot setup buffer for temporary marker file.");
    Filled data(dataBytes({0, 0, 0, 0}));
    refuse(smallJob(), data.stream(), nullptr, "4|Waveform data for 2 samples is not available.");
    WvWriteJob few = smallJob();
    few.markers = {1};
    refuse(few, nullptr, nullptr, "4|Marker data for 2 samples is not available.");
}

void TestWvWriter::failures()
{
    WvWriteJob job = smallJob();
    Filled few("a");
    WriteRun markers;
    QVERIFY(!markers.write(job, nullptr, few.stream()));
    QVERIFY(markers.log.contains("4|Error reading marker data from temporary file."));
    Filled unreadable("ab");
    unreadable.device().canSeek = false;
    WriteRun tags;
    QVERIFY(tags.write(job, nullptr, nullptr, unreadable.stream()));
    QVERIFY(tags.log.contains("2|Cannot read the unknown tags. They are not in the file."));
    job.iSamples.clear();
    job.qSamples.clear();
    Filled cut(dataBytes({0, 0, 0, 0}).chopped(5));
    WriteRun data;
    QVERIFY(!data.write(job, cut.stream()));
    QVERIFY(data.log.contains("4|Error reading waveform data from temporary file."));
}

/// Samples, markers and unknown tags survive the way through the streams and a new file.
void TestWvWriter::readWriteReadIdentity()
{
    QList<int> values;
    for (int word = -32767; word <= 32767; ++word) {
        values << word << -word;
    }
    const QByteArray source =
        "{TYPE: TVX-WV,0}{COMMENT:c}{CLOCK:1000000}{FREE: text}{SAMPLES:65535}"
        "{MARKER LIST 1: 0:1;100:0;65534:1}{MARKER LIST 2: 0:0;7:1;9:0}{MARKER LIST 4: 0:1;1:0}" +
        sampleBlock(words(values));
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
                               sampleBlock(words(values))));
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

void TestWvWriter::cancelSparesWhatStoodThere()
{
    for (const QByteArray &before : {QByteArray(), QByteArray("what stood there")}) {
        constexpr qsizetype samples = 400'000;
        TestDevice device;
        device.bytes = dataBytes(QList<float>(2 * samples, 0.25F));
        device.slowMs = 110; // each lets a tick of the clock pass
        BufferedIO data(1 << 20);
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
        const TestFolder folder;
        QVERIFY(before.isNull() || folder.store("out.wv", before));
        CapturedLog log;
        QVERIFY(!io.writeWaveform(job, folder.path("out.wv"), &data, nullptr, nullptr));
        QCOMPARE(log.take().last(), QString("4|Action aborted by user."));
        QCOMPARE(folder.entries().size(), before.isNull() ? 0 : 1);
        QCOMPARE(folder.load("out.wv"), before);
    }
}

QTEST_GUILESS_MAIN(TestWvWriter)
#include "tst_wvwriter.moc"
