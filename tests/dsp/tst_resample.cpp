// SPDX-License-Identifier: Apache-2.0
#include "base/parallel.h"
#include "dsp/Resample.h"
#include "literal_resample.h"
#include "stream_helpers.h"
#include "support/rows.h"

#include <QTest>

#include <numbers>

using std::numbers::pi;

namespace {

/// One conversion through streams of its own.
struct Run
{
    Resample resample;
    TempStream input;
    TempStream output;
    TempStream markersIn;
    TempStream markersOut;

    [[nodiscard]] bool prepare(const Samples &samples, int outputCount)
    {
        if (!input.open() || !output.open() || !writeStream(*input.stream(), samples)) {
            return false;
        }
        resample.setInput(input.stream(), static_cast<qint64>(samples.size()));
        resample.setOutput(output.stream(), outputCount);
        return true;
    }

    void apply(const FilterSettings &settings)
    {
        resample.setFilterFrequency(settings.rate, settings.cutoff);
        resample.setFilterLength(settings.length);
        QVERIFY(resample.setFilterType(static_cast<int>(settings.filter), settings.parameter));
        QVERIFY(resample.setWindowType(settings.window));
    }
};

double worstDifference(const Samples &a, const std::vector<std::complex<double>> &b)
{
    if (a.size() != b.size()) {
        return 1e9;
    }
    double worst = 0;
    for (size_t i = 0; i < a.size(); ++i) {
        worst = std::max(worst, std::abs(a[i].real() - b[i].real()));
        worst = std::max(worst, std::abs(a[i].imag() - b[i].imag()));
    }
    return worst;
}

Samples tone(int count, double cycles)
{
    Samples samples(static_cast<size_t>(count));
    for (size_t i = 0; i < samples.size(); ++i) {
        const double angle = 2 * pi * cycles * static_cast<double>(i) / count;
        samples[i] = std::complex<float>(std::polar(1.0, angle));
    }
    return samples;
}

enum class Pass { Run, Rescale, Shift, Split, Statistics };

/// Any pass over streams without end, one of which may be on a full disk.
class Passes
{
public:
    Resample resample;

    explicit Passes(int full = -1)
    {
        for (int i = 0; i < 3; ++i) {
            m_devices[i] = std::make_unique<EndlessDevice>(
                i == full ? 1000 : std::numeric_limits<qint64>::max());
            m_good = m_good && m_streams[i].initBuf(m_devices[i].get(), BufferedIO::ReadWrite);
        }
    }

    [[nodiscard]] bool isGood() const { return m_good; }

    bool call(Pass pass, int samples)
    {
        double peak = 0;
        double rms = 0;
        switch (pass) {
        case Pass::Run:
            resample.setInput(&m_streams[0], samples);
            resample.setOutput(&m_streams[1], samples);
            return resample.run();
        case Pass::Rescale:
            return resample.rescale(samples, 1.0, &m_streams[0]);
        case Pass::Shift:
            return resample.frequencyShift(samples, 1.0, 100.0, &m_streams[0]);
        case Pass::Split:
            return resample.polarSplit(samples, &m_streams[0], &m_streams[1], &m_streams[2], 0, 1);
        case Pass::Statistics:
            break;
        }
        return resample.statistics(samples, &m_streams[0], &peak, &rms);
    }

private:
    static constexpr int BufferBytes = 1 << 20;
    std::unique_ptr<EndlessDevice> m_devices[3];
    BufferedIO m_streams[3] = {BufferedIO(BufferBytes), BufferedIO(BufferBytes),
                               BufferedIO(BufferBytes)};
    bool m_good = true;
};

} // namespace

class TestResample : public QObject
{
    Q_OBJECT

private slots:
    void init() { (void)takeMessages(); }
    void cleanup() { setThreadLimit(0); }
    void equalsLiteral();
    void longRunsKeepTheirPlace();
    void threadsDontChangeTheResult();
    void filterMask();
    void evenLengthLeadsByOneSample();
    void markers();
    void failures();
    void stepBeyondTheFilterFails();
    void rescaleAndStatistics();
    void frequencyShiftFollowsTheLoop();
    void polarSplitConjugates();
    void cancelAndReuse();
    void fullDisk();
};

