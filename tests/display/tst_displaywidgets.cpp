// SPDX-License-Identifier: Apache-2.0
#include "display/CWidgetConstellation.h"
#include "display/CWidgetIQTrace.h"
#include "display/CWidgetSpectrum.h"
#include "display/CWidgetTimeline.h"
#include "displaysamples.h"
#include "log/Tracer.h"

#include <QApplication>
#include <QClipboard>
#include <QContextMenuEvent>
#include <QFile>
#include <QMenu>
#include <QMouseEvent>
#include <QSignalSpy>
#include <QTemporaryDir>
#include <QTest>

#include <cmath>

namespace {

QMenu *openMenu(QWidget &widget)
{
    const QPoint center = widget.rect().center();
    QContextMenuEvent event(QContextMenuEvent::Mouse, center, widget.mapToGlobal(center));
    QApplication::sendEvent(&widget, &event);
    return qobject_cast<QMenu *>(QApplication::activePopupWidget());
}

/// Chooses an entry of the context menu with the mouse.
bool chooseEntry(QWidget &widget, const QString &text)
{
    QMenu *menu = openMenu(widget);
    if (menu == nullptr) {
        return false;
    }
    for (QAction *action : menu->actions()) {
        if (action->text() == text && action->isEnabled()) {
            QTest::mouseClick(menu, Qt::LeftButton, Qt::NoModifier,
                              menu->actionGeometry(action).center());
            return true;
        }
    }
    menu->close();
    return false;
}

QByteArray contentOf(const QString &fileName)
{
    QFile file(fileName);
    return file.open(QIODevice::ReadOnly) ? file.readAll() : QByteArray();
}

} // namespace

class TestDisplayWidgets : public QObject
{
    Q_OBJECT

private slots:
    void init() { (void)Tracer::takeEntries(); }
    void spectrumReadOut();
    void spectrumCache();
    void colorModesFromTheMenu();
    void constellationValueBox();
    void picturesFromTheMenu();
    void savedPicturesAndData();
    void timelineDrag();
    void powerOfTheBase();
};

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
        if (mode == 1) { // line 4 of 9, at sample 1000 + 4 * 256
            QCOMPARE(lines.at(1), "T 3.953 ms");
        }
        QVERIFY(painter.readOut(QPointF(2, 2), plot).isEmpty());

        const QImage before = spectrum.picture();
        QTest::mouseMove(&spectrum, place.toPoint());
        QMouseEvent move(QEvent::MouseMove, place, spectrum.mapToGlobal(place), Qt::NoButton,
                         Qt::NoButton, Qt::NoModifier);
        QApplication::sendEvent(&spectrum, &move);
        QVERIFY(spectrum.picture() != before);
        QEvent leave(QEvent::Leave);
        QApplication::sendEvent(&spectrum, &leave);
        QCOMPARE(spectrum.picture(), before);
    }
}

void TestDisplayWidgets::spectrumCache()
{
    CWidgetSpectrum spectrum;
    spectrum.resize(500, 300);
    const IqList all = toneSamples(20000, 0.01);
    spectrum.setData(all.mid(0, 5120), 0, 5119);
    (void)spectrum.picture();
    const qint64 made = spectrum.scene().lines.transformCount();
    spectrum.col_blue();
    spectrum.resize(700, 400);
    spectrum.setView(0);
    (void)spectrum.picture();
    QCOMPARE(spectrum.scene().lines.transformCount(), made);
    spectrum.setData(all.mid(256, 5120), 256, 5375);
    QCOMPARE(spectrum.scene().lines.transformCount(), made + 1);
    spectrum.setData(all.mid(256, 5120)); // replaces everything
    QCOMPARE(spectrum.scene().lines.transformCount(), 2 * made + 1);
    QCOMPARE(spectrum.scene().lines.lines().front().position, 0);
    spectrum.clear();
    QVERIFY(spectrum.scene().lines.lines().empty());
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
        QVERIFY(chooseEntry(spectrum, name));
        QVERIFY(chooseEntry(constellation, name));
        const QImage picture = spectrum.picture();
        QVERIFY(!pictures.contains(picture));
        pictures += picture;
    }
    QCOMPARE(spectrum.colorMode(), 0);
    QCOMPARE(constellation.colorMode(), 0);
    constellation.col_noise();
    QCOMPARE(constellation.colorMode(), 3);
    QMenu *menu = openMenu(constellation);
    QVERIFY(menu);
    for (int k = 0; k < 4; ++k) {
        QCOMPARE(menu->actions().at(k)->isChecked(), k == 3);
    }
    menu->close();
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

    const QImage before = constellation.picture();
    const QPointF place = square.center() + QPointF(20, -20);
    QMouseEvent move(QEvent::MouseMove, place, constellation.mapToGlobal(place), Qt::NoButton,
                     Qt::NoButton, Qt::NoModifier);
    QApplication::sendEvent(&constellation, &move);
    QVERIFY(constellation.picture() != before);
    QEvent leave(QEvent::Leave);
    QApplication::sendEvent(&constellation, &leave);
    QCOMPARE(constellation.picture(), before);
}

