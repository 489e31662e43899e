// SPDX-License-Identifier: Apache-2.0
#include "jobrun.h"
#include "jobs/CreateJob.h"
#include "jobs/ResampleJob.h"
#include "support/FullDisk.h"
#include "support/files.h"
#include "support/logreader.h"
#include "support/rows.h"
#include "support/wvbytes.h"

#include <QDeadlineTimer>
#include <QTest>

#include <algorithm>
#include <cmath>
#include <memory>
#include <utility>

/// The jobs that make and convert signals, from request to file: what they state, report, repeat,
/// and leave when they are stopped.
class TestSignalJobs : public QObject
{
    Q_OBJECT

private slots:
    void seedsRepeat();
    void statesLevelsAndClock();
    void reportsAConversion();
    void convertsLengths();
    void stopsAndSparesTheTarget();

private:
    [[nodiscard]] QString path(const QString &name) const { return m_folder.path(name); }

    TestFolder m_folder;
    StreamFolder m_streams;
};

namespace {

CreateRequest requestFor(CreateKind kind, const QString &fileName)
{
    CreateRequest request;
    request.signal = makeSettings(kind, {}, [](const SignalField &field) { return field.start; });
    request.output.fileName = fileName;
    return request;
}

} // namespace

void TestSignalJobs::seedsRepeat()
{
    forRows({{"noise", CreateKind::Noise}, {"carriers", CreateKind::MultiCarrier}},
            [&](CreateKind kind) {
                const auto wordsOf = [&](std::optional<unsigned> seed) {
                    CreateRequest request = requestFor(kind, path("out.wv"));
                    request.seed = seed;
                    return CreateJob(request).run() == JobOutcome::Finished
                               ? sampleWords(m_folder.load("out.wv"))
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
            });
}

void TestSignalJobs::statesLevelsAndClock()
{
    // I is clipped where it exceeds 1; the largest vector is then close to (1, 0.8).
    const double high = -10 * std::log10(1.64);
    // I and Q are sines in quadrature, so that the vector has one length, but for an offset of I.
    forRows({{"scaled", 0.5, 0.0, true, false, 10e6, 0.0, 0.0},
             {"as it is", 0.5, 0.0, false, false, 10e6, 6.0206, 6.0206},
             {"clock", 0.5, 0.0, true, false, 1234567.5, 0.0, 0.0},
             {"silence", 0.0, 0.0, true, false, 10e6, 240.0, 240.0},
             {"beyond full scale, no crest", 1.0, 0.4, false, true, 10e6, high, high}},
            [&](double amplitude, double offsetI, bool scaled, bool zeroCrest, double clock,
                double rmsOffset, double peakOffset) {
                CreateRequest request = requestFor(CreateKind::Function, path("out.wv"));
                auto &function = std::get<FunctionSettings>(request.signal);
                function.amplitudeI = function.amplitudeQ = amplitude;
                function.offsetI = offsetI;
                request.autoScaling = scaled;
                request.zeroCrest = zeroCrest;
                if (clock != 10e6) {
                    request.clockHz = clock;
                }
                QCOMPARE(CreateJob(request).run(), JobOutcome::Finished);
                const QByteArray file = m_folder.load("out.wv");
                const QList<QByteArray> levels = tag(file, "LEVEL OFFS").split(',');
                const double near = offsetI > 0 ? 0.02 : 1e-4; // dB
                QVERIFY(std::fabs(levels.value(0).toDouble() - rmsOffset) < near);
                QVERIFY(std::fabs(levels.value(1).toDouble() - peakOffset) < near);
                QCOMPARE(tag(file, "CLOCK"), QByteArray::number(clock, 'f', 6));
            });
}

void TestSignalJobs::reportsAConversion()
{
    QVERIFY(m_folder.store("in.wv", toneFile(4000)));
    ResampleRequest request{path("in.wv"), {path("out.wv"), "a{bc}d", {}}, {}};
    request.target = {.clockDecides = false, .samples = 6000};
    ResampleJob job(request);
    const QStringList report = JobRun(job).report;
    const QStringList source{"Clock Rate:  1 MHz", "Samples:     4000", "Peak Offset: 6.02 dB",
                             "Peak/RMS:    0.00 dB"};
    const QStringList result{"Clock Rate:  1.5 MHz", "Samples:     6000", "Peak Offset: 6.02 dB"};
    QCOMPARE(report.mid(0, 9),
             (QStringList{"Reading waveform", "File:        " + path("in.wv")} + source +
              QStringList{"Resampling", "IN-samples:   4000", "OUT-samples:  6000"}));
    QCOMPARE(
        report.mid(9, 5),
        (QStringList{"Rescaling to same peak level", "File:        " + path("out.wv")} + result));
    QCOMPARE(report.mid(15), (QStringList{"Saving", "File:        " + path("out.wv"),
                                          "Loop point: continuous", "Resampling completed"}));
    QCOMPARE(tag(m_folder.load("out.wv"), "COMMENT"), QByteArray("ac"));

    // The tone has one length of vector, and so has what comes out of it; the markers follow.
    const QByteArray file = m_folder.load("out.wv");
    const QByteArray block = sampleWords(file);
    QCOMPARE(block.size(), 4 * 6000);
    for (qsizetype i = 0; i < block.size(); i += 4) {
        const double length = std::hypot(qFromLittleEndian<qint16>(block.constData() + i),
                                         qFromLittleEndian<qint16>(block.constData() + i + 2));
        QVERIFY2(std::fabs(length - 16383.5) < 20, qPrintable(QString::number(length)));
    }
    QCOMPARE(tag(file, "MARKER LIST 1"), QByteArray(" 0:1;3000:0"));
}

void TestSignalJobs::convertsLengths()
{
    forRows({{"one becomes many", 1, 600, ""},
             {"shorter than the filter", 30, 45, ""},
             {"down to one", 40, 1, ""},
             {"beyond the clock", 4, 2401,
              "The target clock of 600.25 MHz is out of range; permitted: 1 kHz to 600 MHz."}},
            [&](int samples, int target, const QString &error) {
                QFile::remove(path("out.wv"));
                QVERIFY(m_folder.store("in.wv", toneFile(samples)));
                ResampleRequest request{path("in.wv"), {path("out.wv"), {}, {}}, {}};
                request.target = {.clockDecides = false, .samples = target};
                (void)takeLog();
                QCOMPARE(ResampleJob(request).run() == JobOutcome::Finished, error.isEmpty());
                if (error.isEmpty()) {
                    QCOMPARE(sampleWords(m_folder.load("out.wv")).size(), 4 * target);
                } else {
                    QCOMPARE(takeMessages(Tracer::Error), QStringList(error));
                    QVERIFY(!QFile::exists(path("out.wv")));
                }
            });
}

void TestSignalJobs::stopsAndSparesTheTarget()
{
    const TestFolder folder;
    const QString mine = folder.path("mine.wv");
    const QByteArray before = toneFile(50'000);
    QVERIFY(folder.store("mine.wv", before));
    const auto check = [&](bool creates, const QString &at, bool cancels, const QString &report) {
        std::unique_ptr<ToolJob> job;
        if (creates) {
            job = std::make_unique<CreateJob>(requestFor(CreateKind::Noise, mine));
        } else {
            ResampleRequest request{mine, {mine, {}, {}}, {}};
            request.target.clockHz = 20e6;
            job = std::make_unique<ResampleJob>(request);
        }
        bool reached = false;
        std::unique_ptr<FullDisk> full;
        Tracer listener;
        connect(&listener, &Tracer::TraceDataAvailable, this, [&] {
            if (takeLog(Tracer::DefaultMask).filter(at).isEmpty() || std::exchange(reached, true)) {
                return;
            }
            if (cancels) {
                // A clock that runs already ticks at its next look.
                const QDeadlineTimer tick(150);
                while (!tick.hasExpired()) {
                }
                job->cancel();
            } else {
                full = std::make_unique<FullDisk>(1000);
            }
        });
        const JobRun run(*job);
        full.reset();
        QVERIFY(reached);
        QCOMPARE(run.outcome, cancels ? JobOutcome::Cancelled : JobOutcome::Failed);
        QCOMPARE(run.report.last(), report);
        QVERIFY(folder.load("mine.wv") == before);
        QCOMPARE(folder.entries(), QStringList("mine.wv"));
        QVERIFY(m_streams.isEmpty());
    };
    // The line of the log after which the stop comes: a cancel, or else a full disk.
    forRows({{"create, filtering", true, "Buffering waveform tail...", true, "Cancelled"},
             {"create, saving, full", true, "Samples   :", false, "Creation failed"},
             {"resample, reading", false, "samples @ 16 bit", true, "Cancelled"},
             // What is written first stays in the buffer of its stream.
             {"resample, converting, full", false, "Buffering waveform tail...", false,
              "Rescaling failed"},
             {"resample, saving", false, "Samples   :", true, "Cancelled"}},
            check);
}

QTEST_GUILESS_MAIN(TestSignalJobs)
#include "tst_signaljobs.moc"
