// SPDX-License-Identifier: Apache-2.0
#pragma once

#include "PlotStyle.h"

#include <QFontMetricsF>
#include <QRectF>
#include <QString>

#include <vector>

class PixelGrid;
class QPainter;

/// One direction of a plot: what it shows from edge to edge.
struct PlotAxis
{
    double low = 0;
    double high = 1;
    QString unit; ///< gets a prefix, one for the whole axis; empty for plain numbers
};

/// The texts of an axis: all with the same prefix, and the digits that a step needs.
class AxisTexts
{
public:
    explicit AxisTexts(const PlotAxis &axis);

    /// A tick's value.
    [[nodiscard]] QString tick(double value, double step) const;

    /// A value that lies on no tick, to a thousandth of the axis.
    [[nodiscard]] QString exact(double value) const;

private:
    [[nodiscard]] QString text(double value, int digits) const;

    double m_factor = 1;
    double m_span;
    QString m_suffix; ///< blank, prefix and unit
};

/// The round step (1, 2 or 5 times a power of ten) whose texts fit side by side, `extent` pixels
/// each, on an axis of so many pixels.
[[nodiscard]] double axisStep(const PlotAxis &axis, double pixels, double extent);

/// The multiples of the step within the axis.
[[nodiscard]] std::vector<double> axisTicks(const PlotAxis &axis, double step);

/// The round step of a horizontal axis, for which the texts themselves are measured.
[[nodiscard]] double horizontalStep(const PlotAxis &axis, const QFontMetricsF &metrics,
                                    double pixels);

/// Draws the ticks and texts of a horizontal axis below the plot, both ends and as many round
/// values between them as fit, and a grid of that alpha, 0 for none. Returns the step.
double paintHorizontalAxis(QPainter &painter, const PixelGrid &pixels, const PlotStyle &style,
                           const QRectF &area, const QRectF &plot, const PlotAxis &axis,
                           int gridAlpha);

/// As above, left of the plot; the axis runs upwards, or downwards if it is `reversed`.
double paintVerticalAxis(QPainter &painter, const PixelGrid &pixels, const PlotStyle &style,
                         const QRectF &area, const QRectF &plot, const PlotAxis &axis,
                         int gridAlpha, bool reversed = false);
