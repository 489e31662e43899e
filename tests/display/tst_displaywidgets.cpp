// SPDX-License-Identifier: Apache-2.0
#include "display/CWidgetConstellation.h"
#include "display/CWidgetIQTrace.h"
#include "display/CWidgetSpectrum.h"
#include "display/CWidgetTimeline.h"
#include "displaysamples.h"
#include "support/files.h"
#include "support/logreader.h"
#include "support/modals.h"

#include <QApplication>
#include <QClipboard>
#include <QMouseEvent>
#include <QSignalSpy>
#include <QTest>

#include <cmath>

namespace {

/// Moves the mouse over a widget, with a button held or none.
void moveTo(QWidget &widget, const QPointF &place, Qt::MouseButton held = Qt::NoButton)
{
    QMouseEvent move(QEvent::MouseMove, place, widget.mapToGlobal(place), Qt::NoButton, held,
                     Qt::NoModifier);
    QApplication::sendEvent(&widget, &move);
}

/// The point of a trace's plot at a share of its width.
QPoint tracePoint(const CWidgetIQTrace &trace, double share)
{
    const QRectF plot =
        QRectF(trace.rect()).marginsRemoved(TracePainter::margins(PlotStyle::current().font));
    return {static_cast<int>(std::round(plot.left() + share * plot.width())), 60};
}

} // namespace

class TestDisplayWidgets : public QObject
{
    Q_OBJECT

private slots:
    void init() { (void)takeMessages(); }
    void traceMouse();
    void traceCursors();
    void traceKeepsNothingOfTheFormerData();
    void spectrumReadOut();
    void colorModesFromTheMenu();
    void constellationValueBox();
    void savedPicturesAndData();
    void timelineDrag();
};

void TestDisplayWidgets::traceMouse()
{
    CWidgetIQTrace trace;
    trace.resize(600, 300);
    QSignalSpy left(&trace, &CWidgetIQTrace::mouseLeftPress);
    QSignalSpy right(&trace, &CWidgetIQTrace::mouseRightPress);
    QSignalSpy data(&trace, &CWidgetIQTrace::mouseCsrData);

    QTest::mousePress(&trace, Qt::LeftButton, {}, tracePoint(trace, 0.5));
    QCOMPARE(left.count(), 0); // nothing to point at

    IqList samples(1000);
    for (qsizetype k = 0; k < samples.size(); ++k) {
        samples[k] = {static_cast<double>(k), -static_cast<double>(k)};
    }
    trace.setData(samples);
    QTest::mousePress(&trace, Qt::LeftButton, {}, tracePoint(trace, 0.25));
    QCOMPARE(left.count(), 1);
    const int sample = left.at(0).at(0).toInt();
    QVERIFY2(std::abs(sample - 250) <= 2, qPrintable(QString::number(sample)));
    QCOMPARE(data.count(), 1);
    QCOMPARE(data.at(0).at(0).toLongLong(), sample);
    QCOMPARE(data.at(0).at(1).toDouble(), static_cast<double>(sample));
    QCOMPARE(data.at(0).at(2).toDouble(), -static_cast<double>(sample));
    QCOMPARE(trace.scene().mouseBin, sample * 512 / 1000);

    // The same column again is no news, other data in it are.
    QTest::mousePress(&trace, Qt::LeftButton, {}, tracePoint(trace, 0.25));
    QCOMPARE(data.count(), 1);
    trace.setData(toneSamples(1000, 0.1));
    QTest::mousePress(&trace, Qt::LeftButton, {}, tracePoint(trace, 0.25));
    QCOMPARE(data.count(), 2);

    QTest::mousePress(&trace, Qt::RightButton, {}, tracePoint(trace, 0.75));
    QCOMPARE(right.count(), 1);
    QVERIFY(std::abs(right.at(0).at(0).toInt() - 750) <= 2);

    // Outside the plot.
    QTest::mousePress(&trace, Qt::LeftButton, {}, QPoint(3, 60));
    QTest::mousePress(&trace, Qt::LeftButton, {}, QPoint(598, 60));
    QCOMPARE(left.count(), 3);

    // Each new column under a held button is news.
    data.clear();
    QSignalSpy zoomSet(&trace, &CWidgetIQTrace::mouseZoomSet);
    for (const double share : {0.3, 0.4, 0.4}) {
        moveTo(trace, tracePoint(trace, share), Qt::LeftButton);
    }
    QCOMPARE(data.count(), 2);
    QTest::mouseDClick(&trace, Qt::LeftButton, {}, tracePoint(trace, 0.6));
    QCOMPARE(zoomSet.count(), 1);
    QVERIFY(std::abs(zoomSet.at(0).at(0).toInt() - 600) <= 2);
    QSignalSpy in(&trace, &CWidgetIQTrace::zoom_in);
    QSignalSpy out(&trace, &CWidgetIQTrace::zoom_out);
    for (const int delta : {120, -120, -120}) {
        QVERIFY(turnWheel(trace, delta));
    }
    QCOMPARE(in.count(), 1);
    QCOMPARE(out.count(), 2);
}

