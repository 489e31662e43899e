// SPDX-License-Identifier: Apache-2.0
#include "dsp/CreateSignal.h"

#include "signal_cases.h"
#include "stream_helpers.h"

#include <QTest>

class TestSignalFit : public QObject
{
    Q_OBJECT

private slots:
    void init() { (void)Tracer::takeEntries(); }
    void fits_data();
    void fits();
    void refusals_data();
    void refusals();
};

void TestSignalFit::fits_data()
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

void TestSignalFit::fits()
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

void TestSignalFit::refusals_data()
{
    QTest::addColumn<double>("value");
    QTest::newRow("zero") << 0.0;
    QTest::newRow("negative") << -1000.0;
    QTest::newRow("NaN") << std::nan("");
    QTest::newRow("infinite") << HUGE_VAL;
    QTest::newRow("enormous") << 1e300;
    QTest::newRow("tiny") << 1e-300;
}

void TestSignalFit::refusals()
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

QTEST_GUILESS_MAIN(TestSignalFit)
#include "tst_signalfit.moc"
