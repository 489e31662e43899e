// SPDX-License-Identifier: Apache-2.0
#include "ConstellationPainter.h"

#include "plotdraw.h"
#include "view/plotscale.h"

#include <QFontMetricsF>
#include <QPainter>

#include <algorithm>
#include <cmath>
#include <cstdlib>

namespace {

constexpr double InnerRadius = 0.707; ///< where I and Q of a full-scale sample are equal

struct CellRange
{
    double low;
    double high;
};

/// The stretch of -1 to 1 whose samples fall into a cell. Cells are drawn where their samples are,
/// not in equal parts, or else a sample at full scale would stand 4 % too far in.
CellRange cellRange(int cell)
{
    constexpr int Middle = ConstellationGrid::Size / 2;
    constexpr double Width = 1.0 / Middle;
    constexpr double Outermost = Width / 4; // these cells hold full scale alone
    const int distance = std::abs(cell - Middle);
    if (distance == 0) {
        return {-Width, Width};
    }
    const CellRange range = distance == Middle
                                ? CellRange{1 - Outermost, 1}
                                : CellRange{distance * Width, (distance + 1) * Width};
    return cell > Middle ? range : CellRange{-range.high, -range.low};
}

QString axisText(double value)
{
    return QString::number(value, 'g', 3) + " V";
}

} // namespace

ConstellationPainter::ConstellationPainter(const PlotStyle &style, const ConstellationScene &scene)
    : m_style(style)
    , m_scene(scene)
{
}

QMargins ConstellationPainter::margins(const QFont &font)
{
    const QFontMetricsF metrics(font);
    const int side = static_cast<int>(std::ceil(metrics.horizontalAdvance("-0.005 V"))) + 8;
    const int half = static_cast<int>(std::ceil(metrics.height() / 2)) + 2;
    return {side, half, side / 2, 3 * half};
}

QRectF ConstellationPainter::square(const QRectF &area, const QFont &font)
{
    const QRectF room = area.marginsRemoved(margins(font));
    const double side = std::max(0.0, std::floor(std::min(room.width(), room.height())));
    // In a wide area the square moves to the middle, its axis texts with it.
    return {std::floor(room.left() + (room.width() - side) / 2),
            std::floor(room.top() + (room.height() - side) / 2), side, side};
}

std::optional<IqSample> ConstellationPainter::valueAt(const QPointF &place,
                                                      const QRectF &area) const
{
    const QRectF plot = square(area, m_style.font);
    if (plot.isEmpty() || !plot.contains(place)) {
        return std::nullopt;
    }
    return IqSample{((place.x() - plot.left()) / plot.width() * 2 - 1) * m_scene.scaleI,
                    (1 - (place.y() - plot.top()) / plot.height() * 2) * m_scene.scaleQ};
}

void ConstellationPainter::paint(QPainter &painter, const QRectF &area) const
{
    painter.save();
    fillArea(painter, area, m_style.color(ColorSlot::PanelBackground));
    const QRectF plot = square(area, m_style.font);
    if (!plot.isEmpty()) {
        const PixelGrid pixels(painter);
        if (m_scene.sampleCount > DotLimit) {
            paintCells(painter, pixels, plot);
        } else {
            paintDots(painter, pixels, plot);
        }
        paintFrame(painter, pixels, plot);
        paintCursor(painter, plot);
        paintAxisTexts(painter, area, plot);
        paintValueBox(painter, area);
    }
    painter.restore();
}

void ConstellationPainter::paintCells(QPainter &painter, const PixelGrid &pixels,
                                      const QRectF &plot) const
{
    constexpr int CellCount = ConstellationGrid::Size;
    const QPointF center = plot.center();
    const double half = plot.width() / 2;
    // Where nothing is, the colours of the scale go on, or the densest cells would look as empty.
    fillArea(painter, plot,
             QColor(ColorTable::colorOfLevel(m_scene.colorMode, ColorTable::LowestDb)));
    for (int row = 0; row < CellCount; ++row) {
        const CellRange i = cellRange(row);
        const double left = pixels.snap(center.x() + i.low * half);
        const double right = pixels.snap(center.x() + i.high * half);
        for (int column = 0; column < CellCount; ++column) {
            if (m_scene.grid.count(row, column) <= 0) {
                continue;
            }
            const CellRange q = cellRange(column);
            const double top = pixels.snap(center.y() - q.high * half);
            const double bottom = pixels.snap(center.y() - q.low * half);
            const double level = m_scene.grid.levelDb(row, column);
            fillArea(painter, QRectF(left, top, right - left, bottom - top),
                     QColor(ColorTable::colorOfLevel(m_scene.colorMode, level)));
        }
    }
}

