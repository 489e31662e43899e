// SPDX-License-Identifier: Apache-2.0
#include "TextRecorder.h"
#include "display/ConstellationPainter.h"
#include "display/SpectrumPainter.h"
#include "display/waterfall.h"
#include "displaysamples.h"
#include "plotpictures.h"
#include "streams/TempStream.h"
#include "support/logreader.h"
#include "support/rows.h"

#include <QPainter>
#include <QTest>

#include <cmath>
#include <set>
#include <utility>
#include <vector>

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

/// The texts of a picture and their places.
QList<TextRecorder::Text> textsOf(const PlotRequest &request, SampleSource &source,
                                  const QSize &size)
{
    TextRecorder recorder(size);
    QPainter painter(&recorder);
    [&] { QVERIFY(paintPlot(painter, QRectF({0, 0}, QSizeF(size)), request, source)); }();
    painter.end();
    return recorder.texts();
}

} // namespace

class TestPictures : public QObject
{
    Q_OBJECT

private slots:
    static void initTestCase() { setColorPreset(ColorPreset::Classic); } // of dark pictures
    void constantsLieAtTheirLevel();
    void envelopeIsFilled();
    void markerEdges();
    void toneColumnInSpectrum();
    void toneColumnInWaterfall();
    void constellationCellsAndDots();
    void colorTables();
    void waterfallRows();
    void axisTextsDoNotOverlap();
    void shortAndEmptyData();
    void linesAreSharp();
    void streamsAndMemoryGiveTheSame();
    void brokenStreamGivesNoPicture();
};

void TestPictures::constantsLieAtTheirLevel()
{
    // of the first pane, from the bottom
    forRows({{"I", 0, 0.4, 0.0, 0.7},
             {"log envelope", 1, 0.1, 0.0, 0.8},
             {"log of silence", 2, 0.0, 0.0, 0.0},
             {"linear average", 3, 0.3, 0.4, 0.5},
             {"phase of 1 - j", 4, 0.5, -0.5, (-0.785398 / 3.1415 + 1) / 2}},
            [&](int view, double i, double q, double fraction) {
                const QImage image = pictureOf(static_cast<PlotView>(view), IqList(2000, {i, q}));
                const QRectF pane = panesOf(static_cast<TraceMode>(view)).first();
                for (const int bin : {3, 256, 508}) {
                    const int x = static_cast<int>(TracePainter::xOf(tracePlot(), bin));
                    const double row = rowOfTrace(image, x, pane);
                    QVERIFY2(std::fabs(row - TracePainter::yOf(pane, fraction)) <= 1.5,
                             qPrintable(QString("row %1, expected %2")
                                            .arg(row)
                                            .arg(TracePainter::yOf(pane, fraction))));
                }
            });
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
        for (int y = static_cast<int>(plot.top()) + 40; y < topRow; ++y) { // below the legend
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
    for (const double ratio : {1.0, 1.5}) {
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
        const QPoint place(static_cast<int>(plot.center().x() + i / 0.7 * plot.width() / 2),
                           static_cast<int>(plot.center().y() - q / 0.7 * plot.height() / 2));
        return image.pixel(place);
    };
    // The peak is 0.45 sqrt 2 = 0.64, so the edge is 0.7 V; all four cells hold as much.
    const QImage cells = pictureOf(PlotView::Constellation, squareSamples(4000, 0.45));
    const QImage dots = pictureOf(PlotView::Constellation, squareSamples(400, 0.45));
    for (const auto &[i, q] :
         {std::pair(0.45, 0.45), {-0.45, 0.45}, {0.45, -0.45}, {-0.45, -0.45}}) {
        QCOMPARE(colored(cells, i, q), ColorTable().entry(0));
        QCOMPARE(QColor(colored(dots, i, q)), plotColor(ColorSlot::AverageTrace));
    }
    // One cell further it is empty.
    QVERIFY(colored(cells, 0.5, 0.45) != ColorTable().entry(0));
    QVERIFY(colored(cells, 0.45, 0.4) != ColorTable().entry(0));
}

void TestPictures::waterfallRows()
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
    // What exceeds the scale has its highest colour, or a strong signal would show as a hole.
    std::vector<double> level(512, -30.0);
    level[0] = 0.5;
    level[1] = 1e-12; // a full-scale tone with its rounding
    level[2] = -149.5;
    const QImage edges = waterfallImage({{0, level}}, table, QSize(512, 3));
    QCOMPARE(edges.pixel(0, 1), table.entry(0));
    QCOMPARE(edges.pixel(1, 1), table.entry(0));
    QCOMPARE(edges.pixel(2, 1), table.entry(149));
    QCOMPARE(edges.pixel(4, 2), table.entry(30));
}

