// SPDX-License-Identifier: Apache-2.0
#include "composer/Composition.h"
#include "composer/compositiontext.h"
#include "support/files.h"
#include "support/rows.h"

#include <QDir>
#include <QTest>

class tst_compositionfile : public QObject
{
    Q_OBJECT

private slots:
    void init();
    void bytesOfAFile();
    void namesMoveWithTheFile();
    void repairs();
    void surplusTracks();
    void hostile();

private:
    [[nodiscard]] QString path(const QString &name) const { return m_folder.path(name); }
    [[nodiscard]] bool load(Composition &document, const QByteArray &xml) const;

    TestFolder m_folder;
};

bool tst_compositionfile::load(Composition &document, const QByteArray &xml) const
{
    return m_folder.store("test.cms", xml) && document.load(path("test.cms"));
}

void tst_compositionfile::init()
{
    Tracer::setMask(Tracer::DebugMask);
    loggedText();
}

void tst_compositionfile::bytesOfAFile()
{
    Composition document;
    document.addTrack();
    document.addTrack();
    document.track(0)->bSelect = false;
    ComposerSegment segment = segmentFromText("a@7:2+30/2.5~");
    segment.sName = path("wave/a & b.wv");
    segment.dFOfs = 1234.5678901234567;
    segment.dLOfs = 0.1;
    segment.iFadeOut = FadeBlank;
    segment.bMkr = true;
    document.track(0)->segments.push_back(segment);
    document.target.sName = path("../out.wv");
    QVERIFY(document.save(path("test.cms")));
    const QByteArray expected =
        "<!DOCTYPE HV_Corvane_Waveform_Composer>\n"
        "<Settings>\n"
        "  <TargetWv sName=\"../out.wv\" iLenMode=\"0\" bSamples=\"0\" lSamples=\"0\" dTime=\"0\" "
        "bClk=\"1\" dUsrClk=\"1e+06\"/>\n"
        "  <Track bEnable=\"1\" bSelect=\"0\">\n"
        "    <Segment sName=\"wave/a &amp; b.wv\" dFOfs=\"1234.5678901234567\" dLOfs=\"0.1\" "
        "dFadeIn=\"0\" iFadeIn=\"0\" dFadeOut=\"0\" iFadeOut=\"3\" lSamples=\"32\" "
        "dSrcClk=\"2500000\" lStart=\"2\" lUsed=\"30\" lTarget=\"7\" bMkr=\"1\" bWrap=\"1\" "
        "bAdjOfs=\"1\" dAdjLim=\"0.1\"/>\n"
        "  </Track>\n"
        "  <Track bEnable=\"1\" bSelect=\"1\"/>\n"
        "</Settings>\n";
    QCOMPARE(m_folder.load("test.cms"), expected);
    Composition again;
    QVERIFY(again.load(path("test.cms")));
    QCOMPARE(textOf(again), textOf(document));
    QCOMPARE(again.segment(0, 0)->dFOfs, segment.dFOfs);
    QVERIFY(again.segment(0, 0)->missing);
    QVERIFY(again.segment(0, 0)->bMkr);
    QCOMPARE(again.target.sName, QDir::cleanPath(path("../out.wv")));
}

void tst_compositionfile::namesMoveWithTheFile()
{
    QVERIFY(QDir(m_folder.path()).mkpath("one"));
    Composition document;
    document.addTrack();
    ComposerSegment segment = segmentFromText("a@0:0+3");
    segment.sName = path("one/a.wv");
    document.track(0)->segments.push_back(segment);
    QVERIFY(document.save(path("one/test.cms")));
    QVERIFY(m_folder.store("one/a.wv", {}));
    QVERIFY(QFile::rename(path("one"), path("two")));
    QVERIFY(document.load(path("two/test.cms")));
    QCOMPARE(document.segment(0, 0)->sName, path("two/a.wv"));
    QVERIFY(!document.segment(0, 0)->missing);
    const QString log = loggedText();
    QVERIFY2(log.contains("Relative input file 'a.wv'\n  converted to '" + path("two/a.wv") + "'"),
             qPrintable(log));
}

void tst_compositionfile::repairs()
{
    Composition document;
    QVERIFY(load(document, "<Settings><Track><Segment/></Track><TargetWv/><TargetWv bClk='1'/>"
                           "</Settings>"));
    QCOMPARE(document.target.sName, path("composition.wv"));
    QCOMPARE(document.target.dUsrClk, 1e6);
    QVERIFY(!document.target.bClk);
    QVERIFY(!document.tracks().front().bEnable && !document.tracks().front().bSelect);
    const ComposerSegment &segment = *document.segment(0, 0);
    QVERIFY(segment.bAdjOfs && segment.missing);
    QCOMPARE(segment.dAdjLim, 0.1);
    QVERIFY(load(document, "<Settings><TargetWv dUsrClk='0' dTime='-1' lSamples='-5' bClk='x'/>"
                           "</Settings>"));
    QCOMPARE(document.target.dUsrClk, 1e6);
    QCOMPARE(document.target.dTime, 0.0);
    QCOMPARE(document.target.lSamples, 0);
    QVERIFY(!document.save(path("nowhere/test.cms")));
    QVERIFY(loggedText().contains(path("nowhere/test.cms")));
}

void tst_compositionfile::surplusTracks()
{
    QByteArray xml = "<Settings>";
    for (int i = 1; i <= 10000; ++i) {
        xml += "<Track bEnable='" + QByteArray::number(i % 2) + "'><Segment lTarget='" +
               QByteArray::number(i) + "'/></Track>";
    }
    Composition document;
    QVERIFY(load(document, xml + "</Settings>"));
    QCOMPARE(document.trackCount(), Composition::MaxTracks);
    QCOMPARE(document.segmentCount(15), 10000 - 15);
    QCOMPARE(document.segment(15, 1)->lTarget, 17);
    QVERIFY(!document.tracks().back().bEnable);
    QVERIFY(loggedText().contains("Cannot add more tracks.\nMaxumum number is 16 tracks."));
}

void tst_compositionfile::hostile()
{
    QByteArray bomb = "<!DOCTYPE x [<!ENTITY a0 'aaaaaaaaaa'>";
    for (int i = 1; i < 12; ++i) {
        const QByteArray before = "&a" + QByteArray::number(i - 1) + ';';
        bomb += "<!ENTITY a" + QByteArray::number(i) + " '" + before.repeated(10) + "'>";
    }
    forRows({{"empty", QByteArray(), false},
             {"cut", "<Settings><Track>", false},
             {"two roots", "<Settings/><a/>", false},
             {"wrong root", "<Setting><Track/></Setting>", true},
             {"entity bomb", bomb + "]><Settings a='&a11;'/>", false},
             {"outside entity",
              "<!DOCTYPE x [<!ENTITY a SYSTEM 'file:///etc/passwd'>]><Settings>&a;"
              "<Track b='&a;'/></Settings>",
              false}},
            [this](const QByteArray &xml, bool emptied) {
                Composition document = documentOf("A@0:0+1");
                QVERIFY(!load(document, xml));
                QCOMPARE(document.trackCount(), emptied ? 0 : 1);
                const QString log = loggedText();
                QVERIFY2(log.contains(path("test.cms")) &&
                             log.contains(emptied ? "\"Settings\"" : "line 1"),
                         qPrintable(log));
            });
}

QTEST_GUILESS_MAIN(tst_compositionfile)
#include "tst_compositionfile.moc"
