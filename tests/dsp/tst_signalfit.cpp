// SPDX-License-Identifier: Apache-2.0
#include "dsp/CreateSignal.h"
#include "support/rows.h"

#include "signal_cases.h"
#include "stream_helpers.h"

#include <QTest>

class TestSignalFit : public QObject
{
    Q_OBJECT

private slots:
    void init() { (void)takeMessages(); }
    void fits();
    void refusals();
};

void TestSignalFit::fits()
{
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
    const auto pmCase = [](double frequency) {
        return makeCase("", SignalType::Pm, PmSettings{frequency, 10}, &CreateSignal::configurePm,
                        fitPm, Literal::pm);
    };
    const PulseSettings pulse{1e-5, 1e-4, 1e-5, 1e-4, RampKind::Linear, 1e-7};
    const auto noiseCase = [](double bandwidth, double duration) {
        return makeCase("", SignalType::Noise, NoiseSettings{NoiseKind::White, bandwidth, duration},
                        &CreateSignal::configureNoise, fitNoise, Literal::noise);
    };
    forRows(
        {{"function", function(10e3), 1e5, 1e8, 1000, 10e6, {}},
         {"function, limited", function(1e6), 1e5, 1e8, 100, 1e8, fewer(100)},
         {"function, raised", function(100, true, 10), 1e5, 1e8, 1000, 1e5, {}},
         {"function, 7 samples", function(12.6e6), 1e5, 1e8, 0, 0, upper},
         {"function, above a million", function(100, true, 2000000), 1e5, 6e8, 2000000, 2e8, {}},
         {"function, no count", function(1e6, true, 0), 1e5, 1e8, 0, 0,
          "The signal is shorter than one sample. Check settings."},
         {"carriers", carrierCase("", {10000, 100, 0, true}), 1e5, 1e8, 10000, 1e8, {}},
         {"carriers, no sample limit",
          carrierCase("", {10, 10000, 0, true}),
          1e5,
          1e8,
          2560000,
          25.6e6,
          {}},
         {"pm", pmCase(1e4), 1e5, 1e8, 1024, 10.24e6, {}},
         {"pm, too long", pmCase(0.05), 1e5, 1e8, 0, 0, exceeds},
         // gcd 5000, 2 and 3 cycles; 1024 samples: periods 512 and 341.33, clock 512 x 10 kHz.
         {"am, two tones",
          amCase("", {AmKind::TwoTone, 1e4, 100, 15e3, 100}),
          1e5,
          1e8,
          1024,
          5.12e6,
          {}},
         {"fm", fmCase("", {FmKind::SingleTone, 1000, 10000, 0, 0}), 1e5, 1e8, 1024, 1.024e6, {}},
         // gcd 100, 4 x 99999 samples.
         {"fm, long",
          fmCase("", {FmKind::SingleTone, 100, 9999900, 0, 0}),
          1e5,
          1e8,
          399996,
          39999600,
          {}},
         {"fm, no deviation", fmCase("", {FmKind::SingleTone, 0.5, 0.5, 0, 0}), 1e5, 1e8, 0, 0,
          "Invalid FM configuration."},
         // gcd(gcd(1000, 2000), gcd(10000, 7500)) = 500; 4 x 20 samples at least.
         {"fm, two tones",
          fmCase("", {FmKind::TwoTone, 1000, 10000, 2000, 7500}),
          1e5,
          1e8,
          1024,
          512e3,
          {}},
         {"sweep", sweepCase("", {SweepKind::Linear, 1e5, 0.01, 0, 360}), 1e5, 1e8, 8000, 8e5, {}},
         {"pulse", pulseCase("", pulse), 1e5, 1e8, 2200, 1e7, {}},
         {"pulse, too fine", pulseCase("", {0, 1e-4, 0, 0, RampKind::Linear, 1e-9}), 1e5, 1e8, 0, 0,
          upper},
         {"pulse, too coarse", pulseCase("", {0, 1e-4, 0, 0, RampKind::Linear, 1e-4}), 1e5, 1e8, 0,
          0, lower},
         {"noise", noiseCase(1e6, 0.01), 1e5, 1e8, 15000, 1.5e6, {}}},
        [](const Case &test, double minClock, double maxClock, int samples, double clock,
           const QString &message) {
            CreateSignal signal;
            signal.setMinClock(minClock);
            signal.setMaxClock(maxClock);
            QCOMPARE(test.configure(signal), samples > 0);
            QCOMPARE(signal.sampleCount(), samples);
            QVERIFY(std::abs(signal.clockRate() - clock) <= 1e-9 * clock);
            QCOMPARE(takeMessages(), message.isEmpty() ? QStringList{} : QStringList{message});
        });
}

void TestSignalFit::refusals()
{
    forRows(
        {{"zero", 0.0},
         {"negative", -1000.0},
         {"NaN", std::nan("")},
         {"infinite", HUGE_VAL},
         {"enormous", 1e300},
         {"tiny", 1e-300}},
        [&](double value) {
            // Where such a value makes no signal, one message says so; where it does, it can be
            // made.
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
        });
}

QTEST_GUILESS_MAIN(TestSignalFit)
#include "tst_signalfit.moc"
