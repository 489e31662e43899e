// SPDX-License-Identifier: Apache-2.0
#pragma once

#include "PlotStyle.h"
#include "view/SignalFigures.h"

#include <QRectF>
#include <QStringList>

class QPainter;

/// Draws how likely the power of a signal exceeds its mean by so many dB, beside the curve of
/// Gaussian noise, over decades of probability.
class CcdfPainter
{
public:
    CcdfPainter(const PlotStyle &style, const SignalFigures &figures);

    void paint(QPainter &painter, const QRectF &area, const QRectF &plot) const;

    /// The lines of the read-out at a place of the plot.
    [[nodiscard]] QStringList readOut(const QPointF &place, const QRectF &plot) const;

private:
    [[nodiscard]] double yOf(const QRectF &plot, double probability) const;
    [[nodiscard]] double probabilityAt(double db) const;

    const PlotStyle &m_style;
    const SignalFigures &m_figures;
    double m_mostDb = 12;
    int m_decades = 6;
};
