// SPDX-License-Identifier: Apache-2.0
#include "filebytes.h"
#include "jobs/DumpJob.h"
#include "jobs/LevelJob.h"
#include "jobs/MeasureJob.h"
#include "jobs/ReportText.h"
#include "jobs/WavImportJob.h"
#include "jobs/WaveformOutput.h"
#include "log/Tracer.h"
#include "streams/TempStream.h"

#include <QDir>
#include <QRegularExpression>
#include <QSignalSpy>
#include <QTemporaryDir>
#include <QTest>

#include <algorithm>
#include <cmath>
#include <memory>
#include <utility>
#include <vector>

using namespace filebytes;

class TestJobs : public QObject
{
    Q_OBJECT

private slots:
    void initTestCase();
    void init();
    void cleanup();
    void importScales_data();
    void importScales();
    void importTellsItsSteps();
    void importSetsTheClock_data();
    void importSetsTheClock();
    void importFails_data();
    void importFails();
    void measuresRanges_data();
    void measuresRanges();
    void cancelKeepsLaterStepsFromStarting_data();
    void cancelKeepsLaterStepsFromStarting();
    void cancelAfterTheEndIsHarmless();
    void clippingIsTold();

private:
    [[nodiscard]] QString path(const QString &name) const { return m_folder.filePath(name); }

    /// Files in the jobs' temporary folder, those counted that are open and have no name.
    [[nodiscard]] qsizetype temporaryFiles() const
    {
        qsizetype count = QDir(m_temporary.path()).entryList(QDir::Files).size();
        const QDir descriptors("/proc/self/fd");
        for (const QFileInfo &open : descriptors.entryInfoList(QDir::Files | QDir::System)) {
            const QString target = open.symLinkTarget();
            count += target.startsWith(m_temporary.path()) && !QFile::exists(target) ? 1 : 0;
        }
        return count;
    }

    QTemporaryDir m_folder;
    QTemporaryDir m_temporary; // where the jobs keep their streams
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

} // namespace

void TestJobs::initTestCase()
{
    qputenv("TMPDIR", QFile::encodeName(m_temporary.path()));
    TempStream held;
    QVERIFY(held.open());
    QCOMPARE(temporaryFiles(), 1);
}

void TestJobs::init()
{
    Tracer::setMask(Tracer::DebugMask);
    (void)Tracer::takeEntries();
    QFile::remove(path("out.wv"));
}

void TestJobs::cleanup()
{
    // Whatever a job has come to, its streams are gone.
    QCOMPARE(temporaryFiles(), 0);
}

void TestJobs::importScales_data()
{
    QTest::addColumn<QByteArray>("source");
    QTest::addColumn<ImportScaling>("scaling");
    QTest::addColumn<QByteArray>("result");
    QTest::addColumn<double>("peakOffset");
    const auto row = [](const char *name, const QByteArray &source, ImportScaling scaling,
                        const QByteArray &result, double peakOffset) {
        QTest::newRow(name) << source << scaling << result << peakOffset;
    };
    // 32767 / 32768 in both gives a peak of 1.41417, -3.0100 dB; a third sample keeps the chunk
    // above 8 bytes.
    const QByteArray high = words({0x7FFF, 0x7FFF, 0, 0, 0, 0});
    const double highOffset = -20 * std::log10(std::sqrt(2.0) * 32767 / 32768);
    row("high, none", high, ImportScaling::None, words({32766, 32766, 0, 0, 0, 0}), highOffset);
    row("high, down", high, ImportScaling::Down, words({23170, 23170, 0, 0, 0, 0}), 0);
    row("high, auto", high, ImportScaling::Auto, words({23170, 23170, 0, 0, 0, 0}), 0);
    const QByteArray low = words({0, 0, 0x4000, 0, 0, -0x1000});
    const double lowOffset = 20 * std::log10(2.0);
    // 0.5 x 32767 + 0.5 = 16384, -0.125 x 32767 + 0.5 = -4095.4
    row("low, none", low, ImportScaling::None, words({0, 0, 16384, 0, 0, -4095}), lowOffset);
    row("low, down", low, ImportScaling::Down, words({0, 0, 16384, 0, 0, -4095}), lowOffset);
    row("low, auto", low, ImportScaling::Auto, words({0, 0, 32767, 0, 0, -8191}), 0);
    const QByteArray full = words({-0x8000, 0, 0, 0, 0, 0x7FFF});
    row("full scale, auto", full, ImportScaling::Auto, words({-32766, 0, 0, 0, 0, 32766}), 0);
    const QByteArray silence(12, '\0');
    row("silence, auto", silence, ImportScaling::Auto, silence, 240);
}

