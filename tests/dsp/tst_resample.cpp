// SPDX-License-Identifier: Apache-2.0
#include "dsp/Resample.h"

#include "base/parallel.h"
#include "literal_resample.h"
#include "stream_helpers.h"

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

} // namespace

class TestResample : public QObject
{
    Q_OBJECT

private slots:
    void init() { (void)Tracer::takeEntries(); }
    void cleanup() { setThreadLimit(0); }
    void equalsLiteral_data();
    void equalsLiteral();
    void longRunsKeepTheirPlace();
    void threadsDontChangeTheResult();
    void loopHasNoStep();
    void filterMask();
    void evenLengthLeadsByOneSample();
    void levelOffsets();
    void markers_data();
    void markers();
    void failures_data();
    void failures();
    void settersRefuseUnknownKinds();
    void stepBeyondTheFilterFails();
    void cancelAndReuse_data();
    void cancelAndReuse();
    void fullDisk_data();
    void fullDisk();
    void rescaleAndStatistics();
    void frequencyShiftFollowsTheLoop();
    void polarSplitConjugates();
};

void TestResample::equalsLiteral_data()
{
    QTest::addColumn<int>("window");
    QTest::addColumn<int>("filter");
    QTest::addColumn<int>("length");
    QTest::addColumn<double>("cutoff");
    QTest::addColumn<double>("parameter");
    QTest::addColumn<int>("inputCount");
    QTest::addColumn<int>("outputCount");
    const auto row = [](const char *name, int window, int filter, int length, double cutoff,
                        double parameter, int in, int out) {
        QTest::newRow(name) << window << filter << length << cutoff << parameter << in << out;
    };
    row("tool 3:2", 1, 0, 50, 0.45, 0.5, 6000, 9000);
    row("tool 100:73", 1, 0, 50, 0.45, 0.5, 10000, 7300);
    row("tool prime", 1, 0, 50, 0.45, 0.5, 5000, 7919);
    row("tool prime down", 1, 0, 50, 0.45, 0.5, 9973, 4999);
    row("tool 1.0009", 1, 0, 50, 0.45, 0.5, 10000, 10009);
    row("integer down", 1, 0, 50, 0.45, 0.5, 9000, 3000);
    row("integer up", 1, 0, 50, 0.45, 0.5, 1000, 7000);
    row("odd, no window, 7 down", 0, 0, 51, 0.45, 0.5, 7000, 1000);
    row("odd, no window, rounded positions", 0, 0, 201, 0.3, 0.5, 4900, 2300);
    row("odd, no window, prime", 0, 0, 201, 0.3, 0.5, 4900, 5003);
    row("even, no window, prime", 0, 0, 200, 0.3, 0.5, 4900, 5003);
    row("even, no window, rounded positions", 0, 0, 200, 0.3, 0.5, 4900, 2300);
    row("upsampled, first positions", 0, 0, 201, 0.3, 0.5, 600, 4998);
    row("equal counts", 1, 0, 201, 0.25, 0.5, 5000, 5000);
    row("equal counts, even", 3, 0, 50, 0.25, 0.5, 5000, 5000);
    row("defaults", 1, 0, 21, 0.45, 0.5, 3000, 3001);
    row("root cosine", 2, 1, 101, 0.25, 0.35, 3000, 4500);
    row("cosine", 4, 2, 101, 0.25, 0.35, 3000, 4507);
    row("gauss", 5, 3, 41, 0.25, 0.3, 3000, 2999);
    row("flat top", 6, 0, 101, 0.2, 0.3, 3000, 3600);
    row("high gain", 1, 0, 201, 0.004, 0.5, 3000, 4000);
    row("high gain, equal", 1, 0, 201, 0.004, 0.5, 3000, 3000);
    row("high gain, prime", 1, 0, 201, 0.004, 0.5, 3000, 4001);
    row("shorter than the filter", 1, 0, 201, 0.4, 0.5, 100, 150);
    row("shorter than the filter, equal", 0, 0, 201, 0.4, 0.5, 100, 100);
    row("one sample", 1, 0, 201, 0.4, 0.5, 1, 64);
    row("one to one", 0, 0, 3, 0.4, 0.5, 1, 1);
    row("two samples", 0, 0, 50, 0.4, 0.5, 2, 3);
    row("longer than the wrap", 0, 0, 801, 0.4, 0.5, 5000, 5500);
    row("longest", 1, 0, 4999, 0.4, 0.5, 12000, 12500);
    row("shortest", 0, 0, 3, 0.4, 0.5, 3000, 4001);
    row("shortest even", 0, 0, 4, 0.4, 0.5, 3000, 4001);
    row("largest step", 1, 0, 50, 0.45, 0.5, 48 * 500, 500);
    row("one output", 1, 0, 50, 0.45, 0.5, 100000, 1);
    row("many phases, few taps", 0, 0, 5, 0.45, 0.5, 100000, 100003);
}

