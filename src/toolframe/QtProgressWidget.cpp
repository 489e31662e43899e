// SPDX-License-Identifier: Apache-2.0
#include "QtProgressWidget.h"

#include <QPainter>
#include <QPainterPath>
#include <QTimerEvent>

#include <algorithm>

namespace {

constexpr int FrameMs = 40;
constexpr qreal Radius = 4;
constexpr qreal StripeWidth = 12;
constexpr qreal BlockShare = 0.25; // of the bar, for the block of an unknown progress

} // namespace

QtProgressWidget::QtProgressWidget(QWidget *parent)
    : QWidget(parent)
{
    setSizePolicy(QSizePolicy::Expanding, QSizePolicy::Fixed);
}

void QtProgressWidget::setValue(int percent)
{
    const int value = percent < 0 ? -1 : std::min(percent, 100);
    if (value != m_value) {
        m_value = value;
        update();
    }
}

QSize QtProgressWidget::sizeHint() const
{
    return {320, std::max(24, fontMetrics().height() + 8)};
}

QRectF QtProgressWidget::filledPart(const QRectF &bar) const
{
    QRectF part = bar;
    if (m_value >= 0) {
        part.setWidth(bar.width() * m_value / 100);
        return part;
    }
    // There and back in 100 steps.
    const int step = m_phase % 100;
    const qreal share = (step < 50 ? step : 100 - step) / 50.0;
    part.setWidth(bar.width() * BlockShare);
    part.translate(share * (bar.width() - part.width()), 0);
    return part;
}

void QtProgressWidget::paintEvent(QPaintEvent * /*event*/)
{
    QPainter painter(this);
    painter.setRenderHint(QPainter::Antialiasing);
    const QRectF bar = QRectF(rect()).adjusted(0.5, 0.5, -0.5, -0.5);
    QPainterPath outline;
    outline.addRoundedRect(bar, Radius, Radius);
    painter.fillPath(outline, palette().base());

    const QRectF filled = filledPart(bar);
    const QColor highlight = palette().color(QPalette::Highlight);
    painter.save();
    painter.setClipPath(outline);
    painter.setClipRect(filled, Qt::IntersectClip);
    painter.fillRect(filled, highlight);
    painter.setPen(Qt::NoPen);
    painter.setBrush(highlight.lighter(118));
    // Slanted by the height of the bar, so the first begins that far to the left.
    const int period = static_cast<int>(2 * StripeWidth);
    const qreal first = m_phase % period - period - bar.height();
    const int count = static_cast<int>((bar.width() + bar.height()) / period) + 2;
    for (int i = 0; i < count; ++i) {
        const qreal x = first + i * period;
        painter.drawPolygon(QPolygonF({{x, bar.bottom()},
                                       {x + StripeWidth, bar.bottom()},
                                       {x + StripeWidth + bar.height(), bar.top()},
                                       {x + bar.height(), bar.top()}}));
    }
    painter.restore();
    painter.strokePath(outline, QPen(palette().color(QPalette::Mid), 1));

    if (m_value < 0) {
        return;
    }
    // The text changes its colour where the filled part ends, so that it can be read on both.
    const QString text = QString("%1 %").arg(m_value);
    painter.setClipRect(bar.adjusted(filled.width(), 0, 0, 0));
    painter.setPen(palette().color(QPalette::Text));
    painter.drawText(bar, Qt::AlignCenter, text);
    painter.setClipRect(filled);
    painter.setPen(palette().color(QPalette::HighlightedText));
    painter.drawText(bar, Qt::AlignCenter, text);
}

void QtProgressWidget::timerEvent(QTimerEvent *event)
{
    if (event->timerId() == m_timer.timerId()) {
        ++m_phase;
        update();
    } else {
        QWidget::timerEvent(event);
    }
}

void QtProgressWidget::showEvent(QShowEvent *event)
{
    m_timer.start(FrameMs, this);
    QWidget::showEvent(event);
}

void QtProgressWidget::hideEvent(QHideEvent *event)
{
    m_timer.stop();
    QWidget::hideEvent(event);
}
