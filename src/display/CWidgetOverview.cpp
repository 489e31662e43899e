// SPDX-License-Identifier: Apache-2.0
#include "CWidgetOverview.h"

#include "OverviewPainter.h"
#include "plotdraw.h"

#include <QMouseEvent>
#include <QPainter>
#include <QTextStream>

#include <algorithm>
#include <cmath>

CWidgetOverview::CWidgetOverview(QWidget *parent)
    : CWidgetBase(parent)
{
    setAccessibleName("Whole waveform");
}

void CWidgetOverview::setOverview(const Overview &overview, double clockHz)
{
    m_overview = overview;
    m_clockHz = clockHz;
    update();
}

void CWidgetOverview::setRange(qint64 first, qint64 count)
{
    m_first = first;
    m_count = count;
    update();
}

void CWidgetOverview::drawPlot(QPainter &painter, const QRectF &area)
{
    OverviewPainter(plotStyle(), m_overview).paint(painter, area, m_clockHz);
    const QRectF plot = OverviewPainter::plotOf(plotStyle(), area);
    if (m_overview.samples() < 1 || m_count < 1 || plot.width() <= 0) {
        return;
    }
    constexpr int ShadeAlpha = 70;
    constexpr double SmallestWidth = 2; // a short view in a long file stays visible
    const double scale = plot.width() / static_cast<double>(m_overview.samples());
    const double left = plot.left() + static_cast<double>(m_first) * scale;
    const double width = std::max(static_cast<double>(m_count) * scale, SmallestWidth);
    fillArea(painter, QRectF(left, plot.top(), width, plot.height()).intersected(plot),
             plotStyle().color(ColorSlot::PrimaryMarker, ShadeAlpha));
}

void CWidgetOverview::writeData(QTextStream &stream)
{
    stream << "sample,lowest_magnitude,highest_magnitude\n";
    const auto &bins = m_overview.bins();
    const auto count = static_cast<qint64>(bins.size());
    for (qint64 bin = 0; bin < count; ++bin) {
        const OverviewBin &values = bins[static_cast<std::size_t>(bin)];
        stream << m_overview.samples() / count * bin + m_overview.samples() % count * bin / count
               << ',' << values.low << ',' << values.high << '\n';
    }
}

void CWidgetOverview::mousePressEvent(QMouseEvent *event)
{
    const QRectF plot = OverviewPainter::plotOf(plotStyle(), QRectF(rect()));
    const double share = (event->position().x() - plot.left()) / plot.width();
    if (event->button() != Qt::LeftButton || m_overview.samples() < 1 || share < 0 || share > 1) {
        CWidgetBase::mousePressEvent(event);
        return;
    }
    const auto samples = static_cast<double>(m_overview.samples());
    emit sampleChosen(
        std::min(static_cast<qint64>(std::floor(share * samples)), m_overview.samples() - 1));
}
