// SPDX-License-Identifier: Apache-2.0
#include "support/files.h"
#include "support/rows.h"
#include "view/AveragedSpectrum.h"
#include "view/Overview.h"
#include "view/SignalFigures.h"
#include "view/SpectrumLines.h"
#include "view/SpectrumTrace.h"

#include <QStandardPaths>
#include <QTest>

#include <algorithm>
#include <cmath>
#include <numbers>
#include <random>
#include <vector>

namespace {

constexpr double ClockHz = 1e6;

/// Linear sweeps of 4096 samples between two frequencies in cycles per sample; with a gap, the
/// second half is silent.
std::vector<IqSample> sweep(std::size_t count, double from, double to, bool withGap = false)
{
    constexpr std::size_t Period = 4096;
    std::vector<IqSample> samples(count);
    double turns = 0;
    for (std::size_t k = 0; k < (withGap ? count / 2 : count); ++k) {
        samples[k] = {std::cos(2 * std::numbers::pi * turns),
                      std::sin(2 * std::numbers::pi * turns)};
        turns += from + (to - from) * static_cast<double>(k % Period) / Period;
    }
    return samples;
}

std::vector<IqSample> noise(std::size_t count)
{
    std::mt19937_64 source(7); // NOLINT: the values are to be the same each time
    std::normal_distribution<double> value(0, 0.1);
    std::vector<IqSample> samples(count);
    for (IqSample &sample : samples) {
        sample = {value(source), value(source)};
    }
    return samples;
}

} // namespace

class TestFigures : public QObject
{
    Q_OBJECT

private slots:
    void initTestCase() { QStandardPaths::setTestModeEnabled(true); }
    void burstsAndTonesKeepTheirLevel();
    void sweepFillsItsBand();
    void noiseFollowsGauss();
    void levelsAndClipping();
    void overviewIsKeptOfTheFileAsItIs();
};

void TestFigures::burstsAndTonesKeepTheirLevel()
{
    // A tone on a point of every transform: 1/8 of the clock, all of the time or half of it.
    forRows({{"tone", false, 0.0, 0.0}, {"burst of 50 %", true, 0.5, 0.0}},
            [](bool withGap, double meanPower, double peakDb) {
                const std::vector<IqSample> samples = sweep(51200, 0.125, 0.125, withGap);
                AveragedSpectrum spectrum(51200, 1024, 5);
                // However it is cut.
                spectrum.append(std::span(samples).first(777));
                spectrum.append(std::span(samples).subspan(777));
                const std::size_t tone = 512 + 128;
                QVERIFY(std::abs(spectrum.mean().at(tone) - (withGap ? meanPower : 1)) < 0.01);
                SpectrumLines lines;
                lines.update(samples, 0);
                const SpectrumTrace given = makeTrace({}, lines, samples);
                const double level = *std::max_element(given.maximum.begin(), given.maximum.end());
                QVERIFY2(std::abs(level - peakDb) < 0.01, qPrintable(QString::number(level)));
            });
}

void TestFigures::sweepFillsItsBand()
{
    const std::vector<IqSample> samples = sweep(1 << 18, -0.2, 0.1);
    MemorySource source(samples);
    const auto figures = measureFigures(source, ClockHz, FrequencyBand{-200e3, -50e3});
    QVERIFY(figures && figures->occupiedHz && figures->bandDb);
    QVERIFY2(std::abs(*figures->occupiedHz - 0.99 * 300e3) < 2e3,
             qPrintable(QString::number(*figures->occupiedHz)));
    QVERIFY(std::abs(*figures->occupiedCentreHz + 50e3) < 1e3);
    QVERIFY(std::abs(*figures->bandDb - 10 * std::log10(0.5)) < 0.05);
    MemorySource again(samples);
    QVERIFY(!measureFigures(again, 0)->occupiedHz); // no clock, no bandwidth
}

void TestFigures::noiseFollowsGauss()
{
    MemorySource source(noise(1 << 20));
    const std::vector<IqSample> samples = noise(1 << 20);
    MemorySource held(samples);
    const auto figures = measureFigures(held, ClockHz);
    for (const CcdfPoint &point : figures->ccdf) {
        const double expected = std::exp(-std::pow(10, point.overMeanDb / 10));
        if (expected > 1e-3) {
            QVERIFY(std::abs(point.probability / expected - 1) < 0.1);
        }
        QVERIFY(std::abs(gaussianCcdf(point.overMeanDb) - expected) < 1e-12);
    }
    QVERIFY(std::abs(*figures->occupiedHz / ClockHz - 0.99) < 0.01);
}

void TestFigures::levelsAndClipping()
{
    // QPSK at full scale has no crest; one value beyond it is a clipped one.
    std::vector<IqSample> samples(4096);
    for (std::size_t k = 0; k < samples.size(); ++k) {
        samples[k] = {k % 2 == 0 ? 0.5 : -0.5, k % 3 == 0 ? 0.5 : -0.5};
    }
    MemorySource source(samples);
    auto figures = measureFigures(source, ClockHz);
    QVERIFY(std::abs(figures->crestDb()) < 1e-9);
    QVERIFY(std::abs(figures->rms - std::sqrt(0.5)) < 1e-12);
    QCOMPARE(figures->clipped, 0);
    samples[5].q = -1.25;
    MemorySource beyond(samples);
    figures = measureFigures(beyond, ClockHz);
    QCOMPARE(figures->clipped, 1);
    const std::vector<IqSample> silence(100);
    MemorySource quiet(silence);
    figures = measureFigures(quiet, ClockHz);
    QVERIFY(figures->ccdf.empty() && !figures->occupiedHz && figures->crestDb() == 0);
}

void TestFigures::overviewIsKeptOfTheFileAsItIs()
{
    TestFolder folder;
    const QString name = folder.path("a.wv");
    QVERIFY(folder.store("a.wv", "one"));
    constexpr qint64 Count = 10'000;
    Overview overview(Count);
    std::vector<float> iq(2 * Count, 0.25F);
    std::vector<quint8> markers(Count, 0);
    iq[2 * 7000] = 1;
    markers[3] = 4;
    constexpr std::size_t Cut = 3333;
    overview.append(std::span(iq).first(2 * Cut), std::span(markers).first(Cut));
    overview.append(std::span(iq).subspan(2 * Cut), std::span(markers).subspan(Cut));
    QVERIFY(overview.isComplete() && overview.save(name));
    const Overview kept = Overview::kept(name, Count);
    QVERIFY(kept.isComplete());
    QCOMPARE(kept.markersSeen(), 4);
    const auto highest = std::max_element(
        kept.bins().begin(), kept.bins().end(),
        [](const OverviewBin &a, const OverviewBin &b) { return a.high < b.high; });
    QCOMPARE(highest - kept.bins().begin(), 7000 * 2048 / Count);
    QVERIFY(!Overview::kept(name, Count - 1).isComplete());
    QVERIFY(folder.store("a.wv", "another"));
    QVERIFY(!Overview::kept(name, Count).isComplete());
}

QTEST_GUILESS_MAIN(TestFigures)
#include "tst_figures.moc"
