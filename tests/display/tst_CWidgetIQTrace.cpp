// SPDX-License-Identifier: Apache-2.0
#include "display/CWidgetIQTrace.h"
#include "displaysamples.h"

#include <QApplication>
#include <QMouseEvent>
#include <QSignalSpy>
#include <QTest>
#include <QWheelEvent>

#include <cmath>

namespace {

void wheel(QWidget &widget, int delta, bool &accepted)
{
    const QPointF center = widget.rect().center();
    QWheelEvent event(center, widget.mapToGlobal(center), QPoint(), QPoint(0, delta), Qt::NoButton,
                      Qt::NoModifier, Qt::NoScrollPhase, false);
    event.setAccepted(false);
    QApplication::sendEvent(&widget, &event);
    accepted = event.isAccepted();
}

/// The point of a trace's plot at a share of its width.
QPoint tracePoint(const CWidgetIQTrace &trace, double share)
{
    const QRectF plot =
        QRectF(trace.rect()).marginsRemoved(TracePainter::margins(PlotStyle::current().font));
    return {static_cast<int>(std::round(plot.left() + share * plot.width())), 60};
}

bool differs(const QImage &a, const QImage &b, const QRect &part)
{
    return a.copy(part) != b.copy(part);
}

} // namespace

class TestCWidgetIQTrace : public QObject
{
    Q_OBJECT

private slots:
    void mouse();
    void dragAndDoubleClick();
    void wheelZooms();
    void cursors();
    void modesAndZoom();
    void keepsNothingOfTheFormerData();
};

void TestCWidgetIQTrace::mouse()
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
}

void TestCWidgetIQTrace::dragAndDoubleClick()
{
    CWidgetIQTrace trace;
    trace.resize(600, 300);
    trace.setData(toneSamples(5000, 0.01));
    QSignalSpy data(&trace, &CWidgetIQTrace::mouseCsrData);
    QSignalSpy zoomSet(&trace, &CWidgetIQTrace::mouseZoomSet);
    QTest::mousePress(&trace, Qt::LeftButton, {}, tracePoint(trace, 0.2));
    for (const double share : {0.3, 0.4, 0.4}) {
        const QPointF place = tracePoint(trace, share);
        QMouseEvent move(QEvent::MouseMove, place, trace.mapToGlobal(place), Qt::NoButton,
                         Qt::LeftButton, Qt::NoModifier);
        QApplication::sendEvent(&trace, &move);
    }
    QTest::mouseRelease(&trace, Qt::LeftButton, {}, tracePoint(trace, 0.4));
    QCOMPARE(data.count(), 3);
    QTest::mouseDClick(&trace, Qt::LeftButton, {}, tracePoint(trace, 0.6));
    QCOMPARE(zoomSet.count(), 1);
    QVERIFY(std::abs(zoomSet.at(0).at(0).toInt() - 3000) <= 10);
}

void TestCWidgetIQTrace::wheelZooms()
{
    CWidgetIQTrace trace;
    QSignalSpy in(&trace, &CWidgetIQTrace::zoom_in);
    QSignalSpy out(&trace, &CWidgetIQTrace::zoom_out);
    bool accepted = false;
    wheel(trace, 120, accepted);
    QVERIFY(accepted);
    QCOMPARE(in.count(), 1);
    wheel(trace, -120, accepted);
    QVERIFY(accepted);
    QCOMPARE(in.count(), 1);
    QCOMPARE(out.count(), 1);
}

void TestCWidgetIQTrace::cursors()
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
    const int top = static_cast<int>(std::round(TracePainter::yOf(plot, 0.95)));
    const int bottom = static_cast<int>(std::round(TracePainter::yOf(plot, 0.05)));
    for (const int y : {top, bottom}) {
        QVERIFY(differs(reference, plain, {x - 3, y, 1, 1}));
        QVERIFY(differs(reference, plain, {x + 3, y, 1, 1}));
        QVERIFY(!differs(measuring, plain, {x - 3, y, 1, 1}));
    }
    for (const QImage &image : {reference, measuring}) {
        QVERIFY(differs(image, plain, {x, (top + bottom) / 2, 1, 1}));
        QVERIFY(!differs(image, plain, {x, 0, 1, top - 1}));
        QVERIFY(!differs(image, plain, {x, bottom + 2, 1, 8}));
    }

    trace.setCursor(1, 1000); // behind the last sample
    QCOMPARE(trace.scene().cursorBins[0], -1);
    trace.setCursor(1, 999);
    QCOMPARE(trace.scene().cursorBins[0], 511);
    trace.setCursor(3, 10);
    QCOMPARE(trace.scene().cursorBins[1], -1);
}

void TestCWidgetIQTrace::modesAndZoom()
{
    CWidgetIQTrace trace;
    trace.setView(5);
    QCOMPARE(trace.view(), 5);
    trace.setView(6);
    trace.setView(-1);
    QCOMPARE(trace.view(), 5);
    QList<double> zooms;
    for (int k = 0; k < 4; ++k) {
        trace.zoomInY();
        zooms += trace.scene().zoomY;
    }
    for (int k = 0; k < 5; ++k) {
        trace.zoomOutY();
        zooms += trace.scene().zoomY;
    }
    QCOMPARE(zooms, QList<double>({2, 5, 10, 20, 10, 5, 2, 1, 1}));
}

void TestCWidgetIQTrace::keepsNothingOfTheFormerData()
{
    CWidgetIQTrace trace;
    trace.resize(500, 300);
    const QImage empty = trace.picture();
    trace.setData(toneSamples(1000, 0.01), QList<quint8>(1000, 3));
    QVERIFY(trace.picture() != empty);
    trace.setData({});
    QCOMPARE(trace.picture(), empty);
    trace.setData(toneSamples(1000, 0.01));
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

QTEST_MAIN(TestCWidgetIQTrace)
#include "tst_CWidgetIQTrace.moc"
