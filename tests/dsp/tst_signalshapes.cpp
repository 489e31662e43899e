// SPDX-License-Identifier: Apache-2.0
// The signals against what the textbooks say of them, not against the code's own formulas.
#include "dsp/CreateSignal.h"

#include "dsp/fft.h"
#include "stream_helpers.h"

#include <QTest>

#include <numbers>

using std::numbers::pi;
using Complex = std::complex<double>;

namespace {

/// The level of one line of a signal that is taken as a loop: the direct sum.
Complex lineOf(const Samples &samples, int cycles)
{
    Complex sum = 0;
    for (size_t i = 0; i < samples.size(); ++i) {
        const auto turns = static_cast<double>(static_cast<qint64>(i) * cycles %
                                               static_cast<qint64>(samples.size()));
        sum += Complex(samples[i]) *
               std::polar(1.0, -2 * pi * turns / static_cast<double>(samples.size()));
    }
    return sum / static_cast<double>(samples.size());
}

/// The phase of a sum of sines over samples, m = 0 to i, swings by 1 / (2 sin(w / 2)) instead of
/// the 1 / w of the integral, w being the angle from sample to sample.
double fmIndex(double frequency, double deviation, double clock)
{
    return pi * deviation / clock / std::sin(pi * frequency / clock);
}

/// Phase from sample to sample, without jumps, starting with that of the first one.
std::vector<double> unwrapped(const Samples &samples)
{
    std::vector<double> phases;
    double phase = 0;
    Complex last = 1;
    for (const std::complex<float> &sample : samples) {
        phase += std::arg(Complex(sample) * std::conj(last));
        last = Complex(sample);
        phases.push_back(phase);
    }
    return phases;
}

/// Power of a noise in bands of one octave from bin 32 on, per bin, in dB.
std::vector<double> octaveLevels(const Samples &samples, int octaves)
{
    std::vector<Complex> in(samples.begin(), samples.end());
    std::vector<Complex> out(in.size());
    std::vector<double> levels;
    if (!fft(in, out)) {
        return levels;
    }
    for (size_t first = 32; static_cast<int>(levels.size()) < octaves; first *= 2) {
        double power = 0;
        for (size_t k = first; k < 2 * first; ++k) {
            power += std::norm(out[k]) + std::norm(out[out.size() - k]);
        }
        levels.push_back(10 * std::log10(power / static_cast<double>(first)));
    }
    return levels;
}

} // namespace

class TestSignalShapes : public QObject
{
    Q_OBJECT

private slots:
    void sineIsOneLine();
    void fmLinesAreBessel_data();
    void fmLinesAreBessel();
    void twoToneFmHasBothTones();
    void pmDeviation();
    void amDepth();
    void sidebands_data();
    void sidebands();
    void twoToneAm();
    void linearSweepPhase();
    void sineSweepFrequency();
    void chirpPhase();
    void carriersAreEven_data();
    void carriersAreEven();
    void noiseBand();
    void noiseSlope_data();
    void noiseSlope();
    void loopsHaveNoStep();

private:
    template <typename Settings>
    Samples make(SignalType type, bool (CreateSignal::*configure)(const Settings &),
                 const Settings &settings)
    {
        TempStream stream;
        CreateSignal signal;
        signal.setSeed(3);
        signal.setSignalType(type);
        const bool configured = (signal.*configure)(settings);
        signal.setOutput(stream.stream());
        m_clock = signal.clockRate();
        return stream.open() && configured && signal.generate() ? readStream(*stream.stream())
                                                                : Samples{};
    }

    double m_clock = 0; ///< of the last signal made, Hz
};

void TestSignalShapes::sineIsOneLine()
{
    // I = A sin, Q = A cos: one line at minus one cycle, and the offsets at zero.
    const Samples samples = make(
        SignalType::Function, &CreateSignal::configureFunction,
        {.amplitudeI = 0.5, .amplitudeQ = 0.5, .offsetI = 0.25, .offsetQ = -0.125, .phaseQ = 90});
    QVERIFY(std::abs(lineOf(samples, -1) - Complex(0, 0.5)) < 1e-7);
    QVERIFY(std::abs(lineOf(samples, 1)) < 1e-7);
    QVERIFY(std::abs(lineOf(samples, 0) - Complex(0.25, -0.125)) < 1e-7);
}

