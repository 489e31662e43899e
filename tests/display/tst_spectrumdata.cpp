// SPDX-License-Identifier: Apache-2.0
#include "display/ColorTable.h"
#include "display/waterfall.h"
#include "view/ConstellationGrid.h"
#include "view/SpectrumLines.h"

#include <QTest>

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

} // namespace

class TestSpectrumData : public QObject
{
    Q_OBJECT

private slots:
    void toneLevels();
    void lineCounts_data();
    void lineCounts();
    void movesTransformOnlyNewFrames();
    void resultDoesNotDependOnTheWay();
    void meanIsInDb();
    void colorTables_data();
    void colorTables();
    void waterfallRows();
    void waterfallKeepsBackgroundOutsideTheScale();
    void constellationCells_data();
    void constellationCells();
    void constellationLevels();
};

void TestSpectrumData::toneLevels()
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

void TestSpectrumData::lineCounts_data()
{
    QTest::addColumn<int>("samples");
    QTest::addColumn<int>("lines");
    QTest::newRow("none") << 0 << 0;
    QTest::newRow("one short") << 511 << 0;
    QTest::newRow("one frame") << 512 << 1;
    QTest::newRow("second one short") << 767 << 1;
    QTest::newRow("second frame") << 768 << 2;
    QTest::newRow("5000") << 5000 << 18;
}

void TestSpectrumData::lineCounts()
{
    QFETCH(int, samples);
    QFETCH(int, lines);
    SpectrumLines spectrum;
    spectrum.update(tone(static_cast<std::size_t>(samples), 3), 100);
    QCOMPARE(static_cast<int>(spectrum.lines().size()), lines);
    QCOMPARE(spectrum.mean().empty(), lines == 0);
    for (int k = 0; k < lines; ++k) {
        QCOMPARE(spectrum.lines()[static_cast<std::size_t>(k)].position, 100 + 256 * k);
    }
}

void TestSpectrumData::movesTransformOnlyNewFrames()
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

void TestSpectrumData::resultDoesNotDependOnTheWay()
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

void TestSpectrumData::meanIsInDb()
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

void TestSpectrumData::colorTables_data()
{
    QTest::addColumn<int>("mode");
    QTest::addColumn<double>("level");
    QTest::addColumn<QRgb>("color");
    QTest::newRow("rainbow top") << 0 << 0.0 << qRgb(255, 255, 0);
    QTest::newRow("rainbow bottom") << 0 << -150.0 << qRgb(0, 0, 64);
    QTest::newRow("rainbow row 1") << 0 << -112.5 << qRgb(0, 0, 144);
    QTest::newRow("rainbow row 2") << 0 << -75.0 << qRgb(192, 0, 0);
    // t = (1 - 0.2) * 4 = 3.2: 208 + 47 * 0.2 = 217.4, 80 + 175 * 0.2 = 115, 0
    QTest::newRow("rainbow between") << 0 << -30.0 << qRgb(217, 115, 0);
    QTest::newRow("above the scale") << 0 << 3.0 << qRgb(255, 255, 0);
    QTest::newRow("below the scale") << 0 << -400.0 << qRgb(0, 0, 64);
    QTest::newRow("no number") << 0 << qQNaN() << qRgb(0, 0, 64);
    QTest::newRow("black/white top") << 1 << 0.0 << qRgb(16, 16, 16);
    QTest::newRow("blue row 3") << 2 << -37.5 << qRgb(80, 80, 128);
    QTest::newRow("noise row 1") << 3 << -112.5 << qRgb(160, 160, 240);
}

void TestSpectrumData::colorTables()
{
    QFETCH(int, mode);
    QFETCH(double, level);
    QFETCH(QRgb, color);
    const QRgb actual = ColorTable::colorOfLevel(static_cast<ColorMode>(mode), level);
    // Truncation may take one step off where the mix is a whole number but for rounding.
    QVERIFY(std::abs(qRed(actual) - qRed(color)) <= 1);
    QVERIFY(std::abs(qGreen(actual) - qGreen(color)) <= 1);
    QVERIFY(std::abs(qBlue(actual) - qBlue(color)) <= 1);
    const double whole = std::round(level);
    if (whole == level && level <= 0 && level >= -150) {
        const ColorTable table(static_cast<ColorMode>(mode));
        QCOMPARE(table.entry(static_cast<int>(-level)), actual);
    }
}