void TestDisplayWidgets::traceCursors()
{
    CWidgetIQTrace trace;
    trace.resize(600, 300);
    trace.setView(3);
    trace.setData(IqList(1000, {0.0, 0.0}));
    const QImage plain = trace.picture();
    trace.setCursor(2, 500);
    QCOMPARE(trace.scene().cursorBins[1], 256);
    const QImage reference = trace.picture();
    trace.setCursor(2, -1);
    QCOMPARE(trace.picture(), plain);
    trace.setCursor(1, 500);
    const QImage measuring = trace.picture();

    // The reference cursor alone has serifs: three pixels to each side at both ends.
    const QRectF plot =
        QRectF(trace.rect()).marginsRemoved(TracePainter::margins(PlotStyle::current().font));
    const int x = static_cast<int>(TracePainter::xOf(plot, 256));
    for (const double end : {0.95, 0.05}) {
        const int y = static_cast<int>(std::round(TracePainter::yOf(plot, end)));
        QVERIFY(reference.pixel(x - 3, y) != plain.pixel(x - 3, y));
        QVERIFY(reference.pixel(x + 3, y) != plain.pixel(x + 3, y));
        QVERIFY(measuring.pixel(x - 3, y) == plain.pixel(x - 3, y));
    }
    const int middle = static_cast<int>(plot.center().y());
    QVERIFY(reference.pixel(x, middle) != plain.pixel(x, middle));
    QVERIFY(measuring.pixel(x, middle) != plain.pixel(x, middle));

    trace.setCursor(1, 1000); // behind the last sample
    QCOMPARE(trace.scene().cursorBins[0], -1);
    trace.setCursor(1, 999);
    QCOMPARE(trace.scene().cursorBins[0], 511);
    trace.setCursor(3, 10);
    QCOMPARE(trace.scene().cursorBins[1], -1);
}

void TestDisplayWidgets::traceKeepsNothingOfTheFormerData()
{
    CWidgetIQTrace trace;
    trace.resize(500, 300);
    const QImage empty = trace.picture();
    trace.setData(toneSamples(1000, 0.01), QList<quint8>(1000, 3));
    QVERIFY(trace.picture() != empty);
    trace.setCursor(1, 5);
    trace.clear();
    QCOMPARE(trace.picture(), empty);
    // Three samples leave the table alone, but what it holds isn't theirs and isn't shown.
    trace.setData(toneSamples(1000, 0.01));
    (void)trace.picture();
    trace.setData(toneSamples(3, 0.01));
    const QImage three = trace.picture();
    trace.clear();
    trace.setData(toneSamples(3, 0.01));
    QCOMPARE(trace.picture(), three);
}

