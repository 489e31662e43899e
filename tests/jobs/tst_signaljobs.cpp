// SPDX-License-Identifier: Apache-2.0
#include "filebytes.h"
#include "jobs/CreateJob.h"
#include "jobs/ReportText.h"
#include "jobs/ResampleJob.h"
#include "log/Tracer.h"

#include <QDeadlineTimer>
#include <QDir>
#include <QSignalSpy>
#include <QTemporaryDir>
#include <QTest>

#include <algorithm>
#include <cmath>
#include <csignal>
#include <memory>
#include <sys/resource.h>

using namespace filebytes;

/// The jobs that make and convert signals, from request to file: what they state, report, repeat,
/// and leave when they are stopped.
class TestSignalJobs : public QObject
{
    Q_OBJECT

private slots:
    void initTestCase();
    void init();
    void seedsRepeat_data();
    void seedsRepeat();
    void statesLevelsAndClock_data();
    void statesLevelsAndClock();
    void reportsACreation();
    void reportsAConversion();
    void convertsLengths_data();
    void convertsLengths();
    void stopsAndSparesTheTarget_data();
    void stopsAndSparesTheTarget();

private:
    [[nodiscard]] QString path(const QString &name) const { return m_folder.filePath(name); }

    /// Runs a job and returns its report without markup.
    [[nodiscard]] static QStringList reportOf(ToolJob &job, bool &done)
    {
        QStringList lines;
        connect(&job, &ToolJob::report, &job,
                [&lines](const ReportLine &line) { lines << plainLine(line); });
        done = job.run() == JobOutcome::Finished;
        return lines;
    }

    QTemporaryDir m_folder;
    QTemporaryDir m_temporary; // where the jobs keep their streams
};

namespace {

/// A tone of 1 kHz at a clock of 1 MHz, at 0.5 of full scale, with marker 1 high in its first half.
QByteArray toneFile(int samples)
{
    QByteArray block;
    for (int i = 0; i < samples; ++i) {
        const double phase = 2 * M_PI * i / 1000;
        block += words({static_cast<int>(std::lround(16383.5 * std::cos(phase))),
                        static_cast<int>(std::lround(16383.5 * std::sin(phase)))});
    }
    const QByteArray half = samples > 1 ? ';' + QByteArray::number(samples / 2) + ":0" : "";
    return wvFile("{TYPE: TGX-WV,0}{CLOCK:1000000}{CONTROL LENGTH:" + QByteArray::number(samples) +
                      "}{MARKER LIST 1: 0:1" + half + '}',
                  block);
}

CreateRequest requestFor(CreateKind kind, const QString &fileName)
{
    CreateRequest request;
    request.signal = makeSettings(kind, {}, [](const CreateField &field) { return field.start; });
    request.output.fileName = fileName;
    return request;
}

} // namespace

void TestSignalJobs::initTestCase()
{
    qputenv("TMPDIR", QFile::encodeName(m_temporary.path()));
}

void TestSignalJobs::init()
{
    QVERIFY(QDir(m_folder.path()).removeRecursively() && QDir().mkpath(m_folder.path()));
    (void)Tracer::takeEntries();
}

void TestSignalJobs::seedsRepeat_data()
{
    QTest::addColumn<CreateKind>("kind");
    QTest::newRow("noise") << CreateKind::Noise;
    QTest::newRow("multi carrier") << CreateKind::MultiCarrier;
}

void TestSignalJobs::seedsRepeat()
{
    QFETCH(CreateKind, kind);
    const auto wordsOf = [&](std::optional<unsigned> seed) {
        CreateRequest request = requestFor(kind, path("out.wv"));
        request.seed = seed;
        return CreateJob(request).run() == JobOutcome::Finished ? sampleWords(load(path("out.wv")))
                                                                : QByteArray();
    };
    const QByteArray first = wordsOf(7);
    QVERIFY(!first.isEmpty());
    QVERIFY(wordsOf(8) != first);
    QVERIFY(wordsOf({}) != first);
    QVERIFY(wordsOf(7) == first);
    // The preview shows what the file holds, but for the rounding of its words.
    CreateRequest request = requestFor(kind, {});
    request.seed = 7;
    SignalPreviewJob preview(request);
    QCOMPARE(preview.run(), JobOutcome::Finished);
    QCOMPARE(static_cast<qsizetype>(2 * preview.samples().size()), first.size());
    for (size_t i = 0; i < preview.samples().size(); ++i) {
        const int word = qFromLittleEndian<qint16>(first.constData() + 2 * i);
        QVERIFY(std::fabs(preview.samples()[i] * 32767 - word) <= 1.0001);
    }
}

