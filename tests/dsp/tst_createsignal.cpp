// SPDX-License-Identifier: Apache-2.0
#include "dsp/CreateSignal.h"

#include "dsp/Resample.h"
#include "literal_resample.h"
#include "literal_signals.h"
#include "stream_helpers.h"

#include <QTest>

#include <functional>

namespace {

/// How a test sets a signal up, and what it then is, sample by sample.
struct Case
{
    const char *name;
    SignalType type;
    std::function<bool(CreateSignal &)> configure;
    std::function<Literal::Vectors(const ClockLimits &)> literal;
};

template <typename Settings, typename Configure, typename Fit, typename Make>
Case makeCase(const char *name, SignalType type, const Settings &settings, Configure configure,
              Fit fit, Make make)
{
    return {name, type, [=](CreateSignal &signal) { return (signal.*configure)(settings); },
            [=](const ClockLimits &limits) {
                const std::optional<SignalFit> fitted = fit(settings, limits);
                return fitted ? make(settings, *fitted) : Literal::Vectors{};
            }};
}

Case functionCase(const char *name, const FunctionSettings &s)
{
    return makeCase(name, SignalType::Function, s, &CreateSignal::configureFunction, fitFunction,
                    Literal::function);
}

Case fmCase(const char *name, const FmSettings &s)
{
    return makeCase(name, SignalType::Fm, s, &CreateSignal::configureFm, fitFm, Literal::fm);
}

Case amCase(const char *name, const AmSettings &s)
{
    return makeCase(name, SignalType::Am, s, &CreateSignal::configureAm, fitAm, Literal::am);
}

Case sweepCase(const char *name, const SweepSettings &s)
{
    return makeCase(name, SignalType::FmSweep, s, &CreateSignal::configureSweep, fitSweep,
                    Literal::sweep);
}

Case carrierCase(const char *name, const MultiCarrierSettings &s)
{
    return makeCase(name, SignalType::MultiCarrier, s, &CreateSignal::configureMultiCarrier,
                    fitMultiCarrier, Literal::multiCarrier);
}

Case pulseCase(const char *name, const PulseSettings &s)
{
    return makeCase(name, SignalType::Pulse, s, &CreateSignal::configurePulse, fitPulse,
                    Literal::pulse);
}

Case chirpCase(const char *name, const ChirpSettings &s)
{
    return makeCase(name, SignalType::Pulse, s, &CreateSignal::configureChirp, fitChirp,
                    Literal::chirp);
}

std::vector<Case> functionCases()
{
    std::vector<Case> cases;
    const char *names[] = {"sine", "square", "triangular", "sawtooth"};
    for (int kind = 0; kind < 4; ++kind) {
        cases.push_back(functionCase(names[kind], {static_cast<FunctionKind>(kind), 10000, 0.707,
                                                   0.707, 0, 0, 90, false, 100}));
        cases.push_back(functionCase(names[kind], {static_cast<FunctionKind>(kind), 333, 1.0, 0.5,
                                                   -0.25, 0.5, -137.5, true, 99991}));
        cases.push_back(functionCase(
            names[kind], {static_cast<FunctionKind>(kind), 1000, 0.5, 1.0, 0.5, 0, 180, true, 12}));
    }
    cases.push_back(functionCase("sine, repeated", {FunctionKind::Sine, 1e6}));
    return cases;
}

std::vector<Case> allCases()
{
    std::vector<Case> cases = functionCases();
    cases.push_back(fmCase("fm", {FmKind::SingleTone, 1000, 10000, 0, 0}));
    cases.push_back(fmCase("fm, long", {FmKind::SingleTone, 100, 24999900, 0, 0}));
    cases.push_back(fmCase("fm, fraction", {FmKind::SingleTone, 1000.7, 10000.2, 0, 0}));
    cases.push_back(fmCase("fm, two tones", {FmKind::TwoTone, 1000, 10000, 2500, 33300}));
    const char *amNames[] = {"am",    "lsb",     "usb",    "lsb+c",
                             "usb+c", "lsb+usb", "2-tone", "2-tone w/o c"};
    for (int kind = 0; kind < 8; ++kind) {
        cases.push_back(amCase(amNames[kind], {static_cast<AmKind>(kind), 10000, 83, 15000, 47}));
    }
    cases.push_back(amCase("2-tone, long", {AmKind::TwoTone, 100007, 100, 150013, 100}));
    cases.push_back(sweepCase("sweep", {SweepKind::Linear, 1e5, 0.01, 0, 360}));
    cases.push_back(sweepCase("sweep, long", {SweepKind::Linear, 12.5e6, 0.01, 0, 360}));
    cases.push_back(sweepCase("sweep, sine", {SweepKind::Sine, 1e5, 0.02, -45, 720}));
    cases.push_back(sweepCase("sweep, triangular", {SweepKind::Triangular, 1e5, 0.02, -360, 500}));
    const auto pmCase = [](const char *name, const PmSettings &s) {
        return makeCase(name, SignalType::Pm, s, &CreateSignal::configurePm, fitPm, Literal::pm);
    };
    cases.push_back(pmCase("pm", {10000, 180}));
    cases.push_back(pmCase("pm, repeated", {20e6, -77}));
    cases.push_back(carrierCase("carriers", {10000, 100, 0, true}));
    cases.push_back(carrierCase("carriers, in phase", {10000, 101, 0.25, false}));
    cases.push_back(carrierCase("carriers, one row", {100000, 128, 0, true}));
    cases.push_back(carrierCase("carriers, rows", {5000, 1000, -0.125, true}));
    cases.push_back(carrierCase("one carrier", {10000, 2, 0, true}));
    cases.push_back(pulseCase("pulse", {1e-5, 1e-4, 1e-5, 1e-4, RampKind::Linear, 1e-7}));
    cases.push_back(pulseCase("pulse, cosine", {1e-5, 0, 2e-4, 0, RampKind::RaisedCosine, 1e-8}));
    cases.push_back(pulseCase("pulse, no ramps", {0, 1e-4, 0, 1e-4, RampKind::Linear, 1e-7}));
    cases.push_back(chirpCase("chirp", {{1e-5, 1e-4, 1e-5, 1e-4, RampKind::Linear, 1e-7}, 1e6}));
    cases.push_back(
        chirpCase("chirp, cosine", {{1e-3, 4e-3, 2e-3, 1e-3, RampKind::RaisedCosine, 1e-7}, 2e7}));
    return cases;
}

} // namespace

