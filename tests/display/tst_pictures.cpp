// SPDX-License-Identifier: Apache-2.0
#include "display/CWidgetTimeline.h"
#include "display/ConstellationPainter.h"
#include "display/SpectrumPainter.h"
#include "displaysamples.h"
#include "plotpictures.h"

#include <QPainter>
#include <QTest>

#include <cmath>
#include <utility>

namespace {

TraceScene sceneOf(TraceMode mode, bool markers = false)
{
    TraceScene scene;
    scene.mode = mode;
    scene.showMarkers = markers;
    return scene;
}

QList<QRectF> panesOf(TraceMode mode, bool markers = false)
{
    const PlotStyle style = PlotStyle::current();
    const TraceScene scene = sceneOf(mode, markers);
    return TracePainter(style, scene).panes(tracePlot());
}

bool isNear(QRgb pixel, const QColor &color, int tolerance = 60)
{
    return std::abs(qRed(pixel) - color.red()) < tolerance &&
           std::abs(qGreen(pixel) - color.green()) < tolerance &&
           std::abs(qBlue(pixel) - color.blue()) < tolerance;
}

/// Mean row of the yellow trace in a column of a pane, weighted by its strength, since a line
/// between two rows of pixels colours both; -1 if there is none.
double rowOfTrace(const QImage &image, int x, const QRectF &pane)
{
    double sum = 0;
    double weights = 0;
    for (int y = static_cast<int>(pane.top()) + 1; y < static_cast<int>(pane.bottom()) - 1; ++y) {
        const int yellow = qRed(image.pixel(x, y)) - qBlue(image.pixel(x, y));
        if (yellow > 20) {
            sum += (y + 0.5) * yellow;
            weights += yellow;
        }
    }
    return weights > 0 ? sum / weights : -1;
}

} // namespace

class TestPictures : public QObject
{
    Q_OBJECT

private slots:
    void constantsLieAtTheirLevel_data();
    void constantsLieAtTheirLevel();
    void envelopeIsFilled();
    void phaseOfTheImaginaryAxisIsOffThePane();
    void markerEdges();
    void sparseDots();
    void toneColumnInSpectrum();
    void toneColumnInWaterfall();
    void constellationCellsAndDots();
    void timelineShowsRangeAndCursors();
};

void TestPictures::constantsLieAtTheirLevel_data()
{
    QTest::addColumn<int>("view");
    QTest::addColumn<double>("i");
    QTest::addColumn<double>("q");
    QTest::addColumn<double>("fraction"); // of the first pane, from the bottom
    QTest::newRow("I") << 0 << 0.4 << 0.0 << 0.7;
    QTest::newRow("I negative") << 0 << -0.6 << 0.1 << 0.2;
    QTest::newRow("log envelope") << 1 << 0.1 << 0.0 << 0.8;
    QTest::newRow("log average") << 2 << 0.0 << 0.01 << 0.6;
    QTest::newRow("log of silence") << 2 << 0.0 << 0.0 << 0.0;
    QTest::newRow("linear average") << 3 << 0.3 << 0.4 << 0.5;
    QTest::newRow("phase of 1 + j, upwards") << 4 << 0.5 << 0.5 << (0.785398 / 3.1415 + 1) / 2;
    QTest::newRow("phase of 1 - j") << 4 << 0.5 << -0.5 << (-0.785398 / 3.1415 + 1) / 2;
}

void TestPictures::constantsLieAtTheirLevel()
{
    QFETCH(int, view);
    QFETCH(double, i);
    QFETCH(double, q);
    QFETCH(double, fraction);
    const QImage image = pictureOf(static_cast<PlotView>(view), IqList(2000, {i, q}));
    const QRectF pane = panesOf(static_cast<TraceMode>(view)).first();
    for (const int bin : {3, 256, 508}) {
        const int x = static_cast<int>(TracePainter::xOf(tracePlot(), bin));
        const double row = rowOfTrace(image, x, pane);
        QVERIFY2(
            std::fabs(row - TracePainter::yOf(pane, fraction)) <= 1.5,
            qPrintable(
                QString("row %1, expected %2").arg(row).arg(TracePainter::yOf(pane, fraction))));
    }
}

