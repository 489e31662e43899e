// SPDX-License-Identifier: Apache-2.0
#include "TracePainter.h"

#include "base/EngineeringNumber.h"
#include "base/limits.h"
#include "plotdraw.h"
#include "view/plotscale.h"

#include <QCoreApplication>
#include <QFontMetricsF>
#include <QPainter>

#include <algorithm>
#include <array>
#include <cmath>

namespace {

constexpr int Divisions = 10;        ///< of the level axis
constexpr double MarkerPitch = 0.25; ///< of the pane's height from row to row
constexpr double MarkerHeight = 0.1; ///< of a high level over a low one
constexpr double LogRange = 100.0;   ///< dB from bottom to top
constexpr double HalfTurn = 3.1415;  ///< rad at the top of the phase scale
constexpr int GridAlpha = 70;
constexpr double PaneInset = 10; ///< pixels left free above and below the values

/// Keeps what lies far off the pane within the range that a rasteriser can handle.
double drawable(double fraction)
{
    constexpr double FarOff = 4;
    return fraction > -FarOff ? std::min(fraction, FarOff + 1) : -FarOff;
}

double logLevel(double magnitude)
{
    return magnitude > 0 ? std::clamp(20 * std::log10(magnitude), -LogRange, 0.0) : -LogRange;
}

/// Fills between two edges with the same horizontal places, column by column: a fraction of the
/// cost of filling one polygon of a thousand corners. The outline is drawn over it.
void fillBetween(const PixelGrid &pixels, const QPolygonF &upper, const QPolygonF &lower,
                 const QRectF &pane, const QColor &color)
{
    const double column = 1 / pixels.ratio();
    for (qsizetype k = 1; k < upper.size(); ++k) {
        const double left = upper.at(k - 1).x();
        const double width = upper.at(k).x() - left;
        const double start = pixels.snap(left);
        const int columns = static_cast<int>(std::ceil((left + width - start) / column));
        for (int step = 0; step < columns; ++step) {
            const double x = start + step * column;
            const double share = std::max(0.0, (x - left) / width);
            const double first = upper.at(k - 1).y() * (1 - share) + upper.at(k).y() * share;
            const double second = lower.at(k - 1).y() * (1 - share) + lower.at(k).y() * share;
            const double top = std::max(std::min(first, second), pane.top());
            const double bottom = std::min(std::max(first, second), pane.bottom());
            if (bottom > top) {
                pixels.fill(QRectF(x, top, column, bottom - top), color);
            }
        }
    }
}

QString translated(const char *text)
{
    return QCoreApplication::translate("TracePainter", text);
}

} // namespace

TracePainter::TracePainter(const PlotStyle &style, const TraceScene &scene)
    : m_style(style)
    , m_scene(scene)
{
}

QMargins TracePainter::margins(const QFont &font)
{
    const QFontMetricsF metrics(font);
    const int left = static_cast<int>(std::ceil(metrics.horizontalAdvance("-100 MHz"))) + 6;
    const int bottom = static_cast<int>(std::ceil(metrics.height())) + 6;
    return {left, 6, 8, bottom};
}

QList<QRectF> TracePainter::panes(const QRectF &plot) const
{
    const int valuePanes = m_scene.mode == TraceMode::IqEnvelope ? 2 : 1;
    const double valueHeight = m_scene.showMarkers ? plot.height() * 2 / 3 : plot.height();
    const double height = valueHeight / valuePanes;
    QList<QRectF> result;
    for (int k = 0; k < valuePanes; ++k) {
        result += QRectF(plot.left(), plot.top() + k * height, plot.width(), height);
    }
    if (m_scene.showMarkers) {
        result += QRectF(plot.left(), plot.top() + valueHeight, plot.width(),
                         plot.height() - valueHeight);
    }
    return result;
}

double TracePainter::yOf(const QRectF &pane, double fraction)
{
    return pane.top() + PaneInset + (1 - fraction) * (pane.height() - 2 * PaneInset);
}

double TracePainter::xOf(const QRectF &plot, int bin)
{
    return std::floor(plot.width() / TraceBins::BinCount * bin + 0.5) + plot.left();
}

