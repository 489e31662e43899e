// SPDX-License-Identifier: Apache-2.0
#include "plotdraw.h"

#include "base/vectorstate.h"

#include <QFontMetricsF>
#include <QPaintDevice>

#include <algorithm>
#include <cmath>

namespace {

constexpr qreal BoxPadding = 4;
constexpr qreal AnchorGap = 8; ///< keeps a box clear of the mouse pointer
constexpr int BoxAlpha = 215;

QPolygonF flagPolygon(FlagShape shape, qreal size)
{
    const qreal half = size / 2;
    switch (shape) {
    case FlagShape::Top:
        return {{{0, 0}, {-half, -size}, {half, -size}}};
    case FlagShape::Bottom:
        return {{{0, 0}, {half, size}, {-half, size}}};
    case FlagShape::Left:
        return {{{0, 0}, {-size, half}, {-size, -half}}};
    case FlagShape::Right:
        return {{{0, 0}, {size, -half}, {size, half}}};
    case FlagShape::TopLeft:
        return {{{0, 0}, {0, -size}, {-size, -half}}};
    case FlagShape::TopRight:
        return {{{0, 0}, {0, -size}, {size, -half}}};
    case FlagShape::Diamond:
        break;
    }
    return {{{0, -half}, {half, 0}, {0, half}, {-half, 0}}};
}

QPointF cornerOf(const QPointF &anchor, const QSizeF &size, BoxSide side)
{
    switch (side) {
    case BoxSide::Right:
        return {anchor.x() + AnchorGap, anchor.y() + AnchorGap};
    case BoxSide::Left:
        return {anchor.x() - AnchorGap - size.width(), anchor.y() + AnchorGap};
    case BoxSide::Centered:
        break;
    }
    return {anchor.x() - size.width() / 2, anchor.y() + AnchorGap};
}

QSizeF sizeOf(const PlotStyle &style, const ValueBox &box)
{
    const QFontMetricsF metrics(style.font);
    qreal widest = 0;
    for (const QString &line : box.lines) {
        widest = std::max(widest, metrics.horizontalAdvance(line));
    }
    const auto rows = static_cast<qreal>(box.lines.size());
    return {std::ceil(std::max(widest + 2 * BoxPadding, box.leastWidth)),
            std::ceil(metrics.height() * rows + 2 * BoxPadding)};
}

/// The nearest position at which a length fits between two bounds; the lower bound wins.
qreal fitted(qreal position, qreal length, qreal low, qreal high)
{
    return std::max(low, std::min(position, high - length));
}

} // namespace

void fillArea(QPainter &painter, const QRectF &rect, const QColor &color)
{
    painter.fillRect(rect, color);
    clearVectorState();
}

PixelGrid::PixelGrid(QPainter &painter)
    : m_painter(painter)
    , m_ratio(painter.device() != nullptr ? painter.device()->devicePixelRatioF() : 1.0)
    , m_lineWidth(std::max(1.0, std::floor(m_ratio + 0.25)) / m_ratio)
{
}

qreal PixelGrid::snap(qreal coordinate) const
{
    return std::round(coordinate * m_ratio) / m_ratio;
}

void PixelGrid::fill(const QRectF &rect, const QColor &color) const
{
    const QPointF topLeft(snap(rect.left()), snap(rect.top()));
    fillArea(m_painter, QRectF(topLeft, QPointF(snap(rect.right()), snap(rect.bottom()))), color);
}

void PixelGrid::horizontal(qreal y, qreal fromX, qreal toX, const QColor &color) const
{
    fillArea(m_painter, QRectF(snap(fromX), snap(y), snap(toX) - snap(fromX), m_lineWidth), color);
}

void PixelGrid::vertical(qreal x, qreal fromY, qreal toY, const QColor &color) const
{
    fillArea(m_painter, QRectF(snap(x), snap(fromY), m_lineWidth, snap(toY) - snap(fromY)), color);
}

