// SPDX-License-Identifier: Apache-2.0
#include "filebytes.h"
#include "jobs/LevelJob.h"
#include "jobs/ReportText.h"
#include "log/Tracer.h"

#include <QSignalSpy>
#include <QTemporaryDir>
#include <QTest>

#include <algorithm>
#include <cmath>

using namespace filebytes;

class TestLevelJob : public QObject
{
    Q_OBJECT

private slots:
    void init();
    void levelKeepsAllButTheLevels();
    void levelKeepsEveryWord();
    void levelKeepsLongUnknownTags();
    void levelTranslatesKinds_data();
    void levelTranslatesKinds();
    void levelCompletesMarkers_data();
    void levelCompletesMarkers();
    void levelDefaults_data();
    void levelDefaults();
    void levelTellsItsSteps();

private:
    [[nodiscard]] QString path(const QString &name) const { return m_folder.filePath(name); }

    /// Runs a level copy of the file "in.wv" with these bytes and returns the result's bytes.
    QByteArray levelCopy(const QByteArray &source, std::optional<double> peakDb = {},
                         std::optional<double> peakToRmsDb = {})
    {
        if (!store(path("in.wv"), source)) {
            return {};
        }
        LevelJob job({path("in.wv"), {path("out.wv"), {}, {}}, peakDb, peakToRmsDb});
        return job.run() == JobOutcome::Finished ? load(path("out.wv")) : QByteArray();
    }

    QTemporaryDir m_folder;
};

namespace {

const QByteArray plainTags = "{TYPE: TGX-WV,0}{CLOCK:1000000}{LEVEL OFFS:3.5,1.25}";

QStringList texts(const QSignalSpy &spy)
{
    QStringList lines;
    for (const QList<QVariant> &arguments : spy) {
        const QVariant &value = arguments.first();
        lines << (value.canConvert<ReportLine>() ? plainLine(value.value<ReportLine>())
                                                 : value.toString());
    }
    return lines;
}

} // namespace

void TestLevelJob::init()
{
    (void)Tracer::takeEntries();
    QFile::remove(path("out.wv"));
}

void TestLevelJob::levelKeepsAllButTheLevels()
{
    const QByteArray samples = words({1, 2, -3, 4, 0x7FFF, -0x7FFF, 0, -1});
    const QByteArray source =
        wvFile("{X: y}{TYPE: TVX-WV,0}{COMMENT:c d}{CLOCK:2500000.25}{CLOCK MARKER:5}"
               "{SAMPLES:4}{clock marker: 7}{COPYRIGHT:me}{CLOCK MARKER: 6}{CLOCK MARKERS:{}"
               "{LEVEL OFFS:3,1}{CONTROL LENGTH:4}{MARKER LIST 4: 0:0;3:1}"
               "{MARKER LIST 1: 0:1;1:0;2:1}{MARKER LIST 2: 0:0}",
               samples);
    QByteArray copy = levelCopy(source, -2, 4.5);
    copy.replace(tag(copy, "DATE"), "now");
    QCOMPARE(copy,
             wvFile("{TYPE: TVX-WV,0}{COMMENT:c d}{COPYRIGHT:me}{DATE:now}{CLOCK:2500000.250000}"
                    "{CLOCK MARKER:2500000.250000}{LEVEL OFFS:6.500000,2.000000}{SAMPLES:4}"
                    "{X: y}{clock marker: 7}{CLOCK MARKERS: {}{CONTROL LENGTH: 4}"
                    "{MARKER LIST 1: 0:1;1:0;2:1}{MARKER LIST 2: 0:0}{MARKER LIST 3: 0:0}"
                    "{MARKER LIST 4: 0:0;3:1}",
                    samples));
    // A copy of the copy changes nothing more.
    QByteArray again = levelCopy(copy, -2, 4.5);
    again.replace(tag(again, "DATE"), "now");
    QCOMPARE(again, copy);
}

void TestLevelJob::levelKeepsEveryWord()
{
    QByteArray samples;
    QByteArray expected;
    for (int word = -0x8000; word <= 0x7FFF; ++word) {
        samples += littleEndian(static_cast<qint16>(word));
        // The writer never goes below -32767, so one word can't come back.
        expected += littleEndian(static_cast<qint16>(std::max(word, -0x7FFF)));
    }
    QVERIFY(sampleWords(levelCopy(wvFile(plainTags, samples), 0, 0)) == expected);
}

