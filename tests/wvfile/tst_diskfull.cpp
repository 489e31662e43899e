// SPDX-License-Identifier: Apache-2.0
#include "streams/BufferedIO.h"
#include "streams/TempStream.h"
#include "support/FullDisk.h"
#include "support/files.h"
#include "support/logreader.h"
#include "support/rows.h"
#include "wvfile/HvFileIO.h"

#include <QFile>
#include <QTest>

namespace {

constexpr qint64 mebibyte = 1'048'576;

} // namespace

class TestDiskFull : public QObject
{
    Q_OBJECT

private slots:
    void writingAFile();
    void readingIntoStreams();
};

void TestDiskFull::writingAFile()
{
    const TestFolder folder;
    for (const QByteArray &before : {QByteArray(), QByteArray("what stood there")}) {
        QVERIFY(before.isNull() || folder.store("out.wv", before));
        WvWriteJob job;
        job.clock = 1;
        job.samples = 1000 * 1000;
        job.iSamples = job.qSamples = QList<float>(job.samples, 0.5F);
        job.markers = QList<int>(job.samples, 1);
        CapturedLog log;
        const FullDisk disk(mebibyte);
        QVERIFY(!HvFileIO().writeWaveform(job, folder.path("out.wv"), nullptr, nullptr, nullptr));
        QCOMPARE(log.take(Tracer::Error),
                 QStringList("4|Error writing output file: File too large"));
        QCOMPARE(folder.load("out.wv"), before);
        QCOMPARE(folder.entries().size(), before.isNull() ? 0 : 1);
    }
}

void TestDiskFull::readingIntoStreams()
{
    const TestFolder folder;
    const TestFolder streams;
    qputenv("TMPDIR", QFile::encodeName(streams.path()));
    forRows({{"samples", QByteArray(), 4 * mebibyte, "4|Cannot write to temporary file!"},
             {"markers up to the control length", "{CONTROL LENGTH:40000000}", 50 * mebibyte,
              "4|Writing marker stream failed at position 33554432"},
             {"unknown tags", "{FREE:" + QByteArray(40 * mebibyte, 'x') + '}', 1,
              "4|Cannot save unknown tag."}},
            [&](const QByteArray &head, qint64 samples, const QString &words) {
                // The samples are a hole in a file.
                QFile source(folder.path("in.wv"));
                QVERIFY(source.open(QIODevice::WriteOnly));
                source.write("{TYPE:TGX-WV}{SAMPLES:" + QByteArray::number(samples) + '}' + head +
                             "{WAVEFORM-" + QByteArray::number(4 * samples + 1) + ": #");
                QVERIFY(source.resize(source.pos() + 4 * samples));
                source.close();
                CapturedLog log;
                {
                    const FullDisk disk(20 * mebibyte);
                    TempStream data;
                    TempStream markers;
                    TempStream tags;
                    QVERIFY(data.open() && markers.open() && tags.open());
                    WvFileInfo info;
                    info.fileName = source.fileName();
                    info.dataStream = data.stream();
                    info.markerStream = markers.stream();
                    info.tagsStream = tags.stream();
                    QVERIFY(!HvFileIO().readWaveform(&info));
                }
                // Each stream says so, some when they go.
                const QString reason = "4|Cannot write to the temporary folder '" + streams.path() +
                                       "': File too large";
                QStringList errors = log.take(Tracer::Error);
                QCOMPARE(errors.value(0), reason);
                errors.removeAll(reason);
                QCOMPARE(errors, QStringList(words));
                QVERIFY(streams.entries().isEmpty());
            });
}

QTEST_GUILESS_MAIN(TestDiskFull)
#include "tst_diskfull.moc"
