// SPDX-License-Identifier: Apache-2.0
#include "cli/CliRun.h"
#include "support/files.h"
#include "support/rows.h"
#include "support/wvbytes.h"

#include <QFile>
#include <QJsonArray>
#include <QJsonDocument>
#include <QJsonObject>
#include <QTest>
#include <QtEndian>

#include <cstdlib>
#include <utility>

class tst_composecommand : public QObject
{
    Q_OBJECT

private slots:
    void init();
    void renders();
    void lists();

private:
    TestFolder m_folder;
};

/// A tone of 4000 samples from the start of the file on, and its copy 1000 samples later.
void tst_composecommand::init()
{
    QVERIFY(m_folder.store("tone.wv", toneFile(4000)));
    const QByteArray segment = "<Segment sName='tone.wv' lSamples='4000' lUsed='4000' "
                               "dSrcClk='1e6' bMkr='1' lTarget='";
    const QByteArray disabled = "<Track><Segment sName='gone.wv' lSamples='4' lUsed='4'/></Track>";
    QVERIFY(
        m_folder.store("a.cms", "<Settings><TargetWv sName='out.wv' lSamples='5000' dUsrClk='1e6'/>"
                                "<Track bEnable='1'>" +
                                    segment + "0'/></Track><Track bEnable='1'>" + segment +
                                    "1000'/></Track>" + disabled + "</Settings>"));
    QFile::remove(m_folder.path("out.wv"));
    QFile::remove(m_folder.path("other.wv"));
}

void tst_composecommand::renders()
{
    const auto check = [this](const QString &options, const QString &output) {
        const QStringList arguments = QString("compose a.cms " + options).split(' ');
        const CliRun run = CliRun::in(m_folder.path(), arguments);
        QVERIFY2(run.exitCode == 0, qPrintable(run.lines.join('\n')));
        QVERIFY(run.output.isEmpty());
        const QByteArray file = m_folder.load(output);
        QCOMPARE(tag(file, "SAMPLES"), "5000");
        QCOMPARE(tag(file, "COMMENT"), "Created with Corvane");
        QCOMPARE(tag(file, "MARKER LIST 1"), " 0:1;3000:0");
        // Twice the tone where both play; 1000 samples are one turn. The tone's own rounding lifts
        // the peak by some words.
        for (const auto &[sample, word] :
             {std::pair{0, 16384}, {1000, 32767}, {3000, 32767}, {4000, 16384}}) {
            const auto got = qFromLittleEndian<qint16>(sampleWords(file).constData() + 4 * sample);
            QVERIFY2(std::abs(got - word) <= 4, qPrintable(QString::number(got)));
        }
        QVERIFY(!run.lines.filter("frequency shifting 2 Waveforms, 8000 Input").isEmpty());
        // An existing file stays.
        QCOMPARE(CliRun::in(m_folder.path(), arguments).exitCode, 1);
    };
    forRows({{"as composed", "--no-multi-process", "out.wv"},
             {"other name", "-o other.wv", "other.wv"}},
            check);
}

void tst_composecommand::lists()
{
    const CliRun run = CliRun::in(m_folder.path(), {"compose", "a.cms", "--list", "--json"});
    QCOMPARE(run.exitCode, 0);
    const QJsonObject object = QJsonDocument::fromJson(run.output).object();
    QCOMPARE(object["target"]["sName"].toString(), m_folder.path("out.wv"));
    QCOMPARE(object["target"]["dUsrClk"].toDouble(), 1e6);
    QCOMPARE(object["tracks"].toArray().size(), 3);
    const QJsonObject segment = object["tracks"][1]["segments"][0].toObject();
    QCOMPARE(segment["lTarget"].toInt(), 1000);
    QCOMPARE(segment["missing"].toBool(), false);
    QCOMPARE(object["tracks"][2]["segments"][0]["missing"].toBool(), true);
    QCOMPARE(object["tracks"][2]["bEnable"].toBool(), false);
    const CliRun plain = CliRun::in(m_folder.path(), {"compose", "a.cms", "--list"});
    QVERIFY(plain.output.contains("gone.wv (missing)"));
    QVERIFY(!QFile::exists(m_folder.path("out.wv")));
}

QTEST_GUILESS_MAIN(tst_composecommand)
#include "tst_composecommand.moc"