void TestResample::equalsLiteral()
{
    // window, filter, length, cut-off, parameter; samples in and out
    forRows({{"tool 3:2", 1, 0, 50, 0.45, 0.5, 6000, 9000},
             {"tool prime down", 1, 0, 50, 0.45, 0.5, 9973, 4999},
             {"tool 1.0009", 1, 0, 50, 0.45, 0.5, 10000, 10009},
             {"odd, no window, rounded positions", 0, 0, 201, 0.3, 0.5, 4900, 2300},
             {"even, no window, prime", 0, 0, 200, 0.3, 0.5, 4900, 5003},
             {"upsampled, first positions", 0, 0, 201, 0.3, 0.5, 600, 4998},
             {"equal counts, even", 3, 0, 50, 0.25, 0.5, 5000, 5000},
             {"root cosine", 2, 1, 101, 0.25, 0.35, 3000, 4500},
             {"cosine", 4, 2, 101, 0.25, 0.35, 3000, 4507},
             {"gauss", 5, 3, 41, 0.25, 0.3, 3000, 2999},
             {"high gain, prime", 1, 0, 201, 0.004, 0.5, 3000, 4001},
             {"one sample", 1, 0, 201, 0.4, 0.5, 1, 64},
             {"longest", 1, 0, 4999, 0.4, 0.5, 12000, 12500},
             {"shortest even", 0, 0, 4, 0.4, 0.5, 3000, 4001},
             {"largest step", 1, 0, 50, 0.45, 0.5, 48 * 500, 500},
             {"one output", 1, 0, 50, 0.45, 0.5, 100000, 1}},
            [](int window, int filter, int length, double cutoff, double parameter, int inputCount,
               int outputCount) {
                const FilterSettings settings{
                    window, static_cast<FilterKind>(filter), length, 1.0, cutoff, parameter};
                const Samples samples = randomSamples(inputCount);
                Run run;
                QVERIFY(run.prepare(samples, outputCount));
                run.apply(settings);
                QVERIFY(run.resample.run());
                const auto expected = literalResample(settings, samples, outputCount);
                QVERIFY(expected.has_value());
                const double worst = worstDifference(readStream(*run.output.stream()), *expected);
                QVERIFY2(worst <= 3e-6, qPrintable(QString::number(worst)));
            });
}

void TestResample::longRunsKeepTheirPlace()
{
    // Several blocks of outputs and input: a tone must come out with the phase of its position.
    constexpr int inputCount = 700000;
    for (const int outputCount : {1050000, 999983, 400009}) {
        Run run;
        QVERIFY(run.prepare(tone(inputCount, 70000), outputCount));
        run.apply({.length = 51});
        QVERIFY(run.resample.run());
        const Samples result = readStream(*run.output.stream());
        QCOMPARE(result.size(), static_cast<size_t>(outputCount));
        // The sinc of edge 0.45 sums to 1 / 0.9 in its pass band.
        double worst = 0;
        for (size_t i = 0; i < result.size(); ++i) {
            const double cycles = std::fmod(70000.0 * static_cast<double>(i) / outputCount, 1.0);
            const std::complex<double> expected = std::polar(1 / 0.9, 2 * pi * cycles);
            worst = std::max(worst, std::abs(std::complex<double>(result[i]) - expected));
        }
        QVERIFY2(worst < 1e-4, qPrintable(QString::number(worst)));
        QVERIFY(std::abs(run.resample.peakOffset() - 20 * std::log10(0.9)) < 1e-3);
        QVERIFY(std::abs(run.resample.rmsOffset() - 20 * std::log10(0.9)) < 1e-3);
    }
}

void TestResample::threadsDontChangeTheResult()
{
    const Samples samples = randomSamples(300000);
    std::vector<std::pair<Samples, double>> results;
    for (const unsigned threads : {1U, 5U}) {
        setThreadLimit(threads);
        Run run;
        QVERIFY(run.prepare(samples, 301013));
        run.apply({.length = 50});
        QVERIFY(run.resample.run());
        results.emplace_back(readStream(*run.output.stream()), run.resample.rmsOffset());
    }
    QVERIFY(results[0] == results[1]);
}

