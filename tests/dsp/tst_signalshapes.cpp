// SPDX-License-Identifier: Apache-2.0
// The signals against what the textbooks say of them, not against the code's own formulas.
#include "dsp/CreateSignal.h"
#include "dsp/fft.h"
#include "dsp/signalgenerators.h"
#include "stream_helpers.h"
#include "support/rows.h"

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
    void fmLinesAreBessel();
    void sidebands();
    void noiseBand();
    void noiseSlope();
    void codedPulse();

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

void TestSignalShapes::fmLinesAreBessel()
{
    forRows({{"index 2", 1000.0, 2000.0}, {"index 10", 1000.0, 10000.0}}, [&](double frequency,
                                                                              double deviation) {
        const Samples samples = make(SignalType::Fm, &CreateSignal::configureFm,
                                     {FmKind::SingleTone, frequency, deviation, 0, 0});
        const double index =
            fmIndex(frequency, deviation, m_clock); // deviation / frequency, nearly
        QVERIFY(std::abs(index - deviation / frequency) < 0.01 * index);
        const int cycles = static_cast<int>(
            std::lround(frequency * static_cast<double>(samples.size()) / m_clock));
        for (int k = 0; k <= 12; ++k) {
            const double expected = std::cyl_bessel_j(static_cast<double>(k), index);
            QVERIFY(std::abs(std::abs(lineOf(samples, k * cycles)) - std::abs(expected)) < 1e-6);
            QVERIFY(std::abs(std::abs(lineOf(samples, -k * cycles)) - std::abs(expected)) < 1e-6);
        }
    });
}

void TestSignalShapes::sidebands()
{
    forRows(
        {// Depth 50 %. A pair of carriers of the level c in I and Q makes a line of c sqrt(2).
         {"usb", 2, 0.0, 0.0, 0.5 * 0.707},
         {"lsb+c", 3, 0.25 * 0.707, 0.5 * 0.707 * std::sqrt(2.0), 0.0},
         {"lsb+usb", 5, 0.125, 0.0, 0.125}},
        [&](int kind, double lower, double carrier, double upper) {
            const Samples samples = make(SignalType::Am, &CreateSignal::configureAm,
                                         {static_cast<AmKind>(kind), 10000, 50, 0, 0});
            QVERIFY(std::abs(std::abs(lineOf(samples, -1)) - lower) < 1e-6);
            QVERIFY(std::abs(std::abs(lineOf(samples, 0)) - carrier) < 1e-6);
            QVERIFY(std::abs(std::abs(lineOf(samples, 1)) - upper) < 1e-6);
        });
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

void TestSignalShapes::noiseSlope()
{
    // dB in an octave
    forRows({{"white", 0, 0.0}, {"pink", 1, -3.01}, {"brown", 2, -6.02}},
            [&](int kind, double slope) {
                const Samples samples =
                    make(SignalType::Noise, &CreateSignal::configureNoise,
                         NoiseSettings{static_cast<NoiseKind>(kind), 1e6, 262144.5 / 1.5e6});
                QCOMPARE(samples.size(), size_t{262144});
                // Bins 32 to 65536, a quarter of the clock. The step at the junction of brown
                // noise, and the rounding of its sum's spectrum near half the clock, bend its ends
                // a little.
                const std::vector<double> levels = octaveLevels(samples, 10);
                QCOMPARE(levels.size(), size_t{10});
                const double measured = (levels[9] - levels[2]) / 7;
                QVERIFY2(std::abs(measured - slope) < 0.25, qPrintable(QString::number(measured)));
            });
}

void TestSignalShapes::codedPulse()
{
    // At 1 MHz: rise 2, on 28, fall 2, transitions of 4: symbols of (28 + 4) / 4 = 8 samples. The
    // transition of a symbol fills its last 4 samples, and the fall cuts off the last one's.
    PulseRecord record;
    record.kind = PulseKind::Coded;
    record.pulse = {2e-6, 28e-6, 2e-6, 4e-6, RampKind::Linear, 1e-6};
    record.pattern = "1101";
    record.transitionTime = 4e-6;
    SignalFit fit;
    fit.clock = 1e6;
    fit.samples = 36;
    auto generator = makePulse(record, fit);
    QVERIFY(generator != nullptr);
    std::vector<double> inPhase(36);
    std::vector<double> q(36);
    // In two pieces, as a stream would be.
    generator->fill(0, std::span(inPhase).first(11), std::span(q).first(11));
    generator->fill(11, std::span(inPhase).subspan(11), std::span(q).subspan(11));
    const std::vector<double> expected{
        0,   0.5,                             // rise
        1,   1,   1,   1,  1,  1,    1, 1,    // equal symbols have no transition between them
        1,   1,   1,   1,  1,  0.5,  0, -0.5, // from +1 to -1 in steps of 2 / 4
        -1,  -1,  -1,  -1, -1, -0.5, 0, 0.5,  1, 1, 1, 1, // the last symbol has no next one
        1,   0.5,                                         // fall
        0.5, 0.5, 0.5, 0.5};                              // the last value stays
    QCOMPARE(q, expected);
    QCOMPARE(inPhase, std::vector<double>(36));
}

QTEST_GUILESS_MAIN(TestSignalShapes)
#include "tst_signalshapes.moc"
