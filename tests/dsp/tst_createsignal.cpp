// SPDX-License-Identifier: Apache-2.0
#include "dsp/CreateSignal.h"
#include "dsp/Resample.h"
#include "literal_resample.h"
#include "signal_cases.h"
#include "stream_helpers.h"
#include "support/rows.h"

#include <QTest>

namespace {

std::vector<Case> functionCases()
{
    std::vector<Case> cases;
    const char *names[] = {"sine", "square", "triangular", "sawtooth"};
    for (int kind = 0; kind < 4; ++kind) {
        cases.push_back(functionCase(names[kind], {static_cast<FunctionKind>(kind), 333, 1.0, 0.5,
                                                   -0.25, 0.5, -137.5, true, 99991}));
    }
    cases.push_back(functionCase("sawtooth, 12",
                                 {FunctionKind::Sawtooth, 1000, 0.5, 1.0, 0.5, 0, 180, true, 12}));
    cases.push_back(functionCase("sine, repeated", {FunctionKind::Sine, 1e6}));
    return cases;
}

std::vector<Case> allCases()
{
    std::vector<Case> cases = functionCases();
    cases.push_back(fmCase("fm", {FmKind::SingleTone, 1000, 10000, 0, 0}));
    cases.push_back(fmCase("fm, fraction", {FmKind::SingleTone, 1000.7, 10000.2, 0, 0}));
    cases.push_back(fmCase("fm, two tones", {FmKind::TwoTone, 1000, 10000, 2500, 33300}));
    const char *amNames[] = {"am",    "lsb",     "usb",    "lsb+c",
                             "usb+c", "lsb+usb", "2-tone", "2-tone w/o c"};
    for (int kind = 0; kind < 8; ++kind) {
        cases.push_back(amCase(amNames[kind], {static_cast<AmKind>(kind), 10000, 83, 15000, 47}));
    }
    cases.push_back(sweepCase("sweep", {SweepKind::Linear, 1e5, 0.01, 0, 360}));
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
    cases.push_back(carrierCase("one carrier", {10000, 2, 0, true}));
    cases.push_back(pulseCase("pulse", {1e-5, 1e-4, 1e-5, 1e-4, RampKind::Linear, 1e-7}));
    cases.push_back(pulseCase("pulse, cosine", {1e-5, 0, 2e-4, 0, RampKind::RaisedCosine, 1e-8}));
    cases.push_back(chirpCase("chirp", {{1e-5, 1e-4, 1e-5, 1e-4, RampKind::Linear, 1e-7}, 1e6}));
    cases.push_back(
        chirpCase("chirp, cosine", {{1e-3, 4e-3, 2e-3, 1e-3, RampKind::RaisedCosine, 1e-7}, 2e7}));
    return cases;
}

/// A signal made, and what is said of it.
struct Made
{
    Samples samples;
    int written = 0;
    double rms = 0;
    double peak = 0;
};

std::optional<Made> make(CreateSignal &signal)
{
    TempStream stream;
    signal.setOutput(stream.open() ? stream.stream() : nullptr);
    Made made;
    if (!signal.generate() || !signal.statistics(&made.written, &made.rms, &made.peak)) {
        return {};
    }
    made.samples = readStream(*stream.stream());
    return made;
}

} // namespace

class TestCreateSignal : public QObject
{
    Q_OBJECT

private slots:
    void init() { (void)takeMessages(); }
    void wordsEqualLiteral();
    void refusals();
    void manyCarriersEqualLiteral();
    void noiseEqualsLiteral();
    void fits();
    void anyNumber();
    void cancelAndFullDisk();
};

