// SPDX-License-Identifier: Apache-2.0
#include "support/rows.h"
#include "view/ConstellationGrid.h"
#include "view/SpectrumLines.h"
#include "view/TraceBins.h"
#include "view/plotscale.h"

#include <QRandomGenerator>
#include <QTest>

#include <algorithm>
#include <cmath>
#include <numbers>
#include <vector>

namespace {

/// A tone in the middle of a transform's bin (0 is zero frequency).
std::vector<IqSample> tone(std::size_t count, int bin, double amplitude = 1, qint64 first = 0)
{
    std::vector<IqSample> samples(count);
    for (std::size_t i = 0; i < count; ++i) {
        const double turns = bin * static_cast<double>(first + static_cast<qint64>(i)) / 512;
        const double angle = 2 * std::numbers::pi * turns;
        samples[i] = {amplitude * std::cos(angle), amplitude * std::sin(angle)};
    }
    return samples;
}

std::vector<qint64> positions(const SpectrumLines &lines)
{
    std::vector<qint64> result;
    for (const SpectrumLines::Line &line : lines.lines()) {
        result.push_back(line.position);
    }
    return result;
}

using Bins = std::array<TraceBin, TraceBins::BinCount>;

double plainPhase(const IqSample &sample, double magnitude)
{
    if (!(magnitude > 1e-6)) {
        return 0;
    }
    if (sample.i == 0) {
        return sample.q > 0 ? 6.283185308 : -6.283185308;
    }
    if (sample.q == 0) {
        return sample.i <= 0 ? 3.141592654 : 0;
    }
    return std::atan2(sample.q, sample.i);
}

/// One sample after the other, as one would write it down: the judge of the block loop.
Bins plainBins(const std::vector<IqSample> &samples, const std::vector<quint8> &markers)
{
    Bins bins{};
    double previous = 0;
    for (std::size_t i = 0; i < samples.size(); ++i) {
        const IqSample &s = samples[i];
        const double m = std::sqrt(s.i * s.i + s.q * s.q);
        const double p = plainPhase(s, m);
        const double q = p < 0 ? p + 6.283 : p;
        const IqSample &second = samples[1];
        const double next = plainPhase(second, std::hypot(second.i, second.q));
        // The first one, which has nothing before it, takes the step to the second.
        double d = i == 0 ? (next < 0 ? next + 6.283 : next) - q : q - previous;
        previous = q;
        if (d > 3.1415) {
            d -= 6.283;
        } else if (d < -3.1415) {
            d += 6.283;
        }
        TraceBin &bin = bins[i * 512 / samples.size()];
        if (bin.count == 0) {
            bin = {s.i, s.i, s.q, s.q, m, m, m, p, p, d, d, 0, 0, 0};
        }
        bin.iMin = std::min(bin.iMin, s.i);
        bin.iMax = std::max(bin.iMax, s.i);
        bin.qMin = std::min(bin.qMin, s.q);
        bin.qMax = std::max(bin.qMax, s.q);
        bin.magMin = std::min(bin.magMin, m);
        bin.magMax = std::max(bin.magMax, m);
        bin.magAvg = (m + bin.count * bin.magAvg) / (bin.count + 1);
        if (std::fabs(p) < std::fabs(bin.phaseLow)) {
            bin.phaseLow = p;
        }
        if (std::fabs(p) > std::fabs(bin.phaseHigh)) {
            bin.phaseHigh = p;
        }
        bin.freqMin = std::min(bin.freqMin, d);
        bin.freqMax = std::max(bin.freqMax, d);
        ++bin.count;
        if (i < markers.size()) {
            bin.mkrHigh = static_cast<quint8>(bin.mkrHigh | markers[i]);
            bin.mkrLow = static_cast<quint8>(bin.mkrLow | (markers[i] ^ 15));
        }
    }
    return bins;
}

std::vector<IqSample> mixedSamples(std::size_t count)
{
    QRandomGenerator random(4711);
    std::vector<IqSample> samples(count);
    for (std::size_t i = 0; i < count; ++i) {
        const double angle = 0.31 * static_cast<double>(i) + random.generateDouble();
        const double size = random.generateDouble();
        samples[i] = {size * std::cos(angle), size * std::sin(angle)};
        switch (random.bounded(12)) { // the special cases of the phase
        case 0:
            samples[i].i = 0;
            break;
        case 1:
            samples[i].q = 0;
            break;
        case 2:
            samples[i] = {};
            break;
        case 3:
            samples[i] = {7e-7, -7e-7};
            break;
        case 4:
            samples[i] = {-0.5, -0.0};
            break;
        default:
            break;
        }
    }
    return samples;
}

/// The phase comes from another arc tangent and the mean from a plain sum: equal to within a few
/// units in the last place of the greatest phase. Everything else is equal.
constexpr double Tolerance = 4e-15;

QString difference(const Bins &actual, const Bins &expected)
{
    const auto exact = [](const TraceBin &b) {
        return QList<double>{b.iMin,   b.iMax,        b.qMin,          b.qMax,        b.magMin,
                             b.magMax, b.count * 1.0, b.mkrHigh * 1.0, b.mkrLow * 1.0};
    };
    const auto rounded = [](const TraceBin &b) {
        return QList<double>{b.magAvg, b.phaseLow, b.phaseHigh, b.freqMin, b.freqMax};
    };
    for (std::size_t k = 0; k < actual.size(); ++k) {
        bool equal = exact(actual[k]) == exact(expected[k]);
        const QList<double> a = rounded(actual[k]);
        const QList<double> e = rounded(expected[k]);
        for (qsizetype i = 0; i < a.size(); ++i) {
            equal = equal && std::fabs(a.at(i) - e.at(i)) <= Tolerance;
        }
        if (!equal) {
            return QString("bin %1: phase %2/%3").arg(k).arg(a.at(2)).arg(e.at(2));
        }
    }
    return {};
}

} // namespace

