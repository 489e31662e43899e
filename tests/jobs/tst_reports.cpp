// SPDX-License-Identifier: Apache-2.0
#include "jobs/InfoReport.h"
#include "jobs/ReportText.h"
#include "support/logreader.h"
#include "support/rows.h"
#include "wvfile/WvTypes.h"

#include <QTest>

#include <cmath>

class TestReports : public QObject
{
    Q_OBJECT

private slots:
    void tagTexts();
    void showsNoNegativeZero();
    void listsSegments();
};

void TestReports::tagTexts()
{
    forRows({{"braces", "a{bc}d", "ac", 1},
             {"brace pair", "x{}y", "xy", 1},
             {"tag in a tag", "a{SAMPLES:1}{", "aAMPLES:1", 1},
             {"brace before a line break", "a\n{\nWAVEFORM-5:#}}", "a\nWAVEFORM-5:#", 2},
             {"umlaut", QString::fromUtf8("Prüf"), QString::fromUtf8("Prüf"), 1},
             {"tilde ends a text", "a~b", "a~b", 1}},
            [](const QString &text, const QString &kept, int warnings) {
                (void)takeLog();
                QCOMPARE(tagText("comment", text), kept);
                QCOMPARE(takeLog(Tracer::Warning).filter("comment").size(), warnings);
            });
}

void TestReports::showsNoNegativeZero()
{
    WvWriteJob record;
    record.peakOffset = record.rmsOffset = -1e-5;
    QCOMPARE(levelRows(record).at(1).value, "0.00 dB");
    QCOMPARE(std::signbit(offsetDb(1.0)), false);
    // The guard against silence shows in no digit that is written.
    QVERIFY(std::fabs(offsetDb(0.5) - 20 * std::log10(2.0)) < 1e-9);
    QVERIFY(std::fabs(offsetDb(0) - 240) < 1e-9);
}

void TestReports::listsSegments()
{
    WvFileSummary summary;
    summary.segmentCount = 1;
    summary.segments = {{"b.wv", 2, 3, 2, 5e5, 1000, 1000000}};
    const QStringList lines = infoText(summary).section("Segments:", 1).split('\n');
    const QStringList expected{
        "Segment 1: b.wv", "Clock: 500 kHz",    "Start Sample, Samples: 1000, 1000000",
        "Play Time: 2 s",  "Peak Offset: 2 dB", "Peak/RMS: 1 dB"};
    for (qsizetype i = 0; i < expected.size(); ++i) {
        // After the count, the settings file and the two modes.
        QCOMPARE(lines.value(4 + i).simplified(), expected.at(i));
    }
}

QTEST_GUILESS_MAIN(TestReports)
#include "tst_reports.moc"
