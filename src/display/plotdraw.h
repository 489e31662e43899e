// SPDX-License-Identifier: Apache-2.0
#pragma once

#include "PlotStyle.h"

#include <QPainter>
#include <QRectF>
#include <QStringList>

/// QPainter::fillRect that leaves the processor ready for the arithmetic of the painters.
void fillArea(QPainter &painter, const QRectF &rect, const QColor &color);

/// The grid of device pixels under a painter. Straight lines are drawn as filled rectangles on it,
/// so that they stay sharp where a logical pixel is 1.5 device pixels.
class PixelGrid
{
public:
    explicit PixelGrid(QPainter &painter);

    [[nodiscard]] qreal snap(qreal coordinate) const;
    /// The width of a line of one pixel: whole device pixels, at least one.
    [[nodiscard]] qreal lineWidth() const { return m_lineWidth; }
    /// Device pixels to a logical one.
    [[nodiscard]] qreal ratio() const { return m_ratio; }

    /// Fills the device pixels that the rectangle covers by at least a half.
    void fill(const QRectF &rect, const QColor &color) const;
    void horizontal(qreal y, qreal fromX, qreal toX, const QColor &color) const;
    void vertical(qreal x, qreal fromY, qreal toY, const QColor &color) const;
    void frame(const QRectF &rect, const QColor &color) const;
    void dashedVertical(qreal x, qreal fromY, qreal toY, const QColor &color) const;

private:
    QPainter &m_painter;
    qreal m_ratio;
    qreal m_lineWidth;
};

/// The seven cursor flags; the tip touches the point given to drawFlag.
enum class FlagShape {
    Top,      ///< triangle hanging above the point
    Bottom,   ///< triangle standing below it
    Left,     ///< triangle at the left, pointing right
    Right,    ///< triangle at the right, pointing left
    TopLeft,  ///< pennant from a pole at the point, flying left
    TopRight, ///< pennant flying right
    Diamond,  ///< centred on the point
};

/// Draws a small filled flag of `size` pixels with a lighter outline of its colour.
void drawFlag(QPainter &painter, qreal x, qreal y, FlagShape shape, qreal size,
              const QColor &color);

/// Where a value box lies, seen from its anchor.
enum class BoxSide {
    Centered, ///< below the anchor, centred
    Right,
    Left,
};

struct ValueBox
{
    QStringList lines;
    BoxSide side = BoxSide::Right;
    qreal leastWidth = 0; ///< the box is as wide as its widest line, but no less than this
    qreal cornerRadius = 0;
};

/// Paints a semi-transparent framed box with lines of text beside the anchor and returns its
/// place. It is moved so far that it lies within `bounds`.
QRectF drawValueBox(QPainter &painter, const PlotStyle &style, const QPointF &anchor,
                    const ValueBox &box, const QRectF &bounds);

/// As above, on the side of the anchor where the room is.
QRectF drawValueBoxWhereRoom(QPainter &painter, const PlotStyle &style, const QPointF &anchor,
                             ValueBox box, const QRectF &bounds);

/// A short text over the plot itself, on a patch of background that keeps it readable.
void drawCaption(QPainter &painter, const PlotStyle &style, const QRectF &area,
                 Qt::Alignment alignment, const QString &text);
