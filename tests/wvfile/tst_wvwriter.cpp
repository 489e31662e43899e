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

} // namespace

class TestWvWriter : public QObject
{
    Q_OBJECT

private slots:
    void bytes();
    void markerTags();
    void levels();
    void refused();
    void failures();
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
    Filled otherHeader("IQG");
    refuse(smallJob(), otherHeader.stream(), nullptr, "4|Cannot read data stream header.");
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
    QVERIFY(folder.store("out.wv", "what stood there"));
    CapturedLog log;
    QVERIFY(!io.writeWaveform(job, folder.path("out.wv"), &data, nullptr, nullptr));
    QCOMPARE(log.take().last(), QString("4|Action aborted by user."));
    QCOMPARE(folder.entries(), QStringList("out.wv"));
    QCOMPARE(folder.load("out.wv"), "what stood there");
}

QTEST_GUILESS_MAIN(TestWvWriter)
#include "tst_wvwriter.moc"