class TestCreateSignal : public QObject
{
    Q_OBJECT

private slots:
    void init() { (void)Tracer::takeEntries(); }
    void wordsEqualLiteral_data();
    void wordsEqualLiteral();
    void manyCarriersEqualLiteral();
    void noiseEqualsLiteral_data();
    void noiseEqualsLiteral();
    void fits_data();
    void fits();
    void refusals_data();
    void refusals();
    void shortSignalsRepeat();
    void orderOfCalls();
    void unknownKinds();
    void seeds();
    void cancel_data();
    void cancel();
    void fullDisk();

private:
    void compare(const Case &test);
};

void TestCreateSignal::wordsEqualLiteral_data()
{
    QTest::addColumn<int>("index");
    const std::vector<Case> cases = allCases();
    for (size_t i = 0; i < cases.size(); ++i) {
        QTest::addRow("%s #%d", cases[i].name, static_cast<int>(i)) << static_cast<int>(i);
    }
}

void TestCreateSignal::wordsEqualLiteral()
{
    QFETCH(int, index);
    compare(allCases()[static_cast<size_t>(index)]);
}

void TestCreateSignal::compare(const Case &test)
{
    constexpr unsigned seed = 4711;
    TempStream stream;
    QVERIFY(stream.open());
    CreateSignal signal;
    signal.setSeed(seed);
    signal.setSignalType(test.type);
    QVERIFY(test.configure(signal));
    signal.setOutput(stream.stream());
    QVERIFY(signal.generate());
    int written = 0;
    double rms = 0;
    double peak = 0;
    QVERIFY(signal.statistics(&written, &rms, &peak));
    const Samples samples = readStream(*stream.stream());
    QCOMPARE(samples.size(), static_cast<size_t>(written));

    std::srand(seed);
    const Literal::Vectors expected = test.literal(ClockLimits{});
    QCOMPARE(expected.size(), static_cast<size_t>(signal.sampleCount()));
    double literalPeak = 0;
    double literalSum = 0;
    const auto gain = static_cast<float>(1 / peak);
    for (size_t i = 0; i < samples.size(); ++i) {
        const std::complex<double> vector = expected[i % expected.size()];
        literalPeak = std::max(literalPeak, std::norm(vector));
        literalSum += std::norm(vector);
        const std::complex<float> sample(vector);
        const bool same = fileWord(samples[i].real()) == fileWord(sample.real()) &&
                          fileWord(samples[i].imag()) == fileWord(sample.imag()) &&
                          fileWord(samples[i].real() * gain) == fileWord(sample.real() * gain) &&
                          fileWord(samples[i].imag() * gain) == fileWord(sample.imag() * gain);
        QVERIFY2(same, qPrintable(QString("sample %1").arg(i)));
    }
    QVERIFY(std::abs(peak - std::sqrt(literalPeak)) < 1e-12);
    QVERIFY(std::abs(rms - std::sqrt(literalSum / written)) < 1e-12);
}

