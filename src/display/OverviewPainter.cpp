// SPDX-License-Identifier: Apache-2.0
#include "OverviewPainter.h"

#include "base/limits.h"
#include "plotaxis.h"
#include "plotdraw.h"

#include <QFontMetricsF>
#include <QPainter>

#include <algorithm>
#include <array>
#include <cmath>

namespace {

constexpr int GridAlpha = 70;

} // namespace

OverviewPainter::OverviewPainter(const PlotStyle &style, const Overview &overview)
    : m_style(style)
    , m_overview(overview)
{
    constexpr double Rounding = 1e-4; // a peak of full scale may exceed it by that
    for (const OverviewBin &bin : overview.bins()) {
        if (static_cast<double>(bin.high) > m_top + Rounding) {
            m_top = static_cast<double>(bin.high);
        }
    }
}

QRectF OverviewPainter::plotOf(const PlotStyle &style, const QRectF &area)
{
    const QFontMetricsF metrics(style.font);
    const double left = std::ceil(metrics.horizontalAdvance("1.234")) + 10;
    return area.adjusted(left, 8, -10, -metrics.height() - 7);
}

void OverviewPainter::paint(QPainter &painter, const QRectF &area, double clockHz) const
{
    const QRectF plot = plotOf(m_style, area);
    fillArea(painter, area, m_style.color(ColorSlot::PanelBackground));
    if (plot.width() <= 0 || plot.height() <= 0) {
        return;
    }
    const PixelGrid pixels(painter);
    const auto samples = static_cast<double>(m_overview.samples());
    const PlotAxis time =
        clockHz > 0 ? PlotAxis{0, samples / clockHz, "s"} : PlotAxis{0, samples, {}};
    paintVerticalAxis(painter, pixels, m_style, area, plot, {0, m_top, {}}, GridAlpha);
    paintHorizontalAxis(painter, pixels, m_style, area, plot, time, GridAlpha);
    paintBare(painter, plot);
    pixels.frame(plot, m_style.color(ColorSlot::GridLines));
    drawCaption(painter, m_style, plot, Qt::AlignRight | Qt::AlignTop,
                "Magnitude, full scale 1, whole file");
}

void OverviewPainter::paintBare(QPainter &painter, const QRectF &place) const
{
    const auto &bins = m_overview.bins();
    if (bins.empty()) {
        return;
    }
    const PixelGrid pixels(painter);
    const quint8 seen = m_overview.markersSeen();
    int rows = 0;
    for (int row = 0; row < MarkerCount; ++row) {
        rows += (seen >> row) & 1;
    }
    const double rowHeight = std::min(place.height() / 10, 12.0);
    const QRectF values = place.adjusted(0, 0, 0, -rows * rowHeight);
    const auto yOf = [&](float magnitude) {
        return values.bottom() -
               std::min(static_cast<double>(magnitude) / m_top, 1.0) * values.height();
    };
    const double column = 1 / pixels.ratio();
    const int columns = static_cast<int>(std::ceil(place.width() / column));
    const auto count = static_cast<double>(bins.size());
    const QColor color = m_style.color(ColorSlot::AverageTrace);
    const QColor faint = m_style.color(ColorSlot::AverageTrace, 90); // below the envelope
    const auto taken = m_overview.samples() > 0
                           ? static_cast<double>(m_overview.taken()) /
                                 static_cast<double>(m_overview.samples()) * count
                           : 0.0;
    for (int k = 0; k < columns; ++k) {
        const auto from = static_cast<std::size_t>(k * count / columns);
        const auto to = static_cast<std::size_t>((k + 1) * count / columns);
        if (static_cast<double>(from) >= taken) {
            break;
        }
        float low = bins[from].low;
        float high = bins[from].high;
        for (std::size_t bin = from + 1; bin < std::min(to, bins.size()); ++bin) {
            low = std::min(low, bins[bin].low);
            high = std::max(high, bins[bin].high);
        }
        const double top = yOf(high);
        const double bottom = std::max(yOf(low), top + pixels.lineWidth());
        const double left = place.left() + k * column;
        fillArea(painter, QRectF(left, top, column, values.bottom() - top), faint);
        fillArea(painter, QRectF(left, top, column, bottom - top), color);
    }
    constexpr std::array RowColors{ColorSlot::PrimaryMarker, ColorSlot::SecondaryMarker,
                                   ColorSlot::AverageTrace, ColorSlot::PeakTrace};
    double top = values.bottom();
    for (std::size_t row = 0; row < RowColors.size(); ++row) {
        const auto bit = static_cast<quint8>(1U << row);
        if ((seen & bit) != 0) {
            paintMarkerRow(painter, QRectF(place.left(), top, place.width(), rowHeight), bit,
                           RowColors[row]);
            top += rowHeight;
        }
    }
}

void OverviewPainter::paintMarkerRow(QPainter &painter, const QRectF &row, quint8 bit,
                                     ColorSlot slot) const
{
    const auto &bins = m_overview.bins();
    const double width = row.width() / static_cast<double>(bins.size());
    const PixelGrid pixels(painter);
    for (std::size_t k = 0; k < bins.size(); ++k) {
        if ((bins[k].markersHigh & bit) == 0) {
            continue;
        }
        const double left = row.left() + static_cast<double>(k) * width;
        const double thick = std::max(row.height() * 0.5, pixels.lineWidth());
        fillArea(
            painter,
            QRectF(left, row.center().y() - thick / 2, std::max(width, pixels.lineWidth()), thick),
            m_style.color(slot));
    }
}