void TestDisplayWidgets::spectrumReadOut()
{
    CWidgetSpectrum spectrum;
    spectrum.resize(800, 400);
    spectrum.setClock(512e3); // a bin is 1 kHz
    spectrum.setData(toneSamples(2560, 100 / 512.0, 0.1), 1000, 3559);
    for (const int mode : {0, 1}) {
        spectrum.setView(mode);
        const PlotStyle style = PlotStyle::current();
        const QRectF plot = QRectF(spectrum.rect())
                                .marginsRemoved(SpectrumPainter::margins(
                                    style.font, static_cast<SpectrumMode>(mode)));
        const QPointF place(SpectrumPainter::xOf(plot, 356), plot.center().y());
        const SpectrumPainter painter(style, spectrum.scene());
        const QStringList lines = painter.readOut(place, plot);
        QCOMPARE(lines.first(), "F 100 kHz");
        QCOMPARE(lines.last(), "L -20.00 dB");
        if (mode == 1) { // line 4 of 9, the middle of its frame at 1000 + 5 * 256
            QCOMPARE(lines.at(1), "T 4.453 ms");
        }
        QVERIFY(painter.readOut(QPointF(2, 2), plot).isEmpty());

        const QImage before = spectrum.grab().toImage();
        moveTo(spectrum, place);
        QVERIFY(spectrum.grab().toImage() != before);
        QCOMPARE(spectrum.picture(),
                 before.convertToFormat(QImage::Format_RGB32)); // no read-out in it
        moveTo(spectrum, place);
        QEvent leave(QEvent::Leave);
        QApplication::sendEvent(&spectrum, &leave);
        QCOMPARE(spectrum.grab().toImage(), before);
    }
}

void TestDisplayWidgets::colorModesFromTheMenu()
{
    CWidgetSpectrum spectrum;
    CWidgetConstellation constellation;
    spectrum.setView(1);
    spectrum.setData(toneSamples(3000, 0.1));
    constellation.setData(toneSamples(3000, 0.01));
    const QStringList names{"Black/White", "Blue", "Noise (Blue)", "Rainbow"};
    QList<QImage> pictures;
    for (const QString &name : names) {
        QVERIFY(chooseFromMenu(spectrum, name));
        QVERIFY(chooseFromMenu(constellation, name));
        const QImage picture = spectrum.picture();
        QVERIFY(!pictures.contains(picture));
        pictures += picture;
    }
    QCOMPARE(spectrum.colorMode(), 0);
    QCOMPARE(constellation.colorMode(), 0);
    constellation.col_noise();
    QCOMPARE(constellation.colorMode(), 3);
    // The picture goes to the clipboard the same way.
    QApplication::clipboard()->clear();
    QVERIFY(chooseFromMenu(spectrum, "Copy Picture"));
    QCOMPARE(QApplication::clipboard()->image().convertToFormat(QImage::Format_RGB32),
             pictures.last().convertToFormat(QImage::Format_RGB32));
}

void TestDisplayWidgets::constellationValueBox()
{
    CWidgetConstellation constellation;
    constellation.resize(500, 400);
    constellation.setScale(2, 2);
    const PlotStyle style = PlotStyle::current();
    const QRectF area(constellation.rect());
    const QRectF square = ConstellationPainter::square(area, style.font);
    const ConstellationPainter painter(style, constellation.scene());
    const auto value =
        painter.valueAt({square.left() + square.width() * 0.75, square.center().y()}, area);
    QVERIFY(value.has_value());
    QVERIFY(std::fabs(value->i - 1) < 1e-9);
    QVERIFY(std::fabs(value->q) < 1e-9);
    QVERIFY(!painter.valueAt({square.left() - 3, square.center().y()}, area).has_value());
}