void TestCreateSignal::manyCarriersEqualLiteral()
{
    // The literal form of all samples takes minutes, so every 997th is judged.
    TempStream stream;
    QVERIFY(stream.open());
    CreateSignal signal;
    signal.setSeed(99);
    signal.setSignalType(SignalType::MultiCarrier);
    signal.setMaxClock(6e8);
    const MultiCarrierSettings settings{600, 10000, 0, true};
    QVERIFY(signal.configureMultiCarrier(settings));
    QCOMPARE(signal.sampleCount(), 1000000);
    signal.setOutput(stream.stream());
    QVERIFY(signal.generate());
    const Samples samples = readStream(*stream.stream());
    QCOMPARE(samples.size(), size_t{1000000});

    std::srand(99);
    double phases[64] = {};
    for (int k = 1; k <= 5000; ++k) {
        phases[k % 64] = ((std::rand() % 365) / 365.0) * Literal::T;
    }
    for (size_t i = 0; i < samples.size(); i += 997) {
        const double x = 600.0 * Literal::T * static_cast<double>(i) / signal.clockRate();
        double sum = 0;
        for (int k = 1; k <= 5000; ++k) {
            sum += std::sin(k * x + phases[k % 64]) + 0.0;
        }
        QCOMPARE(samples[i].real(), static_cast<float>(sum / 5000));
        QCOMPARE(samples[i].imag(), 0.0F);
    }
}

void TestCreateSignal::noiseEqualsLiteral_data()
{
    QTest::addColumn<int>("kind");
    QTest::newRow("white") << 0;
    QTest::newRow("pink") << 1;
    QTest::newRow("brown") << 2;
}

