// SPDX-License-Identifier: Apache-2.0
#include "jobrun.h"
#include "jobs/InfoReport.h"
#include "jobs/LevelJob.h"
#include "jobs/MeasureJob.h"
#include "jobs/WavImportJob.h"
#include "jobs/WaveformOutput.h"
#include "streams/TempStream.h"
#include "support/files.h"
#include "support/logreader.h"
#include "support/rows.h"
#include "support/wavbytes.h"
#include "support/wvbytes.h"

#include <QTest>

#include <algorithm>
#include <cmath>
#include <memory>
#include <utility>
#include <vector>

class TestJobs : public QObject
{
    Q_OBJECT

private slots:
    void init();
    void importScales();
    void importSetsTheClock();
    void measuresRanges();
    void cancelKeepsLaterStepsFromStarting();
    void clippingIsTold();
    void levelCopyKeepsTheRest();
    void keepsEveryWord();
    void keepsLongUnknownTags();
    void levelCopyCompletesMarkers();
    void levelDefaults();
    void tagTexts();
    void showsNoNegativeZero();
    void listsSegments();

private:
    [[nodiscard]] QString path(const QString &name) const { return m_folder.path(name); }

    TestFolder m_folder;
    StreamFolder m_streams;
};

namespace {

const QByteArray plainTags = "{TYPE: TGX-WV,0}{CLOCK:1000000}{LEVEL OFFS:3.5,1.25}";

/// Writes values, I and Q in turn, as they are.
class WriteJob final : public ToolJob
{
public:
    WriteJob(const QString &fileName, std::vector<float> values)
        : m_output(*this, {fileName, {}, {}})
        , m_values(std::move(values))
    {
    }

private:
    bool work() override
    {
        TempStream data;
        m_output.setLength(1e6, static_cast<qint64>(m_values.size() / 2));
        return data.open() && data->writeHeader("IQF") &&
               data->writeBytes(static_cast<int>(m_values.size() * sizeof(float)),
                                m_values.data()) &&
               m_output.save({.data = data.stream()}, "Saving...");
    }

