// SPDX-License-Identifier: Apache-2.0
#include "filebytes.h"
#include "jobs/InfoReport.h"
#include "jobs/ReportText.h"
#include "log/Tracer.h"

#include <QTest>

#include <cmath>

using namespace filebytes;

class TestReports : public QObject
{
    Q_OBJECT

private slots:
    void tagTexts_data();
    void tagTexts();
    void plainLines();
    void showsNoNegativeZero();
    void escapesTextsOfFiles();
    void listsSegments();
};

void TestReports::tagTexts_data()
{
    QTest::addColumn<QString>("text");
    QTest::addColumn<QString>("kept");
    QTest::addColumn<int>("warnings");
    const auto row = [](const char *name, const QString &text, const QString &kept, int warnings) {
        QTest::newRow(name) << text << kept << warnings;
    };
    row("plain", "a b|[]\\", "a b|[]\\", 0);
    row("braces", "a{bc}d", "ac", 0);
    row("brace pair", "x{}y", "xy", 0);
    row("tag in a tag", "a{SAMPLES:1}{", "aAMPLES:1", 0);
    row("brace before a line break", "a\n{\nWAVEFORM-5:#}}", "a\nWAVEFORM-5:#", 1);
    row("umlaut", QString::fromUtf8("Prüf"), QString::fromUtf8("Prüf"), 1);
    row("other script", QString::fromUtf8("波形"), QString::fromUtf8("波形"), 1);
    row("tilde ends a text", "a~b", "a~b", 1);
    row("empty", "", "", 0);
}

void TestReports::tagTexts()
{
    QFETCH(QString, text);
    QFETCH(int, warnings);
    (void)Tracer::takeEntries();
    QTEST(tagText("comment", text), "kept");
    const QStringList log = takeLog(Tracer::Warning);
    QCOMPARE(log.size(), warnings);
    QVERIFY(log.filter("comment").size() == warnings);
}

void TestReports::plainLines()
{
    QCOMPARE(plainLine(fileRow("/a <b>&amp; \"c\".wv")), "File:        /a <b>&amp; \"c\".wv");
    QCOMPARE(plainLine(ReportLine::plain("\n")), "");
}

void TestReports::showsNoNegativeZero()
{
    WvWriteJob record;
    record.peakOffset = -1e-5;
    record.rmsOffset = -1e-5;
    QCOMPARE(levelRows(record).at(1).value, "0.00 dB");
    QCOMPARE(levelRows(record).at(2).value, "0.00 dB");
    QCOMPARE(std::signbit(offsetDb(1.0)), false);
    // The guard against silence shows in no digit that is written.
    QVERIFY(std::fabs(offsetDb(0.5) - 20 * std::log10(2.0)) < 1e-9);
    QVERIFY(std::fabs(offsetDb(0) - 240) < 1e-9);
}

void TestReports::escapesTextsOfFiles()
{
    WvFileSummary summary;
    summary.fileName = "<i>&.wv";
    summary.comment = "</table>";
    const QString html = infoHtml(summary, "/a<b/", {"#1", "#2", "#3", "#4"});
    QVERIFY(html.contains("<h2>/a&lt;b/</h2><h2>&nbsp;&nbsp;&lt;i&gt;&amp;.wv</h2>"));
    QVERIFY(html.contains("'&lt;/table&gt;'"));
    QCOMPARE(html.count("</table>"), 1);
}

void TestReports::listsSegments()
{
    WvFileSummary summary;
    summary.fileName = "m.wv";
    summary.segmentCount = 2;
    summary.segments = {{"a.wv", 0.001, 5, 2, 1e6, 0, 1000}, {"b.wv", 2, 3, 3, 5e5, 1000, 1000000}};
    const QString text = infoText(summary);
    const QStringList values = text.section("Segments:", 1).split('\n');
    const QStringList expected{
        "Segment 1: a.wv", "Clock: 1 MHz",      "Start Sample, Samples: 0, 1000",
        "Play Time: 1 ms", "Peak Offset: 2 dB", "Peak/RMS: 3 dB",
        "Segment 2: b.wv", "Clock: 500 kHz",    "Start Sample, Samples: 1000, 1000000",
        "Play Time: 2 s",  "Peak Offset: 3 dB", "Peak/RMS: 0 dB"};
    for (qsizetype i = 0; i < expected.size(); ++i) {
        // Behind the count, the settings file and the two modes.
        QCOMPARE(values.value(4 + i).simplified(), expected.at(i));
    }
}

QTEST_GUILESS_MAIN(TestReports)
#include "tst_reports.moc"