class TestPlotData : public QObject
{
    Q_OBJECT

private slots:
    void toneLevels();
    void lineCounts();
    void movesTransformOnlyNewFrames();
    void resultDoesNotDependOnTheWay();
    void meanIsInDb();
    void constellationCells();
    void scales();
    void power();
    void equalsPlainForm();
    void piecesGiveTheSame();
};

void TestPlotData::toneLevels()
{
    SpectrumLines lines;
    lines.update(tone(512, 40, 0.5), 0);
    const std::vector<double> &level = lines.lines().at(0).level;
    // The window 1 - cos has a mean of 1 and puts half the amplitude into each neighbour.
    const double full = 20 * std::log10(0.5);
    QVERIFY(std::fabs(level[256 + 40] - full) < 1e-9);
    QVERIFY(std::fabs(level[256 + 39] - (full - 20 * std::log10(2.0))) < 1e-9);
    QVERIFY(std::fabs(level[256 + 41] - (full - 20 * std::log10(2.0))) < 1e-9);
    QVERIFY(level[256 + 43] < -200);
    QVERIFY(level[256 - 40] < -200);
}

void TestPlotData::lineCounts()
{
    for (const auto &[samples, count] : {std::pair(511, 0), {767, 1}, {768, 2}, {5000, 18}}) {
        SpectrumLines spectrum;
        spectrum.update(tone(static_cast<std::size_t>(samples), 3), 100);
        const std::vector<qint64> places = positions(spectrum);
        QCOMPARE(static_cast<int>(places.size()), count);
        QCOMPARE(spectrum.mean().empty(), count == 0);
        QVERIFY(count == 0 || places.back() == 100 + 256 * (count - 1));
    }
}

void TestPlotData::movesTransformOnlyNewFrames()
{
    SpectrumLines lines;
    lines.update(tone(2048, 7), 0);
    QCOMPARE(lines.transformCount(), 7);
    lines.update(tone(2048, 7, 1, 512), 512); // two frames later: two new ones at the back
    QCOMPARE(lines.transformCount(), 9);
    lines.update(tone(2048, 7, 1, 256), 256); // one back: one new at the front
    QCOMPARE(lines.transformCount(), 10);
    lines.update(tone(2560, 7, 1, 256), 256); // longer from the same start
    QCOMPARE(lines.transformCount(), 12);
    lines.update(tone(1024, 7, 1, 512), 512); // a part
    QCOMPARE(lines.transformCount(), 12);
    QCOMPARE(positions(lines), std::vector<qint64>({512, 768, 1024}));
    lines.clear();
    lines.update(tone(1024, 7, 1, 512), 512);
    QCOMPARE(lines.transformCount(), 15);
}

void TestPlotData::resultDoesNotDependOnTheWay()
{
    SpectrumLines walked;
    SpectrumLines direct;
    for (const qint64 first : {0, 250, 500, 756, 300}) {
        walked.update(tone(20000, 11, 0.3, first), first);
    }
    direct.update(tone(20000, 11, 0.3, 300), 300);
    QCOMPARE(positions(walked), positions(direct));
    for (std::size_t k = 0; k < direct.lines().size(); ++k) {
        QCOMPARE(walked.lines()[k].level, direct.lines()[k].level);
    }
}

void TestPlotData::meanIsInDb()
{
    // One frame at 0 dB and one at -20 dB: the mean of the levels, not of the powers.
    std::vector<IqSample> samples = tone(512, 16);
    SpectrumLines lines;
    lines.update(samples, 0);
    std::vector<SpectrumLines::Line> both = lines.lines();
    lines.clear();
    lines.update(tone(512, 16, 0.1), 0);
    both.push_back(lines.lines().front());
    lines.setLines(both);
    QVERIFY(std::fabs(lines.mean()[256 + 16] + 10) < 1e-9);
}