void TestCreateSignal::noiseEqualsLiteral()
{
    QFETCH(int, kind);
    const NoiseSettings settings{static_cast<NoiseKind>(kind), 1e6, 0.01};
    TempStream stream;
    QVERIFY(stream.open());
    CreateSignal signal;
    signal.setSeed(7);
    signal.setSignalType(SignalType::Noise);
    QVERIFY(signal.configureNoise(settings));
    QCOMPARE(signal.sampleCount(), 15000);
    QCOMPARE(signal.clockRate(), 1.5e6);
    signal.setOutput(stream.stream());
    QVERIFY(signal.generate());
    int written = 0;
    double rms = 0;
    double peak = 0;
    QVERIFY(signal.statistics(&written, &rms, &peak));
    QCOMPARE(written, 15000);

    std::srand(7);
    Samples raw;
    for (const std::complex<double> &value :
         Literal::noise(settings, *fitNoise(settings, ClockLimits{}))) {
        raw.emplace_back(value);
    }
    const auto expected =
        literalResample({.length = 101, .rate = 1.5e6, .cutoff = 0.5e6}, raw, 15000);
    const Samples samples = readStream(*stream.stream());
    QCOMPARE(samples.size(), size_t{15000});
    double highest = 0;
    double sum = 0;
    for (size_t i = 0; i < samples.size(); ++i) {
        // Brown noise goes beyond full scale before it is scaled.
        QVERIFY(std::abs(std::complex<double>(samples[i]) - (*expected)[i]) <
                3e-6 * std::max(1.0, peak));
        highest = std::max(highest, std::norm((*expected)[i]));
        sum += std::norm((*expected)[i]);
    }
    // The level of the filtered noise, not of what went in.
    QVERIFY(std::abs(peak - std::sqrt(highest)) < 3e-6 * std::max(1.0, peak));
    QVERIFY(std::abs(rms - std::sqrt(sum / 15000)) < 1e-6);
}

