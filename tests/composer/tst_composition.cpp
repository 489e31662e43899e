// SPDX-License-Identifier: Apache-2.0
#include "composer/Composition.h"
#include "composer/compositiontext.h"

#include <QTest>

#include <functional>

using Edit = std::function<bool(Composition &)>;

class tst_composition : public QObject
{
    Q_OBJECT

private slots:
    void init();
    void edits_data();
    void edits();
    void lengths_data();
    void lengths();
    void clockChange();
    void playTimeFallsOnSamples();
    void ends();
    void adjust();
    void nearestBorder_data();
    void nearestBorder();
    void segmentQuery();
    void offsets_data();
    void offsets();
};

void tst_composition::init()
{
    Tracer::setMask(Tracer::DebugMask);
    loggedText();
}

void tst_composition::edits_data()
{
    QTest::addColumn<QString>("before");
    QTest::addColumn<Edit>("edit");
    QTest::addColumn<QString>("after");
    QTest::addColumn<QString>("log");
    const auto row = [](const char *name, const char *before, Edit edit, const char *after,
                        const char *log = "") {
        QTest::newRow(name) << QString(before) << std::move(edit) << QString(after) << QString(log);
    };
    const auto insert = [](const char *text) {
        return [segment = segmentFromText(text)](Composition &document) {
            return document.insertSegment(segment);
        };
    };
    const auto overwrite = [](const char *text) {
        return [segment = segmentFromText(text)](Composition &document) {
            return document.overwriteSegment(segment);
        };
    };
    const auto lift = [](qint64 at) { return [at](Composition &d) { return d.liftAt(at); }; };
    const auto extract = [](qint64 at) { return [at](Composition &d) { return d.extractAt(at); }; };
    const Edit removeTracks = [](Composition &document) {
        document.deleteSelectedTracks();
        return true;
    };

    row("insert on a first sample", "A@0:0+10 B@10:0+10", insert("N@10:0+5"),
        "A@0:0+10 N@10:0+5 B@15:0+10");
    row("insert inside", "A@0:3+10 B@10:0+10", insert("N@4:0+5"),
        "A@0:3+4 N@4:0+5 A@9:7+6 B@15:0+10");
    row("insert on a last sample", "A@0:0+10", insert("N@9:0+5"), "A@0:0+9 N@9:0+5 A@14:9+1");
    row("insert past the end", "A@0:0+10", insert("N@15:0+5"), "A@0:0+10 N@15:0+5");
    row("insert into selected tracks only", "A@0:0+4|-B@0:0+4|", insert("N@0:0+2"),
        "N@0:0+2 A@2:0+4|-B@0:0+4|N@0:0+2");
    row("insert clears wraps of the track", "A@0:0+4~ B@4:0+4~|-C@0:0+4~", insert("N@9:0+2"),
        "A@0:0+4 B@4:0+4 N@9:0+2|-C@0:0+4~");
    // 0.5 source samples a target sample: 7 target samples are 3 source samples.
    row("insert cuts to source samples", "A@0:0+10/0.5", insert("N@7:0+5"),
        "A@0:0+3/0.5 N@7:0+5 A@12:3+7/0.5");
    row("insert a file of no samples", "A@0:0+4", insert("N@0:0+0"), "A@0:0+4",
        "Cannot insert segment. Invalid sample count.");

    row("overwrite on a first sample", "A@0:0+10", overwrite("N@0:0+4"), "A@0:0+0 N@0:0+4 A@4:0+6",
        "Segment 1 in track 1 updated.\n ( Truncated to 0 samples. )\n"
        "Remaining fraction from segment 1 in track 1.\n"
        "  ( 6 samples starting at position 4 )");
    // The rest plays on from where the new segment began, at source sample 3.
    row("overwrite inside", "A@0:0+10", overwrite("N@3:0+4"), "A@0:0+3 N@3:0+4 A@7:3+3");
    row("overwrite up to the end", "A@0:0+10", overwrite("N@6:0+4"), "A@0:0+6 N@6:0+4",
        "Segment 1 in track 1 updated.\n ( Truncated to 6 samples. )\n"
        "No remaining data from segment 1 in track 1.");
    row("overwrite covers two", "A@0:0+4 B@4:0+4 C@8:0+4 D@20:0+4", overwrite("N@2:0+10"),
        "A@0:0+2 N@2:0+10 D@20:0+4",
        "Segment 1 in track 1 updated.\n ( Truncated to 2 samples. )\n"
        "No remaining data from segment 1 in track 1.\n"
        "Removing segment 3 from track 1\n  because 'N' ends at sample 13.\n"
        "Removing segment 3 from track 1\n  because 'N' ends at sample 13.");
    // The end is 8, of which B loses 8 - 6 + 1 samples and moves to 8.
    row("overwrite cuts a head", "A@0:0+4 B@6:2+10", overwrite("N@4:0+4"),
        "A@0:0+4 N@4:0+4 B@8:5+7");
    row("overwrite before a first sample", "A@5:0+3 B@8:0+10", overwrite("N@1:0+5"),
        "N@1:0+5 A@6:2+1 B@8:0+10");
    row("overwrite clears wraps", "A@0:0+4~ B@30:0+2~", overwrite("N@9:0+2"),
        "A@0:0+4 N@9:0+2 B@30:0+2");
    // 5 samples at 3 MHz are 1.67 at 1 MHz: cut to 1 here, though 2 elsewhere.
    row("overwrite cuts its length", "A@0:0+9", overwrite("N@2:0+5/3"),
        "A@0:0+2 N@2:0+5/3 A@3:2+6");
    row("overwrite without a clock", "A@0:0+9", overwrite("N@2:0+5/0"), "A@0:0+9",
        "Cannot overwrite with segment. Clock rate is invalid.");

    row("lift leaves a gap", "A@0:0+4 B@4:0+4|-C@0:0+9|D@0:0+9", lift(3), "B@4:0+4|-C@0:0+9|");
    row("lift in a gap", "A@0:0+4 B@9:0+4", lift(6), "A@0:0+4 B@9:0+4");
    row("extract closes the gap", "A@0:0+4 B@4:0+4 C@20:0+1|D@2:0+1", extract(0),
        "B@0:0+4 C@16:0+1|D@2:0+1");

    row("delete: the second slides up and stays", "A@0:0+1|B@0:0+1|-C@0:0+1", removeTracks,
        "B@0:0+1|-C@0:0+1", "1 tracks deleted.");
    row("delete: behind an unselected one", "-A@0:0+1|B@0:0+1|C@0:0+1", removeTracks, "-A@0:0+1",
        "2 tracks deleted.");
}

