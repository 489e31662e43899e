// SPDX-License-Identifier: Apache-2.0
#include "../dsp/literal_resample.h"
#include "jobs/FilterJob.h"
#include "jobs/MarkerJob.h"
#include "jobs/PolarJob.h"
#include "jobs/WrapJob.h"
#include "support/files.h"
#include "support/logreader.h"
#include "support/rows.h"
#include "support/seed.h"
#include "support/wvbytes.h"

#include <QTest>
#include <QtEndian>

#include <algorithm>
#include <cmath>
#include <complex>
#include <numbers>

using Sample = std::complex<double>;
using Samples = std::vector<Sample>;

namespace {

constexpr double Clock = 1e6; // Hz

Samples decoded(const QByteArray &file)
{
    const QByteArray words = sampleWords(file);
    Samples samples;
    for (qsizetype i = 0; i + 3 < words.size(); i += 4) {
        const auto value = [&](qsizetype at) {
            return static_cast<double>(
                (static_cast<float>(qFromLittleEndian<qint16>(words.constData() + at)) - 0.5F) /
                32767.0F);
        };
        samples.emplace_back(value(i), value(i + 2));
    }
    return samples;
}

/// Largest distance of I or Q, in steps of the file's words.
double distance(const Samples &a, const Samples &b)
{
    double most = a.size() == b.size() ? 0 : 1e9;
    for (size_t i = 0; i < std::min(a.size(), b.size()); ++i) {
        most = std::max({most, std::abs(a[i].real() - b[i].real()) * 32767,
                         std::abs(a[i].imag() - b[i].imag()) * 32767});
    }
    return most;
}

double peakOf(const Samples &samples)
{
    double peak = 0;
    for (const Sample &sample : samples) {
        peak = std::max(peak, std::abs(sample));
    }
    return peak;
}

double rmsOf(const Samples &samples)
{
    double sum = 0;
    for (const Sample &sample : samples) {
        sum += std::norm(sample);
    }
    return std::sqrt(sum / static_cast<double>(samples.size()));
}

/// Both offsets (dB) of the level tag, RMS first.
std::pair<double, double> levelsOf(const QByteArray &file)
{
    const QList<QByteArray> parts = tag(file, "LEVEL OFFS").split(',');
    return parts.size() == 2 ? std::pair(parts[0].toDouble(), parts[1].toDouble())
                             : std::pair(-1.0, -1.0);
}

double offset(double level)
{
    return -20 * std::log10(level);
}

/// Words that look like noise of half the full scale, or like a tone that a loop doesn't close.
QByteArray noiseWords(int samples)
{
    QList<int> values;
    for (const auto &sample : randomSamples(samples)) {
        values << static_cast<int>(sample.real() * 16000)
               << static_cast<int>(sample.imag() * 16000);
    }
    return words(values);
}

QByteArray toneWords(int samples)
{
    QList<int> values;
    for (int n = 0; n < samples; ++n) {
        const double phase = 2 * std::numbers::pi * (n + 0.3) / 77.7;
        values << static_cast<int>(16000 * std::cos(phase))
               << static_cast<int>(16000 * std::sin(phase));
    }
    return words(values);
}

QByteArray wave(const QByteArray &sampleBytes, const QByteArray &extraTags = {})
{
    return wvFile("{TYPE: TGX-WV,0}{COMMENT: c}{CLOCK: 1000000}" + extraTags, sampleBytes);
}

} // namespace

class TestEditJobs : public QObject
{
    Q_OBJECT

private slots:
    void init() { (void)takeLog(); }
    void filterFollowsTheFormula();
    void markersFollowAPlainModel();
    void polarFollowsTheFormula();
    void wrapFollowsTheFormula();
    void wrapRemovesTheStep();
    void refusals();

private:
    [[nodiscard]] OutputOptions out(const QString &name = "out.wv") const
    {
        return {m_folder.path(name), {}, {}};
    }

    TestFolder m_folder;
};