void TestSignalJobs::statesLevelsAndClock_data()
{
    QTest::addColumn<double>("amplitude");
    QTest::addColumn<bool>("scaled");
    QTest::addColumn<bool>("zeroCrest");
    QTest::addColumn<double>("clock"); // 0: the fitted one
    QTest::addColumn<double>("rmsOffset");
    QTest::addColumn<double>("peakOffset");
    // I and Q are sines in quadrature, so that the vector has one length.
    QTest::newRow("scaled") << 0.5 << true << false << 0.0 << 0.0 << 0.0;
    QTest::newRow("as it is") << 0.5 << false << false << 0.0 << 6.0206 << 6.0206;
    QTest::newRow("clock") << 0.5 << true << false << 1234567.5 << 0.0 << 0.0;
    QTest::newRow("silence") << 0.0 << true << false << 0.0 << 240.0 << 240.0;
}

void TestSignalJobs::statesLevelsAndClock()
{
    QFETCH(double, amplitude);
    QFETCH(bool, scaled);
    QFETCH(bool, zeroCrest);
    QFETCH(double, clock);
    QFETCH(double, rmsOffset);
    QFETCH(double, peakOffset);
    CreateRequest request = requestFor(CreateKind::Function, path("out.wv"));
    auto &function = std::get<FunctionSettings>(request.signal);
    function.amplitudeI = function.amplitudeQ = amplitude;
    request.autoScaling = scaled;
    request.zeroCrest = zeroCrest;
    if (clock > 0) {
        request.clockHz = clock;
    }
    QCOMPARE(CreateJob(request).run(), JobOutcome::Finished);
    const QByteArray file = load(path("out.wv"));
    const QList<QByteArray> levels = tag(file, "LEVEL OFFS").split(',');
    QVERIFY(std::fabs(levels.value(0).toDouble() - rmsOffset) < 1e-4);
    QVERIFY(std::fabs(levels.value(1).toDouble() - peakOffset) < 1e-4);
    QCOMPARE(tag(file, "CLOCK"), QByteArray::number(clock > 0 ? clock : 10e6, 'f', 6));

    // Beyond full scale the peak offset is negative; a crest of 0 dB is stated on request.
    function.amplitudeI = function.amplitudeQ = 1;
    function.offsetI = 0.4;
    request.autoScaling = false;
    request.zeroCrest = true;
    QCOMPARE(CreateJob(request).run(), JobOutcome::Finished);
    const QList<QByteArray> high = tag(load(path("out.wv")), "LEVEL OFFS").split(',');
    QVERIFY(std::fabs(high.value(1).toDouble() + 20 * std::log10(1.4)) < 1e-4);
    QCOMPARE(high.value(0), high.value(1));
}