void TestCreateSignal::fits_data()
{
    QTest::addColumn<Case *>("test");
    QTest::addColumn<double>("minClock");
    QTest::addColumn<double>("maxClock");
    QTest::addColumn<int>("samples");
    QTest::addColumn<double>("clock");
    QTest::addColumn<QString>("message");
    static std::vector<std::unique_ptr<Case>> cases;
    const auto row = [](const char *name, const Case &test, double minClock, double maxClock,
                        int samples, double clock, const QString &message = {}) {
        cases.push_back(std::make_unique<Case>(test));
        QTest::newRow(name) << cases.back().get() << minClock << maxClock << samples << clock
                            << message;
    };
    const auto fewer = [](int count) {
        return QString("The number of samples is less than %1. Check settings.").arg(count);
    };
    const QString upper = "The required ARB clock rate exceeds the upper limit. Check settings.";
    const QString lower = "The required ARB clock rate exceeds the lower limit. Check settings.";
    const QString exceeds = "The number of samples exceeds 1e+06. Check settings.";
    const FunctionSettings sine;
    const auto function = [sine](double frequency, bool custom = false, int count = 100) {
        FunctionSettings s = sine;
        s.frequency = frequency;
        s.customOversampling = custom;
        s.oversampling = count;
        return functionCase("", s);
    };
    row("function", function(10e3), 1e5, 1e8, 1000, 10e6);
    row("function, limited", function(1e6), 1e5, 1e8, 100, 1e8, fewer(100));
    row("function, raised", function(100, true, 10), 1e5, 1e8, 1000, 1e5);
    row("function, fraction", function(3e5 / 7, true, 4), 1e6, 1e8, 23, 23 * 3e5 / 7, fewer(23));
    row("function, 8 samples", function(12.5e6), 1e5, 1e8, 8, 1e8, fewer(8));
    row("function, 7 samples", function(12.6e6), 1e5, 1e8, 0, 0, upper);
    row("function, few by choice", function(1e6, true, 4), 1e5, 1e8, 4, 4e6, fewer(4));
    row("function, above a million", function(100, true, 2000000), 1e5, 6e8, 2000000, 2e8);
    row("function, no count", function(1e6, true, 0), 1e5, 1e8, 0, 0,
        "The signal is shorter than one sample. Check settings.");
    row("carriers", carrierCase("", {10000, 100, 0, true}), 1e5, 1e8, 10000, 1e8);
    row("carriers, odd", carrierCase("", {10000, 3, 0, true}), 1e5, 1e8, 512, 5.12e6);
    row("carriers, too many", carrierCase("", {1e6, 60, 0, true}), 1e5, 1e8, 0, 0, upper);
    row("carriers, no sample limit", carrierCase("", {10, 10000, 0, true}), 1e5, 1e8, 2560000,
        25.6e6);
    const auto pmCase = [](double frequency) {
        return makeCase("", SignalType::Pm, PmSettings{frequency, 10}, &CreateSignal::configurePm,
                        fitPm, Literal::pm);
    };
    row("pm", pmCase(1e4), 1e5, 1e8, 1024, 10.24e6);
    row("pm, 4 samples", pmCase(25e6), 1e5, 1e8, 4, 1e8, fewer(4));
    row("pm, 3 samples", pmCase(26e6), 1e5, 1e8, 0, 0, upper);
    row("pm, too long", pmCase(0.05), 1e5, 1e8, 0, 0, exceeds);
    row("am", amCase("", {AmKind::Lsb, 1e4, 100, 0, 0}), 1e5, 1e8, 1024, 10.24e6);
    // gcd 5000, 2 and 3 cycles; 1024 samples: periods 512 and 341.33, clock 512 x 10 kHz.
    row("am, two tones", amCase("", {AmKind::TwoTone, 1e4, 100, 15e3, 100}), 1e5, 1e8, 1024,
        5.12e6);
    // Clock 1e7: periods 1000 and 666.67, samples 1000 / 2.
    row("am, two tones, raised", amCase("", {AmKind::TwoTone, 1e4, 100, 15e3, 100}), 1e7, 1e8, 500,
        1e7, fewer(500));
    row("fm", fmCase("", {FmKind::SingleTone, 1000, 10000, 0, 0}), 1e5, 1e8, 1024, 1.024e6);
    // gcd 100, 4 x 99999 samples.
    row("fm, long", fmCase("", {FmKind::SingleTone, 100, 9999900, 0, 0}), 1e5, 1e8, 399996,
        39999600);
    row("fm, too fast", fmCase("", {FmKind::SingleTone, 1e6, 30e6, 0, 0}), 1e5, 1e8, 0, 0, upper);
    row("fm, half a hertz", fmCase("", {FmKind::SingleTone, 0.5, 1000, 0, 0}), 1e5, 1e8, 1024,
        1.024e6);
    row("fm, no deviation", fmCase("", {FmKind::SingleTone, 0.5, 0.5, 0, 0}), 1e5, 1e8, 0, 0,
        "Invalid FM configuration.");
    // gcd(gcd(1000, 2000), gcd(10000, 7500)) = 500; 4 x 20 samples at least.
    row("fm, two tones", fmCase("", {FmKind::TwoTone, 1000, 10000, 2000, 7500}), 1e5, 1e8, 1024,
        512e3);
    row("fm, too long", fmCase("", {FmKind::SingleTone, 1, 1000001, 0, 0}), 1e5, 1e8, 0, 0,
        exceeds);
    row("sweep", sweepCase("", {SweepKind::Linear, 1e5, 0.01, 0, 360}), 1e5, 1e8, 8000, 8e5);
    row("sweep, raised", sweepCase("", {SweepKind::Linear, 1e3, 0.01, 0, 360}), 1e5, 1e8, 1000,
        1e5);
    row("sweep, too wide", sweepCase("", {SweepKind::Linear, 2e7, 0.01, 0, 360}), 1e5, 1e8, 0, 0,
        upper);
    row("sweep, too long", sweepCase("", {SweepKind::Linear, 1e7, 0.02, 0, 360}), 1e5, 1e8, 0, 0,
        exceeds);
    const PulseSettings pulse{1e-5, 1e-4, 1e-5, 1e-4, RampKind::Linear, 1e-7};
    row("pulse", pulseCase("", pulse), 1e5, 1e8, 2200, 1e7);
    row("pulse, too fine", pulseCase("", {0, 1e-4, 0, 0, RampKind::Linear, 1e-9}), 1e5, 1e8, 0, 0,
        upper);
    row("pulse, too coarse", pulseCase("", {0, 1e-4, 0, 0, RampKind::Linear, 1e-4}), 1e5, 1e8, 0, 0,
        lower);
    row("pulse, too long", pulseCase("", {0, 1.0, 0, 0, RampKind::Linear, 1e-8}), 1e5, 1e8, 0, 0,
        exceeds);
    row("chirp", chirpCase("", {pulse, 2e7}), 1e5, 1e8, 4400, 2e7);
    const auto noiseCase = [](double bandwidth, double duration) {
        return makeCase("", SignalType::Noise, NoiseSettings{NoiseKind::White, bandwidth, duration},
                        &CreateSignal::configureNoise, fitNoise, Literal::noise);
    };
    row("noise", noiseCase(1e6, 0.01), 1e5, 1e8, 15000, 1.5e6);
    row("noise, too wide", noiseCase(1e8, 1e-4), 1e5, 1e8, 0, 0, upper);
    row("noise, too narrow", noiseCase(1e3, 1), 1e5, 1e8, 0, 0, lower);
    row("noise, too long", noiseCase(1e6, 1), 1e5, 1e8, 0, 0, exceeds);
}