void TestEditJobs::filterFollowsTheFormula()
{
    struct Row
    {
        const char *name;
        int samples;
        FilterRequest request;
    };
    const auto request = [&](FilterKind kind, int window, int length, double parameter,
                             double bandwidth) {
        FilterRequest r;
        r.inputFile = m_folder.path("in.wv");
        r.output = out();
        r.kind = kind;
        r.window = window;
        r.length = length;
        r.parameter = parameter;
        r.bandwidthHz = bandwidth;
        return r;
    };
    const std::vector<Row> table{
        {"odd sinc", 3000, request(FilterKind::Rectangular, 2, 101, 0, 1e5)},
        {"even length leads by a sample", 3000, request(FilterKind::Rectangular, 0, 150, 0, 4e5)},
        {"root cosine", 3000, request(FilterKind::RootCosine, 5, 201, 0.22, 2e5)},
        {"cosine", 500, request(FilterKind::Cosine, 4, 51, 0.5, 2e5)},
        {"gauss", 500, request(FilterKind::Gauss, 1, 21, 0.3, 2e5)},
        {"shorter than the filter", 7, request(FilterKind::Rectangular, 2, 101, 0, 2e5)},
        {"one sample", 1, request(FilterKind::Rectangular, 2, 5, 0, 2e5)},
    };
    forRows(table, [&](const Row &row) {
        QVERIFY(m_folder.store("in.wv", wave(noiseWords(row.samples), "{X Y: kept}")));
        FilterJob job(row.request);
        QCOMPARE(job.run(), JobOutcome::Finished);
        const QByteArray file = m_folder.load("out.wv");
        const Samples source = decoded(m_folder.load("in.wv"));
        const auto filtered = literalResample(row.request.settings(Clock),
                                              {source.begin(), source.end()}, row.samples);
        QVERIFY(filtered);
        const double gain = peakOf(source) / peakOf(*filtered);
        Samples expected = *filtered;
        for (Sample &sample : expected) {
            sample *= gain;
        }
        QVERIFY2(distance(decoded(file), expected) < 1.6,
                 qPrintable(QString::number(distance(decoded(file), expected))));
        QVERIFY(std::abs(levelsOf(file).first - offset(rmsOf(expected))) < 1e-3);
        QVERIFY(std::abs(levelsOf(file).second - offset(peakOf(source))) < 1e-3);
        QCOMPARE(tag(file, "X Y"), QByteArray(" kept"));
        QCOMPARE(tag(file, "COMMENT"), QByteArray("c"));
    });
}