void TestJobs::importScales()
{
    QFETCH(QByteArray, source);
    QFETCH(ImportScaling, scaling);
    QFETCH(double, peakOffset);
    QVERIFY(store(path("in.wav"), wavFile(formatChunk() + chunk("data", source))));
    WavImportRequest request{path("in.wav"), {.output = {path("out.wv"), {}, {}}}};
    request.target.scaling = scaling;
    WavImportJob job(request);
    QCOMPARE(job.run(), JobOutcome::Finished);
    const QByteArray result = load(path("out.wv"));
    QTEST(sampleWords(result), "result");
    QCOMPARE(tag(result, "LEVEL OFFS").split(',').value(1), QByteArray::number(peakOffset, 'f', 6));
    QCOMPARE(tag(result, "SAMPLES"), "3");
    // An import has no markers.
    QVERIFY(!result.contains("MARKER LIST"));
}

void TestJobs::importTellsItsSteps()
{
    QVERIFY(store(path("in.wav"),
                  wavFile(formatChunk() + chunk("data", words({0x7FFF, 0x7FFF, 0, 0, 0, 0})))));
    WavImportJob job({path("in.wav"), {.output = {path("out.wv"), "a{bc}d", "me"}}});
    const QSignalSpy steps(&job, &ToolJob::stepStarted);
    const QSignalSpy report(&job, &ToolJob::report);
    QCOMPARE(job.run(), JobOutcome::Finished);
    QCOMPARE(texts(steps), (QStringList{"Reading WAV-File Data...", "Analyzing Levels...",
                                        "Rescaling...", "Creating Waveform File..."}));
    QCOMPARE(texts(report), (QStringList{"Reading directory entry from cache.", "Opening file.",
                                         "Reading WAV-file data", "Scaling", "Samples:     3",
                                         "Peak Offset: 0.00 dB",
                                         // One sample of three at full scale: 10 log10(3)
                                         "Peak/RMS:    4.77 dB", "Saving",
                                         "File:        " + path("out.wv"), "Import completed"}));
    const QByteArray result = load(path("out.wv"));
    QCOMPARE(tag(result, "COMMENT"), "ac");
    QCOMPARE(tag(result, "COPYRIGHT"), "me");
    QVERIFY(QRegularExpression("^\\d{4}-\\d\\d-\\d\\d;\\d\\d:\\d\\d:\\d\\d$")
                .match(tag(result, "DATE"))
                .hasMatch());
}

void TestJobs::importSetsTheClock_data()
{
    QTest::addColumn<int>("rate");
    QTest::addColumn<double>("given"); // 0: from the file
    QTest::addColumn<QByteArray>("clock");
    QTest::addColumn<bool>("warns");
    QTest::newRow("from the file") << 44100 << 0.0 << QByteArray("44100.000000") << false;
    QTest::newRow("given") << 44100 << 2.5e6 << QByteArray("2500000.000000") << false;
    QTest::newRow("below all clocks") << 500 << 0.0 << QByteArray("1000.000000") << true;
    QTest::newRow("negative") << -1 << 0.0 << QByteArray("1000.000000") << true;
    QTest::newRow("above all clocks")
        << 2'000'000'000 << 0.0 << QByteArray("600000000.000000") << true;
}