QList<TracePainter::Label> TracePainter::labels() const
{
    const double zoom = m_scene.zoomY;
    QList<Label> result;
    switch (m_scene.mode) {
    case TraceMode::IqEnvelope:
        // In the order of their weight, for panes that have no room for all: full scale is seen.
        for (const double value : {0.0, 1.0, -1.0, 0.7, -0.7}) {
            result += {(value + 1) / 2, QString::number(value / zoom)};
        }
        break;
    case TraceMode::LogMagEnvelope:
    case TraceMode::LogMagAverage:
        for (int k = 0; k <= Divisions; ++k) {
            result += {1.0 - static_cast<double>(k) / Divisions,
                       QString("%1 dB").arg(
                           k == 0 && m_scene.topDb == 0 ? 0.0 : m_scene.topDb - 10 * k / zoom)};
        }
        break;
    case TraceMode::LinMagAverage: {
        const int digits = 1 + std::max(0, static_cast<int>(std::ceil(std::log10(zoom))));
        for (int k = Divisions; k >= 0; --k) {
            const double fraction = static_cast<double>(k) / Divisions;
            result += {fraction, QString::number(fraction / zoom, 'f', digits)};
        }
        break;
    }
    case TraceMode::Frequency:
        if (m_scene.clockHz > 0) {
            const double range = m_scene.clockHz / 2 / zoom;
            const PlotAxis axis{-range, range, "Hz"};
            const AxisTexts texts(axis);
            const double step = niceStep(range / 4);
            for (const double value : axisTicks(axis, step)) {
                result += {(value / range + 1) / 2, texts.tick(value, step)};
            }
            break;
        }
        [[fallthrough]];
    case TraceMode::Phase:
        result += {0.75, QString("\u03c0/%1").arg(2 * zoom)};
        result += {0.5, "0"};
        result += {0.25, QString("-\u03c0/%1").arg(2 * zoom)};
        break;
    }
    return result;
}

double TracePainter::fractionOf(double value) const
{
    const double zoom = m_scene.zoomY;
    switch (m_scene.mode) {
    case TraceMode::IqEnvelope:
        return (value * zoom + 1) * 0.5;
    case TraceMode::LogMagEnvelope:
    case TraceMode::LogMagAverage:
        return (logLevel(value) - m_scene.topDb) * zoom / LogRange + 1;
    case TraceMode::LinMagAverage:
        return value * zoom;
    case TraceMode::Phase:
    case TraceMode::Frequency:
        break;
    }
    return (value * zoom / HalfTurn + 1) * 0.5;
}

void TracePainter::paint(QPainter &painter, const QRectF &area) const
{
    const QRectF plot = area.marginsRemoved(margins(m_style.font));
    painter.save();
    fillArea(painter, area, m_style.color(ColorSlot::PanelBackground));
    if (plot.width() > 0 && plot.height() > 0) {
        const PixelGrid grid(painter);
        const QList<QRectF> rects = panes(plot);
        paintRange(painter, plot);
        const double division =
            paintHorizontalAxis(painter, grid, m_style, area, plot, timeAxis(), GridAlpha);
        const qsizetype valuePanes = rects.size() - (m_scene.showMarkers ? 1 : 0);
        for (qsizetype k = 0; k < rects.size(); ++k) {
            QList<Label> texts = labels();
            if (k == valuePanes) {
                texts.clear();
                for (int row = 0; row < MarkerCount; ++row) {
                    texts += {(MarkerCount - 1 - row) * MarkerPitch + MarkerHeight / 2,
                              QString("M%1").arg(row + 1)};
                }
            }
            paintAxis(painter, grid, area, rects.at(k), texts);
        }
        if (m_scene.sampleCount >= TraceBins::MinSamples) {
            for (int k = 0; k < valuePanes; ++k) {
                paintPaneOfMode(painter, plot, rects.at(k), k);
            }
            if (m_scene.showMarkers) {
                paintMarkers(grid, plot, rects.last());
            }
        }
        paintCaptions(painter, rects);
        paintQuantity(painter, rects.first(), division);
        paintCursors(painter, grid, plot, rects);
    }
    painter.restore();
}