void TestSignalShapes::fmLinesAreBessel_data()
{
    QTest::addColumn<double>("frequency");
    QTest::addColumn<double>("deviation");
    QTest::newRow("index 2") << 1000.0 << 2000.0;
    QTest::newRow("index 10") << 1000.0 << 10000.0;
    QTest::newRow("index 0.5") << 2000.0 << 1000.0;
}

void TestSignalShapes::fmLinesAreBessel()
{
    QFETCH(double, frequency);
    QFETCH(double, deviation);
    const Samples samples = make(SignalType::Fm, &CreateSignal::configureFm,
                                 {FmKind::SingleTone, frequency, deviation, 0, 0});
    const double index = fmIndex(frequency, deviation, m_clock); // deviation / frequency, nearly
    QVERIFY(std::abs(index - deviation / frequency) < 0.01 * index);
    const int cycles =
        static_cast<int>(std::lround(frequency * static_cast<double>(samples.size()) / m_clock));
    for (int k = 0; k <= 12; ++k) {
        const double expected = std::cyl_bessel_j(static_cast<double>(k), index);
        QVERIFY(std::abs(std::abs(lineOf(samples, k * cycles)) - std::abs(expected)) < 1e-6);
        QVERIFY(std::abs(std::abs(lineOf(samples, -k * cycles)) - std::abs(expected)) < 1e-6);
    }
}

void TestSignalShapes::twoToneFmHasBothTones()
{
    // Line (m, n) lies at m f1 + n f2 with the level 0.5 |J_m(b1) J_n(b2)|. With f1 = 10 and f2 =
    // 13 units, no other pair of small orders falls on the lines looked at.
    const Samples samples = make(SignalType::Fm, &CreateSignal::configureFm,
                                 {FmKind::TwoTone, 10000, 5000, 13000, 9100});
    const double index1 = fmIndex(10000, 5000, m_clock);
    const double index2 = fmIndex(13000, 9100, m_clock);
    for (int m = 0; m <= 2; ++m) {
        for (int n = 0; n <= 2; ++n) {
            const double expected = 0.5 * std::cyl_bessel_j(static_cast<double>(m), index1) *
                                    std::cyl_bessel_j(static_cast<double>(n), index2);
            const int cycles = static_cast<int>(std::lround(
                (m * 10000.0 + n * 13000.0) * static_cast<double>(samples.size()) / m_clock));
            QVERIFY(std::abs(std::abs(lineOf(samples, cycles)) - expected) < 1e-6);
        }
    }
}

void TestSignalShapes::pmDeviation()
{
    const Samples samples =
        make(SignalType::Pm, &CreateSignal::configurePm, PmSettings{10000, 120});
    const std::vector<double> phases = unwrapped(samples);
    const auto [lowest, highest] = std::minmax_element(phases.begin(), phases.end());
    QVERIFY(std::abs(*highest - 120 * pi / 180) < 1e-5);
    QVERIFY(std::abs(*lowest + 120 * pi / 180) < 1e-5);
    for (int k = 0; k <= 6; ++k) {
        const double expected = 0.707 * std::cyl_bessel_j(static_cast<double>(k), 120 * pi / 180);
        QVERIFY(std::abs(std::abs(lineOf(samples, k)) - std::abs(expected)) < 1e-6);
    }
}

void TestSignalShapes::amDepth()
{
    for (const double depth : {0.0, 30.0, 100.0}) {
        const Samples samples =
            make(SignalType::Am, &CreateSignal::configureAm, {AmKind::Regular, 10000, depth, 0, 0});
        float lowest = 1;
        float highest = 0;
        for (const std::complex<float> &sample : samples) {
            lowest = std::min(lowest, sample.real());
            highest = std::max(highest, sample.real());
            QCOMPARE(sample.imag(), 0.0F);
        }
        QVERIFY(std::abs((highest - lowest) / (highest + lowest) - depth / 100) < 1e-5);
    }
}