void TestPlotData::constellationCells()
{
    forRows({{"zero", 0.0, 0.0, 25, 25},
             {"corner", 1.0, 1.0, 50, 50},
             {"next cell", 0.0401, -0.0401, 26, 24},
             {"outside", 1.0001, 0.0, -1, -1}},
            [&](double i, double q, int row, int column) {
                const double scale = 2;
                const std::vector<IqSample> samples{{i * scale, q * scale}};
                ConstellationGrid grid;
                grid.compute(samples, scale, scale);
                for (int r = 0; r < ConstellationGrid::Size; ++r) {
                    for (int c = 0; c < ConstellationGrid::Size; ++c) {
                        QCOMPARE(grid.count(r, c), r == row && c == column ? 1.0 : 0.0);
                    }
                }
            });
    std::vector<IqSample> samples(1000, {0.5, 0.5});
    samples.insert(samples.end(), 100, {-0.5, 0.5});
    ConstellationGrid grid;
    grid.compute(samples, 1, 1);
    const int low = ConstellationGrid::cellOf(-0.5);
    const int high = ConstellationGrid::cellOf(0.5);
    QCOMPARE(grid.levelDb(high, high), 0.0);
    QCOMPARE(grid.levelDb(25, 25), ConstellationGrid::EmptyDb);
    QVERIFY(grid.levelDb(low, high) < -30);
    QVERIFY(grid.levelDb(low, high) > ConstellationGrid::EmptyDb + 5);
}

void TestPlotData::scales()
{
    forRows({{"zero", 0.0, 0.0},
             {"exact", 0.2, 0.2},
             {"to 2", 1.01, 2.0},
             {"to 5", 2.5e6, 5e6},
             {"to 10", 0.0051, 0.01},
             {"a thousand, whose logarithm rounds", 1000.0, 1000.0},
             {"negative", -30.0, -50.0}},
            [](double value, double step) { QCOMPARE(niceStep(value), step); });
    QCOMPARE(labelStride(20, 14), 1);
    QCOMPARE(labelStride(13, 14), 2);
    QCOMPARE(labelStride(5, 14), 5);
    QCOMPARE(labelStride(0, 14), 1);
}

void TestPlotData::power()
{
    QCOMPARE(powerText(-3.456, false, false), " -3.46 dBm");
    QCOMPARE(powerText(999999, false, true), "999.999 kW");
    QCOMPARE(powerToDbm(0.0), -60.0);
    // What is 0 takes the smallest power that isn't.
    std::vector<double> in{0, 0, 0.01, 0, 0.1};
    std::vector<double> out(in.size());
    powerToDbm(in, out);
    QCOMPARE(out, std::vector<double>({10, 10, 10, 10, 20}));
    QCOMPARE(in, std::vector<double>({0.01, 0.01, 0.01, 0.01, 0.1}));
}

void TestPlotData::equalsPlainForm()
{
    for (const std::size_t count : {4U, 5U, 249U, 250U, 511U, 512U, 513U, 5000U, 100'003U}) {
        const auto samples = mixedSamples(count);
        // The markers may end early.
        std::vector<quint8> markers(count == 5000 ? 1234 : count);
        for (std::size_t i = 0; i < markers.size(); ++i) {
            markers[i] = static_cast<quint8>(i / 37 % 16);
        }
        TraceBins bins;
        bins.compute(samples, markers);
        const QString text = difference(bins.bins(), plainBins(samples, markers));
        QVERIFY2(text.isEmpty(), qPrintable(QString("%1: %2").arg(count).arg(text)));
        QCOMPARE(bins.isSparse(), count < 250);
    }
}

void TestPlotData::piecesGiveTheSame()
{
    const auto samples = mixedSamples(3001);
    const std::vector<quint8> markers(samples.size(), 5);
    const Bins expected = plainBins(samples, markers);
    for (const std::size_t piece : {1U, 2U, 3U, 7U, 64U, 1000U}) {
        TraceBins bins;
        bins.begin(static_cast<qint64>(samples.size()));
        for (std::size_t from = 0; from < samples.size(); from += piece) {
            const std::size_t count = std::min(piece, samples.size() - from);
            bins.append(std::span(samples).subspan(from, count),
                        std::span(markers).subspan(from, count));
        }
        const QString text = difference(bins.bins(), expected);
        QVERIFY2(text.isEmpty(), qPrintable(QString("pieces of %1: %2").arg(piece).arg(text)));
    }
}

QTEST_APPLESS_MAIN(TestPlotData)
#include "tst_plotdata.moc"