void TestResample::filterMask()
{
    // An impulse through the filter case shows the response: unity at 0 after the known gain,
    // half at the edge, and at least 60 dB from 1.5 edges on.
    Samples impulse(4096);
    impulse[1000] = 1;
    Run run;
    QVERIFY(run.prepare(impulse, 4096));
    run.apply({.length = 201, .rate = 100.0, .cutoff = 10.0});
    QVERIFY(run.resample.run());
    const Samples response = readStream(*run.output.stream());
    const auto gain = [&response](double frequency) {
        std::complex<double> sum = 0;
        for (size_t i = 0; i < response.size(); ++i) {
            sum += std::complex<double>(response[i]) *
                   std::polar(1.0, -2 * pi * frequency * static_cast<double>(i));
        }
        return std::abs(sum) / 5.0; // 1 / (2 x 0.1)
    };
    for (double f = 0.0; f < 0.085; f += 0.005) {
        QVERIFY2(std::abs(gain(f) - 1) < 0.01, qPrintable(QString::number(f)));
    }
    QVERIFY(std::abs(gain(0.1) - 0.5) < 0.01);
    for (double f = 0.15; f <= 0.5; f += 0.01) {
        QVERIFY2(gain(f) < 1e-3, qPrintable(QString::number(f)));
    }
}

void TestResample::evenLengthLeadsByOneSample()
{
    Samples impulse(300);
    impulse[100] = 1;
    for (const int length : {51, 50}) {
        Run run;
        QVERIFY(run.prepare(impulse, 300));
        run.apply({.length = length});
        QVERIFY(run.resample.run());
        const Samples result = readStream(*run.output.stream());
        const auto top = std::max_element(result.begin(), result.end(),
                                          [](auto a, auto b) { return std::abs(a) < std::abs(b); });
        QCOMPARE(top - result.begin(), length == 51 ? 100 : 99);
    }
}

void TestResample::markers()
{
    // The last one takes the positions 0, 1.2, 2.4, 3.6, 4.8.
    for (const QByteArray &expected :
         {QByteArray("112233445566"), QByteArray("135"), QByteArray("12345")}) {
        Run run;
        QVERIFY(run.prepare(randomSamples(6), static_cast<int>(expected.size())));
        QVERIFY(run.markersIn.open() && run.markersOut.open());
        QVERIFY(run.markersIn->writeBytes(6, "123456"));
        run.resample.setMarkers(run.markersIn.stream(), run.markersOut.stream());
        QVERIFY(run.resample.run());
        QVERIFY(run.markersOut->restartAtBegining());
        QByteArray result(20, ' ');
        QCOMPARE(run.markersOut->readBlock(20, result.data()), static_cast<int>(expected.size()));
        QCOMPARE(result.trimmed(), expected);
        // A marker stream that ends early is an error, not a guess.
        Run shortened;
        QVERIFY(shortened.prepare(randomSamples(8), 8));
        shortened.resample.setMarkers(run.markersIn.stream(), run.markersOut.stream());
        QVERIFY(!shortened.resample.run());
        QCOMPARE(takeMessages(), QStringList{"*** Cannot read marker data."});
    }
}

void TestResample::failures()
{
    const QString lengths = "*** Invalid input or output data length.";
    const QString function = "*** Cannot create filter function.";
    const double nan = std::nan("");
    forRows({{"negative output", 10LL, -10LL, 21, 0, 1.0, 0.45, lengths},
             {"low 32 bits", 10LL, 0x1'8000'0000LL, 21, 0, 1.0, 0.45, lengths},
             {"negative length", 10LL, 10LL, -201, 0, 1.0, 0.45, function},
             {"custom", 10LL, 10LL, 21, 4, 1.0, 0.45, function},
             {"cut-off NaN", 10LL, 10LL, 21, 0, 1.0, nan, function},
             {"negative root", 10LL, 10LL, 21, 1, 1.0, -0.45, function},
             {"most samples", 0x7fffffffLL, 0x7fffffffLL, 21, 0, 1.0, 0.45,
              "*** Reading failed for sample 10."}},
            [&](qint64 inputCount, qint64 outputCount, int length, int filter, double rate,
                double cutoff, const QString &message) {
                Run run;
                QVERIFY(run.prepare(randomSamples(10), 10));
                run.resample.setInput(run.input.stream(), inputCount);
                run.resample.setOutput(run.output.stream(), outputCount);
                run.resample.setFilterLength(length);
                QVERIFY(run.resample.setFilterType(filter, 0.5));
                run.resample.setFilterFrequency(rate, cutoff);
                QVERIFY(!run.resample.run());
                QCOMPARE(takeMessages(), QStringList{message});
            });
}