void TestResample::equalsLiteral()
{
    QFETCH(int, window);
    QFETCH(int, filter);
    QFETCH(int, length);
    QFETCH(double, cutoff);
    QFETCH(double, parameter);
    QFETCH(int, inputCount);
    QFETCH(int, outputCount);
    const FilterSettings settings{window,   static_cast<FilterKind>(filter), length, 1.0, cutoff,
                                  parameter};
    const Samples samples = randomSamples(inputCount);
    Run run;
    QVERIFY(run.prepare(samples, outputCount));
    run.apply(settings);
    QVERIFY(run.resample.run());
    const auto expected = literalResample(settings, samples, outputCount);
    QVERIFY(expected.has_value());
    const double worst = worstDifference(readStream(*run.output.stream()), *expected);
    QVERIFY2(worst <= 3e-6, qPrintable(QString::number(worst)));
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
    }
}

void TestResample::threadsDontChangeTheResult()
{
    const Samples samples = randomSamples(300000);
    Samples results[2];
    double offsets[2];
    for (const unsigned threads : {1U, 5U}) {
        setThreadLimit(threads);
        Run run;
        QVERIFY(run.prepare(samples, 301013));
        run.apply({.length = 50});
        QVERIFY(run.resample.run());
        results[threads / 5] = readStream(*run.output.stream());
        offsets[threads / 5] = run.resample.rmsOffset();
    }
    QVERIFY(results[0] == results[1]);
    QCOMPARE(offsets[0], offsets[1]);
}