void TestCreateSignal::fits()
{
    QFETCH(Case *, test);
    QFETCH(double, minClock);
    QFETCH(double, maxClock);
    QFETCH(int, samples);
    QFETCH(double, clock);
    QFETCH(QString, message);
    CreateSignal signal;
    signal.setMinClock(minClock);
    signal.setMaxClock(maxClock);
    QCOMPARE(test->configure(signal), samples > 0);
    QCOMPARE(signal.sampleCount(), samples);
    QVERIFY(std::abs(signal.clockRate() - clock) <= 1e-9 * clock);
    QCOMPARE(takeMessages(), message.isEmpty() ? QStringList{} : QStringList{message});
}

void TestCreateSignal::refusals_data()
{
    QTest::addColumn<double>("value");
    QTest::newRow("zero") << 0.0;
    QTest::newRow("negative") << -1000.0;
    QTest::newRow("NaN") << std::nan("");
    QTest::newRow("infinite") << HUGE_VAL;
    QTest::newRow("enormous") << 1e300;
    QTest::newRow("tiny") << 1e-300;
}

void TestCreateSignal::refusals()
{
    // Where such a value makes no signal, one message says so; where it does, it can be made.
    QFETCH(double, value);
    CreateSignal signal;
    TempStream stream;
    QVERIFY(stream.open());
    signal.setOutput(stream.stream());
    int refused = 0;
    int made = 0;
    const auto check = [&](SignalType type, const Case &test) {
        signal.setSignalType(type);
        (void)takeMessages();
        if (!test.configure(signal)) {
            const QStringList messages = takeMessages(Tracer::Error);
            QCOMPARE(messages.size(), 1);
            ++refused;
            QCOMPARE(signal.sampleCount(), 0);
            return;
        }
        if (signal.sampleCount() <= 1000000) {
            QVERIFY(signal.generate());
            ++made;
        }
    };
    check(SignalType::Function, functionCase("", {.frequency = value}));
    check(SignalType::Function, functionCase("", {.amplitudeI = value}));
    check(SignalType::Function, functionCase("", {.amplitudeQ = value}));
    check(SignalType::Function, functionCase("", {.offsetI = value}));
    check(SignalType::Function, functionCase("", {.offsetQ = value}));
    check(SignalType::Function, functionCase("", {.phaseQ = value}));
    check(SignalType::MultiCarrier, carrierCase("", {.spacing = value}));
    check(SignalType::MultiCarrier, carrierCase("", {.offsetI = value}));
    check(SignalType::MultiCarrier, carrierCase("", {.carriers = 1}));
    check(SignalType::MultiCarrier, carrierCase("", {.carriers = -7}));
    check(SignalType::MultiCarrier, carrierCase("", {.carriers = 0x7fffffff}));
    check(SignalType::Pulse, pulseCase("", {.riseTime = value}));
    check(SignalType::Pulse, pulseCase("", {.onTime = value}));
    check(SignalType::Pulse, pulseCase("", {.fallTime = value}));
    check(SignalType::Pulse, pulseCase("", {.blankTime = value}));
    check(SignalType::Pulse, pulseCase("", {.timeResolution = value}));
    check(SignalType::Pulse, chirpCase("", {PulseSettings{}, value}));
    check(SignalType::Fm, fmCase("", {.frequency1 = value}));
    check(SignalType::Fm, fmCase("", {.deviation1 = value}));
    check(SignalType::Fm, fmCase("", {FmKind::TwoTone, 1000, 1000, value, 1000}));
    check(SignalType::Fm, fmCase("", {FmKind::TwoTone, 1000, 1000, 1000, value}));
    check(SignalType::Am, amCase("", {.frequency1 = value}));
    check(SignalType::Am, amCase("", {.depth1 = value}));
    check(SignalType::Am, amCase("", {AmKind::TwoTone, 1000, 100, value, 100}));
    check(SignalType::Am, amCase("", {AmKind::TwoTone, 1000, 100, 1000, value}));
    check(SignalType::FmSweep, sweepCase("", {.deviation = value}));
    check(SignalType::FmSweep, sweepCase("", {.sweepTime = value}));
    check(SignalType::FmSweep, sweepCase("", {SweepKind::Sine, 1e5, 0.01, value, 0}));
    check(SignalType::FmSweep, sweepCase("", {SweepKind::Triangular, 1e5, 0.01, 0, value}));
    signal.setSignalType(SignalType::Noise);
    if (signal.configureNoise({NoiseKind::White, value, 0.01})) {
        QVERIFY(signal.generate());
    }
    if (signal.configureNoise({NoiseKind::White, 1e6, value})) {
        QVERIFY(signal.generate());
    }
    for (const bool lowest : {true, false}) {
        signal.setMinClock(lowest ? value : 1e5);
        signal.setMaxClock(lowest ? 1e8 : value);
        check(SignalType::Function, functionCase("", {}));
    }
    QVERIFY(refused > 5);
    QVERIFY(std::isfinite(value) == (made > 2));
}

