// SPDX-License-Identifier: Apache-2.0
#include "dsp/fft.h"
#include "dsp/vectormath.h"
#include "dsp/windows.h"
#include "support/rows.h"

#include <QTest>

#include <cmath>
#include <numbers>
#include <random>

using Complex = std::complex<double>;
using std::numbers::pi;

namespace {

std::vector<Complex> randomSamples(std::size_t n)
{
    std::mt19937 generator(static_cast<unsigned>(n));
    std::uniform_real_distribution<double> level(-1.0, 1.0);
    std::vector<Complex> samples(n);
    for (Complex &sample : samples) {
        sample = {level(generator), level(generator)};
    }
    return samples;
}

/// The definition, summed in extended precision.
Complex directBin(const std::vector<Complex> &x, std::size_t k)
{
    long double re = 0;
    long double im = 0;
    const std::size_t n = x.size();
    for (std::size_t i = 0; i < n; ++i) {
        const long double angle = -2 * std::numbers::pi_v<long double> *
                                  static_cast<long double>(k * i % n) / static_cast<long double>(n);
        re += x[i].real() * std::cos(angle) - x[i].imag() * std::sin(angle);
        im += x[i].real() * std::sin(angle) + x[i].imag() * std::cos(angle);
    }
    return {static_cast<double>(re), static_cast<double>(im)};
}

/// The error in units of the last place of the exact value.
double unitsOff(double value, long double exact)
{
    const double nearest = std::abs(static_cast<double>(exact));
    const double unit = std::nextafter(nearest, HUGE_VAL) - nearest;
    return static_cast<double>(std::abs(static_cast<long double>(value) - exact)) / unit;
}

} // namespace

class TestKernels : public QObject
{
    Q_OBJECT

private slots:
    void fftEqualsDirectSum();
    void windowsFollowTheirRows();
    void sinesAreExact();
    void sinesOfNoNumber();
};

void TestKernels::fftEqualsDirectSum()
{
    // Above 131072 twiddles aren't kept any more; there a few bins are enough.
    for (std::size_t n = 1; n <= 262144; n *= n < 4096 ? 2 : 64) {
        const std::vector<Complex> in = randomSamples(n);
        std::vector<Complex> out(n);
        QVERIFY(fft(in, out));
        // The twiddle recurrence loses about one unit in the last place a step; the sum of n
        // samples of unit size has a length of about sqrt(n).
        const auto size = static_cast<double>(n);
        const double bound = 1e-15 * std::sqrt(size) * (4.0 + std::log2(size)) * 8;
        for (std::size_t k = 0; k < n; k += std::max<std::size_t>(1, n > 4096 ? n / 5 : n / 64)) {
            QVERIFY2(std::abs(out[k] - directBin(in, k)) <= bound,
                     qPrintable(QString("%1 of %2").arg(k).arg(n)));
        }
    }
    const std::vector<Complex> three = randomSamples(3);
    std::vector<Complex> out(3, Complex(7, 7));
    QVERIFY(!fft(three, out) && !fftCentred(three, out) && !fft({}, {}));
    QVERIFY(!fft(std::span(three).first(2), out));
    QCOMPARE(out[0], Complex(7, 7));
}

void TestKernels::windowsFollowTheirRows()
{
    // sum of a[j] (-1)^j, the value at n / 2
    // sum of a[j], the value at 0
    // a0: all cosines have whole periods
    forRows(
        {{"None", 0, 1.0, 1.0, 1.0},
         {"Rife Vincent", 1, 1.0, 0.0, 0.375},
         {"Hann", 2, 1.0, 0.0, 0.5},
         {"Hanning", 3, 1.0, 0.07672, 0.53836},
         {"Blackmann", 4, 1.0, 0.0, 0.42},
         {"Bl. Harris", 5, 1.0, 0.0 + 0.35875 - 0.48829 + 0.14128 - 0.01168, 0.35875},
         {"Flat Top", 6, 0.9999944, 0.0069394 + 0.215508 - 0.41593 + 0.278 - 0.083617, 0.215508},
         {"9 is 0", 9, 1.0, 1.0, 1.0}},
        [&](int kind, double top, double bottom, double mean) {
            constexpr int n = 96;
            const std::vector<double> window = windowList(n, kind);
            QCOMPARE(window.size(), static_cast<std::size_t>(n));
            QVERIFY(std::abs(window[n / 2] - top) < 1e-6);
            QVERIFY(std::abs(window[0] - bottom) < 1e-12);
            double sum = 0;
            for (const double value : window) {
                sum += value;
            }
            QVERIFY(std::abs(sum / n - mean) < 1e-12);
            // Periodic, not symmetric: w(i) equals w(n - i).
            QVERIFY(std::abs(window[1] - window[n - 1]) < 1e-12);
            std::vector<Complex> samples(n, Complex(2, -3));
            QVERIFY(applyWindow(samples, kind));
            QCOMPARE(samples[5], Complex(2 * window[5], -3 * window[5]));
        });
    // A kept window must not serve another length.
    std::vector<Complex> four(4, 1.0);
    QVERIFY(applyWindow(four, 2));
    QCOMPARE(four[2].real(), windowList(4, 2)[2]);
    QVERIFY(!applyWindow({}, 1));
}

void TestKernels::sinesAreExact()
{
    forRows({{"largest reduced", 1.342e8, 1.3421772e8},
             {"beyond", 1e12, 1.000001e12},
             {"next to 1000 turns", 6283.1853, 6283.1854}},
            [&](double from, double to) {
                std::mt19937 generator(5);
                std::uniform_real_distribution<double> angle(from, to);
                std::vector<double> angles(20000);
                std::generate(angles.begin(), angles.end(), [&] { return angle(generator); });
                std::vector<double> sine(angles.size());
                std::vector<double> cosine(angles.size());
                std::vector<double> alone(angles.size());
                sinCos(angles, sine, cosine);
                sines(angles, alone);
                double worst = 0;
                for (std::size_t i = 0; i < angles.size(); ++i) {
                    // The extended form reduces by the exact circle as well.
                    worst = std::max(
                        worst, unitsOff(sine[i], std::sin(static_cast<long double>(angles[i]))));
                    worst = std::max(
                        worst, unitsOff(cosine[i], std::cos(static_cast<long double>(angles[i]))));
                }
                QVERIFY2(worst < 1.0, qPrintable(QString::number(worst)));
                QCOMPARE(alone, sine);
            });
}

void TestKernels::sinesOfNoNumber()
{
    const std::vector<double> angles{0.0, std::nan(""), HUGE_VAL, 1.0};
    std::vector<double> sine(4);
    std::vector<double> cosine(4);
    sinCos(angles, sine, cosine);
    QCOMPARE(sine[0], 0.0);
    QCOMPARE(cosine[0], 1.0);
    QVERIFY(std::isnan(sine[1]) && std::isnan(cosine[2]));
    QCOMPARE(sine[3], std::sin(1.0));
}

QTEST_GUILESS_MAIN(TestKernels)
#include "tst_kernels.moc"