void TestPictures::envelopeIsFilled()
{
    // Every bin holds both +0.5 and -0.5.
    const QImage image = pictureOf(PlotView::Iq, squareSamples(20000));
    const QList<QRectF> panes = panesOf(TraceMode::IqEnvelope);
    const QColor colors[2] = {plotColor(ColorSlot::AverageTrace), plotColor(ColorSlot::PeakTrace)};
    for (int k = 0; k < 2; ++k) {
        const QRectF &pane = panes.at(k);
        for (int x = static_cast<int>(pane.left()) + 2; x < TracePainter::xOf(tracePlot(), 511) - 1;
             ++x) {
            for (const double fraction : {0.27, 0.5, 0.73}) {
                const int y = static_cast<int>(TracePainter::yOf(pane, fraction));
                QVERIFY2(isNear(image.pixel(x, y), colors[k], 4), qPrintable(QString::number(x)));
            }
            for (const double fraction : {0.2, 0.8}) {
                const int y = static_cast<int>(TracePainter::yOf(pane, fraction));
                QVERIFY(!isNear(image.pixel(x, y), colors[k]));
            }
        }
    }
}

void TestPictures::phaseOfTheImaginaryAxisIsOffThePane()
{
    const QImage image = pictureOf(PlotView::Phase, IqList(2000, {0, 1}));
    const QRectF pane = panesOf(TraceMode::Phase).first();
    QCOMPARE(rowOfTrace(image, 300, pane), -1.0);
}

void TestPictures::markerEdges()
{
    constexpr int count = 5120; // ten samples a bin
    QList<quint8> markers(count, 0);
    std::fill(markers.begin() + 1000, markers.begin() + 3000, quint8{1}); // M1 from bin 100 to 300
    const QImage image = pictureOf(PlotView::Phase, toneSamples(count, 0.01), markers);
    const QRectF pane = panesOf(TraceMode::Phase, true).last();
    QVERIFY(std::fabs(pane.height() - tracePlot().height() / 3) < 1);
    const QColor color = plotColor(ColorSlot::PrimaryMarker);
    const int high = static_cast<int>(std::round(TracePainter::yOf(pane, 0.85)));
    const int low = static_cast<int>(std::round(TracePainter::yOf(pane, 0.75)));
    QVERIFY(high < low);
    const auto x = [](int bin) { return static_cast<int>(TracePainter::xOf(tracePlot(), bin)); };
    for (const int bin : {20, 99, 301, 500}) {
        QVERIFY(isNear(image.pixel(x(bin), low), color, 4));
        QVERIFY(!isNear(image.pixel(x(bin), high), color));
    }
    for (const int bin : {101, 200, 299}) {
        QVERIFY(isNear(image.pixel(x(bin), high), color, 4));
        QVERIFY(!isNear(image.pixel(x(bin), low), color));
    }
    for (const int edge : {100, 300}) {
        QVERIFY(isNear(image.pixel(x(edge), (high + low) / 2), color, 4));
        QVERIFY(!isNear(image.pixel(x(edge) + 2, (high + low) / 2), color));
    }
    // M2 stays low all the way.
    const int secondLow = static_cast<int>(std::round(TracePainter::yOf(pane, 0.5)));
    QVERIFY(isNear(image.pixel(x(256), secondLow), plotColor(ColorSlot::SecondaryMarker), 4));
}

void TestPictures::sparseDots()
{
    const auto dots = [](int samples) {
        const QImage image = pictureOf(PlotView::LinAvg, IqList(samples, {0.5, 0}));
        const QRectF pane = panesOf(TraceMode::LinMagAverage).first();
        const int y = static_cast<int>(TracePainter::yOf(pane, 0.5));
        int runs = 0;
        bool inside = false;
        for (int x = static_cast<int>(pane.left()) - 1; x < pane.right(); ++x) {
            const bool dot = isNear(image.pixel(x, y), plotColor(ColorSlot::CursorLine), 40);
            runs += dot && !inside ? 1 : 0;
            inside = dot;
        }
        return runs;
    };
    QCOMPARE(dots(20), 20);
    QCOMPARE(dots(250), 0);
}

void TestPictures::toneColumnInSpectrum()
{
    constexpr int bin = 100; // above zero frequency
    const QImage image = pictureOf(PlotView::Spectrum, toneSamples(5000, bin / 512.0, 0.1));
    const QRectF plot = PlotArea.marginsRemoved(
        SpectrumPainter::margins(PlotStyle::current().font, SpectrumMode::Spectrum));
    const PlotStyle style = PlotStyle::current();
    const SpectrumScene scene;
    const SpectrumPainter painter(style, scene);
    int topRow = image.height();
    int topColumn = -1;
    for (int x = static_cast<int>(plot.left()) + 1; x < plot.right() - 1; ++x) {
        for (int y = static_cast<int>(plot.top()) + 1; y < topRow; ++y) {
            if (isNear(image.pixel(x, y), plotColor(ColorSlot::AverageTrace))) {
                topRow = y;
                topColumn = x;
            }
        }
    }
    QVERIFY(std::fabs(topColumn + 0.5 - SpectrumPainter::xOf(plot, 256 + bin)) <= 1.5);
    QVERIFY(std::fabs(topRow - painter.yOf(plot, -20)) <= 2.5);
}