void tst_composition::edits()
{
    QFETCH(QString, before);
    QFETCH(Edit, edit);
    QFETCH(QString, after);
    QFETCH(QString, log);
    Composition document = documentOf(before);
    const Composition copy = document;
    QCOMPARE(edit(document), !log.startsWith("Cannot"));
    QCOMPARE(textOf(document), after);
    QCOMPARE(textOf(copy), before);
    if (!log.isEmpty()) {
        QCOMPARE(loggedText(), log);
    }
}

void tst_composition::lengths_data()
{
    QTest::addColumn<QString>("segment");
    QTest::addColumn<qint64>("length");
    QTest::newRow("half the clock") << "A@5:0+1/0.5" << qint64{2};
    QTest::newRow("twice the clock") << "A@5:0+1/2" << qint64{1};
    QTest::newRow("ten times the clock") << "A@5:0+1/10" << qint64{0};
}

void tst_composition::lengths()
{
    QFETCH(QString, segment);
    QFETCH(qint64, length);
    const Composition document;
    const ComposerSegment placed = segmentFromText(segment);
    QCOMPARE(document.targetSamples(placed), length);
    const auto borders = document.segmentBorders(placed);
    QVERIFY(borders);
    QCOMPARE(borders->first, 5);
    QCOMPARE(borders->last, 4 + length);
}

void tst_composition::clockChange()
{
    Composition document = documentOf("A@3:0+1|B@5:0+1");
    document.target.dTime = 1.5e-6;
    QVERIFY(document.setTargetClock(2e6));
    QCOMPARE(textOf(document), "A@6:0+1|B@10:0+1");
    QCOMPARE(document.target.lSamples, 3);
    document.target.dUsrClk = 3e6;
    QVERIFY(document.setTargetClock(2e6)); // 6 / 1.5 = 4; 10 / 1.5 = 6.67
    QCOMPARE(textOf(document), "A@4:0+1|B@6:0+1");
    QVERIFY(!document.setTargetClock(0));
    QCOMPARE(document.target.dUsrClk, 2e6);
    QVERIFY(loggedText().endsWith("Cannot set target clock rate. Invalid value specified."));
}

void tst_composition::playTimeFallsOnSamples()
{
    Composition document;
    QVERIFY(document.setPlayTime(1.25e-6));
    QCOMPARE(document.target.lSamples, 1);
    QCOMPARE(document.target.dTime, 1e-6);
    QVERIFY(!document.setPlayTime(-1));
    QCOMPARE(document.target.lSamples, 1);
}

