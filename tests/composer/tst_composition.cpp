// SPDX-License-Identifier: Apache-2.0
#include "composer/Composition.h"
#include "composer/compositiontext.h"
#include "support/rows.h"

#include <QTest>

#include <vector>

class tst_composition : public QObject
{
    Q_OBJECT

private slots:
    void init();
    void edits();
    void lengths();
    void clockChange();
    void playTimeFallsOnSamples();
    void ends();
    void adjust();
    void nearestBorder();
    void segmentQuery();
    void offsets();
};

void tst_composition::init()
{
    Tracer::setMask(Tracer::DebugMask);
    loggedText();
}

/// The name of a row is the edit: its kind and a segment, or a position.
void tst_composition::edits()
{
    struct Row
    {
        const char *name;
        QString before;
        QString after;
        QString log = {};
    };
    const std::vector<Row> table{
        {"insert N@10:0+5", "A@0:0+10 B@10:0+10", "A@0:0+10 N@10:0+5 B@15:0+10"},
        {"insert N@4:0+5", "A@0:3+10 B@10:0+10", "A@0:3+4 N@4:0+5 A@9:7+6 B@15:0+10"},
        {"insert N@9:0+5", "A@0:0+10", "A@0:0+9 N@9:0+5 A@14:9+1"},
        {"insert N@15:0+5", "A@0:0+10", "A@0:0+10 N@15:0+5"},
        {"insert N@0:0+2", "A@0:0+4|-B@0:0+4|", "N@0:0+2 A@2:0+4|-B@0:0+4|N@0:0+2"},
        // Wraps of the track go.
        {"insert N@9:0+2", "A@0:0+4~ B@4:0+4~|-C@0:0+4~", "A@0:0+4 B@4:0+4 N@9:0+2|-C@0:0+4~"},
        // 0.5 source samples a target sample: 7 target samples are 3 source samples.
        {"insert N@7:0+5", "A@0:0+10/0.5", "A@0:0+3/0.5 N@7:0+5 A@12:3+7/0.5"},
        {"insert N@0:0+0", "A@0:0+4", "A@0:0+4", "Cannot insert segment. Invalid sample count."},
        {"overwrite N@0:0+4", "A@0:0+10", "A@0:0+0 N@0:0+4 A@4:0+6",
         "Segment 1 in track 1 updated.\n ( Truncated to 0 samples. )\n"
         "Remaining fraction from segment 1 in track 1.\n"
         "  ( 6 samples starting at position 4 )"},
        // The rest plays on from where the new segment began, at source sample 3.
        {"overwrite N@3:0+4", "A@0:0+10", "A@0:0+3 N@3:0+4 A@7:3+3"},
        {"overwrite N@6:0+4", "A@0:0+10", "A@0:0+6 N@6:0+4"},
        {"overwrite N@2:0+10", "A@0:0+4 B@4:0+4 C@8:0+4 D@20:0+4", "A@0:0+2 N@2:0+10 D@20:0+4",
         "Segment 1 in track 1 updated.\n ( Truncated to 2 samples. )\n"
         "No remaining data from segment 1 in track 1.\n"
         "Removing segment 3 from track 1\n  because 'N' ends at sample 13.\n"
         "Removing segment 3 from track 1\n  because 'N' ends at sample 13."},
        // The end is 8, of which B loses 8 - 6 + 1 samples and moves to 8.
        {"overwrite N@4:0+4", "A@0:0+4 B@6:2+10", "A@0:0+4 N@4:0+4 B@8:5+7"},
        {"overwrite N@1:0+5", "A@5:0+3 B@8:0+10", "N@1:0+5 A@6:2+1 B@8:0+10"},
        {"overwrite N@9:0+2", "A@0:0+4~ B@30:0+2~", "A@0:0+4 N@9:0+2 B@30:0+2"},
        // 5 samples at 3 MHz are 1.67 at 1 MHz: cut to 1 here, though 2 elsewhere.
        {"overwrite N@2:0+5/3", "A@0:0+9", "A@0:0+2 N@2:0+5/3 A@3:2+6"},
        {"overwrite N@2:0+5/0", "A@0:0+9", "A@0:0+9",
         "Cannot overwrite with segment. Clock rate is invalid."},
        {"lift 3", "A@0:0+4 B@4:0+4|-C@0:0+9|D@0:0+9", "B@4:0+4|-C@0:0+9|"},
        {"lift 6", "A@0:0+4 B@9:0+4", "A@0:0+4 B@9:0+4"},
        {"extract 0", "A@0:0+4 B@4:0+4 C@20:0+1|D@2:0+1", "B@0:0+4 C@16:0+1|D@2:0+1"},
        // The second one slides up and stays.
        {"delete", "A@0:0+1|B@0:0+1|-C@0:0+1", "B@0:0+1|-C@0:0+1"},
        {"delete", "-A@0:0+1|B@0:0+1|C@0:0+1", "-A@0:0+1", "2 tracks deleted."}};
    forRows(table, [](const Row &row) {
        Composition document = documentOf(row.before);
        const Composition copy = document;
        const QString kind = QString(row.name).section(' ', 0, 0);
        const QString operand = QString(row.name).section(' ', 1);
        loggedText();
        bool done = true;
        if (kind == "insert") {
            done = document.insertSegment(segmentFromText(operand));
        } else if (kind == "overwrite") {
            done = document.overwriteSegment(segmentFromText(operand));
        } else if (kind == "delete") {
            document.deleteSelectedTracks();
        } else {
            const qint64 at = operand.toLongLong();
            done = kind == "lift" ? document.liftAt(at) : document.extractAt(at);
        }
        QCOMPARE(done, !row.log.startsWith("Cannot"));
        QCOMPARE(textOf(document), row.after);
        QCOMPARE(textOf(copy), row.before);
        QVERIFY(row.log.isEmpty() || loggedText() == row.log);
    });
}

