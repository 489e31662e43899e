// SPDX-License-Identifier: Apache-2.0
#include "view/TraceBins.h"

#include <QRandomGenerator>
#include <QTest>

#include <algorithm>
#include <cmath>
#include <vector>

namespace {

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
        double d = i == 0 ? 0 : q - previous;
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

class TestTraceBins : public QObject
{
    Q_OBJECT

private slots:
    void equalsPlainForm();
    void piecesGiveTheSame();
    void fewSamplesKeepTheTable();
};

void TestTraceBins::equalsPlainForm()
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

void TestTraceBins::piecesGiveTheSame()
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

void TestTraceBins::fewSamplesKeepTheTable()
{
    TraceBins bins;
    const auto samples = mixedSamples(600);
    bins.compute(samples, {});
    const Bins before = bins.bins();
    bins.compute(std::span(samples).first(3), {});
    QVERIFY(difference(bins.bins(), before).isEmpty());
    bins.clear();
    QCOMPARE(bins.bins()[0].count, 0);
}

QTEST_APPLESS_MAIN(TestTraceBins)
#include "tst_tracebins.moc"