void TestCreateSignal::wordsEqualLiteral()
{
    constexpr unsigned seed = 4711;
    forRows(allCases(), [&](const Case &test) {
        CreateSignal signal;
        signal.setSeed(seed);
        signal.setSignalType(test.type);
        QVERIFY(test.configure(signal));
        const std::optional<Made> made = make(signal);
        QVERIFY(made);
        const auto &[samples, written, rms, peak] = *made;
        QCOMPARE(samples.size(), static_cast<size_t>(written));
        // Short loops are repeated, a pulse isn't.
        QVERIFY(written == signal.sampleCount() ||
                (written >= 512 && test.type != SignalType::Pulse));

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
            const bool same =
                fileWord(samples[i].real()) == fileWord(sample.real()) &&
                fileWord(samples[i].imag()) == fileWord(sample.imag()) &&
                fileWord(samples[i].real() * gain) == fileWord(sample.real() * gain) &&
                fileWord(samples[i].imag() * gain) == fileWord(sample.imag() * gain);
            QVERIFY2(same, qPrintable(QString("sample %1").arg(i)));
        }
        QVERIFY(std::abs(peak - std::sqrt(literalPeak)) < 1e-12);
        QVERIFY(std::abs(rms - std::sqrt(literalSum / written)) < 1e-12);
    });
}

void TestCreateSignal::refusals()
{
    TempStream stream;
    QVERIFY(stream.open());
    CreateSignal signal;
    int written = 0;
    double rms = 0;
    double peak = 0;
    QVERIFY(!signal.generate());
    signal.setOutput(stream.stream());
    QVERIFY(!signal.generate());
    QVERIFY(signal.configureFunction({}) && signal.generate());
    QVERIFY(signal.statistics(&written, &rms, &peak));
    // A failed configuration takes the old one away, and so does another kind.
    QVERIFY(!signal.configureFunction({.frequency = 99e6}));
    QVERIFY(!signal.statistics(&written, &rms, &peak));
    QCOMPARE(signal.clockRate(), 0.0);
    QVERIFY(signal.configureFunction({}));
    signal.setSignalType(SignalType::Function);
    QVERIFY(!signal.generate());
    QVERIFY(signal.configureFunction({.kind = static_cast<FunctionKind>(4)}) && !signal.generate());
}