void TestResample::loopHasNoStep()
{
    Run run;
    QVERIFY(run.prepare(tone(1000, 10), 1500));
    run.apply({.length = 101});
    QVERIFY(run.resample.run());
    const Samples result = readStream(*run.output.stream());
    const double step = 2 * std::sin(pi * 10 / 1500) / 0.9; // chord from sample to sample
    QVERIFY(std::abs(std::abs(result.front() - result.back()) - step) < 1e-4);
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

void TestResample::levelOffsets()
{
    Run run;
    QVERIFY(run.prepare(tone(5000, 100), 7500));
    run.apply({.length = 101});
    QVERIFY(run.resample.run());
    const double expected = 20 * std::log10(0.9); // level 1 / 0.9
    QVERIFY(std::abs(run.resample.peakOffset() - expected) < 1e-3);
    QVERIFY(std::abs(run.resample.rmsOffset() - expected) < 1e-3);
}

void TestResample::markers_data()
{
    QTest::addColumn<QByteArray>("input");
    QTest::addColumn<int>("outputCount");
    QTest::addColumn<QByteArray>("expected");
    const QByteArray six("\x01\x02\x03\x04\x05\x06", 6);
    QTest::newRow("twice") << six << 12
                           << QByteArray("\x01\x01\x02\x02\x03\x03\x04\x04\x05\x05\x06\x06", 12);
    QTest::newRow("half") << six << 3 << QByteArray("\x01\x03\x05", 3);
    QTest::newRow("same") << six << 6 << six;
    // Positions 0, 1.2, 2.4, 3.6, 4.8.
    QTest::newRow("5 of 6") << six << 5 << QByteArray("\x01\x02\x03\x04\x05", 5);
}

void TestResample::markers()
{
    QFETCH(QByteArray, input);
    QFETCH(int, outputCount);
    QFETCH(QByteArray, expected);
    Run run;
    QVERIFY(run.prepare(randomSamples(static_cast<int>(input.size())), outputCount));
    QVERIFY(run.markersIn.open());
    QVERIFY(run.markersOut.open());
    QVERIFY(run.markersIn->writeBytes(static_cast<int>(input.size()), input.constData()));
    run.resample.setMarkers(run.markersIn.stream(), run.markersOut.stream());
    QVERIFY(run.resample.run());
    QVERIFY(run.markersOut->restartAtBegining());
    QByteArray result(20, '\xff');
    QCOMPARE(run.markersOut->readBlock(20, result.data()), static_cast<int>(expected.size()));
    QCOMPARE(result.first(expected.size()), expected);

    // A marker stream that ends early is an error, not a guess.
    QVERIFY(run.markersIn->restartAtBegining());
    Run shortened;
    QVERIFY(shortened.prepare(randomSamples(8), 8));
    shortened.resample.setMarkers(run.markersIn.stream(), run.markersOut.stream());
    (void)takeMessages();
    QVERIFY(!shortened.resample.run());
    QCOMPARE(takeMessages(), QStringList{"*** Cannot read marker data."});
}

void TestResample::failures_data()
{
    QTest::addColumn<qint64>("inputCount");
    QTest::addColumn<qint64>("outputCount");
    QTest::addColumn<int>("length");
    QTest::addColumn<int>("filter");
    QTest::addColumn<double>("rate");
    QTest::addColumn<double>("cutoff");
    QTest::addColumn<QString>("message");
    const QString lengths = "*** Invalid input or output data length.";
    const QString function = "*** Cannot create filter function.";
    const double nan = std::nan("");
    QTest::newRow("no input") << 0LL << 10LL << 21 << 0 << 1.0 << 0.45 << lengths;
    QTest::newRow("negative output") << 10LL << -10LL << 21 << 0 << 1.0 << 0.45 << lengths;
    QTest::newRow("low 32 bits") << 10LL << 0x1'8000'0000LL << 21 << 0 << 1.0 << 0.45 << lengths;
    QTest::newRow("no taps") << 10LL << 10LL << 2 << 0 << 1.0 << 0.45 << function;
    QTest::newRow("negative length") << 10LL << 10LL << -201 << 0 << 1.0 << 0.45 << function;
    QTest::newRow("enormous length") << 10LL << 10LL << 0x7fffffff << 0 << 1.0 << 0.45 << function;
    QTest::newRow("custom") << 10LL << 10LL << 21 << 4 << 1.0 << 0.45 << function;
    QTest::newRow("rate 0") << 10LL << 10LL << 21 << 0 << 0.0 << 0.45 << function;
    QTest::newRow("cut-off NaN") << 10LL << 10LL << 21 << 0 << 1.0 << nan << function;
    QTest::newRow("cut-off infinite") << 10LL << 10LL << 21 << 0 << 1.0 << HUGE_VAL << function;
    QTest::newRow("negative root") << 10LL << 10LL << 21 << 1 << 1.0 << -0.45 << function;
    QTest::newRow("beyond the stream")
        << 11LL << 11LL << 21 << 0 << 1.0 << 0.45 << "*** Reading failed for sample 10.";
    QTest::newRow("most samples") << 0x7fffffffLL << 0x7fffffffLL << 21 << 0 << 1.0 << 0.45
                                  << "*** Reading failed for sample 10.";
}

void TestResample::failures()
{
    QFETCH(qint64, inputCount);
    QFETCH(qint64, outputCount);
    QFETCH(int, length);
    QFETCH(int, filter);
    QFETCH(double, rate);
    QFETCH(double, cutoff);
    QFETCH(QString, message);
    Run run;
    QVERIFY(run.prepare(randomSamples(10), 10));
    run.resample.setInput(run.input.stream(), inputCount);
    run.resample.setOutput(run.output.stream(), outputCount);
    run.resample.setFilterLength(length);
    QVERIFY(run.resample.setFilterType(filter, 0.5));
    run.resample.setFilterFrequency(rate, cutoff);
    QVERIFY(!run.resample.run());
    QCOMPARE(takeMessages(), QStringList{message});
}

void TestResample::settersRefuseUnknownKinds()
{
    Resample resample;
    QVERIFY(resample.setFilterType(4, 0.5));
    QVERIFY(!resample.setFilterType(5, 0.5));
    QVERIFY(!resample.setFilterType(-1, 0.5));
    QVERIFY(resample.setWindowType(6));
    QVERIFY(!resample.setWindowType(7));
    QVERIFY(!resample.setWindowType(-1));

    resample.setInput(nullptr, 10);
    resample.setOutput(nullptr, 10);
    QVERIFY(!resample.run());
    QCOMPARE(takeMessages(), QStringList{"*** Invalid data buffer."});

    Run run;
    QVERIFY(run.prepare(randomSamples(10), 10));
    QVERIFY(run.input->writeHeader("XYZ"));
    QVERIFY(!run.resample.run());
    QCOMPARE(takeMessages(), QStringList{"*** Cannot reset read buffer."});
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
}

void TestResample::cancelAndReuse_data()
{
    QTest::addColumn<int>("pass");
    QTest::newRow("run") << 0;
    QTest::newRow("rescale") << 1;
    QTest::newRow("frequencyShift") << 2;
    QTest::newRow("polarSplit") << 3;
    QTest::newRow("statistics") << 4;
}

void TestResample::cancelAndReuse()
{
    QFETCH(int, pass);
    // As many samples as can be asked for, so that no machine is done before the first tick.
    constexpr int count = std::numeric_limits<int>::max();
    EndlessDevice devices[3];
    BufferedIO streams[3];
    for (int i = 0; i < 3; ++i) {
        QVERIFY(streams[i].initBuf(&devices[i], BufferedIO::ReadWrite));
    }
    Resample resample;
    resample.setInput(&streams[0], count);
    resample.setOutput(&streams[1], count);
    double peak = 0;
    double rms = 0;
    const auto call = [&](int samples) {
        switch (pass) {
        case 0:
            resample.setInput(&streams[0], samples);
            return resample.run();
        case 1:
            return resample.rescale(samples, 1.0, &streams[0]);
        case 2:
            return resample.frequencyShift(samples, 1.0, 100.0, &streams[0]);
        case 3:
            return resample.polarSplit(samples, &streams[0], &streams[1], &streams[2], 0, 1);
        default:
            return resample.statistics(samples, &streams[0], &peak, &rms);
        }
    };
    int ticks = 0;
    connect(&resample, &Resample::ProgressUpdate, &resample, [&](int percent) {
        QVERIFY(percent >= 0 && percent <= 100);
        ++ticks;
        resample.cancel();
        resample.cancel();
    });
    resample.cancel(); // before the start it means nothing
    QVERIFY(!call(count));
    QCOMPARE(ticks, 1);
    QCOMPARE(takeMessages(), QStringList{"*** Action aborted by user."});
    resample.setOutput(&streams[1], 1000);
    QVERIFY(call(1000));
}

void TestResample::fullDisk_data()
{
    QTest::addColumn<int>("pass");
    QTest::addColumn<QString>("message");
    // A buffer of 16 MiB goes to the disk when it is full: with 3 bytes of header that is within
    // sample 2097151.
    QTest::newRow("run") << 0 << "*** Cannot write output data.";
    QTest::newRow("rescale") << 1 << "*** Writing failed for sample 2097151.";
    QTest::newRow("frequencyShift") << 2 << "*** Writing failed for sample 2097151.";
    QTest::newRow("polarSplit phase") << 3 << "*** Writing phase data failed for sample 2097151.";
    QTest::newRow("polarSplit amplitude")
        << 4 << "*** Writing amplitude data failed for sample 2097151.";
}

void TestResample::fullDisk()
{
    QFETCH(int, pass);
    QFETCH(QString, message);
    constexpr int count = 4000000;
    EndlessDevice good;
    EndlessDevice other;
    EndlessDevice full(1000);
    BufferedIO goodStream;
    BufferedIO otherStream;
    BufferedIO fullStream;
    QVERIFY(goodStream.initBuf(&good, BufferedIO::ReadWrite));
    QVERIFY(otherStream.initBuf(&other, BufferedIO::ReadWrite));
    QVERIFY(fullStream.initBuf(&full, BufferedIO::ReadWrite));
    Resample resample;
    resample.setInput(&goodStream, count);
    resample.setOutput(&fullStream, count);
    switch (pass) {
    case 0:
        QVERIFY(!resample.run());
        break;
    case 1:
        QVERIFY(!resample.rescale(count, 1.0, &fullStream));
        break;
    case 2:
        QVERIFY(!resample.frequencyShift(count, 1.0, 100.0, &fullStream));
        break;
    case 3:
        QVERIFY(!resample.polarSplit(count, &goodStream, &fullStream, &otherStream, 0, 1));
        break;
    default:
        QVERIFY(!resample.polarSplit(count, &goodStream, &otherStream, &fullStream, 0, 1));
    }
    QCOMPARE(takeMessages(), QStringList{message});
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
    QVERIFY(!resample.rescale(1, 0.5, nullptr));
    QVERIFY(!resample.rescale(1, std::nan(""), stream.stream()));
    QVERIFY(!resample.rescale(1, 1e300, stream.stream()));
    QVERIFY(!resample.statistics(100001, stream.stream(), &peak, &rms));
    QVERIFY(!resample.statistics(-1, stream.stream(), &peak, &rms));
    QVERIFY(!resample.statistics(1, stream.stream(), nullptr, &rms));
    QVERIFY(stream->writeHeader("XYZ"));
    QVERIFY(!resample.rescale(1, 0.5, stream.stream()));
    QCOMPARE(
        takeMessages(),
        (QStringList{"*** Reading failed for sample 100000.", "*** Invalid input data length.",
                     "*** Invalid data buffer.", "*** Invalid scaling factor nan.",
                     "*** Invalid scaling factor 1e+300.", "*** Reading failed for sample 100000.",
                     "*** Invalid input data length.", "*** Invalid input arguments.",
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
    for (const double bad : {0.0, std::nan("")}) {
        QVERIFY(!resample.frequencyShift(10, 1e3, bad, stream.stream()));
        QCOMPARE(takeMessages().size(), 1);
    }
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
    QVERIFY(!resample.polarSplit(0, source.stream(), phase.stream(), amplitude.stream(), 0, 1));
    QVERIFY(!resample.polarSplit(1, source.stream(), nullptr, amplitude.stream(), 0, 1));
    QVERIFY(!resample.polarSplit(50001, source.stream(), phase.stream(), amplitude.stream(), 0, 1));
    QCOMPARE(takeMessages(),
             (QStringList{"*** Invalid input data length.", "*** Invalid data buffer.",
                          "*** Reading failed for sample 50000."}));
}

QTEST_GUILESS_MAIN(TestResample)
#include "tst_resample.moc"
