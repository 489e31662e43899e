// SPDX-License-Identifier: Apache-2.0
#include "jobrun.h"
#include "jobs/LevelJob.h"
#include "support/files.h"
#include "support/logreader.h"
#include "support/rows.h"
#include "support/wvbytes.h"

#include <QTest>

#include <algorithm>
#include <cmath>

namespace {

using Level = std::optional<double>;

const QByteArray plainTags = "{TYPE: TGX-WV,0}{CLOCK:1000000}{LEVEL OFFS:3.5,1.25}";

/// The bytes of a level copy of a file with these bytes; null if it fails.
QByteArray levelCopy(const QByteArray &source, Level peakDb = {}, Level peakToRmsDb = {})
{
    const TestFolder folder;
    if (!folder.store("in.wv", source)) {
        return {};
    }
    LevelJob job({folder.path("in.wv"), {folder.path("out.wv"), {}, {}}, peakDb, peakToRmsDb});
    return job.run() == JobOutcome::Finished ? folder.load("out.wv") : QByteArray();
}

} // namespace

class TestLevelJob : public QObject
{
    Q_OBJECT

private slots:
    void keepsAllButTheLevels();
    void keepsEveryWord();
    void keepsLongUnknownTags();
    void completesMarkers();
    void defaults();
    void tellsItsSteps();
};

void TestLevelJob::keepsAllButTheLevels()
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

void TestLevelJob::keepsEveryWord()
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

void TestLevelJob::keepsLongUnknownTags()
{
    QVERIFY(!levelCopy(wvFile(plainTags, words({1, 2}))).contains("MARKER LIST"));

    // Longer than any block that they are copied in, with the name of a dropped tag in the middle.
    const QByteArray longTag =
        "{LONG: " + QByteArray(300000, 'a') + "{CLOCK MARKER:1" + QByteArray(65536, 'b') + '}';
    const QByteArray dropped = "{CLOCK MARKER:" + QByteArray(200000, '1') + '}';
    const QByteArray copy =
        levelCopy(wvFile(plainTags + longTag + dropped + "{Z: }" + dropped, words({1, 2})), 0, 0);
    QVERIFY(copy.contains("{SAMPLES:1}" + longTag + "{Z: }{WAVEFORM"));
}

void TestLevelJob::completesMarkers()
{
    forRows({{"ends high", "{CONTROL LENGTH:4}{MARKER LIST 1: 0:0;2:1}", " 0:0;2:1", " 0:0"},
             // Each trace goes on as its own list ends.
             {"shorter than another list",
              "{CONTROL LENGTH:4}{MARKER LIST 1: 0:1;3:0}{MARKER LIST 2: 0:0;1:1}", " 0:1;3:0",
              " 0:0;1:1"},
             {"longer than the samples", "{CONTROL LENGTH:20}{MARKER LIST 1: 0:0;5:1;15:0}",
              " 0:0;5:1", " 0:0"}},
            [](const QByteArray &tags, const QByteArray &first, const QByteArray &second) {
                const QByteArray copy =
                    levelCopy(wvFile(plainTags + tags, QByteArray(40, '\1')), 0, 0);
                QCOMPARE(tag(copy, "CONTROL LENGTH"), " 10");
                QCOMPARE(tag(copy, "MARKER LIST 1"), first);
                QCOMPARE(tag(copy, "MARKER LIST 2"), second);
            });
}

void TestLevelJob::defaults()
{
    // What isn't given is what the samples measure; the written RMS offset is ratio - peak.
    const double first = (0x4000 - 0.5) / 32767;
    const double second = (100 - 0.5) / 32767;
    const auto offset = [](double level) { return 20 * std::log10(1 / (level + 1e-7)); };
    const double rms = offset(std::sqrt(first * first + second * second));
    const double peak = offset(std::sqrt(2 * first * first));
    forRows({{"both", Level(), Level(), rms, peak},
             {"peak given", Level(-4.0), Level(), rms - peak + 4, 4.0},
             {"ratio given", Level(), Level(2.0), peak + 2, peak}},
            [](const Level &given, const Level &ratio, double writtenRms, double writtenPeak) {
                const QByteArray copy =
                    levelCopy(wvFile("{TYPE: TGX-WV,0}{CLOCK:1000}{LEVEL OFFS:3.5,1.25}",
                                     words({0x4000, 0x4000, 100, 100})),
                              given, ratio);
                QCOMPARE(
                    tag(copy, "LEVEL OFFS"),
                    QByteArray(QString::asprintf("%.6f,%.6f", writtenRms, writtenPeak).toLatin1()));
            });
}

void TestLevelJob::tellsItsSteps()
{
    const TestFolder folder;
    QVERIFY(folder.store("in.wv", wvFile(plainTags, words({0, 0x7FFF}))));
    LevelJob job({folder.path("in.wv"), {folder.path("out.wv"), "new <&>", QString()}, {}, 0.25});
    const JobRun run(job);
    QCOMPARE(run.steps, (QStringList{"Reading Waveform...", "Saving waveform..."}));
    QCOMPARE(run.report,
             (QStringList{"Loop point: continuous", "File:        " + folder.path("out.wv"),
                          "Samples:     1", "Peak Offset: 0.00 dB", "Peak/RMS:    0.25 dB"}));
    QCOMPARE(tag(folder.load("out.wv"), "COMMENT"), "new <&>");
}

QTEST_GUILESS_MAIN(TestLevelJob)
#include "tst_leveljob.moc"