void TestLevelJob::levelKeepsLongUnknownTags()
{
    // Longer than any block that they are copied in, with the name of a dropped tag in the middle.
    const QByteArray longTag =
        "{LONG: " + QByteArray(300000, 'a') + "{CLOCK MARKER:1" + QByteArray(65536, 'b') + '}';
    const QByteArray dropped = "{CLOCK MARKER:" + QByteArray(200000, '1') + '}';
    const QByteArray copy =
        levelCopy(wvFile(plainTags + longTag + dropped + "{Z: }" + dropped, words({1, 2})), 0, 0);
    QVERIFY(copy.contains("{SAMPLES:1}" + longTag + "{Z: }{CONTROL LENGTH: 1}"));
}

void TestLevelJob::levelTranslatesKinds_data()
{
    QTest::addColumn<QByteArray>("kind");
    QTest::addColumn<QByteArray>("written");
    QTest::newRow("TGX") << QByteArray("TGX-WV") << QByteArray(" TGX-WV,0");
    QTest::newRow("TBX") << QByteArray("TBX-WV,4711") << QByteArray(" TGX-WV,0");
    QTest::newRow("TVX") << QByteArray("tvx-wv") << QByteArray(" TVX-WV,0");
    QTest::newRow("TQX-130") << QByteArray("TQX-130-WV") << QByteArray(" TGX-WV,0");
    QTest::newRow("TQX-110") << QByteArray("WV-ADD") << QByteArray(" TGX-WV,0");
}

void TestLevelJob::levelTranslatesKinds()
{
    QFETCH(QByteArray, kind);
    const QByteArray copy =
        levelCopy(wvFile("{TYPE: " + kind + "}{CLOCK:1e6}", words({0, 0})), 0, 0);
    QTEST(tag(copy, "TYPE"), "written");
}

void TestLevelJob::levelCompletesMarkers_data()
{
    QTest::addColumn<QByteArray>("tags");
    QTest::addColumn<QByteArray>("first");
    QTest::addColumn<QByteArray>("second");
    QTest::newRow("no markers") << QByteArray() << QByteArray(" 0:0") << QByteArray(" 0:0");
    QTest::newRow("ends high") << QByteArray("{CONTROL LENGTH:4}{MARKER LIST 1: 0:0;2:1}")
                               << QByteArray(" 0:0;2:1") << QByteArray(" 0:0");
    QTest::newRow("ends low") << QByteArray("{CONTROL LENGTH:4}{MARKER LIST 1: 0:1;2:0}")
                              << QByteArray(" 0:1;2:0") << QByteArray(" 0:0");
    QTest::newRow("length one short") << QByteArray("{CONTROL LENGTH:9}{MARKER LIST 2: 0:0;8:1}")
                                      << QByteArray(" 0:0") << QByteArray(" 0:0;8:1");
    // The second list is shorter than the first, with whose last byte the trace goes on.
    QTest::newRow("cut by another list")
        << QByteArray("{CONTROL LENGTH:4}{MARKER LIST 1: 0:1;3:0}{MARKER LIST 2: 0:0;1:1}")
        << QByteArray(" 0:1;3:0") << QByteArray(" 0:0;1:1;4:0");
    QTest::newRow("longer than the samples")
        << QByteArray("{CONTROL LENGTH:20}{MARKER LIST 1: 0:0;5:1;15:0}") << QByteArray(" 0:0;5:1")
        << QByteArray(" 0:0");
}

void TestLevelJob::levelCompletesMarkers()
{
    QFETCH(QByteArray, tags);
    // Ten samples; the length of the file admits positions up to 20 and more.
    const QByteArray copy = levelCopy(wvFile(plainTags + tags, QByteArray(40, '\1')), 0, 0);
    QCOMPARE(tag(copy, "CONTROL LENGTH"), " 10");
    QTEST(tag(copy, "MARKER LIST 1"), "first");
    QTEST(tag(copy, "MARKER LIST 2"), "second");
    QCOMPARE(tag(copy, "MARKER LIST 3"), " 0:0");
    QCOMPARE(tag(copy, "MARKER LIST 4"), " 0:0");
}

