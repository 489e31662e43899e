// SPDX-License-Identifier: Apache-2.0
#include "CWidgetTimeline.h"

#include "OverviewPainter.h"
#include "plotaxis.h"
#include "plotdraw.h"

#include <QFontMetrics>
#include <QMouseEvent>
#include <QPainter>
#include <QWheelEvent>

#include <algorithm>
#include <cmath>

namespace {

constexpr double SideMargin = 6;
constexpr double FlagSize = 7;
constexpr double LeastRangeWidth = 3; ///< pixels, so that a short view of a long file is seen

} // namespace

TimelinePainter::TimelinePainter(const PlotStyle &style, const TimelineScene &scene)
    : m_style(style)
    , m_scene(scene)
{
}

QRectF TimelinePainter::bar(const QRectF &area, const QFont &font)
{
    const double texts = QFontMetricsF(font).height() + 2;
    return area.adjusted(SideMargin, FlagSize + 2, -SideMargin, -texts);
}

double TimelinePainter::xOf(const QRectF &bar, double sample) const
{
    return m_scene.total > 0
               ? bar.left() + sample / static_cast<double>(m_scene.total) * bar.width()
               : bar.left();
}

void TimelinePainter::paint(QPainter &painter, const QRectF &area) const
{
    painter.save();
    fillArea(painter, area, m_style.color(ColorSlot::PanelBackground));
    const QRectF place = bar(area, m_style.font);
    if (place.width() <= 0 || place.height() <= 0) {
        painter.restore();
        return;
    }
    const PixelGrid pixels(painter);
    fillArea(painter, place, m_style.color(ColorSlot::MarkedBackground));
    OverviewPainter(m_style, m_scene.overview).paintBare(painter, place.adjusted(0, 1, 0, -1));
    painter.setFont(m_style.font);
    painter.setPen(m_style.color(ColorSlot::Text));
    const QRectF texts(place.left(), place.bottom() + 1, place.width(),
                       area.bottom() - place.bottom() - 1);
    if (m_scene.total > 0) {
        const double from = xOf(place, static_cast<double>(m_scene.first));
        const double to = xOf(place, static_cast<double>(m_scene.first + m_scene.count));
        const double width = std::max(to - from, LeastRangeWidth);
        const double left = std::max(place.left(), std::min(from, place.right() - width));
        const QRectF range(pixels.snap(left), place.top(), pixels.snap(width), place.height());
        fillArea(painter, range, m_style.color(ColorSlot::PeakTrace, 110));
        pixels.frame(range, m_style.color(ColorSlot::PeakTrace));
        const auto seconds = [this](qint64 sample) {
            return static_cast<double>(sample) / (m_scene.clockHz > 0 ? m_scene.clockHz : 1);
        };
        const QString unit = m_scene.clockHz > 0 ? "s" : "";
        const AxisTexts whole({0, seconds(m_scene.total), unit});
        painter.drawText(texts, Qt::AlignLeft | Qt::AlignVCenter, whole.exact(0));
        painter.drawText(texts, Qt::AlignRight | Qt::AlignVCenter,
                         whole.exact(seconds(m_scene.total)));
        const QFontMetricsF metrics(m_style.font);
        // As exact as the view is short.
        const double viewFrom = seconds(m_scene.first);
        const double viewTo = seconds(m_scene.first + m_scene.count);
        const AxisTexts view({viewFrom, viewTo, unit});
        const QString rangeText = view.exact(viewFrom) + " ... " + view.exact(viewTo);
        if (metrics.horizontalAdvance(rangeText) <
            texts.width() - 2 * metrics.horizontalAdvance("888.888 ms ")) {
            painter.drawText(texts, Qt::AlignCenter, rangeText);
        }
    }
    pixels.frame(place, m_style.color(ColorSlot::GridLines));
    for (std::size_t which = 0; which < m_scene.cursors.size(); ++which) {
        const qint64 sample = m_scene.cursors[which];
        if (sample < 0 || sample >= m_scene.total) {
            continue;
        }
        const double x = pixels.snap(xOf(place, static_cast<double>(sample)));
        const QColor color =
            m_style.color(which == 0 ? ColorSlot::PrimaryMarker : ColorSlot::SecondaryMarker);
        pixels.vertical(x, place.top(), place.bottom(), color);
        drawFlag(painter, x + pixels.lineWidth() / 2, place.top(), FlagShape::Top, FlagSize, color);
    }
    painter.restore();
}