void TestSignalJobs::reportsACreation()
{
    CreateRequest request = requestFor(CreateKind::Am, path("out.wv"));
    CreateJob job(request);
    const QSignalSpy steps(&job, &ToolJob::stepStarted);
    bool done = false;
    const QStringList report = reportOf(job, done);
    QVERIFY(done);
    const QList<QByteArray> levels = tag(load(path("out.wv")), "LEVEL OFFS").split(',');
    QCOMPARE(report,
             (QStringList{"Creating signal", "Level scaling", "Signal statistics",
                          "Samples:     " + tag(load(path("out.wv")), "SAMPLES"),
                          "Clock:       10.24 MHz", "Peak Offset: 0.00 dB",
                          QString("Peak/RMS:    %1 dB").arg(levels[0].toDouble(), 0, 'f', 2),
                          "Saving file", "Signal creation completed"}));
    QStringList labels;
    for (const QList<QVariant> &step : steps) {
        labels << step.at(0).toString();
    }
    QCOMPARE(labels, (QStringList{"Creating waveform data...", "Scaling...", "Saving file..."}));

    request.output.fileName = path("none/out.wv");
    CreateJob failing(request);
    QCOMPARE(reportOf(failing, done).last(), "Creation failed");
    QVERIFY(!done);
    QCOMPARE(takeLog(Tracer::Error),
             (QStringList{"Error opening output file.", "Waveform generation failed."}));
}

void TestSignalJobs::reportsAConversion()
{
    QVERIFY(store(path("in.wv"), toneFile(4000)));
    ResampleRequest request{path("in.wv"), {path("out.wv"), "a{bc}d", {}}, {}};
    request.target = {.clockDecides = false, .samples = 6000};
    ResampleJob job(request);
    bool done = false;
    const QStringList report = reportOf(job, done);
    QVERIFY(done);
    const QStringList source{"Clock Rate:  1 MHz", "Samples:     4000", "Peak Offset: 6.02 dB",
                             "Peak/RMS:    0.00 dB"};
    const QStringList result{"Clock Rate:  1.5 MHz", "Samples:     6000", "Peak Offset: 6.02 dB"};
    QCOMPARE(report.mid(0, 9),
             (QStringList{"Reading waveform", "File:        " + path("in.wv")} + source +
              QStringList{"Resampling", "IN-samples:   4000", "OUT-samples:  6000"}));
    QCOMPARE(
        report.mid(9, 5),
        (QStringList{"Rescaling to same peak level", "File:        " + path("out.wv")} + result));
    QCOMPARE(report.mid(15),
             (QStringList{"Saving", "File:        " + path("out.wv"), "Resampling completed"}));
    QCOMPARE(tag(load(path("out.wv")), "COMMENT"), QByteArray("ac"));

    // The tone has one length of vector, and so has what comes out of it; the markers follow.
    const QByteArray file = load(path("out.wv"));
    const QByteArray block = sampleWords(file);
    QCOMPARE(block.size(), 4 * 6000);
    for (qsizetype i = 0; i < block.size(); i += 4) {
        const double length = std::hypot(qFromLittleEndian<qint16>(block.constData() + i),
                                         qFromLittleEndian<qint16>(block.constData() + i + 2));
        QVERIFY2(std::fabs(length - 16383.5) < 20, qPrintable(QString::number(length)));
    }
    QCOMPARE(tag(file, "MARKER LIST 1"), QByteArray(" 0:1;3000:0"));
}

void TestSignalJobs::convertsLengths_data()
{
    QTest::addColumn<int>("samples");
    QTest::addColumn<qint64>("target");
    QTest::addColumn<QString>("error"); // empty: it works
    QTest::newRow("one sample") << 1 << qint64(1) << "";
    QTest::newRow("one becomes many") << 1 << qint64(600) << "";
    QTest::newRow("shorter than the filter") << 30 << qint64(45) << "";
    QTest::newRow("down to one") << 40 << qint64(1) << "";
    QTest::newRow("beyond the clock")
        << 4 << qint64(2401)
        << "The target clock of 600.25 MHz is out of range; permitted: 1 kHz to 600 MHz.";
    QTest::newRow("beyond the count")
        << 4 << qint64(2147483647)
        << "The target clock of 536870.91175 GHz is out of range; permitted: 1 kHz to 600 MHz.";
    QTest::newRow("none") << 4 << qint64(0)
                          << "The target clock of 0 Hz is out of range; permitted: 1 kHz to "
                             "600 MHz.";
}