void TestLevelJob::levelDefaults_data()
{
    // "Update" over the whole file: the peak level is minus the peak offset of the tag, the peak to
    // RMS ratio is what the samples measure minus the RMS offset of the tag. What is written then
    // is -peak, and ratio - peak.
    const double measured = [] {
        const double first = (0x4000 - 0.5) / 32767;
        const double second = (100 - 0.5) / 32767;
        return 20 * std::log10(1 / std::sqrt((2 * first * first + 2 * second * second) / 2));
    }();
    QTest::addColumn<QByteArray>("levels");
    QTest::addColumn<std::optional<double>>("peak");
    QTest::addColumn<std::optional<double>>("ratio");
    QTest::addColumn<double>("writtenRms");
    QTest::addColumn<double>("writtenPeak");
    using Level = std::optional<double>;
    const auto row = [](const char *name, const QByteArray &levels, Level peak, Level ratio,
                        double rms, double peakOffset) {
        QTest::newRow(name) << levels << peak << ratio << rms << peakOffset;
    };
    row("both", "3.5,1.25", {}, {}, measured - 3.5 + 1.25, 1.25);
    row("peak given", "3.5,1.25", -4.0, {}, measured - 3.5 + 4, 4);
    row("ratio given", "3.5,1.25", {}, 2.0, 3.25, 1.25);
    row("positive peak", "3.5,1.25", 3.0, 2.0, -1, -3);
    row("zero peak", "3.5,1.25", 0.0, 0.0, 0, 0);
    row("peak held to the field", "3.5,80", {}, 1.0, 51, 50);
    row("ratio held to the field", "99,0", {}, {}, -50, 0);
    row("no tag", {}, {}, {}, measured, 0);
}

void TestLevelJob::levelDefaults()
{
    QFETCH(QByteArray, levels);
    QFETCH(std::optional<double>, peak);
    QFETCH(std::optional<double>, ratio);
    QFETCH(double, writtenRms);
    QFETCH(double, writtenPeak);
    const QByteArray tags = "{TYPE: TGX-WV,0}{CLOCK:1000}" +
                            (levels.isEmpty() ? QByteArray() : "{LEVEL OFFS:" + levels + '}');
    const QByteArray copy = levelCopy(wvFile(tags, words({0x4000, 0x4000, 100, 100})), peak, ratio);
    QCOMPARE(tag(copy, "LEVEL OFFS"),
             QByteArray(QString::asprintf("%.6f,%.6f", writtenRms, writtenPeak).toLatin1()));
}

void TestLevelJob::levelTellsItsSteps()
{
    QVERIFY(store(path("in.wv"), wvFile(plainTags, words({0, 0x7FFF}))));
    LevelJob job({path("in.wv"), {path("out.wv"), "new <&>", QString()}, {}, 0.25});
    const QSignalSpy steps(&job, &ToolJob::stepStarted);
    const QSignalSpy report(&job, &ToolJob::report);
    QCOMPARE(job.run(), JobOutcome::Finished);
    QCOMPARE(texts(steps), (QStringList{"Reading Waveform...", "Saving waveform..."}));
    QCOMPARE(texts(report), (QStringList{"File:        " + path("out.wv"), "Samples:     1",
                                         "Peak Offset: 1.25 dB", "Peak/RMS:    0.25 dB"}));
    const QStringList log = takeLog(Tracer::Information);
    QVERIFY(!log.contains("Rescaling from pos. 1 to pos 1."));
    QCOMPARE(log.count("Creating rescaled waveform..."), 1);
    QCOMPARE(tag(load(path("out.wv")), "COMMENT"), "new <&>");

    LevelJob measuring({path("in.wv"), {path("out.wv"), {}, {}}, {}, {}});
    const QSignalSpy measuringSteps(&measuring, &ToolJob::stepStarted);
    QCOMPARE(measuring.run(), JobOutcome::Finished);
    QCOMPARE(texts(measuringSteps),
             (QStringList{"Reading Waveform...", "Calculating...", "Saving waveform..."}));
    QVERIFY(takeLog(Tracer::Information).contains("Rescaling from pos. 1 to pos 1."));
}

QTEST_GUILESS_MAIN(TestLevelJob)
#include "tst_leveljob.moc"