void TestCreateSignal::shortSignalsRepeat()
{
    TempStream stream;
    QVERIFY(stream.open());
    CreateSignal signal;
    signal.setSignalType(SignalType::Function);
    QVERIFY(signal.configureFunction({.frequency = 1e6}));
    QCOMPARE(signal.sampleCount(), 100);
    signal.setOutput(stream.stream());
    QVERIFY(signal.generate());
    const Samples samples = readStream(*stream.stream());
    QCOMPARE(samples.size(), size_t{600});
    for (size_t i = 100; i < samples.size(); ++i) {
        QVERIFY(samples[i] == samples[i - 100]);
    }
    // A pulse isn't repeated.
    signal.setSignalType(SignalType::Pulse);
    QVERIFY(signal.configurePulse({1e-6, 1e-5, 1e-6, 1e-5, RampKind::Linear, 1e-7}));
    QVERIFY(signal.generate());
    int written = 0;
    double rms = 0;
    double peak = 0;
    QVERIFY(signal.statistics(&written, &rms, &peak));
    QCOMPARE(written, 220);
    QCOMPARE(peak, 1.0);
}

void TestCreateSignal::orderOfCalls()
{
    TempStream stream;
    QVERIFY(stream.open());
    CreateSignal signal;
    int written = 0;
    double rms = 0;
    double peak = 0;
    signal.setOutput(nullptr);
    QVERIFY(!signal.generate());
    signal.setOutput(stream.stream());
    signal.setOutput(nullptr); // leaves the stream
    QVERIFY(!signal.generate());
    QCOMPARE(takeMessages(),
             (QStringList{"*** No output device set.", "*** Waveform not yet configured."}));
    QVERIFY(signal.configureFunction({}));
    QVERIFY(!signal.statistics(&written, &rms, &peak));
    QVERIFY(signal.generate());
    QVERIFY(signal.statistics(&written, &rms, &peak));
    QVERIFY(!signal.statistics(nullptr, &rms, &peak));
    // A failed configuration takes the old one away.
    QVERIFY(!signal.configureFunction({.frequency = 99e6}));
    QVERIFY(!signal.statistics(&written, &rms, &peak));
    QCOMPARE(signal.clockRate(), 0.0);
    QVERIFY(signal.configureFunction({}));
    signal.setSignalType(SignalType::Function);
    QVERIFY(!signal.generate());
}