void TestJobs::importSetsTheClock()
{
    QFETCH(int, rate);
    QFETCH(double, given);
    QFETCH(bool, warns);
    QByteArray format = formatChunk();
    format.replace(12, 4, littleEndian(rate));
    QVERIFY(store(path("in.wav"), wavFile(format + chunk("data", QByteArray(12, '\1')))));
    WavImportRequest request{path("in.wav"), {.output = {path("out.wv"), {}, {}}}};
    request.clockFromFile = given == 0;
    request.target.clockHz = given;
    QCOMPARE(WavImportJob(request).run(), JobOutcome::Finished);
    const QByteArray result = load(path("out.wv"));
    QTEST(tag(result, "CLOCK"), "clock");
    QTEST(tag(result, "CLOCK MARKER"), "clock");
    QCOMPARE(takeLog(Tracer::Warning).size(), warns ? 1 : 0);
}

void TestJobs::importFails_data()
{
    QTest::addColumn<QByteArray>("bytes");
    QTest::addColumn<QString>("output");
    QTest::addColumn<QStringList>("errors");
    const QByteArray data = chunk("data", QByteArray(12, '\1'));
    const auto row = [](const char *name, const QByteArray &bytes, const char *output,
                        const QStringList &errors) {
        QTest::newRow(name) << bytes << output << errors;
    };
    row("no file", {}, "out.wv", {"Cannot open .wav file."});
    row("no data", wavFile(formatChunk()), "out.wv", {"Cannot evaluate .wav file header."});
    row("no fmt", wavFile(data), "out.wv", {"Cannot evaluate .wav file header."});
    row("mono", wavFile(formatChunk(1, 1) + data), "out.wv", {"File must contain 2 channels."});
    row("cut data", wavFile(formatChunk() + data).chopped(1), "out.wv",
        {"Cannot read data from .wav file."});
    row("no folder", wavFile(formatChunk() + data), "missing/out.wv",
        {"Error opening output file.", "Waveform generation failed."});
}

void TestJobs::importFails()
{
    QFETCH(QByteArray, bytes);
    QFETCH(QString, output);
    QFile::remove(path("in.wav"));
    QVERIFY(bytes.isEmpty() || store(path("in.wav"), bytes));
    WavImportJob job({path("in.wav"), {.output = {path(output), {}, {}}}});
    const QSignalSpy report(&job, &ToolJob::report);
    QVERIFY(job.run() != JobOutcome::Finished);
    QTEST(takeLog(Tracer::Error), "errors");
    QCOMPARE(texts(report).last(), "Import failed");
    QVERIFY(!QFile::exists(path(output)));
}

void TestJobs::measuresRanges_data()
{
    QTest::addColumn<qint64>("from");
    QTest::addColumn<qint64>("count");
    QTest::addColumn<QString>("error");
    QTest::newRow("whole") << qint64(0) << qint64(100000) << QString();
    QTest::newRow("across blocks") << qint64(65000) << qint64(1000) << QString();
    QTest::newRow("last") << qint64(99999) << qint64(1) << QString();
    QTest::newRow("behind the end")
        << qint64(100000) << qint64(1)
        << "First sample: 100000 lies outside the file; permitted: 0 to 99999";
    QTest::newRow("too many") << qint64(99999) << qint64(2)
                              << "Sample count: 2 leads outside the file; permitted: 1 to 1";
}

void TestJobs::measuresRanges()
{
    QFETCH(qint64, from);
    QFETCH(qint64, count);
    QFETCH(QString, error);
    QByteArray samples;
    double sum = 0;
    double peak = 0;
    for (int i = 0; i < 100000; ++i) {
        const auto inPhase = static_cast<qint16>(i * 31);
        const auto quadrature = static_cast<qint16>(i * 57 + 3);
        samples += littleEndian(inPhase) + littleEndian(quadrature);
        if (i >= from && i < from + count) {
            const double square = std::pow(inPhase - 0.5, 2) + std::pow(quadrature - 0.5, 2);
            sum += square;
            peak = std::max(peak, square);
        }
    }
    QVERIFY(store(path("in.wv"), wvFile(plainTags, samples)));
    MeasureJob job({path("in.wv"), from, count});
    QCOMPARE(job.run() == JobOutcome::Finished, error.isEmpty());
    if (!error.isEmpty()) {
        QCOMPARE(takeLog(Tracer::Error), QStringList{error});
        return;
    }
    const double rms = std::sqrt(sum / static_cast<double>(count)) / 32767;
    QCOMPARE(job.result().samples, count);
    QVERIFY(std::fabs(job.result().rmsOffset + 20 * std::log10(rms + 1e-7)) < 1e-5);
    QVERIFY(std::fabs(job.result().peakOffset + 20 * std::log10(std::sqrt(peak) / 32767 + 1e-7)) <
            1e-5);
}