void TestPictures::toneColumnInWaterfall()
{
    constexpr int bin = -60;
    for (const double ratio : {1.0, 1.5, 2.0}) {
        const QImage image =
            pictureOf(PlotView::Waterfall, toneSamples(3000, bin / 512.0, 1), {}, ratio);
        const QRectF plot = PlotArea.marginsRemoved(
            SpectrumPainter::margins(PlotStyle::current().font, SpectrumMode::Waterfall));
        const auto column = [&](double place) {
            return static_cast<int>(SpectrumPainter::xOf(plot, place) * ratio);
        };
        const ColorTable table;
        for (const double share : {0.1, 0.5, 0.9}) {
            const int y = static_cast<int>((plot.top() + share * plot.height()) * ratio);
            // A column of pixels shows the bin at its left edge, so it may stand one further right.
            const int x = column(256 + bin);
            QVERIFY(image.pixel(x, y) == table.entry(0) || image.pixel(x + 1, y) == table.entry(0));
            QCOMPARE(image.pixel(column(256 + bin + 8), y), table.background());
            QCOMPARE(image.pixel(column(256 - bin), y), table.background());
        }
    }
}

void TestPictures::constellationCellsAndDots()
{
    const PlotStyle style = PlotStyle::current();
    const QRectF plot = ConstellationPainter::square(PlotArea, style.font);
    const auto colored = [&plot](const QImage &image, double i, double q) {
        const QPoint place(static_cast<int>(plot.center().x() + i * plot.width() / 2),
                           static_cast<int>(plot.center().y() - q * plot.height() / 2));
        return image.pixel(place);
    };
    // The peak is 0.45 sqrt 2 = 0.64, so the edge is 1 V; all four cells hold as much.
    const QImage cells = pictureOf(PlotView::Constellation, squareSamples(4000, 0.45));
    const QImage dots = pictureOf(PlotView::Constellation, squareSamples(400, 0.45));
    for (const auto &[i, q] :
         {std::pair(0.45, 0.45), {-0.45, 0.45}, {0.45, -0.45}, {-0.45, -0.45}}) {
        QCOMPARE(colored(cells, i, q), ColorTable().entry(0));
        QCOMPARE(QColor(colored(dots, i, q)), plotColor(ColorSlot::AverageTrace));
    }
    int cellCount = 0;
    for (int row = 0; row < 51; ++row) {
        for (int column = 0; column < 51; ++column) {
            const double i = (row - 25) * 0.04 + (row < 25 ? -0.02 : 0.02);
            const double q = (column - 25) * 0.04 + (column < 25 ? -0.02 : 0.02);
            cellCount += colored(cells, i, q) == ColorTable().entry(0) ? 1 : 0;
        }
    }
    QCOMPARE(cellCount, 4);
}

void TestPictures::timelineShowsRangeAndCursors()
{
    TimelineScene scene;
    scene.total = 1000;
    scene.first = 250;
    scene.count = 500;
    scene.cursors = {100, 900};
    const PlotStyle style = PlotStyle::current();
    const TimelinePainter timeline(style, scene);
    QImage image(600, 50, QImage::Format_RGB32);
    QPainter painter(&image);
    timeline.paint(painter, QRectF(image.rect()));
    painter.end();
    const QRectF bar = TimelinePainter::bar(QRectF(image.rect()), style.font);
    const int y = static_cast<int>(bar.center().y());
    const auto pixel = [&](double sample) {
        return image.pixel(static_cast<int>(std::round(timeline.xOf(bar, sample))), y);
    };
    QCOMPARE(QColor(pixel(50)), style.color(ColorSlot::MarkedBackground));
    QCOMPARE(QColor(pixel(800)), style.color(ColorSlot::MarkedBackground));
    QVERIFY(QColor(pixel(500)) != style.color(ColorSlot::MarkedBackground));
    QCOMPARE(QColor(pixel(100)), style.color(ColorSlot::PrimaryMarker));
    QCOMPARE(QColor(pixel(900)), style.color(ColorSlot::SecondaryMarker));
}

QTEST_MAIN(TestPictures)
#include "tst_pictures.moc"