void TestCreateSignal::manyCarriersEqualLiteral()
{
    // The literal form of all samples takes minutes, so every 997th is judged.
    CreateSignal signal;
    signal.setSeed(99);
    signal.setSignalType(SignalType::MultiCarrier);
    signal.setMaxClock(6e8);
    const MultiCarrierSettings settings{600, 10000, 0, true};
    QVERIFY(signal.configureMultiCarrier(settings));
    QCOMPARE(signal.sampleCount(), 1000000);
    const std::optional<Made> made = make(signal);
    QVERIFY(made && made->samples.size() == 1000000);
    const Samples &samples = made->samples;

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

void TestCreateSignal::noiseEqualsLiteral()
{
    forRows({{"white", 0}, {"pink", 1}, {"brown", 2}}, [&](int kind) {
        const NoiseSettings settings{static_cast<NoiseKind>(kind), 1e6, 0.01};
        CreateSignal signal;
        signal.setSeed(7);
        signal.setSignalType(SignalType::Noise);
        QVERIFY(signal.configureNoise(settings));
        QCOMPARE(signal.sampleCount(), 15000);
        QCOMPARE(signal.clockRate(), 1.5e6);
        const std::optional<Made> made = make(signal);
        QVERIFY(made && made->samples.size() == 15000);
        const auto &[samples, written, rms, peak] = *made;
        QCOMPARE(written, 15000);

        std::srand(7);
        Samples raw;
        for (const std::complex<double> &value :
             Literal::noise(settings, *fitNoise(settings, ClockLimits{}))) {
            raw.emplace_back(value);
        }
        const auto expected =
            literalResample({.length = 101, .rate = 1.5e6, .cutoff = 0.5e6}, raw, 15000);
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
    });
}

/// Each kind makes its count of samples at its clock, or says why it can't.
void TestCreateSignal::fits()
{
    const QString upper = "The required ARB clock rate exceeds the upper limit. Check settings.";
    const QString lower = "The required ARB clock rate exceeds the lower limit. Check settings.";
    const QString exceeds = "The number of samples exceeds 1e+06. Check settings.";
    const auto function = [](double frequency, bool custom = false, int count = 100) {
        FunctionSettings settings;
        settings.frequency = frequency;
        settings.customOversampling = custom;
        settings.oversampling = count;
        return functionCase("", settings);
    };
    const auto pmCase = [](double frequency) {
        return makeCase("", SignalType::Pm, PmSettings{frequency, 10}, &CreateSignal::configurePm,
                        fitPm, Literal::pm);
    };
    const auto fm = [](double f, double d) { return fmCase("", {FmKind::SingleTone, f, d, 0, 0}); };
    const auto pulse = [](double rise, double resolution) {
        return pulseCase("", {rise, 1e-4, 1e-5, 1e-4, RampKind::Linear, resolution});
    };
    forRows(
        {{"function", function(10e3), 1000, 10e6, ""},
         {"function, limited", function(1e6), 100, 1e8,
          "The number of samples is less than 100. Check settings."},
         {"function, raised", function(100, true, 10), 1000, 1e5, ""},
         {"function, 7 samples", function(12.6e6), 0, 0, upper},
         {"function, no count", function(1e6, true, 0), 0, 0,
          "The signal is shorter than one sample. Check settings."},
         {"carriers", carrierCase("", {10000, 100, 0, true}), 10000, 1e8, ""},
         {"many carriers", carrierCase("", {10, 10000, 0, true}), 2560000, 25.6e6, ""},
         {"pm", pmCase(1e4), 1024, 10.24e6, ""},
         {"pm, too long", pmCase(0.05), 0, 0, exceeds},
         // gcd 5000, 2 and 3 cycles; 1024 samples: periods 512 and 341.33, clock 512 x 10 kHz.
         {"am, two tones", amCase("", {AmKind::TwoTone, 1e4, 100, 15e3, 100}), 1024, 5.12e6, ""},
         {"fm", fm(1000, 10000), 1024, 1.024e6, ""},
         // gcd 100, 4 x 99999 samples.
         {"fm, long", fm(100, 9999900), 399996, 39999600, ""},
         {"fm, no deviation", fm(0.5, 0.5), 0, 0, "Invalid FM configuration."},
         // gcd(gcd(1000, 2000), gcd(10000, 7500)) = 500; 4 x 20 samples at least.
         {"fm, two tones", fmCase("", {FmKind::TwoTone, 1000, 10000, 2000, 7500}), 1024, 512e3, ""},
         {"sweep", sweepCase("", {SweepKind::Linear, 1e5, 0.01, 0, 360}), 8000, 8e5, ""},
         {"pulse", pulse(1e-5, 1e-7), 2200, 1e7, ""},
         {"pulse, too fine", pulse(0, 1e-9), 0, 0, upper},
         {"pulse, too coarse", pulse(0, 1e-4), 0, 0, lower}},
        [](const Case &test, int samples, double clock, const QString &message) {
            CreateSignal signal;
            signal.setMinClock(1e5);
            signal.setMaxClock(1e8);
            QCOMPARE(test.configure(signal), samples > 0);
            QCOMPARE(signal.sampleCount(), samples);
            QVERIFY(std::abs(signal.clockRate() - clock) <= 1e-9 * clock);
            QCOMPARE(takeMessages().join('|'), message);
        });
}

/// Where a value makes no signal, one message says so; where it does, the signal can be made.
void TestCreateSignal::anyNumber()
{
    for (const double value : {0.0, -1000.0, std::nan(""), HUGE_VAL, 1e300, 1e-300}) {
        const std::vector<Case> cases{functionCase("", {.frequency = value}),
                                      functionCase("", {.amplitudeI = value}),
                                      functionCase("", {.offsetQ = value}),
                                      functionCase("", {.phaseQ = value}),
                                      carrierCase("", {.spacing = value}),
                                      carrierCase("", {.offsetI = value}),
                                      carrierCase("", {.carriers = -7}),
                                      carrierCase("", {.carriers = 0x7fffffff}),
                                      pulseCase("", {.riseTime = value}),
                                      pulseCase("", {.onTime = value}),
                                      pulseCase("", {.fallTime = value}),
                                      pulseCase("", {.blankTime = value}),
                                      pulseCase("", {.timeResolution = value}),
                                      chirpCase("", {PulseSettings{}, value}),
                                      fmCase("", {.frequency1 = value}),
                                      fmCase("", {.deviation1 = value}),
                                      fmCase("", {FmKind::TwoTone, 1000, 1000, value, 1000}),
                                      fmCase("", {FmKind::TwoTone, 1000, 1000, 1000, value}),
                                      amCase("", {.frequency1 = value}),
                                      amCase("", {.depth1 = value}),
                                      amCase("", {AmKind::TwoTone, 1000, 100, value, 100}),
                                      amCase("", {AmKind::TwoTone, 1000, 100, 1000, value}),
                                      sweepCase("", {.deviation = value}),
                                      sweepCase("", {.sweepTime = value}),
                                      sweepCase("", {SweepKind::Sine, 1e5, 0.01, value, 0}),
                                      noiseCase("", {NoiseKind::White, value, 0.01}),
                                      noiseCase("", {NoiseKind::White, 1e6, value})};
        TempStream stream;
        QVERIFY(stream.open());
        int refused = 0;
        int made = 0;
        const auto check = [&](CreateSignal &signal, const Case &test) {
            signal.setOutput(stream.stream());
            signal.setSignalType(test.type);
            if (!test.configure(signal)) {
                QCOMPARE(takeMessages(Tracer::Error).size(), 1);
                QCOMPARE(signal.sampleCount(), 0);
                ++refused;
            } else if (signal.sampleCount() <= 1000000) {
                QVERIFY(signal.generate());
                ++made;
            }
            (void)takeMessages();
        };
        for (const Case &test : cases) {
            CreateSignal signal;
            check(signal, test);
        }
        CreateSignal lowest;
        lowest.setMinClock(value);
        check(lowest, functionCase("", {}));
        CreateSignal highest;
        highest.setMaxClock(value);
        check(highest, functionCase("", {}));
        QVERIFY(refused > 5);
        QCOMPARE(made > 2, std::isfinite(value));
    }
}

void TestCreateSignal::cancelAndFullDisk()
{
    // As many samples as can be asked for: nobody waits for their end.
    for (const bool carriers : {false, true}) {
        EndlessDevice device;
        BufferedIO stream;
        QVERIFY(stream.initBuf(&device, BufferedIO::ReadWrite));
        CreateSignal signal;
        signal.setMaxClock(1e12);
        signal.setSignalType(carriers ? SignalType::MultiCarrier : SignalType::Function);
        QVERIFY(carriers ? signal.configureMultiCarrier({.spacing = 1, .carriers = 0x7fffff})
                         : signal.configureFunction({.frequency = 1,
                                                     .customOversampling = true,
                                                     .oversampling = 0x7fffffff}));
        signal.setOutput(&stream);
        int ticks = 0;
        connect(&signal, &CreateSignal::ProgressUpdate, &signal, [&] {
            ++ticks;
            signal.cancel();
        });
        signal.cancel(); // before the start it means nothing
        QVERIFY(!signal.generate());
        QCOMPARE(ticks, 1);
        QCOMPARE(takeMessages(), QStringList{"*** User break."});
    }
    EndlessDevice device(1000);
    BufferedIO stream(100'000);
    QVERIFY(stream.initBuf(&device, BufferedIO::ReadWrite));
    CreateSignal signal;
    signal.setOutput(&stream);
    QVERIFY(signal.configureFunction(
        {.frequency = 10, .customOversampling = true, .oversampling = 50'000}));
    QVERIFY(!signal.generate());
    QCOMPARE(takeMessages(), QStringList{"*** Cannot write to output file."});
}

QTEST_GUILESS_MAIN(TestCreateSignal)
#include "tst_createsignal.moc"
