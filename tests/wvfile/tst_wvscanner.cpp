// SPDX-License-Identifier: Apache-2.0
#include "WvTestFile.h"
#include "support/rows.h"
#include "wvfile/WvScanner.h"

#include <QTest>

namespace {

const QString noLevels = "2|No LEVEL OFFS tag found in waveform file.";
const QString noClock = "2|Invalid data in CLOCK tag.";
const QByteArray levels = "{LEVEL OFFS:3.5,1.25}";
const QByteArray clocked = levels + "{CLOCK:1000}";

struct Scan
{
    bool ok = false;
    WvFileSummary summary;
    QStringList log;
};

Scan scan(const QByteArray &bytes)
{
    Scan result;
    CapturedLog log;
    TestDevice device;
    device.bytes = bytes;
    result.ok = device.open(QIODevice::ReadOnly) && WvScanner(result.summary).scan(device);
    result.log = log.take();
    return result;
}

QString suspicious(qint64 block, qint64 tag)
{
    return QString("2|Suspicious number of samples (WAVEFORM tag:%1, SAMPLES tag:%2)")
        .arg(block)
        .arg(tag);
}

} // namespace

class TestWvScanner : public QObject
{
    Q_OBJECT

private slots:
    void accepted();
    void refused();
    void kinds();
    void segments();
    void names();
    void samplesAreNotRead();
};