void TestDisplayWidgets::picturesFromTheMenu()
{
    CWidgetIQTrace trace;
    trace.resize(320, 200);
    trace.setData(toneSamples(1000, 0.01));
    QApplication::clipboard()->clear();
    QVERIFY(chooseEntry(trace, "Copy Picture"));
    QCOMPARE(QApplication::clipboard()->image().convertToFormat(QImage::Format_RGB32),
             trace.picture().convertToFormat(QImage::Format_RGB32));
    trace.clear();
    QVERIFY(!chooseEntry(trace, "Save Data..."));
}

void TestDisplayWidgets::savedPicturesAndData()
{
    const QTemporaryDir folder;
    CWidgetIQTrace trace;
    trace.resize(320, 200);
    trace.setData({{0.5, -0.25}, {1.0 / 3, 0}, {0, 0}, {-1, 1}}, {1, 0, 15, 2});
    trace.setFirstSample(40);
    const QString png = folder.filePath("plot.png");
    QVERIFY(trace.savePicture(png));
    QCOMPARE(QImage(png).convertToFormat(QImage::Format_RGB32), trace.picture());
    const QString svg = folder.filePath("plot.svg");
    QVERIFY(trace.savePicture(svg));
    QVERIFY(contentOf(svg).contains("<svg"));
    QVERIFY(contentOf(svg).contains("full scale 1")); // texts stay texts
    const QString csv = folder.filePath("plot.csv");
    QVERIFY(trace.saveData(csv));
    QCOMPARE(contentOf(csv), "sample,i,q,markers\n40,0.5,-0.25,1\n41,0.333333333,0,0\n42,0,0,15\n"
                             "43,-1,1,2\n");

    CWidgetSpectrum spectrum;
    spectrum.setClock(512);
    spectrum.setData(toneSamples(1000, 0.25, 1), 256, 1255);
    spectrum.setView(0);
    QVERIFY(spectrum.saveData(csv));
    QList<QByteArray> lines = contentOf(csv).split('\n');
    QCOMPARE(lines.size(), 514);
    QCOMPARE(lines.first(), "frequency_hz,level_db");
    QVERIFY(lines.at(1).startsWith("-256,"));
    QCOMPARE(lines.at(1 + 384).split(',').first(), "128");
    QVERIFY(std::fabs(lines.at(1 + 384).split(',').last().toDouble()) < 1e-6);
    spectrum.setView(1);
    QVERIFY(spectrum.saveData(csv));
    lines = contentOf(csv).split('\n');
    QCOMPARE(lines.size(), 4); // two frames between head line and last line end
    QVERIFY(lines.at(1).startsWith("256,"));
    QCOMPARE(lines.at(1).count(','), 512);

    (void)Tracer::takeEntries();
    const QString nowhere = folder.filePath("missing/plot.png");
    QVERIFY(!trace.savePicture(nowhere));
    QVERIFY(!trace.savePicture(folder.filePath("plot.bmp")));
    QVERIFY(!trace.saveData(folder.filePath("missing/plot.csv")));
    const auto entries = Tracer::takeEntries();
    QCOMPARE(entries.size(), 3);
    QVERIFY(entries.at(0).first.contains("Cannot write '" + nowhere + "': "));
    QVERIFY(entries.at(1).first.contains(".png or .svg"));
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
    const auto drag = [&timeline](const QPoint &place) {
        QMouseEvent move(QEvent::MouseMove, place, timeline.mapToGlobal(place), Qt::NoButton,
                         Qt::LeftButton, Qt::NoModifier);
        QApplication::sendEvent(&timeline, &move);
    };

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

    // Set from outside it tells nobody.
    positions.clear();
    timeline.set_xpos(12345);
    QCOMPARE(timeline.scene().first, 12345);
    QCOMPARE(timeline.scene().count, 10000);
    QCOMPARE(positions.count(), 0);

    timeline.setWaveform(0, 0);
    QTest::mousePress(&timeline, Qt::LeftButton, {}, point(5000));
    QCOMPARE(positions.count(), 0);
}

void TestDisplayWidgets::powerOfTheBase()
{
    CWidgetIQTrace display;
    double in[2] = {0, 0.01};
    double out[2] = {};
    display.powerToLog(out, in, 2);
    QCOMPARE(out[0], 10.0);
    QCOMPARE(in[0], 0.01);
    QCOMPARE(display.powerToLog(0.001), 0.0);
    QCOMPARE(display.formatPower(0, false), "  0.00 dBm");
    display.setLinearPower(true);
    double zero[1] = {0};
    display.powerToLog(out, zero, 1);
    QCOMPARE(out[0], 0.0);
    QCOMPARE(zero[0], 0.0);
    QCOMPARE(display.powerToLog(0.25), 0.25);
    QCOMPARE(display.formatPower(0.25, false), "250.000 mW");
}

QTEST_MAIN(TestDisplayWidgets)
#include "tst_displaywidgets.moc"