void TracePainter::paintAxis(QPainter &painter, const PixelGrid &grid, const QRectF &area,
                             const QRectF &pane, const QList<Label> &texts) const
{
    const QColor gridColor = m_style.color(ColorSlot::GridLines, GridAlpha);
    painter.setFont(m_style.font);
    painter.setPen(m_style.color(ColorSlot::Text));
    const double height = QFontMetricsF(m_style.font).height();
    const bool inSteps = texts.size() > 5; // of one size, of which every n-th gets its text
    const double spacing =
        inSteps ? std::fabs(yOf(pane, texts.at(1).fraction) - yOf(pane, texts.at(0).fraction)) : 0;
    const int stride = inSteps ? labelStride(spacing, height) : 1;
    QList<double> placed;
    for (qsizetype k = 0; k < texts.size(); ++k) {
        const double y = yOf(pane, texts.at(k).fraction);
        grid.horizontal(y, pane.left(), pane.right(), gridColor);
        const bool hasRoom = std::none_of(placed.begin(), placed.end(), [&](double other) {
            return std::fabs(other - y) < height;
        });
        if (k % stride == 0 && hasRoom) {
            placed += y;
            painter.drawText(
                QRectF(area.left(), y - height / 2, pane.left() - area.left() - 4, height),
                Qt::AlignRight | Qt::AlignVCenter, texts.at(k).text);
        }
    }
    grid.frame(pane, m_style.color(ColorSlot::GridLines));
}

void TracePainter::paintPaneOfMode(QPainter &painter, const QRectF &plot, const QRectF &pane,
                                   int index) const
{
    switch (m_scene.mode) {
    case TraceMode::IqEnvelope:
        if (index == 0) {
            paintValues(painter, plot, pane, &TraceBin::iMax, &TraceBin::iMin,
                        ColorSlot::AverageTrace);
        } else {
            paintValues(painter, plot, pane, &TraceBin::qMax, &TraceBin::qMin,
                        ColorSlot::PeakTrace);
        }
        break;
    case TraceMode::LogMagEnvelope:
        paintValues(painter, plot, pane, &TraceBin::magMax, &TraceBin::magMin,
                    ColorSlot::AverageTrace);
        break;
    case TraceMode::LogMagAverage:
    case TraceMode::LinMagAverage:
        paintValues(painter, plot, pane, &TraceBin::magAvg, nullptr, ColorSlot::AverageTrace);
        break;
    case TraceMode::Phase:
        paintValues(painter, plot, pane, &TraceBin::phaseHigh, &TraceBin::phaseLow,
                    ColorSlot::AverageTrace);
        break;
    case TraceMode::Frequency:
        paintValues(painter, plot, pane, &TraceBin::freqMax, &TraceBin::freqMin,
                    ColorSlot::AverageTrace);
        break;
    }
}

void TracePainter::paintValues(QPainter &painter, const QRectF &plot, const QRectF &pane,
                               double TraceBin::*upper, double TraceBin::*lower,
                               ColorSlot place) const
{
    QPolygonF upperEdge;
    QPolygonF lowerEdge;
    upperEdge.reserve(qsizetype{2} * TraceBins::BinCount);
    lowerEdge.reserve(TraceBins::BinCount);
    const auto &bins = m_scene.bins.bins();
    // The last column is as wide as the others; of single samples there is nothing behind the last.
    const int columns = TraceBins::BinCount + (m_scene.sampleCount >= TraceBins::BinCount ? 1 : 0);
    for (int k = 0; k < columns; ++k) {
        const TraceBin &bin = bins[static_cast<std::size_t>(std::min(k, TraceBins::BinCount - 1))];
        if (bin.count > 0) {
            const double x = xOf(plot, k);
            upperEdge += QPointF(x, yOf(pane, drawable(fractionOf(bin.*upper))));
            if (lower != nullptr) {
                lowerEdge += QPointF(x, yOf(pane, drawable(fractionOf(bin.*lower))));
            }
        }
    }
    painter.save();
    painter.setClipRect(pane);
    const QColor color = m_style.color(place);
    const PixelGrid pixels(painter);
    if (lower != nullptr) {
        fillBetween(pixels, upperEdge, lowerEdge, pane, color);
    }
    painter.translate(pixels.lineWidth() / 2, pixels.lineWidth() / 2); // onto the grid lines
    painter.setRenderHint(QPainter::Antialiasing);
    painter.setPen(QPen(color, 1));
    painter.setBrush(Qt::NoBrush);
    const QPolygonF dots = upperEdge;
    if (lower != nullptr) {
        std::reverse(lowerEdge.begin(), lowerEdge.end());
        upperEdge += lowerEdge;
        painter.drawPolygon(upperEdge);
    } else {
        painter.drawPolyline(upperEdge);
    }
    if (m_scene.bins.isSparse()) {
        constexpr double Radius = 1.75;
        painter.setPen(Qt::NoPen);
        painter.setBrush(color);
        for (const QPointF &dot : dots) {
            painter.drawEllipse(dot, Radius, Radius);
        }
    }
    painter.restore();
}