void TestSignalShapes::sidebands_data()
{
    QTest::addColumn<int>("kind");
    QTest::addColumn<double>("lower");
    QTest::addColumn<double>("carrier");
    QTest::addColumn<double>("upper");
    // Depth 50 %. A pair of carriers of the level c in I and Q makes a line of c sqrt(2).
    QTest::newRow("lsb") << 1 << 0.5 * 0.707 << 0.0 << 0.0;
    QTest::newRow("usb") << 2 << 0.0 << 0.0 << 0.5 * 0.707;
    QTest::newRow("lsb+c") << 3 << 0.25 * 0.707 << 0.5 * 0.707 * std::sqrt(2.0) << 0.0;
    QTest::newRow("usb+c") << 4 << 0.0 << 0.5 * 0.707 * std::sqrt(2.0) << 0.25 * 0.707;
    QTest::newRow("lsb+usb") << 5 << 0.125 << 0.0 << 0.125;
}

void TestSignalShapes::sidebands()
{
    QFETCH(int, kind);
    QFETCH(double, lower);
    QFETCH(double, carrier);
    QFETCH(double, upper);
    const Samples samples = make(SignalType::Am, &CreateSignal::configureAm,
                                 {static_cast<AmKind>(kind), 10000, 50, 0, 0});
    QVERIFY(std::abs(std::abs(lineOf(samples, -1)) - lower) < 1e-6);
    QVERIFY(std::abs(std::abs(lineOf(samples, 0)) - carrier) < 1e-6);
    QVERIFY(std::abs(std::abs(lineOf(samples, 1)) - upper) < 1e-6);
}

void TestSignalShapes::twoToneAm()
{
    // 10 and 15 kHz: 2 and 3 cycles in 1024 samples. Tone 1 is I sin, Q sin a quarter behind: the
    // upper line of the sine's convention, exp(j x) / j; tone 2 is its mirror.
    const Samples samples = make(SignalType::Am, &CreateSignal::configureAm,
                                 {AmKind::TwoToneNoCarrier, 1e4, 80, 15e3, 40});
    QCOMPARE(samples.size(), size_t{1024});
    QVERIFY(std::abs(std::abs(lineOf(samples, 2)) - 0.8 * 0.707 * 0.5) < 1e-6);
    QVERIFY(std::abs(lineOf(samples, -2)) < 1e-6);
    QVERIFY(std::abs(std::abs(lineOf(samples, -3)) - 0.4 * 0.707 * 0.5) < 1e-6);
    QVERIFY(std::abs(lineOf(samples, 3)) < 1e-6);
    const Samples carrier =
        make(SignalType::Am, &CreateSignal::configureAm, {AmKind::TwoTone, 1e4, 80, 15e3, 40});
    QVERIFY(std::abs(lineOf(carrier, 0) - Complex(1, 1) / 9.0) < 1e-6);
    QVERIFY(std::abs(std::abs(lineOf(carrier, 2)) - 0.8 / 9) < 1e-6);
}

void TestSignalShapes::linearSweepPhase()
{
    const double deviation = 1e5;
    const Samples samples = make(SignalType::FmSweep, &CreateSignal::configureSweep,
                                 {SweepKind::Linear, deviation, 0.01, 0, 360});
    QCOMPARE(samples.size(), size_t{8000});
    const std::vector<double> phases = unwrapped(samples);
    // The sum of D m / N - D / 2 for m = 0 to i, in cycles of the clock.
    for (size_t i = 0; i < phases.size(); ++i) {
        const auto n = static_cast<double>(i);
        const double cycles = (n * (n + 1) / 2 / 8000 - (n + 1) / 2) * deviation / m_clock;
        QVERIFY(std::abs(phases[i] - 2 * pi * cycles) < 1e-5);
    }
}