void TestPictures::colorTables()
{
    forRows({{"rainbow top", 0, 0.0, qRgb(255, 255, 0)},
             {"rainbow bottom", 0, -150.0, qRgb(0, 0, 64)},
             // t = (1 - 0.2) * 4 = 3.2: 208 + 47 * 0.2 = 217.4, 80 + 175 * 0.2 = 115, 0
             {"rainbow between", 0, -30.0, qRgb(217, 115, 0)},
             {"no number", 0, qQNaN(), qRgb(0, 0, 64)},
             {"noise row 1", 3, -112.5, qRgb(160, 160, 240)}},
            [&](int mode, double level, const QRgb &color) {
                const QRgb actual = ColorTable::colorOfLevel(static_cast<ColorMode>(mode), level);
                QVERIFY(isNear(actual, color, 2));
                const double whole = std::round(level);
                if (whole == level && level <= 0 && level >= -150) {
                    const ColorTable table(static_cast<ColorMode>(mode));
                    QCOMPARE(table.entry(static_cast<int>(-level)), actual);
                }
            });
}

void TestPictures::axisTextsDoNotOverlap()
{
    for (int view = 0; view < plotViewNames().size(); ++view) {
        for (const auto &[size, clock] : {std::pair(QSize(400, 300), 600e6),
                                          {QSize(401, 333), 12.345678e6},
                                          {QSize(400, 800), 0.0},
                                          {QSize(1200, 700), 20e6}}) {
            const IqList samples = toneSamples(7777, 0.01);
            MemorySource source(samples, {}, 123456);
            PlotRequest request;
            request.view = static_cast<PlotView>(view);
            request.clockHz = clock;
            request.showMarkers = clock > 15e6;
            const QRectF area({0, 0}, QSizeF(size));
            const QList<TextRecorder::Text> texts = textsOf(request, source, size);
            QVERIFY(texts.size() >= 3);
            for (qsizetype a = 0; a < texts.size(); ++a) {
                QVERIFY2(area.adjusted(-0.5, -2, 0.5, 2).contains(texts.at(a).place),
                         qPrintable(texts.at(a).words));
                for (qsizetype b = a + 1; b < texts.size(); ++b) {
                    // Half a pixel of side bearing isn't seen.
                    const QRectF common = texts.at(a).place.intersected(texts.at(b).place);
                    QVERIFY2(common.width() < 1 || common.height() < 1,
                             qPrintable(texts.at(a).words + " / " + texts.at(b).words));
                }
            }
        }
    }
}

void TestPictures::shortAndEmptyData()
{
    forRows({{"trace of 3", PlotView::LogMag, 3, "A trace needs 4 samples; there are only 3 here."},
             {"empty trace", PlotView::Iq, 0, ""},
             {"spectrum of 511", PlotView::Spectrum, 511,
              "A transform needs 512 samples; there are only 511 here."},
             {"waterfall of 512", PlotView::Waterfall, 512, ""},
             {"empty constellation", PlotView::Constellation, 0, ""}},
            [](PlotView view, int count, const QString &hint) {
                const IqList samples = toneSamples(count, 0.1);
                MemorySource source(samples);
                PlotRequest request;
                request.view = view;
                QStringList words;
                for (const TextRecorder::Text &text : textsOf(request, source, PlotSize)) {
                    words += text.words;
                }
                QCOMPARE(words.filter("needs").join('|'), hint);
            });
}