bool TracePainter::isLowBehind(int bin, quint8 bit) const
{
    const auto &bins = m_scene.bins.bins();
    const auto next = std::find_if(bins.begin() + bin + 1, bins.end(),
                                   [](const TraceBin &behind) { return behind.count > 0; });
    return next != bins.end() && (next->mkrHigh & bit) == 0;
}

void TracePainter::paintMarkers(const PixelGrid &grid, const QRectF &plot, const QRectF &pane) const
{
    const auto &bins = m_scene.bins.bins();
    for (int row = 0; row < MarkerCount; ++row) {
        const auto bit = static_cast<quint8>(1U << static_cast<unsigned>(row));
        const double base = (MarkerCount - 1 - row) * MarkerPitch;
        const double lowY = grid.snap(yOf(pane, base));
        const double highY = grid.snap(yOf(pane, base + MarkerHeight));
        constexpr std::array RowColors{ColorSlot::PrimaryMarker, ColorSlot::SecondaryMarker,
                                       ColorSlot::AverageTrace, ColorSlot::PeakTrace};
        const QColor color = m_style.color(RowColors[static_cast<std::size_t>(row)]);
        const auto edge = [&](double x) {
            grid.vertical(x, highY, lowY + grid.lineWidth(), color);
        };
        int level = -1; // of the line that is being drawn: 0 low, 1 high, -1 none yet
        double lineStart = 0;
        for (int k = 0; k < TraceBins::BinCount; ++k) {
            const TraceBin &bin = bins[static_cast<std::size_t>(k)];
            if (bin.count == 0) {
                continue;
            }
            const double x = xOf(plot, k);
            const int binLevel = (bin.mkrHigh & bit) != 0 ? 1 : 0;
            const bool changes = level >= 0 && binLevel != level;
            if (level != binLevel) {
                if (changes) {
                    grid.horizontal(level == 1 ? highY : lowY, lineStart, x, color);
                }
                level = binLevel;
                lineStart = x;
            }
            // A marker that falls within a bin has its edge where the next one is low.
            if (changes || ((bin.mkrHigh & bin.mkrLow & bit) != 0 && !isLowBehind(k, bit))) {
                edge(x);
            }
        }
        if (level >= 0) {
            grid.horizontal(level == 1 ? highY : lowY, lineStart, plot.right(), color);
        }
    }
}

void TracePainter::paintRange(QPainter &painter, const QRectF &plot) const
{
    const auto [first, last] = m_scene.rangeBins;
    if (first < 0) {
        return;
    }
    const double left = xOf(plot, first);
    const double right = std::max(xOf(plot, last), left + 1);
    fillArea(painter, QRectF(left, plot.top(), right - left, plot.height()),
             m_style.color(ColorSlot::PeakTrace, 50));
}