void ConstellationPainter::paintDots(QPainter &painter, const PixelGrid &pixels,
                                     const QRectF &plot) const
{
    constexpr double DotSize = 3;
    const QColor color = m_style.color(ColorSlot::AverageTrace);
    const QPointF center = plot.center();
    const double half = plot.width() / 2;
    painter.setClipRect(plot);
    for (const IqSample &sample : m_scene.dots) {
        const double i = sample.i / m_scene.scaleI;
        const double q = sample.q / m_scene.scaleQ;
        if (i >= -1 && i <= 1 && q >= -1 && q <= 1) {
            fillArea(painter,
                     QRectF(pixels.snap(center.x() + i * half - DotSize / 2),
                            pixels.snap(center.y() - q * half - DotSize / 2), DotSize, DotSize),
                     color);
        }
    }
    painter.setClipping(false);
}

void ConstellationPainter::paintCursor(QPainter &painter, const QRectF &plot) const
{
    if (!m_scene.cursor) {
        return;
    }
    constexpr double Radius = 4;
    const QPointF place(plot.center().x() + m_scene.cursor->i / m_scene.scaleI * plot.width() / 2,
                        plot.center().y() - m_scene.cursor->q / m_scene.scaleQ * plot.height() / 2);
    painter.save();
    painter.setClipRect(plot.adjusted(-Radius, -Radius, Radius, Radius));
    painter.setRenderHint(QPainter::Antialiasing);
    painter.setPen(QPen(m_style.color(ColorSlot::PrimaryMarker), 2));
    painter.setBrush(m_style.color(ColorSlot::CursorLine));
    painter.drawEllipse(place, Radius, Radius);
    painter.restore();
}

void ConstellationPainter::paintFrame(QPainter &painter, const PixelGrid &pixels,
                                      const QRectF &plot) const
{
    const QColor color = m_style.color(ColorSlot::GridLines);
    const QPointF center = plot.center();
    pixels.frame(plot, color);
    pixels.horizontal(center.y(), plot.left(), plot.right(), color);
    pixels.vertical(center.x(), plot.top(), plot.bottom(), color);
    painter.save();
    painter.setRenderHint(QPainter::Antialiasing);
    painter.setBrush(Qt::NoBrush);
    painter.setPen(QPen(color, pixels.lineWidth()));
    for (const double radius : {1.0, InnerRadius}) {
        const double length = radius * plot.width() / 2;
        painter.drawEllipse(center, length, length);
    }
    painter.restore();
}

void ConstellationPainter::paintAxisTexts(QPainter &painter, const QRectF &area,
                                          const QRectF &plot) const
{
    const QFontMetricsF metrics(m_style.font);
    painter.setFont(m_style.font);
    painter.setPen(m_style.color(ColorSlot::Text));
    const double height = metrics.height();
    for (const double share : {-1.0, 0.0, 1.0}) {
        const QString textI = axisText(share * m_scene.scaleI);
        const double width = metrics.horizontalAdvance(textI);
        const double x = plot.center().x() + share * plot.width() / 2 - width / 2;
        painter.drawText(QRectF(std::min(x, area.right() - width), plot.bottom() + height / 2 + 1,
                                width + 1, height),
                         Qt::AlignCenter, textI);
        const double y = plot.center().y() - share * plot.height() / 2 - height / 2;
        painter.drawText(
            QRectF(area.left(), std::max(y, area.top()), plot.left() - area.left() - 4, height),
            Qt::AlignRight | Qt::AlignVCenter, axisText(share * m_scene.scaleQ));
    }
    // Beside the plot, where no sample lies.
    painter.drawText(QRectF(plot.right() + 3, plot.center().y() - height / 2,
                            std::max(area.right() - plot.right() - 3, 1.0), height),
                     int(Qt::AlignLeft | Qt::AlignVCenter) | Qt::TextDontClip, "I");
    const double width = metrics.horizontalAdvance("Q") + 1;
    const QRectF label(plot.center().x() + 4, plot.top() + 2, width, height);
    // Within the plot, whose ground may be as dark or as light as the text.
    constexpr int PlateAlpha = 200;
    fillArea(painter, label.adjusted(-2, 0, 2, 0),
             m_style.color(ColorSlot::PanelBackground, PlateAlpha));
    painter.drawText(label, Qt::AlignCenter, "Q");
}

void ConstellationPainter::paintValueBox(QPainter &painter, const QRectF &area) const
{
    if (!m_scene.mouse) {
        return;
    }
    const std::optional<IqSample> value = valueAt(*m_scene.mouse, area);
    if (!value) {
        return;
    }
    constexpr double WidthToHeight = 3.5;
    // As many digits as a pixel of the scale deserves.
    const double scale = std::max(m_scene.scaleI, m_scene.scaleQ);
    const int digits = std::clamp(3 - static_cast<int>(std::floor(std::log10(scale))), 3, 9);
    const double level = magnitudeToDb(std::sqrt(value->i * value->i + value->q * value->q));
    ValueBox box;
    box.lines = {QString("I %1 V").arg(value->i, 0, 'f', digits),
                 QString("Q %1 V").arg(value->q, 0, 'f', digits),
                 QString("P %1 dB").arg(level, 0, 'f', 2)};
    box.leastWidth =
        WidthToHeight * QFontMetricsF(m_style.font).boundingRect(" Q -Q.QQQ V").height();
    box.cornerRadius = 5;
    drawValueBoxWhereRoom(painter, m_style, *m_scene.mouse, box, area);
}