void TestEditJobs::markersFollowAPlainModel()
{
    auto random = randomGenerator();
    const auto below = [&random](qint64 limit) {
        return std::uniform_int_distribution<qint64>(0, limit - 1)(random);
    };
    for (const int samples : {1, 2, 2048, 300'000}) { // the last one is more than a block
        QVERIFY(m_folder.store(
            "in.wv", wave(noiseWords(samples), "{CONTROL LENGTH: " + QByteArray::number(samples) +
                                                   "}{MARKER LIST 4: 0:1}")));
        MarkerRequest request{m_folder.path("in.wv"), out(), {}};
        QByteArray expected(samples, '\x08');
        for (int k = 0; k < 6; ++k) {
            MarkerEdit edit;
            edit.mask = static_cast<quint8>(1 + below(15));
            edit.action = static_cast<MarkerAction>(k % 4);
            edit.pattern = edit.action == MarkerAction::Pattern ? "11010" : "";
            // Long patterns would make long lists; an end at the last sample and ranges from the
            // end to the start come often.
            edit.first = below(samples);
            edit.last = below(2) == 0 ? samples - 1 : below(samples);
            request.edits << edit;
            const auto [a, b] = std::minmax(edit.first, edit.last);
            for (qint64 i = a; i <= b; ++i) {
                const bool high =
                    edit.action == MarkerAction::High ||
                    (edit.action == MarkerAction::Toggle && (i - a) % 2 == 0) ||
                    (edit.action == MarkerAction::Pattern && edit.pattern[(i - a) % 5] == '1');
                expected[i] =
                    static_cast<char>(high ? expected[i] | edit.mask : expected[i] & ~edit.mask);
            }
        }
        MarkerJob job(request);
        QCOMPARE(job.run(), JobOutcome::Finished);
        const QByteArray file = m_folder.load("out.wv");
        QCOMPARE(markerBytes(file, samples), expected);
        QCOMPARE(sampleWords(file), sampleWords(m_folder.load("in.wv")));
    }
}

void TestEditJobs::polarFollowsTheFormula()
{
    forRows({{"whole range", 0.0, 1.0}, {"raised", 0.5, 0.5}, {"inverted", 0.0, -0.25}},
            [this](double offsetLevel, double gain) {
                QByteArray bytes = words({0, 0, 0, 12000, 0, -7, 32767, 0, -20000, 300});
                bytes += noiseWords(200);
                QVERIFY(m_folder.store("in.wv", wave(bytes, "{CONTROL LENGTH: 205}"
                                                            "{MARKER LIST 2: 3:1;9:0}")));
                PolarRequest request;
                request.inputFile = m_folder.path("in.wv");
                request.phase = out("p.wv");
                request.amplitude = out("a.wv");
                request.offset = offsetLevel;
                request.gain = gain;
                PolarJob job(request);
                QCOMPARE(job.run(), JobOutcome::Finished);
                Samples phase;
                Samples amplitude;
                for (const Sample &sample : decoded(m_folder.load("in.wv"))) {
                    // No word decodes to zero, so nothing lies on an axis.
                    phase.push_back(std::conj(sample) / std::abs(sample));
                    amplitude.emplace_back((2 * std::abs(sample) - 1) * gain + offsetLevel, 0);
                    amplitude.back().real(std::clamp(amplitude.back().real(), -1.0, 1.0));
                }
                const QByteArray p = m_folder.load("p.wv");
                const QByteArray a = m_folder.load("a.wv");
                QVERIFY(distance(decoded(p), phase) < 1.1);
                QVERIFY(distance(decoded(a), amplitude) < 1.1);
                for (const auto &[file, samples] : {std::pair{p, phase}, {a, amplitude}}) {
                    QVERIFY(std::abs(levelsOf(file).first - offset(rmsOf(samples))) < 1e-3);
                    QVERIFY(std::abs(levelsOf(file).second - offset(peakOf(samples))) < 1e-3);
                    QCOMPARE(tag(file, "MARKER LIST 2"), QByteArray(" 0:0;3:1;9:0"));
                }
                // A name that is taken without leave is kept, and half of the pair doesn't stay.
                QVERIFY(m_folder.store("taken.wv", "taken"));
                request.phase = out("half.wv");
                request.amplitude = out("taken.wv");
                request.amplitude.overwrite = false;
                QCOMPARE(PolarJob(request).run(), JobOutcome::Failed);
                QCOMPARE(m_folder.load("taken.wv"), "taken");
                QVERIFY(!QFile::exists(m_folder.path("half.wv")));
            });
}

void TestEditJobs::wrapFollowsTheFormula()
{
    struct Row
    {
        const char *name;
        int samples;
        WrapSettings settings;
    };
    const std::vector<Row> table{
        {"whole file", 2500, {0, {}, {}, 10}},
        {"shortest", 2049, {0, {}, 1e5, 8}},
        {"a part, widest", 9000, {1000, 6000, 4.9e5, 512}},
        {"ends in the same head", 5000, {2900, 4000, 1e4, 100}},
        {"2048 samples", 2048 + 1, {0, 2048, 2e5, 10}},
    };
    forRows(table, [this](const Row &row) {
        QVERIFY(m_folder.store("in.wv", wave(noiseWords(row.samples))));
        WrapJob job({m_folder.path("in.wv"), out(), row.settings, {}});
        QCOMPARE(job.run(), JobOutcome::Finished);
        const Samples source = decoded(m_folder.load("in.wv"));
        const qint64 end = row.settings.end.value_or(row.samples - 1);
        const double cutoff = row.settings.cutoffHz.value_or(Clock / 4) / Clock;
        const int range = row.settings.range;
        // x(i): 0 is the first sample of the head, -1 the last one of the tail.
        const auto x = [&](int i) {
            return source[static_cast<size_t>(i < 0 ? end + i : row.settings.start + i)];
        };
        const auto corrected = [&](int i) {
            Sample y = 0;
            for (int j = 0; j < 63; ++j) {
                const double t = j - 31;
                const double argument = 2 * std::numbers::pi * cutoff * t;
                const double sinc = t == 0 ? 1 : std::sin(argument) / argument;
                const double angle = 2 * std::numbers::pi * j / 63;
                const double window = 0.375 - 0.5 * std::cos(angle) + 0.125 * std::cos(2 * angle);
                y += x(i + j - 31) * sinc * window / 63.0;
            }
            const double turn = 2 * std::numbers::pi * (i + range) / (2.0 * range);
            return x(i) * (0.5 + 0.5 * std::cos(turn)) + y * (1 - std::cos(turn));
        };
        Samples expected(source.begin() + row.settings.start, source.begin() + end);
        for (int i = 0; i < range; ++i) {
            expected[static_cast<size_t>(i)] = corrected(i);
            expected[expected.size() - 1 - static_cast<size_t>(i)] = corrected(-1 - i);
        }
        const QByteArray file = m_folder.load("out.wv");
        QVERIFY2(distance(decoded(file), expected) < 1.1,
                 qPrintable(QString::number(distance(decoded(file), expected))));
        QVERIFY(std::abs(levelsOf(file).first - offset(rmsOf(expected))) < 1e-3);
        QVERIFY(std::abs(levelsOf(file).second - offset(peakOf(expected))) < 1e-3);
    });
}

/// What the tool is for: a listener no longer hears the loop point of a tone.
void TestEditJobs::wrapRemovesTheStep()
{
    QVERIFY(m_folder.store("in.wv", wave(toneWords(4000))));
    WrapJob job({m_folder.path("in.wv"), out(), {0, {}, 2e4, 100}, {}});
    QCOMPARE(job.run(), JobOutcome::Finished);
    const auto stepAtTheLoop = [](const Samples &samples) {
        return std::abs(samples.front() - samples.back());
    };
    const Samples before = decoded(m_folder.load("in.wv"));
    const double usual = std::abs(before[1] - before[0]);
    QVERIFY(stepAtTheLoop(before) > 5 * usual);
    QVERIFY(stepAtTheLoop(decoded(m_folder.load("out.wv"))) < 1.5 * usual);
}

void TestEditJobs::refusals()
{
    QVERIFY(m_folder.store("in.wv", wave(noiseWords(2047))));
    QVERIFY(m_folder.store("clockless.wv", wvFile("{TYPE: TGX-WV,0}", noiseWords(3000))));
    const QString in = m_folder.path("in.wv");
    const QString clockless = m_folder.path("clockless.wv");
    const QByteArray noClock = QString("4|The waveform \"%1\" states no clock rate. Give the clock "
                                       "rate of the result in the field ARB Clockrate, or by "
                                       "--clock.")
                                   .arg(clockless)
                                   .toUtf8();
    const auto check = [this](const std::shared_ptr<ToolJob> &job, const QByteArray &reason) {
        (void)takeLog();
        QCOMPARE(job->run(), JobOutcome::Failed);
        QCOMPARE(takeLog(Tracer::Error).value(0), QString(reason));
        QVERIFY(!m_folder.entries().contains("out.wv"));
    };
    const auto polar = [&](double level, double gain, const QString &second) {
        return std::make_shared<PolarJob>(
            PolarRequest{in, out(), {second, {}, {}}, level, gain, {}});
    };
    const auto wrap = [&](const QString &file, WrapSettings settings) {
        return std::make_shared<WrapJob>(WrapRequest{file, out(), settings, {}});
    };
    (void)QFile::remove(m_folder.path("out.wv"));
    forRows(
        {{"polar beyond full scale", std::shared_ptr<ToolJob>(polar(0.5, 0.6, "x")),
          QByteArray("4|Invalid amplitude level settings.")},
         {"polar without a second name", polar(0, 1, ""),
          "4|Output file name for amplitude is empty."},
         {"too short", wrap(in, {}), "4|Waveform is too short. Use at least 2048 samples."},
         {"start", wrap(clockless, {953, {}, {}, 10}), noClock},
         {"no pattern",
          std::make_shared<MarkerJob>(
              MarkerRequest{in, out(), {{1, 0, 5, MarkerAction::Pattern, ""}}}),
          "4|No pattern set."},
         {"outside", std::make_shared<MarkerJob>(MarkerRequest{in, out(), {{1, 0, 2047, {}, ""}}}),
          "4|The marker range from 1 to 2048 leads outside the waveform; permitted: 1 to 2047."}},
        check);
    QCOMPARE(wrapProblem({953, {}, {}, 10}, 3000, Clock), QString("Check start sample setting."));
    QCOMPARE(wrapProblem({0, 2047, {}, 10}, 3000, Clock), QString("Check end sample setting."));
    QVERIFY(!wrapProblem({900, 2900, {}, 0}, 3000, Clock).isEmpty());
    QVERIFY(!wrapProblem({2990 - 2048, 2048 - 1000, {}, 512}, 2990, Clock).isEmpty());
}

QTEST_GUILESS_MAIN(TestEditJobs)
#include "tst_editjobs.moc"