void TestPictures::linesAreSharp()
{
    // Across the frame of a pane only pure colours may stand: a blurred line mixes them.
    for (const double ratio : {1.0, 2.0}) {
        const QImage image = pictureOf(PlotView::LinAvg, {}, {}, ratio);
        QCOMPARE(image.size(), (QSizeF(PlotSize) * ratio).toSize());
        const QRectF plot = tracePlot();
        const int y = static_cast<int>((plot.top() + plot.height() * 0.55) * ratio);
        const QRgb frame = plotColor(ColorSlot::GridLines).rgb();
        const QRgb background = plotColor(ColorSlot::PanelBackground).rgb();
        std::set<QRgb> colors;
        int framePixels = 0;
        for (int x = static_cast<int>((plot.left() - 3) * ratio); x < image.width(); ++x) {
            colors.insert(image.pixel(x, y));
            framePixels += image.pixel(x, y) == frame ? 1 : 0;
        }
        colors.erase(frame);
        colors.erase(background);
        QVERIFY2(colors.size() <= 1, "only the weaker grid may be left");
        QCOMPARE(framePixels, ratio < 2 ? 2 : 4);
    }
}

void TestPictures::streamsAndMemoryGiveTheSame()
{
    // Several blocks of the reader, and far more lines than a waterfall has rows.
    constexpr qsizetype count = 200'000;
    constexpr qsizetype first = 1000;
    IqList samples = toneSamples(count, 0.0123, 0.6);
    QList<quint8> markers(count);
    TempStream data;
    TempStream markerStream;
    QVERIFY(data.open() && markerStream.open() && data->writeHeader("IQF"));
    for (qsizetype k = 0; k < count; ++k) {
        const float iq[2] = {static_cast<float>(samples.at(k).i * (k % 1000 < 300 ? 0.3 : 1)),
                             static_cast<float>(samples.at(k).q)};
        samples[k] = {iq[0], iq[1]};
        markers[k] = static_cast<quint8>(k / 5000 % 16);
        QVERIFY(data->writeBytes(8, iq));
    }
    QVERIFY(markerStream->writeBytes(static_cast<int>(count), markers.constData()));

    for (int view = 0; view < plotViewNames().size(); ++view) {
        PlotRequest request;
        request.view = static_cast<PlotView>(view);
        request.clockHz = 1e6;
        request.size = QSize(500, 320);
        request.showMarkers = true;
        if (request.view == PlotView::Waterfall) {
            request.range = LevelRange(); // the fitted one depends on the lines that are kept
        }
        StreamSource stream(*data.stream(), *markerStream.stream(), first, count - first);
        const QImage streamed = renderPlot(request, stream);
        QVERIFY(!streamed.isNull());

        const IqList part = samples.mid(first);
        const QList<quint8> markerPart = markers.mid(first);
        MemorySource memory(part, markerPart, first);
        QCOMPARE(renderPlot(request, memory), streamed);

        if (request.view == PlotView::Waterfall || request.view == PlotView::Spectrum) {
            // The whole cache of lines, as the widget has it.
            SpectrumScene scene;
            scene.lines.update(part, first);
            scene.trace = makeTrace({}, scene.lines, part);
            scene.sampleCount = part.size();
            scene.mode = request.view == PlotView::Spectrum ? SpectrumMode::Spectrum
                                                            : SpectrumMode::Waterfall;
            scene.clockHz = request.clockHz;
            QImage whole(request.size, QImage::Format_RGB32);
            QPainter painter(&whole);
            const PlotStyle style = PlotStyle::current();
            SpectrumPainter(style, scene).paint(painter, QRectF(whole.rect()));
            painter.end();
            QCOMPARE(whole, streamed);
        }
    }
}

void TestPictures::brokenStreamGivesNoPicture()
{
    TempStream data;
    TempStream markers;
    QVERIFY(data.open() && markers.open() && data->writeHeader("IQF"));
    const std::vector<char> bytes(8 * 100, 0);
    QVERIFY(data->writeBytes(800, bytes.data()) && markers->writeBytes(100, bytes.data()));
    StreamSource source(*data.stream(), *markers.stream(), 0, 101);
    (void)takeMessages();
    QVERIFY(renderPlot({}, source).isNull());
    QCOMPARE(takeMessages(), QStringList("Cannot read I/Q data from temporary file."));

    // Stopped by its caller, it says nothing.
    StreamSource stopped(*data.stream(), *markers.stream(), 0, 100, [](qint64) { return false; });
    QVERIFY(renderPlot({}, stopped).isNull());
    QVERIFY(takeMessages().isEmpty());
}

QTEST_MAIN(TestPictures)
#include "tst_pictures.moc"