void PixelGrid::frame(const QRectF &rect, const QColor &color) const
{
    const qreal right = rect.right() - m_lineWidth;
    const qreal bottom = rect.bottom() - m_lineWidth;
    horizontal(rect.top(), rect.left(), rect.right(), color);
    horizontal(bottom, rect.left(), rect.right(), color);
    vertical(rect.left(), rect.top() + m_lineWidth, bottom, color);
    vertical(right, rect.top() + m_lineWidth, bottom, color);
}

void PixelGrid::dashedVertical(qreal x, qreal fromY, qreal toY, const QColor &color) const
{
    constexpr qreal Dash = 4;
    constexpr qreal Period = 7;
    const int dashes = static_cast<int>(std::ceil((toY - fromY) / Period));
    for (int k = 0; k < dashes; ++k) {
        const qreal y = fromY + k * Period;
        vertical(x, y, std::min(y + Dash, toY), color);
    }
}

void drawFlag(QPainter &painter, qreal x, qreal y, FlagShape shape, qreal size, const QColor &color)
{
    painter.save();
    painter.setRenderHint(QPainter::Antialiasing);
    painter.setPen(QPen(color.lighter(150), 1));
    painter.setBrush(color);
    painter.drawPolygon(flagPolygon(shape, size).translated(x, y));
    painter.restore();
}

QRectF drawValueBox(QPainter &painter, const PlotStyle &style, const QPointF &anchor,
                    const ValueBox &box, const QRectF &bounds)
{
    const QSizeF size = sizeOf(style, box);
    const PixelGrid grid(painter);
    const QPointF corner = cornerOf(anchor, size, box.side);
    const QRectF place(grid.snap(fitted(corner.x(), size.width(), bounds.left(), bounds.right())),
                       grid.snap(fitted(corner.y(), size.height(), bounds.top(), bounds.bottom())),
                       size.width(), size.height());
    painter.save();
    painter.setRenderHint(QPainter::Antialiasing, box.cornerRadius > 0);
    const qreal inset = grid.lineWidth() / 2; // the pen is centred on the outline
    painter.setPen(QPen(style.color(ColorSlot::GridLines), grid.lineWidth()));
    painter.setBrush(style.color(ColorSlot::TextboxBackground, BoxAlpha));
    painter.drawRoundedRect(place.adjusted(inset, inset, -inset, -inset), box.cornerRadius,
                            box.cornerRadius);
    painter.setFont(style.font);
    painter.setPen(style.color(ColorSlot::Text));
    painter.drawText(place.adjusted(BoxPadding, BoxPadding, -BoxPadding, -BoxPadding),
                     Qt::AlignLeft | Qt::AlignTop | Qt::TextDontClip, box.lines.join('\n'));
    painter.restore();
    return place;
}

QRectF drawValueBoxWhereRoom(QPainter &painter, const PlotStyle &style, const QPointF &anchor,
                             ValueBox box, const QRectF &bounds)
{
    const qreal needed = sizeOf(style, box).width() + AnchorGap;
    box.side = anchor.x() + needed <= bounds.right() ? BoxSide::Right : BoxSide::Left;
    return drawValueBox(painter, style, anchor, box, bounds);
}

void drawCaption(QPainter &painter, const PlotStyle &style, const QRectF &area,
                 Qt::Alignment alignment, const QString &text)
{
    painter.save();
    painter.setFont(style.font);
    const QRectF place = QFontMetricsF(style.font)
                             .boundingRect(area.adjusted(5, 3, -5, -3),
                                           static_cast<int>(alignment) | Qt::TextWordWrap, text)
                             .adjusted(-3, -1, 3, 1);
    fillArea(painter, place, style.color(ColorSlot::PanelBackground, 190));
    painter.setPen(style.color(ColorSlot::Text));
    painter.drawText(place, Qt::AlignCenter | Qt::TextWordWrap, text);
    painter.restore();
}
