// SPDX-License-Identifier: Apache-2.0
#include "TextRecorder.h"
#include "display/SpectrumPainter.h"
#include "displaysamples.h"
#include "log/Tracer.h"
#include "plotpictures.h"
#include "streams/TempStream.h"

#include <QPainter>
#include <QTest>

#include <set>
#include <vector>

class TestRenderPlot : public QObject
{
    Q_OBJECT

private slots:
    void namesOfViews();
    void shortAndEmptyData_data();
    void shortAndEmptyData();
    void axisTextsDoNotOverlap_data();
    void axisTextsDoNotOverlap();
    void linesAreSharp_data();
    void linesAreSharp();
    void streamsAndMemoryGiveTheSame_data();
    void streamsAndMemoryGiveTheSame();
    void brokenStreamGivesNoPicture();
};

void TestRenderPlot::namesOfViews()
{
    QCOMPARE(plotViewNames().size(), 9);
    QVERIFY(plotViewOf("waterfall") == PlotView::Waterfall);
    QVERIFY(!plotViewOf("Waterfall").has_value());
    QVERIFY(!plotViewOf("").has_value());
}

void TestRenderPlot::shortAndEmptyData_data()
{
    QTest::addColumn<int>("view");
    QTest::addColumn<int>("samples");
    QTest::addColumn<QString>("hint");
    for (int view = 0; view < plotViewNames().size(); ++view) {
        QTest::addRow("%s, empty", qPrintable(plotViewNames().at(view))) << view << 0 << QString();
    }
    QTest::newRow("trace of 3") << 1 << 3 << "A trace needs 4 samples, here are 3.";
    QTest::newRow("spectrum of 511") << 6 << 511 << "A transform needs 512 samples, here are 511.";
    QTest::newRow("waterfall of 3") << 7 << 3 << "A transform needs 512 samples, here are 3.";
    QTest::newRow("waterfall of 512") << 7 << 512 << QString();
}

void TestRenderPlot::shortAndEmptyData()
{
    QFETCH(int, view);
    QFETCH(int, samples);
    QFETCH(QString, hint);
    const IqList list = toneSamples(samples, 0.1);
    QVERIFY(!pictureOf(static_cast<PlotView>(view), list).isNull());

    TextRecorder recorder(PlotSize);
    QPainter painter(&recorder);
    MemorySource source(list);
    PlotRequest request;
    request.view = static_cast<PlotView>(view);
    QVERIFY(paintPlot(painter, PlotArea, request, source));
    painter.end();
    QStringList words;
    for (const TextRecorder::Text &text : recorder.texts()) {
        words += text.words;
    }
    QCOMPARE(words.join('|').contains("needs"), !hint.isEmpty());
    QVERIFY2(hint.isEmpty() || words.contains(hint), qPrintable(words.join('|')));
}

void TestRenderPlot::axisTextsDoNotOverlap_data()
{
    QTest::addColumn<int>("view");
    QTest::addColumn<QSize>("size");
    QTest::addColumn<bool>("markers");
    QTest::addColumn<double>("clock");
    for (int view = 0; view < plotViewNames().size(); ++view) {
        for (const QSize size : {QSize(400, 300), QSize(401, 333), QSize(640, 300), QSize(400, 800),
                                 QSize(1200, 700)}) {
            for (const double clock : {0.0, 12.345678e6, 20e6, 600e6}) {
                const bool markers = static_cast<int>(clock) % 20 == 0;
                QTest::addRow("%s %dx%d at %g", qPrintable(plotViewNames().at(view)), size.width(),
                              size.height(), clock)
                    << view << size << markers << clock;
            }
        }
    }
}

void TestRenderPlot::axisTextsDoNotOverlap()
{
    QFETCH(int, view);
    QFETCH(QSize, size);
    QFETCH(bool, markers);
    QFETCH(double, clock);
    TextRecorder recorder(size);
    QPainter painter(&recorder);
    const IqList samples = toneSamples(7777, 0.01);
    MemorySource source(samples, {}, 123456);
    PlotRequest request;
    request.view = static_cast<PlotView>(view);
    request.clockHz = clock;
    request.showMarkers = markers;
    const QRectF area(0, 0, size.width(), size.height());
    QVERIFY(paintPlot(painter, area, request, source));
    painter.end();
    const QList<TextRecorder::Text> &texts = recorder.texts();
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

void TestRenderPlot::linesAreSharp_data()
{
    QTest::addColumn<double>("ratio");
    for (const double ratio : {1.0, 1.5, 2.0}) {
        QTest::addRow("%g", ratio) << ratio;
    }
}

void TestRenderPlot::linesAreSharp()
{
    // Across the frame of a pane only pure colours may stand: a blurred line mixes them.
    QFETCH(double, ratio);
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

void TestRenderPlot::streamsAndMemoryGiveTheSame_data()
{
    QTest::addColumn<int>("view");
    for (int view = 0; view < plotViewNames().size(); ++view) {
        QTest::addRow("%s", qPrintable(plotViewNames().at(view))) << view;
    }
}

void TestRenderPlot::streamsAndMemoryGiveTheSame()
{
    QFETCH(int, view);
    // Several blocks of the reader, and far more lines than a waterfall has rows.
    constexpr qsizetype count = 300'000;
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

    PlotRequest request;
    request.view = static_cast<PlotView>(view);
    request.clockHz = 1e6;
    request.size = QSize(500, 320);
    request.showMarkers = true;
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
        scene.mean = scene.lines.mean();
        scene.sampleCount = part.size();
        scene.mode =
            request.view == PlotView::Spectrum ? SpectrumMode::Spectrum : SpectrumMode::Waterfall;
        scene.clockHz = request.clockHz;
        QImage whole(request.size, QImage::Format_RGB32);
        QPainter painter(&whole);
        const PlotStyle style = PlotStyle::current();
        SpectrumPainter(style, scene).paint(painter, QRectF(whole.rect()));
        painter.end();
        QCOMPARE(whole, streamed);
    }
}

void TestRenderPlot::brokenStreamGivesNoPicture()
{
    TempStream data;
    TempStream markers;
    QVERIFY(data.open() && markers.open() && data->writeHeader("IQF"));
    const std::vector<char> bytes(8 * 100, 0);
    QVERIFY(data->writeBytes(800, bytes.data()) && markers->writeBytes(100, bytes.data()));
    StreamSource source(*data.stream(), *markers.stream(), 0, 101);
    (void)Tracer::takeEntries();
    QVERIFY(renderPlot({}, source).isNull());
    const auto entries = Tracer::takeEntries();
    QCOMPARE(entries.size(), 1);
    QVERIFY(entries.first().first.endsWith("Cannot read I/Q data from temporary file."));

    // Stopped by its caller, it says nothing.
    StreamSource stopped(*data.stream(), *markers.stream(), 0, 100, [](qint64) { return false; });
    QVERIFY(renderPlot({}, stopped).isNull());
    QVERIFY(Tracer::takeEntries().isEmpty());
}

QTEST_MAIN(TestRenderPlot)
#include "tst_renderplot.moc"