void TestSignalJobs::convertsLengths()
{
    QFETCH(int, samples);
    QFETCH(qint64, target);
    QFETCH(QString, error);
    QVERIFY(store(path("in.wv"), toneFile(samples)));
    ResampleRequest request{path("in.wv"), {path("out.wv"), {}, {}}, {}};
    request.target = {.clockDecides = false, .samples = target};
    ResampleJob job(request);
    QCOMPARE(job.run() == JobOutcome::Finished, error.isEmpty());
    if (error.isEmpty()) {
        QCOMPARE(sampleWords(load(path("out.wv"))).size(), 4 * target);
    } else {
        QCOMPARE(takeLog(Tracer::Error), QStringList(error));
        QVERIFY(!QFile::exists(path("out.wv")));
    }
}

void TestSignalJobs::stopsAndSparesTheTarget_data()
{
    QTest::addColumn<bool>("creates");
    QTest::addColumn<QString>("at");   // line of the log after which the stop comes
    QTest::addColumn<bool>("cancels"); // else the disk is full from there on
    QTest::addColumn<QString>("report");
    for (const bool cancels : {true, false}) {
        const char *stop = cancels ? "cancel" : "full disk";
        const auto row = [&](const char *title, bool creates, const char *at, const char *report) {
            QTest::addRow("%s, %s", title, stop)
                << creates << QString(at) << cancels << QString(report);
        };
        row("create, filtering", true, "Buffering waveform tail...", "Creation failed");
        row("create, saving", true, "Samples   :", "Creation failed");
        row("resample, reading", false, "samples @ 16 bit", "Resampling failed");
        // What is written first stays in the buffer of its stream.
        row("resample, converting", false, "Buffering waveform tail...",
            cancels ? "Resampling failed" : "Rescaling failed");
        row("resample, saving", false, "Samples   :", "Resampling failed");
    }
}

void TestSignalJobs::stopsAndSparesTheTarget()
{
    QFETCH(bool, creates);
    QFETCH(QString, at);
    QFETCH(bool, cancels);
    const QByteArray mine = toneFile(50'000);
    QVERIFY(store(path("mine.wv"), mine));
    std::unique_ptr<ToolJob> job;
    if (creates) {
        CreateRequest request = requestFor(CreateKind::Noise, path("mine.wv"));
        std::get<NoiseSettings>(request.signal).duration = 0.01;
        job = std::make_unique<CreateJob>(request);
    } else {
        ResampleRequest request{path("mine.wv"), {path("mine.wv"), {}, {}}, {}};
        request.target.clockHz = 20e6;
        job = std::make_unique<ResampleJob>(request);
    }
    rlimit whole{};
    QCOMPARE(getrlimit(RLIMIT_FSIZE, &whole), 0);
    const auto oldHandler = std::signal(SIGXFSZ, SIG_IGN);
    bool reached = false;
    Tracer listener;
    connect(&listener, &Tracer::TraceDataAvailable, this, [&] {
        const QList<Tracer::Entry> entries = Tracer::takeEntries();
        const auto isSign = [&](const Tracer::Entry &entry) { return entry.first.contains(at); };
        if (reached || std::none_of(entries.begin(), entries.end(), isSign)) {
            return;
        }
        reached = true;
        if (cancels) {
            // A clock that runs already ticks at its next look.
            const QDeadlineTimer tick(150);
            while (!tick.hasExpired()) {
            }
            job->cancel();
        } else {
            const rlimit full{1000, whole.rlim_max};
            setrlimit(RLIMIT_FSIZE, &full);
        }
    });
    bool done = true;
    const QStringList report = reportOf(*job, done);
    setrlimit(RLIMIT_FSIZE, &whole);
    std::signal(SIGXFSZ, oldHandler);
    QVERIFY(reached);
    QVERIFY(!done);
    QCOMPARE(job->isCancelled(), cancels);
    QTEST(report.last(), "report");
    QVERIFY(load(path("mine.wv")) == mine);
    QCOMPARE(QDir(m_folder.path()).entryList(QDir::Files | QDir::Hidden), QStringList("mine.wv"));
    QVERIFY(QDir(m_temporary.path()).isEmpty());
}

QTEST_GUILESS_MAIN(TestSignalJobs)
#include "tst_signaljobs.moc"