    WaveformOutput m_output;
    std::vector<float> m_values;
};

using Level = std::optional<double>;

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

void TestJobs::init()
{
    (void)takeLog();
    QFile::remove(path("out.wv"));
}

void TestJobs::importScales()
{
    // 32767 / 32768 in both gives a peak of 1.41417, -3.0100 dB; a third sample keeps the chunk
    // above 8 bytes.
    const QByteArray high = words({0x7FFF, 0x7FFF, 0, 0, 0, 0});
    const double highOffset = -20 * std::log10(std::sqrt(2.0) * 32767 / 32768);
    // 0.5 x 32767 + 0.5 = 16384, -0.125 x 32767 + 0.5 = -4095.4
    const QByteArray low = words({0, 0, 0x4000, 0, 0, -0x1000});
    const double lowOffset = 20 * std::log10(2.0);
    using enum ImportScaling;
    forRows({{"high, none", high, None, words({32766, 32766, 0, 0, 0, 0}), highOffset},
             {"high, down", high, Down, words({23170, 23170, 0, 0, 0, 0}), 0.0},
             {"low, down", low, Down, words({0, 0, 16384, 0, 0, -4095}), lowOffset},
             {"low, auto", low, Auto, words({0, 0, 32767, 0, 0, -8191}), 0.0},
             {"silence, auto", words({0, 0, 0, 0, 0, 0}), Auto, words({0, 0, 0, 0, 0, 0}), 240.0}},
            [&](const QByteArray &source, ImportScaling scaling, const QByteArray &result,
                double peakOffset) {
                QVERIFY(m_folder.store("in.wav", wavFile(formatChunk() + chunk("data", source))));
                WavImportRequest request{path("in.wav"), {.output = {path("out.wv"), {}, {}}}};
                request.target.scaling = scaling;
                QCOMPARE(WavImportJob(request).run(), JobOutcome::Finished);
                const QByteArray file = m_folder.load("out.wv");
                QCOMPARE(sampleWords(file), result);
                QCOMPARE(tag(file, "LEVEL OFFS").split(',').value(1),
                         QByteArray::number(peakOffset, 'f', 6));
                QCOMPARE(tag(file, "SAMPLES"), "3");
                QVERIFY2(!file.contains("MARKER LIST"), "an import has no markers");
            });
}

void TestJobs::importSetsTheClock()
{
    forRows({{"given", 44100, 2.5e6, "2500000.000000", 0},
             {"negative", -1, 0.0, "1000.000000", 1},
             {"above all clocks", 2'000'000'000, 0.0, "600000000.000000", 1}},
            [&](int rate, double given, const QByteArray &clock, int warnings) {
                QVERIFY(m_folder.store("in.wav", wavFile(formatChunk(1, 2, rate) +
                                                         chunk("data", QByteArray(12, '\1')))));
                WavImportRequest request{path("in.wav"), {.output = {path("out.wv"), {}, {}}}};
                request.clockFromFile = given == 0;
                request.target.clockHz = given;
                QCOMPARE(WavImportJob(request).run(), JobOutcome::Finished);
                QCOMPARE(tag(m_folder.load("out.wv"), "CLOCK"), clock);
                QCOMPARE(tag(m_folder.load("out.wv"), "CLOCK MARKER"), clock);
                QCOMPARE(takeLog(Tracer::Warning).size(), warnings);
            });
}

void TestJobs::measuresRanges()
{
    QByteArray samples;
    std::vector<double> squares;
    for (int i = 0; i < 100000; ++i) {
        const auto inPhase = static_cast<qint16>(i * 31);
        const auto quadrature = static_cast<qint16>(i * 57 + 3);
        samples += littleEndian(inPhase) + littleEndian(quadrature);
        squares.push_back(std::pow(inPhase - 0.5, 2) + std::pow(quadrature - 0.5, 2));
    }
    QVERIFY(m_folder.store("in.wv", wvFile(plainTags, samples)));
    forRows({{"whole", 0, 100000, ""},
             {"across blocks", 65000, 1000, ""},
             {"last", 99999, 1, ""},
             {"after the end", 100000, 1,
              "First sample: 100000 lies outside the file; permitted: 0 to 99999"},
             {"too many", 99999, 2, "Sample count: 2 leads outside the file; permitted: 1 to 1"}},
            [&](int from, int count, const QString &error) {
                MeasureJob job({path("in.wv"), from, count});
                QCOMPARE(job.run() == JobOutcome::Finished, error.isEmpty());
                if (!error.isEmpty()) {
                    QCOMPARE(takeMessages(Tracer::Error), QStringList{error});
                    return;
                }
                double sum = 0;
                double peak = 0;
                for (int i = from; i < from + count; ++i) {
                    sum += squares[static_cast<size_t>(i)];
                    peak = std::max(peak, squares[static_cast<size_t>(i)]);
                }
                const auto offset = [](double square) {
                    return -20 * std::log10(std::sqrt(square) / 32767 + 1e-7);
                };
                QCOMPARE(job.result().samples, count);
                const std::vector<NamedFigure> figures = namedFigures(job.result());
                QVERIFY(std::fabs(figures[2].value - offset(sum / count)) < 1e-5);
                QVERIFY(std::fabs(figures[1].value - offset(peak)) < 1e-5);
            });
}

void TestJobs::cancelKeepsLaterStepsFromStarting()
{
    QVERIFY(m_folder.store("in.wv", wvFile(plainTags, QByteArray(400, '\1'))));
    QVERIFY(
        m_folder.store("in.wav", wavFile(formatChunk() + chunk("data", QByteArray(400, '\1')))));
    // The step in which the wish comes, none for one before the run, and the steps that begin.
    forRows({{"level, before", true, "", 0},
             {"level, reading", true, "Reading Waveform...", 1},
             {"import, before", false, "", 1},
             {"import, reading", false, "Reading WAV-File Data...", 1},
             {"import, scaling", false, "Rescaling...", 3}},
            [&](bool level, const QString &at, int steps) {
                std::unique_ptr<ToolJob> job;
                if (level) {
                    job = std::make_unique<LevelJob>(
                        LevelRequest{path("in.wv"), {path("out.wv"), {}, {}}, {}, {}});
                } else {
                    WavImportRequest request{path("in.wav"), {.output = {path("out.wv"), {}, {}}}};
                    request.target.scaling = ImportScaling::Auto;
                    job = std::make_unique<WavImportJob>(request);
                }
                connect(job.get(), &ToolJob::stepStarted, job.get(), [&](const QString &label) {
                    if (label == at) {
                        job->cancel();
                        job->cancel();
                    }
                });
                if (at.isEmpty()) {
                    job->cancel();
                }
                const JobRun run(*job);
                QCOMPARE(run.outcome, JobOutcome::Cancelled);
                QCOMPARE(run.steps.size(), steps);
                QCOMPARE(takeMessages(Tracer::Error), QStringList{"Action aborted by user."});
                QVERIFY(!QFile::exists(path("out.wv")));
                QVERIFY(m_streams.isEmpty());
            });
}

void TestJobs::clippingIsTold()
{
    const auto warning = [&](const std::vector<float> &values) {
        WriteJob job(path("out.wv"), values);
        const JobRun run(job);
        return run.done() ? run.report.filter("clipped").value(0) : QString("failed");
    };
    // What words decode to, and what rounding leaves above 1, isn't clipped.
    QCOMPARE(warning({1, -1, -32767.5F / 32767, std::nextafter(1.0F, 2.0F)}), QString());
    // 20 log10(2) = 6.02
    QVERIFY(warning({1, -2, 1.001F, 0, 0, 1.5F})
                .startsWith("3 of 6 values clipped, largest 6.02 dB above full scale."));
    QVERIFY(warning({std::nanf(""), 0}).startsWith("1 of 2 values clipped, largest 0.00 dB"));
}

void TestJobs::levelCopyKeepsTheRest()
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

void TestJobs::keepsEveryWord()
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

void TestJobs::keepsLongUnknownTags()
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

void TestJobs::levelCopyCompletesMarkers()
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

void TestJobs::levelDefaults()
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

void TestJobs::tagTexts()
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

void TestJobs::showsNoNegativeZero()
{
    WvWriteJob record;
    record.peakOffset = record.rmsOffset = -1e-5;
    QCOMPARE(levelRows(record).at(1).value, "0.00 dB");
    QCOMPARE(std::signbit(offsetDb(1.0)), false);
    // The guard against silence shows in no digit that is written.
    QVERIFY(std::fabs(offsetDb(0.5) - 20 * std::log10(2.0)) < 1e-9);
    QVERIFY(std::fabs(offsetDb(0) - 240) < 1e-9);
}

void TestJobs::listsSegments()
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

QTEST_GUILESS_MAIN(TestJobs)
#include "tst_jobs.moc"
