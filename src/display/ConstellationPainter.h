// SPDX-License-Identifier: Apache-2.0
#pragma once

#include "ColorTable.h"
#include "PlotStyle.h"
#include "view/ConstellationGrid.h"

#include <QMargins>
#include <QPointF>
#include <QRectF>

#include <optional>
#include <span>

class PixelGrid;
class QPainter;

/// Everything a painted constellation depends on, apart from its size and style.
struct ConstellationScene
{
    ConstellationGrid grid;
    qint64 sampleCount = 0;
    /// The samples themselves, needed up to the limit of dots only; must outlive the painting.
    std::span<const IqSample> dots;
    double scaleI = 1; ///< the value at the right edge
    double scaleQ = 1; ///< the value at the top
    ColorMode colorMode = DefaultColorMode;
    std::optional<IqSample> cursor; ///< the sample of the measuring cursor
    std::optional<QPointF> mouse;   ///< place of the mouse within the painted area
};

/// Draws a constellation into any painter: up to 500 samples as dots, more as a density of cells.
class ConstellationPainter
{
public:
    static constexpr qint64 DotLimit = 500; ///< samples that are still drawn one by one

    ConstellationPainter(const PlotStyle &style, const ConstellationScene &scene);

    void paint(QPainter &painter, const QRectF &area) const;

    [[nodiscard]] static QMargins margins(const QFont &font);

    /// The square of the plot within the area.
    [[nodiscard]] static QRectF square(const QRectF &area, const QFont &font);

    /// The value at a place of the painted area, nothing outside the square.
    [[nodiscard]] std::optional<IqSample> valueAt(const QPointF &place, const QRectF &area) const;

private:
    void paintCells(QPainter &painter, const PixelGrid &pixels, const QRectF &plot) const;
    void paintDots(QPainter &painter, const PixelGrid &pixels, const QRectF &plot) const;
    void paintCursor(QPainter &painter, const QRectF &plot) const;
    void paintFrame(QPainter &painter, const PixelGrid &pixels, const QRectF &plot) const;
    void paintAxisTexts(QPainter &painter, const QRectF &area, const QRectF &plot) const;
    void paintValueBox(QPainter &painter, const QRectF &area) const;

    const PlotStyle &m_style;
    const ConstellationScene &m_scene;
};