void TestResample::stepBeyondTheFilterFails()
{
    // A step beyond the reach of 48 taps.
    Run run;
    QVERIFY(run.prepare(randomSamples(50000), 1000));
    run.apply({.length = 50});
    QVERIFY(!run.resample.run());
    QCOMPARE(takeMessages(), QStringList{"*** Missed input sample."});
    QVERIFY(!literalResample({.length = 50}, randomSamples(50000), 1000).has_value());
    QVERIFY(!run.resample.setFilterType(5, 0.5));
    QVERIFY(!run.resample.setWindowType(7));
    QVERIFY(run.input->writeHeader("XYZ"));
    QVERIFY(!run.resample.run());
    QCOMPARE(takeMessages(), QStringList{"*** Cannot reset read buffer."});
}

void TestResample::rescaleAndStatistics()
{
    TempStream stream;
    QVERIFY(stream.open());
    const Samples samples = randomSamples(100000);
    QVERIFY(writeStream(*stream.stream(), samples));
    Resample resample;
    QVERIFY(resample.rescale(99999, 0.3, stream.stream()));
    const Samples scaled = readStream(*stream.stream());
    double highest = 0;
    double sum = 0;
    for (size_t i = 0; i < scaled.size(); ++i) {
        const std::complex<float> expected =
            i < 99999 ? std::complex<float>(samples[i].real() * 0.3F, samples[i].imag() * 0.3F)
                      : samples[i];
        QVERIFY(scaled[i] == expected);
        highest = std::max(highest, std::norm(std::complex<double>(expected)));
        sum += std::norm(std::complex<double>(expected));
    }
    double peak = 0;
    double rms = 0;
    QVERIFY(resample.statistics(100000, stream.stream(), &peak, &rms));
    QCOMPARE(peak, std::sqrt(highest));
    QCOMPARE(rms, std::sqrt(sum / 100000));

    QVERIFY(!resample.rescale(100001, 0.5, stream.stream()));
    QVERIFY(!resample.rescale(0, 0.5, stream.stream()));
    QVERIFY(!resample.rescale(1, std::nan(""), stream.stream()));
    QVERIFY(!resample.statistics(100001, stream.stream(), &peak, &rms));
    QVERIFY(stream->writeHeader("XYZ"));
    QVERIFY(!resample.rescale(1, 0.5, stream.stream()));
    QCOMPARE(
        takeMessages(),
        (QStringList{"*** Reading failed for sample 100000.", "*** Invalid input data length.",
                     "*** Invalid scaling factor nan.", "*** Reading failed for sample 100000.",
                     "*** Cannot validate data stream header."}));
}

void TestResample::frequencyShiftFollowsTheLoop()
{
    TempStream stream;
    QVERIFY(stream.open());
    Samples samples = randomSamples(200000);
    samples[7] = {0.0F, 0.5F}; // the axis with the full circle
    samples[8] = {0.0F, -0.5F};
    samples[9] = {-0.5F, 0.0F};
    samples[10] = {0.0F, 0.0F};
    Resample resample;
    // The last one passes the angles that the vector form reduces itself.
    for (const double frequency : {1000.0, -3.3e6, 4e9}) {
        QVERIFY(writeStream(*stream.stream(), samples));
        QVERIFY(resample.frequencyShift(200000, frequency, 1e7, stream.stream()));
        const Samples shifted = readStream(*stream.stream());
        double angle = 0.0;
        for (size_t i = 0; i < samples.size(); ++i) {
            const double re = samples[i].real();
            const double im = samples[i].imag();
            const double phase = re == 0 ? (im > 0 ? 2 * pi : -2 * pi) : std::atan2(im, re);
            const std::complex<double> expected = std::polar(std::hypot(re, im), phase + angle);
            QVERIFY(std::abs(std::complex<double>(shifted[i]) - expected) < 1e-7);
            angle += frequency * 6.283185307179586 / 1e7;
        }
    }
    QVERIFY(!resample.frequencyShift(10, 1e3, 0, stream.stream()));
    (void)takeMessages();
    QVERIFY(!resample.frequencyShift(10, 1e300, 1e6, stream.stream()));
    QCOMPARE(takeMessages(),
             QStringList{"*** Invalid frequency shift of 1e+300 Hz at a clock of 1e+06 Hz."});
}

