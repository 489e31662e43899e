// SPDX-License-Identifier: Apache-2.0
//
// Files that lie. What they may cost is counted in bytes moved and not in seconds, so that a slow
// machine doesn't matter; one that really hangs ends at the time limit of the test.
#include "WvTestFile.h"
#include "base/ProgressClock.h"
#include "support/rows.h"
#include "wvfile/WvReader.h"
#include "wvfile/WvScanner.h"

#include <QTest>

#include <atomic>

#include <sys/stat.h>

namespace {

constexpr qint64 mebibyte = 1'048'576;
const QByteArray tgx = "{TYPE:TGX-WV}";

QByteArray repeated(const QByteArray &text, qsizetype count)
{
    return QByteArray(text).repeated(count);
}

} // namespace

class TestHostileFiles : public QObject
{
    Q_OBJECT

private slots:
    void workIsBounded();
    void noPlainFile();
    void everyCut();
};

void TestHostileFiles::workIsBounded()
{
    const char *noTag = "No tag mark found! Probably incorrect format.";
    const char *tooShort = "Cannot read enough data from xWAVEFORM tag!";
    const char *tooLarge = " Marker position value is too large.";
    QByteArray dense = "{MARKER LIST 1: ";
    for (int i = 0; i < 1'200'000; i += 2) {
        dense += QByteArray::number(i) + (i % 4 == 0 ? ":1;" : ":0;");
    }
    forRows(
        {{"two thousand million samples", tgx + "{SAMPLES:2000000000}{WAVEFORM-8000000001: #abcd}",
          tooShort},
         {"a long control", tgx + "{SAMPLES:1}{CONTROL LENGTH:2000000000}{WAVEFORM-5: #abcd}",
          "CONTROL LENGTH tag is invalid ('2000000000')."},
         {"a marker far out", tgx + "{MARKER LIST 1: 0:0;2000000000:1}", tooLarge},
         {"lists as long as they may be",
          tgx + repeated("{MARKER LIST 1: 0:1;500000:0}", 100'000) + "{SAMPLES:1}{WAVEFORM-5: #abc",
          "Too many MARKER LIST tags: their positions exceed what a file of this size can hold."},
         {"dense lists, again and again",
          tgx + dense + '}' + repeated("{MARKER LIST 2: 0:1}", 100'000) +
              "{SAMPLES:1}{WAVEFORM-5: #ab",
          "Too many MARKER LIST tags: their positions exceed what a file of this size can hold."},
         {"the same position for ever", tgx + "{MARKER LIST 1: " + repeated("7:1;", mebibyte),
          " old pos. = 9, new pos. = 7"},
         {"a name of megabytes", tgx + '{' + QByteArray(4 * mebibyte, 'x'),
          "Tag name \'" + QString(100, 'x') + "\' is invalid."},
         {"a text of megabytes", tgx + "{COMMENT:" + QByteArray(4 * mebibyte, 'x'),
          "Invalid tag data"},
         {"blanks", tgx + "{COMMENT:" + QByteArray(4 * mebibyte, ' '), noTag},
         {"opening braces", QByteArray(4 * mebibyte, '{'),
          "Tag name \'" + QString(100, '{') + "\' is invalid."},
         {"empty tags", repeated("{:}", mebibyte), noTag},
         {"blocks behind the block", tgx + repeated("{WAVEFORM-1:#}", 100'000),
          "Invalid number of samples in WAVEFORM tag."}},
        [](const QByteArray &bytes, const QString &words) {
            const qint64 fileSize = bytes.size();
            TestDevice file;
            file.bytes = bytes;
            TestDevice devices[3];
            BufferedIO streams[3];
            for (int i = 0; i < 3; ++i) {
                QVERIFY(streams[i].initBuf(&devices[i], BufferedIO::ReadWrite));
            }
            WvFileInfo info;
            info.dataStream = &streams[0];
            info.markerStream = &streams[1];
            info.tagsStream = &streams[2];
            CapturedLog log;
            const std::atomic<bool> cancelled{false};
            ProgressClock progress([](int) {}, cancelled);
            QVERIFY(file.open(QIODevice::ReadOnly | QIODevice::Unbuffered));
            QVERIFY(!WvReader(info, file, progress).read());
            QCOMPARE(log.take().last(), "4|" + words);
            QVERIFY(file.bytesRead <= fileSize + mebibyte);
            qint64 moved = 0;
            for (TestDevice &device : devices) {
                moved += device.bytesRead + device.bytesWritten;
                QVERIFY(device.bytes.size() <= 2 * fileSize + mebibyte);
            }
            QVERIFY2(moved <= 64 * fileSize + 32 * mebibyte, qPrintable(QString::number(moved)));

            file.close();
            file.bytesRead = 0;
            QVERIFY(file.open(QIODevice::ReadOnly | QIODevice::Unbuffered));
            WvFileSummary summary;
            static_cast<void>(WvScanner(summary).scan(file));
            QVERIFY(file.bytesRead <= fileSize + mebibyte);
            QVERIFY(log.take().size() <= 5 * fileSize / 13 + 2);
        });
}

void TestHostileFiles::noPlainFile()
{
    const TestFolder folder;
    QCOMPARE(::mkfifo(folder.path("pipe").toLocal8Bit().constData(), 0600), 0);
    QVERIFY(QFile::link("/dev/zero", folder.path("link")));
    // A device without end, a link to it, a folder and a pipe that nobody fills.
    for (const QString &path :
         {QString("/dev/zero"), folder.path("link"), folder.path(), folder.path("pipe")}) {
        ReadRun run{QByteArray()};
        run.info.fileName = path;
        QVERIFY(!run.read().ok);
        QCOMPARE(run.log.last(), QString("4|Cannot open waveform input file."));
        CapturedLog log;
        WvFileSummary summary;
        QVERIFY(!HvFileIO().readWaveformInfo(path, &summary));
        QCOMPARE(log.take().last(), QString("4|Cannot open file."));
    }
}

/// A good file cut at each of its bytes: always an end, and a reason.
void TestHostileFiles::everyCut()
{
    const QByteArray whole = tgx + "{CLOCK:1}{LEVEL OFFS:1,2}{SAMPLES:2}{FREE:x}{CONTROL LENGTH: 2}"
                                   "{MARKER LIST 1: 0:1;1:0}{WAVEFORM-9: #abcdefgh}";
    for (qsizetype size = 0; size < whole.size(); ++size) {
        ReadRun run(whole.left(size));
        // The closing brace alone isn't missed.
        QCOMPARE(run.read().ok, size == whole.size() - 1);
        QCOMPARE(run.log.filter(QRegularExpression("^4")).isEmpty(), run.ok);
    }
}

QTEST_GUILESS_MAIN(TestHostileFiles)
#include "tst_hostilefiles.moc"