void TestSignalShapes::sineSweepFrequency()
{
    const Samples samples = make(SignalType::FmSweep, &CreateSignal::configureSweep,
                                 {SweepKind::Sine, 1e5, 0.01, 90, 450});
    for (size_t i = 1; i < samples.size(); ++i) {
        const double step = std::arg(Complex(samples[i]) * std::conj(Complex(samples[i - 1])));
        const double expected = 5e4 * std::cos(2 * pi * static_cast<double>(i) / 8000);
        QVERIFY(std::abs(step * m_clock / (2 * pi) - expected) < 0.1);
    }
    const Samples triangle = make(SignalType::FmSweep, &CreateSignal::configureSweep,
                                  {SweepKind::Triangular, 1e5, 0.01, 0, 360});
    const auto frequencyAt = [&](size_t i) {
        return std::arg(Complex(triangle[i]) * std::conj(Complex(triangle[i - 1]))) * m_clock /
               (2 * pi);
    };
    QVERIFY(std::abs(frequencyAt(1000) - 2.5e4) < 0.1); // half way up
    QVERIFY(std::abs(frequencyAt(2000) - 5e4) < 0.1);
    QVERIFY(std::abs(frequencyAt(6000) + 5e4) < 0.1);
}

void TestSignalShapes::chirpPhase()
{
    const PulseSettings pulse{1e-5, 1e-4, 1e-5, 1e-4, RampKind::RaisedCosine, 1e-7};
    const double range = 1e6;
    const Samples samples =
        make(SignalType::Pulse, &CreateSignal::configureChirp, ChirpSettings{pulse, range});
    QCOMPARE(samples.size(), size_t{2200});
    const int width = 1200;
    Samples inside(samples.begin() + 1, samples.begin() + width - 1);
    const std::vector<double> phases = unwrapped(inside);
    for (size_t i = 0; i < phases.size(); ++i) {
        const auto n = static_cast<double>(i + 1);
        const double cycles = (n * (n + 1) / 2 / width - (n + 1) / 2) * range / m_clock;
        QVERIFY(std::abs(phases[i] - 2 * pi * cycles) < 1e-4);
    }
    QVERIFY(std::abs(std::abs(samples[50]) - 0.5) < 1e-6); // half way up the cosine ramp
    QVERIFY(std::abs(std::abs(samples[600]) - 1.0) < 1e-6);
    for (size_t i = width; i < samples.size(); ++i) {
        QCOMPARE(samples[i], std::complex<float>(0));
    }
}

void TestSignalShapes::carriersAreEven_data()
{
    QTest::addColumn<int>("carriers");
    QTest::newRow("10") << 10;
    QTest::newRow("128") << 128;
    QTest::newRow("250") << 250;
}

void TestSignalShapes::carriersAreEven()
{
    QFETCH(int, carriers);
    const Samples samples = make(SignalType::MultiCarrier, &CreateSignal::configureMultiCarrier,
                                 {10000, carriers, 0.125, true});
    const int half = carriers / 2;
    for (int k = 1; k <= half; ++k) {
        // A sine has half of its level on each side.
        QVERIFY(std::abs(std::abs(lineOf(samples, k)) - 0.5 / half) < 1e-7);
        QVERIFY(std::abs(std::abs(lineOf(samples, -k)) - 0.5 / half) < 1e-7);
    }
    QVERIFY(std::abs(lineOf(samples, 0) - 0.125) < 1e-7);
    QVERIFY(std::abs(lineOf(samples, half + 1)) < 1e-7);
    if (half > 65) {
        // Carriers 64 apart have the same phase, neighbours hardly ever.
        const double first = std::arg(lineOf(samples, 1));
        QVERIFY(std::abs(std::remainder(std::arg(lineOf(samples, 65)) - first, 2 * pi)) < 1e-4);
        QVERIFY(std::abs(std::remainder(std::arg(lineOf(samples, 2)) - first, 2 * pi)) > 1e-3);
    }
}

