// SPDX-License-Identifier: Apache-2.0
#pragma once

#include "PlotStyle.h"
#include "view/Overview.h"

#include <QRectF>

class QPainter;

/// Draws the envelope of a whole waveform and a row for each marker that is ever high. Magnitudes
/// run from 0 at the bottom of the place to the larger of full scale and the peak at its top.
class OverviewPainter
{
public:
    OverviewPainter(const PlotStyle &style, const Overview &overview);

    /// As a picture with axes.
    void paint(QPainter &painter, const QRectF &area, double clockHz) const;

    /// Where a picture with axes has its values.
    [[nodiscard]] static QRectF plotOf(const PlotStyle &style, const QRectF &area);

    /// The envelope and the markers alone, in a place of any size.
    void paintBare(QPainter &painter, const QRectF &place) const;

private:
    void paintMarkerRow(QPainter &painter, const QRectF &row, quint8 bit, ColorSlot slot) const;

    const PlotStyle &m_style;
    const Overview &m_overview;
    double m_top = 1; ///< magnitude at the top
};