void TracePainter::paintCursors(QPainter &painter, const PixelGrid &grid, const QRectF &plot,
                                const QList<QRectF> &panes) const
{
    constexpr double Serif = 3;
    constexpr double FlagSize = 7;
    constexpr int Reference = 1;
    for (int which = 0; which < 2; ++which) {
        const int bin = m_scene.cursorBins[static_cast<std::size_t>(which)];
        if (bin < 0 || bin >= TraceBins::BinCount) {
            continue;
        }
        const double x = grid.snap(xOf(plot, bin));
        const QColor color = m_style.color(which == Reference ? ColorSlot::SecondaryMarker
                                                              : ColorSlot::PrimaryMarker);
        for (const QRectF &pane : panes) {
            const double top = yOf(pane, 0.95);
            const double bottom = yOf(pane, 0.05);
            grid.vertical(x, top, bottom, color);
            if (which == Reference) {
                grid.horizontal(top, x - Serif, x + Serif + grid.lineWidth(), color);
                grid.horizontal(bottom, x - Serif, x + Serif + grid.lineWidth(), color);
            }
        }
    }
    // Where a measuring cursor is set it stands at the very place of the mouse cursor.
    if (m_scene.cursorBins[0] < 0 && m_scene.mouseBin >= 0 &&
        m_scene.mouseBin < TraceBins::BinCount) {
        const double x = xOf(plot, m_scene.mouseBin);
        grid.dashedVertical(x, plot.top(), plot.bottom(), m_style.color(ColorSlot::CursorLine));
        drawFlag(painter, x + grid.lineWidth() / 2, plot.bottom() - FlagSize, FlagShape::Bottom,
                 FlagSize, m_style.color(ColorSlot::TriggerSymbol));
    }
}

void TracePainter::paintCaptions(QPainter &painter, const QList<QRectF> &panes) const
{
    if (m_scene.mode == TraceMode::IqEnvelope) {
        drawCaption(painter, m_style, panes.at(0), Qt::AlignLeft | Qt::AlignTop, "I");
        drawCaption(painter, m_style, panes.at(1), Qt::AlignLeft | Qt::AlignTop, "Q");
    }
    if (m_scene.sampleCount > 0 && m_scene.sampleCount < TraceBins::MinSamples) {
        drawCaption(painter, m_style, panes.first(), Qt::AlignCenter,
                    translated("A trace needs %1 samples; there are only %2 here.")
                        .arg(TraceBins::MinSamples)
                        .arg(m_scene.sampleCount));
    } else if (const QString hint = scaleHint(); !hint.isEmpty()) {
        drawCaption(painter, m_style, panes.first(), Qt::AlignCenter, hint);
    }
}

PlotAxis TracePainter::timeAxis() const
{
    const auto first = static_cast<double>(m_scene.firstSample);
    const double end = first + static_cast<double>(m_scene.sampleCount);
    return m_scene.clockHz > 0 ? PlotAxis{first / m_scene.clockHz, end / m_scene.clockHz, "s"}
                               : PlotAxis{first, end, {}};
}

void TracePainter::paintQuantity(QPainter &painter, const QRectF &pane, double division) const
{
    QString caption = quantity();
    if (division > 0) {
        const QString text = m_scene.clockHz > 0 ? AxisTexts({0, division, "s"}).exact(division)
                                                 : translated("%1 samples").arg(division);
        caption += ", " + translated("%1/div").arg(text);
    }
    const QFontMetricsF metrics(m_style.font);
    if (metrics.horizontalAdvance(caption) < pane.width() - 2 * metrics.height()) {
        drawCaption(painter, m_style, pane, Qt::AlignRight | Qt::AlignTop, caption);
    }
}

QString TracePainter::quantity() const
{
    switch (m_scene.mode) {
    case TraceMode::IqEnvelope:
        return translated("Full scale 1");
    case TraceMode::LogMagEnvelope:
    case TraceMode::LogMagAverage:
        return translated("Magnitude in dBFS");
    case TraceMode::LinMagAverage:
        return translated("Magnitude, full scale 1");
    case TraceMode::Phase:
        return translated("Phase in rad");
    case TraceMode::Frequency:
        break;
    }
    return m_scene.clockHz > 0 ? translated("Frequency")
                               : translated("Frequency in rad per sample");
}

QString TracePainter::scaleHint() const
{
    const bool isLog =
        m_scene.mode == TraceMode::LogMagEnvelope || m_scene.mode == TraceMode::LogMagAverage;
    if (!isLog || m_scene.sampleCount < TraceBins::MinSamples) {
        return {};
    }
    double highest = -1;
    for (const TraceBin &bin : m_scene.bins.bins()) {
        if (bin.count > 0) {
            highest = std::max(
                highest,
                fractionOf(m_scene.mode == TraceMode::LogMagAverage ? bin.magAvg : bin.magMax));
        }
    }
    return highest < 0 ? translated("The signal lies below the scale.") : QString();
}
