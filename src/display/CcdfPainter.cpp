// SPDX-License-Identifier: Apache-2.0
#include "CcdfPainter.h"

#include "plotaxis.h"
#include "plotdraw.h"
#include "view/plotscale.h"

#include <QFontMetricsF>
#include <QPainter>

#include <algorithm>
#include <cmath>

namespace {

constexpr int GridAlpha = 70;

QString percentText(double probability)
{
    return QString::number(probability * 100, 'g', 4) + " %";
}

} // namespace

CcdfPainter::CcdfPainter(const PlotStyle &style, const SignalFigures &figures)
    : m_style(style)
    , m_figures(figures)
{
    m_mostDb = std::max(m_mostDb, std::ceil(figures.crestDb()) + 1);
    // No sample is rarer than one of all.
    const double rarest = std::log10(static_cast<double>(std::max<qint64>(figures.samples, 1)));
    m_decades = std::clamp(static_cast<int>(std::ceil(rarest)), 2, m_decades);
}

double CcdfPainter::yOf(const QRectF &plot, double probability) const
{
    const double depth = probability > 0 ? -std::log10(probability) / m_decades : 2;
    return plot.top() + std::min(depth, 2.0) * plot.height();
}

double CcdfPainter::probabilityAt(double db) const
{
    const auto &points = m_figures.ccdf;
    const auto next = std::lower_bound(
        points.begin(), points.end(), db,
        [](const CcdfPoint &point, double value) { return point.overMeanDb < value; });
    return next != points.end() ? next->probability : 0;
}

void CcdfPainter::paint(QPainter &painter, const QRectF &area, const QRectF &plot) const
{
    const PixelGrid pixels(painter);
    const double height = QFontMetricsF(m_style.font).height();
    const int stride = labelStride(plot.height() / m_decades, height);
    painter.setFont(m_style.font);
    for (int decade = 0; decade <= m_decades; ++decade) {
        const double y = yOf(plot, std::pow(10.0, -decade));
        pixels.horizontal(y, plot.left(), plot.right(),
                          m_style.color(ColorSlot::GridLines, GridAlpha));
        if (decade % stride == 0) {
            painter.setPen(m_style.color(ColorSlot::Text));
            painter.drawText(
                QRectF(area.left(), std::min(y - height / 2, plot.bottom() + 3 - height),
                       plot.left() - area.left() - 4, height),
                Qt::AlignRight | Qt::AlignVCenter, percentText(std::pow(10.0, -decade)));
        }
    }
    paintHorizontalAxis(painter, pixels, m_style, area, plot, {0, m_mostDb, "dB"}, GridAlpha);
    const auto xOf = [&](double db) { return plot.left() + db / m_mostDb * plot.width(); };
    QPolygonF noise;
    for (double db = 0; db <= m_mostDb; db += 0.1) {
        noise += QPointF(xOf(db), yOf(plot, gaussianCcdf(db)));
    }
    QPolygonF signal;
    for (const CcdfPoint &point : m_figures.ccdf) {
        signal += QPointF(xOf(point.overMeanDb), yOf(plot, point.probability));
    }
    painter.save();
    painter.setClipRect(plot);
    painter.setRenderHint(QPainter::Antialiasing);
    painter.setPen(QPen(m_style.color(ColorSlot::PeakTrace), 1, Qt::DashLine));
    painter.drawPolyline(noise);
    painter.setPen(QPen(m_style.color(ColorSlot::AverageTrace), 1.5));
    painter.drawPolyline(signal);
    painter.restore();
    const QString caption =
        m_figures.ccdf.empty()
            ? QString("Silence has no distribution.")
            : QString("Power over mean (%1 dBFS); peak %2 dB over it; dashed: Gaussian noise")
                  .arg(magnitudeToDb(m_figures.rms), 0, 'f', 2)
                  .arg(m_figures.crestDb(), 0, 'f', 2);
    drawCaption(painter, m_style, plot.adjusted(0, 0, -plot.width() * 0.1, 0),
                Qt::AlignRight | Qt::AlignTop, caption);
}

QStringList CcdfPainter::readOut(const QPointF &place, const QRectF &plot) const
{
    if (m_figures.ccdf.empty()) {
        return {};
    }
    const double db = (place.x() - plot.left()) / plot.width() * m_mostDb;
    return {QString("%1 dB over mean").arg(db, 0, 'f', 2),
            QString("Signal %1").arg(percentText(probabilityAt(db))),
            QString("Noise %1").arg(percentText(gaussianCcdf(db)))};
}