CWidgetTimeline::CWidgetTimeline(QWidget *parent)
    : QWidget(parent)
    , m_style(PlotStyle::current())
{
    setSizePolicy(QSizePolicy::Expanding, QSizePolicy::Fixed);
    setAccessibleName("Visible part of the waveform");
}

void CWidgetTimeline::setWaveform(qint64 total, double clockHz)
{
    m_scene.total = std::max<qint64>(total, 0);
    m_scene.clockHz = clockHz;
    m_scene.overview = Overview();
    update();
}

void CWidgetTimeline::setOverview(const Overview &overview)
{
    m_scene.overview = overview;
    update();
}

void CWidgetTimeline::setRange(qint64 first, qint64 count)
{
    m_scene.first = first;
    m_scene.count = count;
    update();
}

void CWidgetTimeline::setCursor(int which, qint64 sample)
{
    if (which == 1 || which == 2) {
        m_scene.cursors[static_cast<std::size_t>(which - 1)] = sample;
        update();
    }
}

void CWidgetTimeline::setColors(int)
{
    m_style = PlotStyle::current();
    update();
}

QSize CWidgetTimeline::sizeHint() const
{
    return {400, minimumSizeHint().height() + 6};
}

QSize CWidgetTimeline::minimumSizeHint() const
{
    return {200, static_cast<int>(FlagSize) + 36 + QFontMetrics(m_style.font).height()};
}

void CWidgetTimeline::set_xpos(double firstSample)
{
    setRange(static_cast<qint64>(std::llround(firstSample)), m_scene.count);
}

void CWidgetTimeline::paintEvent(QPaintEvent *)
{
    QPainter painter(this);
    TimelinePainter(m_style, m_scene).paint(painter, QRectF(rect()));
}

double CWidgetTimeline::sampleAt(double x) const
{
    const QRectF bar = TimelinePainter::bar(QRectF(rect()), m_style.font);
    return bar.width() > 0 ? (x - bar.left()) / bar.width() * static_cast<double>(m_scene.total)
                           : 0.0;
}

void CWidgetTimeline::askFor(double firstSample)
{
    const auto last = static_cast<double>(std::max<qint64>(m_scene.total - m_scene.count, 0));
    const double limited = std::clamp(std::floor(firstSample), 0.0, last);
    set_xpos(limited);
    emit mouse_xpos(limited);
}

void CWidgetTimeline::mousePressEvent(QMouseEvent *event)
{
    if (event->button() != Qt::LeftButton || m_scene.total < 1) {
        return;
    }
    const double sample = sampleAt(event->position().x());
    const auto first = static_cast<double>(m_scene.first);
    const auto count = static_cast<double>(m_scene.count);
    const bool onRange = sample >= first && sample < first + count;
    // The range follows the mouse by the point that was taken; a press beside it centres it.
    m_grip = onRange ? sample - first : count / 2;
    m_dragging = true;
    emit state_xpos(true);
    if (!onRange) {
        askFor(sample - m_grip);
    }
}

void CWidgetTimeline::mouseMoveEvent(QMouseEvent *event)
{
    if (m_dragging) {
        askFor(sampleAt(event->position().x()) - m_grip);
    }
}

void CWidgetTimeline::mouseReleaseEvent(QMouseEvent *event)
{
    if (m_dragging && event->button() == Qt::LeftButton) {
        m_dragging = false;
        emit state_xpos(false);
    }
}

void CWidgetTimeline::wheelEvent(QWheelEvent *event)
{
    if (event->angleDelta().y() != 0) {
        emit zoomRequested(event->angleDelta().y() < 0);
    }
    event->accept();
}