void TestSpectrumData::waterfallRows()
{
    // Two lines of one level each; the rows between are mixed, those of the last line are not.
    const std::vector<SpectrumLines::Line> lines{{0, std::vector<double>(512, -20.0)},
                                                 {256, std::vector<double>(512, -100.0)}};
    const ColorTable table(ColorMode::Rainbow);
    const QImage image = waterfallImage(lines, table, QSize(30, 8));
    const int expected[8] = {20, 40, 60, 80, 100, 100, 100, 100};
    for (int y = 0; y < 8; ++y) {
        QCOMPARE(image.pixel(17, y), table.entry(expected[y]));
    }
    QVERIFY(waterfallImage(lines, table, QSize(0, 8)).isNull());
    const QImage empty = waterfallImage({}, table, QSize(4, 4));
    QCOMPARE(empty.pixel(2, 2), table.background());
}

void TestSpectrumData::waterfallKeepsBackgroundOutsideTheScale()
{
    std::vector<double> level(512, -30.0);
    level[0] = 0.5;
    level[1] = 1e-12; // a full-scale tone with its rounding
    level[2] = -149.0;
    level[3] = -149.5;
    const ColorTable table(ColorMode::Blue);
    const QImage image = waterfallImage({{0, level}}, table, QSize(512, 3));
    QCOMPARE(image.pixel(0, 1), table.background());
    QCOMPARE(image.pixel(1, 1), table.entry(0));
    QCOMPARE(image.pixel(2, 1), table.entry(149));
    QCOMPARE(image.pixel(3, 1), table.background());
    QCOMPARE(image.pixel(4, 2), table.entry(30));
}

void TestSpectrumData::constellationCells_data()
{
    QTest::addColumn<double>("i");
    QTest::addColumn<double>("q");
    QTest::addColumn<int>("row");
    QTest::addColumn<int>("column");
    QTest::newRow("zero") << 0.0 << 0.0 << 25 << 25;
    QTest::newRow("corner") << 1.0 << 1.0 << 50 << 50;
    QTest::newRow("other corner") << -1.0 << -1.0 << 0 << 0;
    QTest::newRow("still the middle") << 0.0399 << -0.0399 << 25 << 25;
    QTest::newRow("next cell") << 0.0401 << -0.0401 << 26 << 24;
    QTest::newRow("outside") << 1.0001 << 0.0 << -1 << -1;
    QTest::newRow("no number") << qQNaN() << 0.0 << -1 << -1;
}

void TestSpectrumData::constellationCells()
{
    QFETCH(double, i);
    QFETCH(double, q);
    QFETCH(int, row);
    QFETCH(int, column);
    const double scale = 2;
    const std::vector<IqSample> samples{{i * scale, q * scale}};
    ConstellationGrid grid;
    grid.compute(samples, scale, scale);
    double sum = 0;
    for (int r = 0; r < ConstellationGrid::Size; ++r) {
        for (int c = 0; c < ConstellationGrid::Size; ++c) {
            sum += grid.count(r, c);
        }
    }
    QCOMPARE(sum, row < 0 ? 0.0 : 1.0);
    if (row >= 0) {
        QCOMPARE(grid.count(row, column), 1.0);
    }
}

void TestSpectrumData::constellationLevels()
{
    std::vector<IqSample> samples(1000, {0.5, 0.5});
    samples.insert(samples.end(), 100, {-0.5, 0.5});
    samples.push_back({-0.5, -0.5});
    ConstellationGrid grid;
    grid.compute(samples, 1, 1);
    const int low = ConstellationGrid::cellOf(-0.5);
    const int high = ConstellationGrid::cellOf(0.5);
    QCOMPARE(grid.levelDb(high, high), 0.0);
    QCOMPARE(grid.levelDb(25, 25), ConstellationGrid::EmptyDb);
    QVERIFY(grid.levelDb(low, high) < -30);
    QVERIFY(grid.levelDb(low, low) < grid.levelDb(low, high));
    QVERIFY(grid.levelDb(low, low) > ConstellationGrid::EmptyDb + 5);
}

QTEST_APPLESS_MAIN(TestSpectrumData)
#include "tst_spectrumdata.moc"