void TestResample::polarSplitConjugates()
{
    TempStream source;
    TempStream phase;
    TempStream amplitude;
    QVERIFY(source.open() && phase.open() && amplitude.open());
    Samples samples = randomSamples(50000);
    samples[0] = 0;
    samples[1] = {0.0F, 0.5F};
    samples[2] = {0.0F, -0.5F};
    samples[3] = {-0.5F, 0.0F};
    samples[4] = {0.5F, 0.0F};
    QVERIFY(writeStream(*source.stream(), samples));
    Resample resample;
    QVERIFY(
        resample.polarSplit(50000, source.stream(), phase.stream(), amplitude.stream(), 0.25, 0.5));
    const Samples unit = readStream(*phase.stream());
    const Samples level = readStream(*amplitude.stream());
    QCOMPARE(unit.size(), samples.size());
    QCOMPARE(level.size(), samples.size());
    for (size_t i = 0; i < samples.size(); ++i) {
        const double re = samples[i].real();
        const double im = samples[i].imag();
        const double angle = re == 0 ? (im > 0 ? 2 * pi : -2 * pi) : std::atan2(im, re);
        QVERIFY(std::abs(unit[i].real() - std::cos(angle)) < 1e-7);
        QVERIFY(std::abs(unit[i].imag() + std::sin(angle)) < 1e-7);
        QVERIFY(std::abs(level[i].real() - ((2 * std::hypot(re, im) - 1) * 0.5 + 0.25)) < 1e-7);
        QCOMPARE(level[i].imag(), 0.0F);
    }
    QVERIFY(!resample.polarSplit(50001, source.stream(), phase.stream(), amplitude.stream(), 0, 1));
    QCOMPARE(takeMessages(), QStringList{"*** Reading failed for sample 50000."});
}

void TestResample::cancelAndReuse()
{
    forRows({{"run", Pass::Run},
             {"rescale", Pass::Rescale},
             {"shift", Pass::Shift},
             {"split", Pass::Split},
             {"statistics", Pass::Statistics}},
            [this](Pass pass) {
                Passes passes;
                QVERIFY(passes.isGood());
                int ticks = 0;
                connect(&passes.resample, &Resample::ProgressUpdate, this, [&](int percent) {
                    QVERIFY(percent >= 0 && percent <= 100);
                    ++ticks;
                    passes.resample.cancel();
                });
                passes.resample.cancel(); // before the start it means nothing
                // As many samples as can be asked for: no machine is done before the first tick.
                QVERIFY(!passes.call(pass, std::numeric_limits<int>::max()));
                QCOMPARE(ticks, 1);
                QCOMPARE(takeMessages(), QStringList{"*** Action aborted by user."});
                QVERIFY(passes.call(pass, 1000));
            });
}

void TestResample::fullDisk()
{
    // A buffer of 1 MiB goes to the disk when it is full: with 3 bytes of header that is within
    // sample 131071.
    forRows({{"run", Pass::Run, 1, "*** Cannot write output data."},
             {"rescale", Pass::Rescale, 0, "*** Writing failed for sample 131071."},
             {"shift", Pass::Shift, 0, "*** Writing failed for sample 131071."},
             {"phase", Pass::Split, 1, "*** Writing phase data failed for sample 131071."},
             {"amplitude", Pass::Split, 2, "*** Writing amplitude data failed for sample 131071."}},
            [](Pass pass, int fullOne, const QString &message) {
                Passes passes(fullOne);
                QVERIFY(passes.isGood());
                QVERIFY(!passes.call(pass, 400'000));
                QCOMPARE(takeMessages(), QStringList{message});
            });
}

QTEST_GUILESS_MAIN(TestResample)
#include "tst_resample.moc"