void TestCreateSignal::unknownKinds()
{
    TempStream stream;
    QVERIFY(stream.open());
    CreateSignal signal;
    signal.setOutput(stream.stream());
    QVERIFY(signal.configureFunction({.kind = static_cast<FunctionKind>(4)}));
    QVERIFY(!signal.generate());
    signal.setSignalType(static_cast<SignalType>(8));
    QVERIFY(signal.configureFunction({}));
    QVERIFY(!signal.generate());
    signal.setSignalType(SignalType::Am);
    QVERIFY(signal.configureAm({.kind = static_cast<AmKind>(8)}));
    QVERIFY(!signal.generate());
    signal.setSignalType(SignalType::Fm);
    QVERIFY(!signal.configureFm({.kind = static_cast<FmKind>(2)}));
    QCOMPARE(takeMessages(),
             (QStringList{"*** Invalid signal type.", "*** Invalid signal type.",
                          "*** Invalid AM signal type.", "Invalid FM configuration."}));
}

void TestCreateSignal::seeds()
{
    const auto make = [](std::optional<unsigned> seed, bool noise) {
        TempStream stream;
        CreateSignal signal;
        signal.setSeed(seed);
        signal.setSignalType(noise ? SignalType::Noise : SignalType::MultiCarrier);
        const bool configured =
            noise ? signal.configureNoise({}) : signal.configureMultiCarrier({});
        signal.setOutput(stream.stream());
        return stream.open() && configured && signal.generate() ? readStream(*stream.stream())
                                                                : Samples{};
    };
    for (const bool noise : {false, true}) {
        const Samples first = make(1, noise);
        QVERIFY(!first.empty());
        QVERIFY(make(1, noise) == first);
        QVERIFY(make(2, noise) != first);
        QCOMPARE(make({}, noise).size(), first.size());
    }
}

void TestCreateSignal::cancel_data()
{
    QTest::addColumn<int>("type");
    QTest::newRow("function") << 0;
    QTest::newRow("multi carrier") << 1;
}

void TestCreateSignal::cancel()
{
    QFETCH(int, type);
    // As many samples as can be asked for: nobody waits for their end.
    EndlessDevice device;
    BufferedIO stream;
    QVERIFY(stream.initBuf(&device, BufferedIO::ReadWrite));
    CreateSignal signal;
    signal.setMaxClock(1e12);
    signal.setSignalType(static_cast<SignalType>(type));
    QVERIFY(type == 0
                ? signal.configureFunction(
                      {.frequency = 1, .customOversampling = true, .oversampling = 0x7fffffff})
                : signal.configureMultiCarrier({.spacing = 1, .carriers = 0x7fffff}));
    signal.setOutput(&stream);
    int ticks = 0;
    connect(&signal, &CreateSignal::ProgressUpdate, &signal, [&] {
        ++ticks;
        signal.cancel();
        signal.cancel();
    });
    signal.cancel(); // before the start it means nothing
    QVERIFY(!signal.generate());
    QCOMPARE(ticks, 1);
    QCOMPARE(takeMessages(), QStringList{"*** User break."});
    int written = 0;
    double rms = 0;
    double peak = 0;
    QVERIFY(!signal.statistics(&written, &rms, &peak));
    signal.setSignalType(SignalType::Function);
    QVERIFY(signal.configureFunction({}));
    QVERIFY(signal.generate());
}

void TestCreateSignal::fullDisk()
{
    EndlessDevice device(1000);
    BufferedIO stream;
    QVERIFY(stream.initBuf(&device, BufferedIO::ReadWrite));
    CreateSignal signal;
    signal.setOutput(&stream);
    QVERIFY(signal.configureFunction(
        {.frequency = 10, .customOversampling = true, .oversampling = 5000000}));
    QVERIFY(!signal.generate());
    QCOMPARE(takeMessages(), QStringList{"*** Cannot write to output file."});
}

QTEST_GUILESS_MAIN(TestCreateSignal)
#include "tst_createsignal.moc"