void tst_composition::ends()
{
    // The last segment of a track counts with its whole source: 5 + (7 + 3).
    Composition document = documentOf("A@0:0+8 B@5:7+3|C@1:0+9/3");
    QCOMPARE(document.longestSegmentEnd(), 8e-6);
    QCOMPARE(document.longestTrackEnd(), 15e-6);
    QCOMPARE(document.highestClock(), 3e6);
    QCOMPARE(loggedText(), "Longest segment is 8e-06 s.\nLongest track play time is 1.5e-05 s.");
    document.segment(1, 0)->dSrcClk = 0;
    QVERIFY(document.longestTrackEnd() < 0);
    QCOMPARE(loggedText(),
             "Cannot determine longest track. Invalid segment clock rate in track 2.");
    const Composition empty;
    QCOMPARE(empty.longestTrackEnd(), 0.0);
    QCOMPARE(empty.longestSegmentEnd(), 0.0);
    QCOMPARE(empty.highestClock(), 1e6);
}

void tst_composition::adjust()
{
    Composition document = documentOf("A@4:0+8/2|B@0:0+2");
    document.target.iLenMode = LongestSegmentWins;
    QVERIFY(document.adjustTarget()); // 4 at 1 MHz become 8 at 2 MHz; 4 us and 4 us
    QCOMPARE(textOf(document), "A@8:0+8/2|B@0:0+2");
    QCOMPARE(document.target.lSamples, 16);
    QVERIFY(document.extractAt(9));
    document.target.iLenMode = UserDefinedLength;
    QVERIFY(document.adjustTarget());
    QCOMPARE(document.target.dUsrClk, 1e6);
    QCOMPARE(document.target.lSamples, 8); // the play time stays
}

void tst_composition::nearestBorder_data()
{
    QTest::addColumn<qint64>("position");
    QTest::addColumn<qint64>("border");
    QTest::newRow("start of all") << qint64{3} << qint64{0};
    QTest::newRow("a first sample") << qint64{9} << qint64{10};
    QTest::newRow("behind a last sample") << qint64{21} << qint64{20};
    QTest::newRow("not of an unselected track") << qint64{27} << qint64{20};
    QTest::newRow("end of the target") << qint64{90} << qint64{100};
}

void tst_composition::nearestBorder()
{
    QFETCH(qint64, position);
    QFETCH(qint64, border);
    Composition document = documentOf("A@10:0+10|-B@28:0+4");
    document.target.lSamples = 100;
    QCOMPARE(document.nearestBorder(position), border);
}

void tst_composition::segmentQuery()
{
    Composition document = documentOf("A@2:0+4 B@10:0+5 C@20:0+1|-D@0:0+30");
    const auto place = document.segmentAt(0, 14);
    QVERIFY(place);
    QCOMPARE(place->index, 1);
    QCOMPARE(place->gapFirst, 6);
    QCOMPARE(place->gapLast, 19);
    QCOMPARE(document.segmentAt(0, 2)->gapFirst, -1);
    QCOMPARE(document.segmentAt(0, 20)->gapLast, -1);
    QVERIFY(!document.segmentAt(0, 15));
    document.markAt(12);
    QVERIFY(document.segment(0, 1)->selected);
    QVERIFY(!document.segment(1, 0)->selected);
    document.markAt(15);
    QVERIFY(!document.segment(0, 1)->selected);
}

void tst_composition::offsets_data()
{
    QTest::addColumn<double>("offset");
    QTest::addColumn<bool>("adjust");
    QTest::addColumn<double>("limit");
    QTest::addColumn<double>("expected");
    QTest::addColumn<bool>("limited");
    // 1000 samples at 1 MHz: one rotation is 1 kHz.
    QTest::newRow("below") << 3200.0 << true << 100.0 << 3000.0 << false;
    QTest::newRow("above") << 3700.0 << true << 100.0 << 4000.0 << false;
    QTest::newRow("half goes on") << 3500.0 << true << 100.0 << 4000.0 << false;
    QTest::newRow("negative") << -3200.0 << true << 100.0 << -3000.0 << false;
    QTest::newRow("limited below") << 3200.0 << true << 1.0 << 3168.0 << true;
    QTest::newRow("limited above") << 3700.0 << true << 1.0 << 3737.0 << true;
    QTest::newRow("no deviation") << 3700.0 << true << 0.0 << 3700.0 << true;
    QTest::newRow("switched off") << 3700.0 << false << 100.0 << 3700.0 << false;
    QTest::newRow("none") << 1e-7 << true << 100.0 << 0.0 << false;
}

void tst_composition::offsets()
{
    QFETCH(double, offset);
    QFETCH(bool, adjust);
    QFETCH(double, limit);
    ComposerSegment segment = segmentFromText("A@0:0+1000");
    segment.dFOfs = offset;
    segment.bAdjOfs = adjust;
    segment.dAdjLim = limit;
    const EffectiveOffset result = Composition().effectiveOffset(segment);
    QTEST(result.limited, "limited");
    QFETCH(double, expected);
    QVERIFY2(std::abs(result.hz - expected) < 1e-6,
             qPrintable(QString::number(result.hz, 'g', 12)));
}

QTEST_GUILESS_MAIN(tst_composition)
#include "tst_composition.moc"