void TestSignalShapes::noiseBand()
{
    // 16384 samples at 1.5 times the bandwidth: the band is +-1/3 of the clock. As the filter runs
    // round the loop, the transform of the whole signal shows no leakage.
    const double bandwidth = 1e6;
    const Samples samples =
        make(SignalType::Noise, &CreateSignal::configureNoise,
             NoiseSettings{NoiseKind::White, bandwidth, 16384.5 / (1.5 * bandwidth)});
    QCOMPARE(samples.size(), size_t{16384});
    std::vector<Complex> in(samples.begin(), samples.end());
    std::vector<Complex> out(in.size());
    QVERIFY(fft(in, out));
    const auto meanPower = [&](double from, double to) {
        double sum = 0;
        int count = 0;
        for (int k = static_cast<int>(from * 16384); k < static_cast<int>(to * 16384); ++k) {
            sum += std::norm(out[static_cast<size_t>(k)]) +
                   std::norm(out[static_cast<size_t>(16383 - k)]);
            count += 2;
        }
        return 10 * std::log10(sum / count);
    };
    const double inner = meanPower(0.01, 0.10);
    QVERIFY(std::abs(meanPower(0.10, 0.20) - inner) < 0.5);
    QVERIFY(std::abs(meanPower(0.20, 0.30) - inner) < 0.5);
    QVERIFY(meanPower(0.38, 0.49) < inner - 60);
    QVERIFY(std::abs(meanPower(0.328, 0.338) - inner + 4.5) < 3); // the edge, -6 dB in its middle
}

void TestSignalShapes::noiseSlope_data()
{
    QTest::addColumn<int>("kind");
    QTest::addColumn<double>("slope"); // dB in an octave
    QTest::newRow("white") << 0 << 0.0;
    QTest::newRow("pink") << 1 << -3.01;
    QTest::newRow("brown") << 2 << -6.02;
}

void TestSignalShapes::noiseSlope()
{
    QFETCH(int, kind);
    QFETCH(double, slope);
    const Samples samples =
        make(SignalType::Noise, &CreateSignal::configureNoise,
             NoiseSettings{static_cast<NoiseKind>(kind), 1e6, 262144.5 / 1.5e6});
    QCOMPARE(samples.size(), size_t{262144});
    // Bins 32 to 65536, a quarter of the clock. The step at the junction of brown noise, and the
    // rounding of its sum's spectrum near half the clock, bend its ends a little.
    const std::vector<double> levels = octaveLevels(samples, 10);
    QCOMPARE(levels.size(), size_t{10});
    const double measured = (levels[9] - levels[2]) / 7;
    QVERIFY2(std::abs(measured - slope) < 0.25, qPrintable(QString::number(measured)));
}

void TestSignalShapes::loopsHaveNoStep()
{
    // The step over the junction is no longer than the longest one inside.
    const auto check = [](const Samples &samples) {
        QVERIFY(samples.size() > 100);
        float longest = 0;
        for (size_t i = 1; i < samples.size(); ++i) {
            longest = std::max(longest, std::abs(samples[i] - samples[i - 1]));
        }
        QVERIFY(std::abs(samples.front() - samples.back()) <= 1.01F * longest);
    };
    check(make(SignalType::Function, &CreateSignal::configureFunction,
               FunctionSettings{FunctionKind::Sine, 7777}));
    check(make(SignalType::Function, &CreateSignal::configureFunction,
               FunctionSettings{FunctionKind::Triangular, 7777}));
    check(make(SignalType::Fm, &CreateSignal::configureFm,
               FmSettings{FmKind::TwoTone, 1000, 9000, 3500, 777000}));
    check(make(SignalType::Pm, &CreateSignal::configurePm, PmSettings{12345, 90}));
    check(make(SignalType::Am, &CreateSignal::configureAm,
               AmSettings{AmKind::TwoTone, 10000, 100, 15000, 100}));
    check(make(SignalType::MultiCarrier, &CreateSignal::configureMultiCarrier,
               MultiCarrierSettings{10000, 333, 0, true}));
    check(make(SignalType::FmSweep, &CreateSignal::configureSweep,
               SweepSettings{SweepKind::Sine, 1e5, 0.01, 0, 360}));
    check(make(SignalType::Noise, &CreateSignal::configureNoise,
               NoiseSettings{NoiseKind::White, 1e6, 0.1}));
}

QTEST_GUILESS_MAIN(TestSignalShapes)
#include "tst_signalshapes.moc"
