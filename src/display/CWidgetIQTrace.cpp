// SPDX-License-Identifier: Apache-2.0
#include "CWidgetIQTrace.h"

#include "plotexport.h"
#include "view/plotscale.h"

#include <QMouseEvent>
#include <QWheelEvent>

#include <algorithm>
#include <cmath>
#include <utility>

namespace {

constexpr double LargestZoomY = 1000;

int binOf(qint64 sample, qint64 count)
{
    return static_cast<int>(sample * TraceBins::BinCount / count);
}

} // namespace

CWidgetIQTrace::CWidgetIQTrace(QWidget *parent)
    : CWidgetBase(parent)
{
    setPlotMargins(TracePainter::margins(plotStyle().font));
    setAccessibleName("Trace of the samples");
}

void CWidgetIQTrace::setData(const QList<CWidgetBase::IQData> &samples,
                             const QList<quint8> &markers)
{
    m_samples = samples;
    m_markers = markers;
    m_scene.sampleCount = samples.size();
    m_dirty = true;
    m_mouseReported = false;
    m_scene.mouseBin = -1; // it stood at a sample of the former data
    update();
}

void CWidgetIQTrace::setData(const QList<CWidgetBase::IQData> &samples)
{
    setData(samples, {});
}

void CWidgetIQTrace::setView(int mode)
{
    if (mode < 0 || mode >= TraceModeCount) {
        return;
    }
    m_scene.mode = static_cast<TraceMode>(mode);
    update();
}

void CWidgetIQTrace::setCursor(int which, int sample)
{
    if (which != 1 && which != 2) {
        return;
    }
    const bool inside = sample >= 0 && sample < m_samples.size();
    m_scene.cursorBins[static_cast<std::size_t>(which - 1)] =
        inside ? binOf(sample, m_samples.size()) : -1;
    update();
}

void CWidgetIQTrace::setRange(qint64 first, qint64 last)
{
    const qint64 count = m_samples.size();
    if (first < count && last >= 0 && first <= last) {
        m_scene.rangeBins = {binOf(std::max<qint64>(first, 0), count),
                             binOf(std::min(last, count - 1), count)};
    } else {
        m_scene.rangeBins = {-1, -1};
    }
    update();
}

void CWidgetIQTrace::setShowMarkers(bool show)
{
    m_scene.showMarkers = show;
    update();
}

void CWidgetIQTrace::setClock(double hz)
{
    m_scene.clockHz = hz;
    update();
}

const TraceScene &CWidgetIQTrace::scene()
{
    updateBins();
    return m_scene;
}

void CWidgetIQTrace::clear()
{
    setData({}, {});
    m_scene.bins.clear();
    m_scene.mouseBin = -1;
    m_scene.cursorBins = {-1, -1};
    m_scene.rangeBins = {-1, -1};
}

void CWidgetIQTrace::zoomInY()
{
    m_scene.zoomY = std::min(niceStep(m_scene.zoomY * 1.5), LargestZoomY);
    keepPeakOnView();
    update();
}

/// A magnified level scale that began at 0 dB would lose a weak signal.
void CWidgetIQTrace::keepPeakOnView()
{
    updateBins();
    double peak = 0;
    for (const TraceBin &bin : m_scene.bins.bins()) {
        peak = bin.count > 0 ? std::max(peak, bin.magMax) : peak;
    }
    constexpr double Range = 100; // dB on view without zoom
    const double step = Range / 10 / m_scene.zoomY;
    const double peakDb = magnitudeToDb(peak);
    const bool isFar = peakDb > -Range && peakDb < -5 * step;
    m_scene.topDb = isFar ? std::ceil(peakDb / step) * step : 0;
}

void CWidgetIQTrace::zoomOutY()
{
    // 10 -> 5, 5 -> 2, 2 -> 1: the next step at or above 0.4 of the present one.
    m_scene.zoomY = std::max(niceStep(m_scene.zoomY * 0.4), 1.0);
    keepPeakOnView();
    update();
}

void CWidgetIQTrace::drawPlot(QPainter &painter, const QRectF &area)
{
    updateBins();
    TracePainter(plotStyle(), m_scene).paint(painter, area);
}

void CWidgetIQTrace::writeData(QTextStream &stream)
{
    writeSampleTable(stream, m_samples, m_markers, m_scene.firstSample);
}

void CWidgetIQTrace::mousePressEvent(QMouseEvent *event)
{
    const int sample = sampleAt(event->position());
    if (sample < 0) {
        return;
    }
    if (event->button() == Qt::LeftButton) {
        emit mouseLeftPress(sample);
        moveMouseCursor(sample);
    } else if (event->button() == Qt::RightButton) {
        emit mouseRightPress(sample);
    }
}

void CWidgetIQTrace::mouseMoveEvent(QMouseEvent *event)
{
    const int sample = sampleAt(event->position());
    if (sample < 0 || (event->buttons() & Qt::LeftButton) == 0 ||
        binOf(sample, m_samples.size()) == m_scene.mouseBin) {
        return;
    }
    emit mouseLeftPress(sample);
    moveMouseCursor(sample);
}

void CWidgetIQTrace::mouseDoubleClickEvent(QMouseEvent *event)
{
    const int sample = sampleAt(event->position());
    if (sample >= 0 && event->button() == Qt::LeftButton) {
        emit mouseZoomSet(sample);
    }
}

void CWidgetIQTrace::wheelEvent(QWheelEvent *event)
{
    constexpr int Step = 120; // of a plain wheel; others send parts of it
    m_wheel += event->angleDelta().y();
    m_wheelSample = sampleAt(event->position());
    for (; m_wheel >= Step; m_wheel -= Step) {
        emit zoom_in();
    }
    for (; m_wheel <= -Step; m_wheel += Step) {
        emit zoom_out();
    }
    event->accept();
}

int CWidgetIQTrace::sampleAt(const QPointF &position) const
{
    const QRectF plot = plotRect();
    if (!(plot.width() > 0)) {
        return -1;
    }
    const double share = (position.x() - plot.left()) / plot.width();
    const double sample = std::floor(share * static_cast<double>(m_samples.size()));
    const bool inside = sample >= 0 && sample < static_cast<double>(m_samples.size());
    return inside ? static_cast<int>(sample) : -1;
}

void CWidgetIQTrace::moveMouseCursor(int sample)
{
    const int bin = binOf(sample, m_samples.size());
    if (bin == m_scene.mouseBin && m_mouseReported) {
        return;
    }
    m_scene.mouseBin = bin;
    m_mouseReported = true;
    const IQData &here = m_samples.at(sample);
    emit mouseCsrData(sample, here.i, here.q);
    update();
}

void CWidgetIQTrace::updateBins()
{
    if (m_dirty && m_samples.size() >= TraceBins::MinSamples) {
        m_scene.bins.compute(std::as_const(m_samples), std::as_const(m_markers));
        m_dirty = false;
    }
}
