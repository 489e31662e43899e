// SPDX-License-Identifier: Apache-2.0
#pragma once

#include "display/TracePainter.h"
#include "display/renderplot.h"

#include <QImage>

inline constexpr QSize PlotSize(720, 400); // the waterfall has more columns than bins
inline const QRectF PlotArea(0, 0, PlotSize.width(), PlotSize.height());

inline QImage pictureOf(PlotView view, const IqList &samples, const QList<quint8> &markers = {},
                        double ratio = 1)
{
    MemorySource source(samples, markers);
    PlotRequest request;
    request.view = view;
    request.clockHz = 100e6;
    request.size = PlotSize;
    request.pixelRatio = ratio;
    request.showMarkers = !markers.isEmpty();
    return renderPlot(request, source);
}

inline QRectF tracePlot()
{
    return PlotArea.marginsRemoved(TracePainter::margins(PlotStyle::current().font));
}

inline QColor plotColor(ColorSlot place)
{
    return PlotStyle::current().color(place);
}