void tst_composition::lengths()
{
    // At half the target clock, at twice and ten times of it.
    for (const auto &[text, length] :
         {std::pair("A@5:0+1/0.5", 2), {"A@5:0+1/2", 1}, {"A@5:0+1/10", 0}}) {
        const ComposerSegment placed = segmentFromText(text);
        QCOMPARE(Composition().targetSamples(placed), length);
        const auto borders = Composition().segmentBorders(placed);
        QVERIFY(borders && borders->first == 5 && borders->last == 4 + length);
    }
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

void tst_composition::nearestBorder()
{
    Composition document = documentOf("A@10:0+10|-B@28:0+4");
    document.target.lSamples = 100;
    // The start of all, a first sample, behind a last one, none of an unselected track, the end.
    for (const auto &[position, border] :
         {std::pair(3, 0), {9, 10}, {21, 20}, {27, 20}, {90, 100}}) {
        QCOMPARE(document.nearestBorder(position), border);
    }
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

void tst_composition::offsets()
{
    // 1000 samples at 1 MHz: one rotation is 1 kHz.
    forRows({{"below", 3200.0, true, 100.0, 3000.0, false},
             {"half goes on", 3500.0, true, 100.0, 4000.0, false},
             {"negative", -3200.0, true, 100.0, -3000.0, false},
             {"limited below", 3200.0, true, 1.0, 3168.0, true},
             {"limited above", 3700.0, true, 1.0, 3737.0, true},
             {"no deviation", 3700.0, true, 0.0, 3700.0, true},
             {"switched off", 3700.0, false, 100.0, 3700.0, false},
             {"none", 1e-7, true, 100.0, 0.0, false}},
            [](double offset, bool adjust, double limit, double expected, bool limited) {
                ComposerSegment segment = segmentFromText("A@0:0+1000");
                segment.dFOfs = offset;
                segment.bAdjOfs = adjust;
                segment.dAdjLim = limit;
                const EffectiveOffset result = Composition().effectiveOffset(segment);
                QCOMPARE(result.limited, limited);
                QVERIFY(std::abs(result.hz - expected) < 1e-6);
            });
}

QTEST_GUILESS_MAIN(tst_composition)
#include "tst_composition.moc"