void TestJobs::cancelKeepsLaterStepsFromStarting_data()
{
    QTest::addColumn<bool>("level");
    QTest::addColumn<QString>("at"); // the step in which the wish comes; empty: before the run
    QTest::addColumn<int>("steps");
    QTest::newRow("level, before") << true << "" << 0;
    QTest::newRow("level, reading") << true << "Reading Waveform..." << 1;
    QTest::newRow("level, measuring") << true << "Calculating..." << 2;
    QTest::newRow("import, before") << false << "" << 1;
    QTest::newRow("import, reading") << false << "Reading WAV-File Data..." << 1;
    QTest::newRow("import, measuring") << false << "Analyzing Levels..." << 2;
    QTest::newRow("import, scaling") << false << "Rescaling..." << 3;
}

void TestJobs::cancelKeepsLaterStepsFromStarting()
{
    QFETCH(bool, level);
    QFETCH(QString, at);
    QFETCH(int, steps);
    QVERIFY(store(path("in.wv"), wvFile(plainTags, QByteArray(400, '\1'))));
    QVERIFY(store(path("in.wav"), wavFile(formatChunk() + chunk("data", QByteArray(400, '\1')))));
    std::unique_ptr<ToolJob> job;
    if (level) {
        job = std::make_unique<LevelJob>(
            LevelRequest{path("in.wv"), {path("out.wv"), {}, {}}, {}, {}});
    } else {
        WavImportRequest request{path("in.wav"), {.output = {path("out.wv"), {}, {}}}};
        request.target.scaling = ImportScaling::Auto;
        job = std::make_unique<WavImportJob>(request);
    }
    const QSignalSpy spy(job.get(), &ToolJob::stepStarted);
    connect(job.get(), &ToolJob::stepStarted, this, [&](const QString &label) {
        if (label == at) {
            job->cancel();
            job->cancel();
        }
    });
    if (at.isEmpty()) {
        job->cancel();
    }
    QVERIFY(job->run() != JobOutcome::Finished);
    QVERIFY(job->isCancelled());
    QCOMPARE(spy.size(), steps);
    QCOMPARE(takeLog(Tracer::Error), QStringList{"Action aborted by user."});
    QVERIFY(!QFile::exists(path("out.wv")));
}

void TestJobs::cancelAfterTheEndIsHarmless()
{
    QVERIFY(store(path("in.wv"), wvFile(plainTags, words({0, 1, 2, 3}))));
    QByteArray dumped;
    DumpJob job({path("in.wv"), 1, {}}, DumpFormat::Ci16, [&dumped](const QByteArray &bytes) {
        dumped += bytes;
        return true;
    });
    QCOMPARE(job.run(), JobOutcome::Finished);
    job.cancel();
    QCOMPARE(dumped, words({2, 3}));
}

void TestJobs::clippingIsTold()
{
    const auto warning = [&](const std::vector<float> &values) {
        WriteJob job(path("out.wv"), values);
        const QSignalSpy report(&job, &ToolJob::report);
        return job.run() == JobOutcome::Finished ? texts(report).value(0) : QString("failed");
    };
    // What words decode to, and what rounding leaves above 1, isn't clipped.
    QCOMPARE(warning({1, -1, -32767.5F / 32767, std::nextafter(1.0F, 2.0F)}), QString());
    // 20 log10(2) = 6.02
    QVERIFY(warning({1, -2, 1.001F, 0, 0, 1.5F})
                .startsWith("3 of 6 values clipped, largest 6.02 dB above full scale."));
    QVERIFY(warning({std::nanf(""), 0}).startsWith("1 of 2 values clipped, largest 0.00 dB"));
}

QTEST_GUILESS_MAIN(TestJobs)
#include "tst_jobs.moc"