void TestDisplayWidgets::savedPicturesAndData()
{
    const TestFolder folder;
    CWidgetIQTrace trace;
    trace.resize(320, 200);
    trace.setData({{0.5, -0.25}, {1.0 / 3, 0}, {0, 0}, {-1, 1}}, {1, 0, 15, 2});
    trace.setFirstSample(40);
    const QString png = folder.path("plot.png");
    QVERIFY(trace.savePicture(png));
    QCOMPARE(QImage(png).convertToFormat(QImage::Format_RGB32), trace.picture());
    const QString svg = folder.path("plot.svg");
    QVERIFY(trace.savePicture(svg));
    QVERIFY(load(svg).contains("<svg"));
    QVERIFY(load(svg).contains("Full scale 1")); // texts stay texts
    const QString csv = folder.path("plot.csv");
    QVERIFY(trace.saveData(csv));
    QCOMPARE(load(csv), "sample,i,q,markers\n40,0.5,-0.25,1\n41,0.333333333,0,0\n42,0,0,15\n"
                        "43,-1,1,2\n");

    CWidgetSpectrum spectrum;
    spectrum.setClock(512);
    spectrum.setData(toneSamples(1000, 0.25, 1), 256, 1255);
    spectrum.setView(0);
    QVERIFY(spectrum.saveData(csv));
    const QList<QByteArray> lines = load(csv).split('\n');
    QCOMPARE(lines.size(), 514);
    QCOMPARE(lines.first(), "frequency_hz,level_db,max_db");
    QVERIFY(lines.at(1).startsWith("-256,"));
    QCOMPARE(lines.at(1 + 384).split(',').first(), "128");
    QVERIFY(std::fabs(lines.at(1 + 384).split(',').last().toDouble()) < 1e-6);
    const QString nowhere = folder.path("missing/plot.png");
    QVERIFY(!trace.savePicture(nowhere));
    QVERIFY(!trace.savePicture(folder.path("plot.bmp")));
    const QStringList errors = takeMessages();
    QCOMPARE(errors.size(), 2);
    QVERIFY(errors.at(0).contains("Cannot write '" + nowhere + "': "));
    QVERIFY(errors.at(1).contains(".png, .svg or .pdf"));
}

void TestDisplayWidgets::timelineDrag()
{
    CWidgetTimeline timeline;
    timeline.resize(412, 44);
    timeline.setWaveform(100000, 1e6);
    timeline.setRange(20000, 10000);
    QSignalSpy positions(&timeline, &CWidgetTimeline::mouse_xpos);
    QSignalSpy states(&timeline, &CWidgetTimeline::state_xpos);
    const QRectF bar =
        TimelinePainter::bar(QRectF(timeline.rect()), PlotStyle::current().font); // 400 wide
    const auto point = [&bar](double sample) {
        return QPoint(static_cast<int>(std::round(bar.left() + sample / 100000 * bar.width())),
                      static_cast<int>(bar.center().y()));
    };
    const auto drag = [&timeline](const QPoint &place) { moveTo(timeline, place, Qt::LeftButton); };

    // Taken inside, the range follows by the point that was taken.
    QTest::mousePress(&timeline, Qt::LeftButton, {}, point(25000));
    QCOMPARE(positions.count(), 0);
    drag(point(45000));
    QCOMPARE(positions.last().at(0).toDouble(), 40000.0);
    QCOMPARE(timeline.scene().first, 40000);
    drag(point(200000));
    QCOMPARE(positions.last().at(0).toDouble(), 90000.0);
    drag(QPoint(-500, 10));
    QCOMPARE(positions.last().at(0).toDouble(), 0.0);
    QTest::mouseRelease(&timeline, Qt::LeftButton, {}, point(0));
    QCOMPARE(states.count(), 2);
    QCOMPARE(states.at(0).at(0).toBool(), true);
    QCOMPARE(states.at(1).at(0).toBool(), false);

    // Pressed beside the range, its middle goes there.
    positions.clear();
    QTest::mouseClick(&timeline, Qt::LeftButton, {}, point(70000));
    QCOMPARE(positions.count(), 1);
    QCOMPARE(positions.at(0).at(0).toDouble(), 65000.0);
}

QTEST_MAIN(TestDisplayWidgets)
#include "tst_displaywidgets.moc"