void TestWvScanner::accepted()
{
    forRows(
        {{"no tag at all", "", {noLevels, noClock}},
         {"no levels", "{CLOCK:1}", {noLevels}},
         {"LEVEL OFFSET isn't known here", "{CLOCK:1}{LEVEL OFFSET:1,2}", {noLevels}},
         {"tags of no interest",
          clocked + "{CONTROL LENGTH:x}{CRESTFACTOR:{}{RESOLUTION:" + QByteArray(2000, '1') +
              "}{FREE" + QByteArray(5, '\0') + ":}{MWV_SEGMENT_NEWS:" + QByteArray(2000, '1') + '}',
          {}},
         {"block without SAMPLES", clocked + silentBlock(2), {suspicious(2, -1)}},
         {"block of broken length",
          clocked + "{SAMPLES:1}{WAVEFORM-8:1,#abcdef}",
          {"2|Resulting data length in WAVEFORM tag is invalid: 5",
           "2|Tag begins with 'WAVEFORM-8:1,#'",
           "2|Number of stripped bytes at beginning (including #): 3"}},
         {"block beyond belief",
          clocked + "{SAMPLES:1}{WAVEFORM-16000000005: #ab}",
          {"2|Invalid number of samples in WAVEFORM tag: 4000000001", suspicious(4'000'000'001, 1),
           "2|The file is cut off: 4000000001 of 4000000001 samples are missing."}},
         {"block shorter than its prefix",
          clocked + "{SAMPLES:1}{WAVEFORM-2:12345#}",
          {"2|Invalid number of samples in WAVEFORM tag: 0", suspicious(0, 1)}}},
        [](const QByteArray &file, const QStringList &log) {
            const Scan result = scan(file);
            QCOMPARE(result.log, log);
            QVERIFY(result.ok);
        });
}

void TestWvScanner::refused()
{
    forRows(
        {{"kind", "{TYPE:XYZ,0}", "4|Invalid file format in TYPE tag."},
         {"clock", "{CLOCK:inf}", "4|Invalid clock rate in CLOCK tag."},
         {"one level", "{LEVEL OFFS:1}", "4|Invalid parameters in LEVEL OFFS tag."},
         {"negative count", "{MWV_SEGMENT_COUNT:-1}", "4|Invalid count in MSW_SEGMENT_COUNT tag."},
         {"segment clock", "{MWV_SEGMENT_CLOCK:1,,2}", "4|Invalid MWV_SEGMENT_CLOCK tag."},
         {"segment levels", "{MWV_SEGMENT_LEVEL_OFFS:1,2,3,x}",
          "4|Invalid MWV_SEGMENT_LEVEL_OFFS tag."},
         {"block without mark", "{WAVEFORM-5:}", "4|Invalid WAVEFORM tag."},
         {"list without end", "{MARKER LIST 1:0:1", "4|Invalid MARKER LIST tag."}},
        [](const QByteArray &tags, const QString &words) {
            const Scan result = scan(clocked + tags);
            QCOMPARE(result.log, QStringList(words));
            QVERIFY(!result.ok);
        });
    for (const char *tag :
         {"TYPE", "COMMENT", "COPYRIGHT", "DATE", "CLOCK", "SAMPLES", "LEVEL OFFS", "WAVEFORM-1",
          "MWV_SEGMENT_SETTINGS_FILE", "MWV_SEGMENT_LEVEL_MODE", "MWV_SEGMENT_CLOCK_MODE"}) {
        const QString name = QString(tag).section('-', 0, 0);
        QCOMPARE(scan(clocked + '{' + tag + ':' + QByteArray(1025, '1') + '}').log,
                 QStringList({"4|Tag content exceeds limit.", "4|Invalid " + name + " tag."}));
    }
    // Lists of many segments are long; one that is too long costs its own row alone.
    for (const auto &[length, complaints] : {std::pair{65536, 0}, {65537, 2}}) {
        const Scan result =
            scan(clocked + "{MWV_SEGMENT_COUNT:1}{MWV_SEGMENT_FILES:" + QByteArray(length, 'n') +
                 "}{COMMENT:c}");
        QCOMPARE(result.log.filter(QRegularExpression("^4")).size(), complaints);
    }
}

void TestWvScanner::kinds()
{
    forRows({{"TGX", " tgx-wv , 0 ", "TGX Waveform File", false},
             {"TQX-130", "TQX-130-WV,123456", "TQX-130 waveform file", true},
             {"TQX-110", "WV, -1", "TQX-110, TQX-120 waveform file", true},
             {"added", "WV-ADD,x", "TQX-110, TQX-120 additional waveform file", false},
             {"control", "TGX-CL,0,7", "TGX control list", false}},
            [](const QByteArray &content, const QString &text, bool checksum) {
                const Scan result = scan("{TYPE:" + content + '}' + clocked);
                QVERIFY(result.ok);
                QCOMPARE(result.log, QStringList("1|Waveform TYPE-tag : " + text));
                QCOMPARE(result.summary.typeText, text);
                QCOMPARE(result.summary.hasChecksum, checksum);
            });
}

void TestWvScanner::segments()
{
    const Scan result = scan(
        clocked + "{TYPE:TGX-MWV,0}{MWV_SEGMENT_COUNT: 3}{MWV_SEGMENT_FILES:\"a.wv\",b \"c\".wv}"
                  "{MWV_SEGMENT_START:0,9000000000}{MWV_SEGMENT_LENGTH: 10 , 20}"
                  "{MWV_SEGMENT_CLOCK:1e6,2e6}{MWV_SEGMENT_DURATION:0.5,1,2}"
                  "{MWV_SEGMENT_LEVEL_OFFS:1,2,3,4,5}{MWV_SEGMENT_LEVEL_MODE:UNCHANGED}"
                  "{MWV_SEGMENT_CLOCK_MODE:HIGHEST}{MWV_SEGMENT_SETTINGS_FILE:\"s.inf\"}");
    QVERIFY2(result.ok, qPrintable(result.log.join('\n')));
    const WvFileSummary &summary = result.summary;
    QCOMPARE(summary.segmentCount, 3);
    const WvFileSummary empty = scan("").summary;
    QCOMPARE(empty.samples, qint64(-1));
    QCOMPARE(empty.clock, -1.0);
    QVERIFY(!empty.levelsValid);
    QCOMPARE(scan("{SAMPLES:1000}{CLOCK:0}").summary.playTime, -1.0);
    QCOMPARE(summary.levelMode, QString("UNCHANGED"));
    QCOMPARE(summary.clockMode, QString("HIGHEST"));
    QCOMPARE(summary.settingsFile, QString("s.inf"));
    QCOMPARE(summary.segments.size(), 3);
    QCOMPARE(summary.segments.at(0).fileName, QString("a.wv"));
    QCOMPARE(summary.segments.at(1).fileName, QString("b c.wv"));
    QCOMPARE(summary.segments.at(1).start, qint64(9'000'000'000));
    QCOMPARE(summary.segments.at(1).length, qint64(20));
    QCOMPARE(summary.segments.at(0).clock, 1e6);
    QCOMPARE(summary.segments.at(2).duration, 2.0);
    QCOMPARE(summary.segments.at(1).rmsOffset, 3.0);
    QCOMPARE(summary.segments.at(1).peakOffset, 4.0);
    QCOMPARE(summary.segments.at(2).rmsOffset, 0.0);
}

void TestWvScanner::names()
{
    forRows({{"control byte in a name", "{COM\nMENT:no}"},
             {"empty name", "{:no}"},
             {"long name", '{' + QByteArray(1100, 'x') + ":no}"},
             {"brace in a name", "{{COMMENT:no}"}},
            [](const QByteArray &before) {
                const Scan result = scan(before + clocked + "{COMMENT:yes}");
                QVERIFY(result.ok);
                QCOMPARE(result.log, QStringList());
                QCOMPARE(result.summary.comment, QString("yes"));
            });
}

/// However long the block and whatever it looks like, a scan reads the tags alone.
void TestWvScanner::samplesAreNotRead()
{
    TestDevice device;
    device.bytes = clocked + "{SAMPLES:3000000}" +
                   sampleBlock(QByteArray("{COMMENT:no}").repeated(1'000'000)) + "{COMMENT:behind}";
    QVERIFY(device.open(QIODevice::ReadOnly | QIODevice::Unbuffered));
    CapturedLog log;
    WvFileSummary summary;
    QVERIFY(WvScanner(summary).scan(device));
    QCOMPARE(log.take(), QStringList());
    QCOMPARE(summary.comment, QString("behind"));
    QVERIFY2(device.bytesRead < 131'072, qPrintable(QString::number(device.bytesRead)));
}

QTEST_GUILESS_MAIN(TestWvScanner)
#include "tst_wvscanner.moc"
