// SPDX-License-Identifier: Apache-2.0
#include "SpectrumPainter.h"

#include "CcdfPainter.h"
#include "base/EngineeringNumber.h"
#include "plotdraw.h"
#include "view/plotscale.h"
#include "waterfall.h"

#include <QCoreApplication>
#include <QFontMetricsF>
#include <QPainter>

#include <algorithm>
#include <cmath>

namespace {

constexpr int Bins = SpectrumLines::FrameSize;
constexpr int GridAlpha = 70;
constexpr double LevelInset = 10; ///< pixels above the top line, where more still shows
constexpr double ColorBarGap = 6;
constexpr double ColorBarWidth = 10;

QString translated(const char *text)
{
    return QCoreApplication::translate("SpectrumPainter", text);
}

} // namespace

SpectrumPainter::SpectrumPainter(const PlotStyle &style, const SpectrumScene &scene)
    : m_style(style)
    , m_scene(scene)
{
}

QMargins SpectrumPainter::margins(const QFont &font, SpectrumMode mode)
{
    const QFontMetricsF metrics(font);
    const bool waterfall = mode == SpectrumMode::Waterfall;
    const double left = metrics.horizontalAdvance(waterfall ? "888.888 ms" : "-150 dB") + 8;
    const double right =
        waterfall ? ColorBarGap + ColorBarWidth + metrics.horizontalAdvance("-150 dB") + 6 : 10;
    const double bottom = metrics.height() + 7;
    const double top = metrics.height() / 2 + 2;
    return {static_cast<int>(std::ceil(left)), static_cast<int>(std::ceil(top)),
            static_cast<int>(std::ceil(right)), static_cast<int>(std::ceil(bottom))};
}

QSize SpectrumPainter::waterfallSize(const QRectF &plot, double ratio)
{
    return {static_cast<int>(std::lround(plot.width() * ratio)),
            static_cast<int>(std::lround(plot.height() * ratio))};
}

double SpectrumPainter::xOf(const QRectF &plot, double bin)
{
    return plot.left() + (bin + 0.5) / Bins * plot.width();
}

double SpectrumPainter::yOf(const QRectF &plot, double db) const
{
    const double range = m_scene.dbPerDivision * Divisions;
    return plot.top() + LevelInset -
           (db - m_scene.referenceDb) / range * (plot.height() - LevelInset);
}

double SpectrumPainter::xOfShare(const QRectF &plot, double share) const
{
    // A point stands for the stretch about its frequency; the first one begins at the left edge.
    const auto points =
        static_cast<double>(m_scene.trace.level.empty() ? Bins : m_scene.trace.level.size());
    const double span = m_scene.highShare - m_scene.lowShare;
    return plot.left() + (share + 0.5 / points - m_scene.lowShare) / span * plot.width();
}

double SpectrumPainter::shareAt(const QRectF &plot, double x) const
{
    const auto points =
        static_cast<double>(m_scene.trace.level.empty() ? Bins : m_scene.trace.level.size());
    const double span = m_scene.highShare - m_scene.lowShare;
    return m_scene.lowShare + (x - plot.left()) / plot.width() * span - 0.5 / points;
}

QRectF SpectrumPainter::colorBar(const QRectF &plot)
{
    return {plot.right() + ColorBarGap, plot.top(), ColorBarWidth, plot.height()};
}

void SpectrumPainter::paint(QPainter &painter, const QRectF &area) const
{
    painter.save();
    fillArea(painter, area, m_style.color(ColorSlot::PanelBackground));
    painter.setFont(m_style.font);
    const QRectF plot = area.marginsRemoved(margins(m_style.font, m_scene.mode));
    if (plot.width() > 0 && plot.height() > LevelInset) {
        const PixelGrid pixels(painter);
        switch (m_scene.mode) {
        case SpectrumMode::Waterfall:
            paintWaterfall(painter, pixels, area, plot);
            break;
        case SpectrumMode::Ccdf:
            CcdfPainter(m_style, m_scene.figures).paint(painter, area, plot);
            break;
        case SpectrumMode::Spectrum:
            paintSpectrum(painter, pixels, area, plot);
            break;
        }
        pixels.frame(plot, m_style.color(ColorSlot::GridLines));
        paintHint(painter, plot);
        paintMouse(painter, pixels, area, plot);
    }
    painter.restore();
}

void SpectrumPainter::paintMouse(QPainter &painter, const PixelGrid &pixels, const QRectF &area,
                                 const QRectF &plot) const
{
    const QStringList lines = m_scene.mouse ? readOut(*m_scene.mouse, plot) : QStringList();
    if (lines.isEmpty()) {
        return;
    }
    pixels.dashedVertical(m_scene.mouse->x(), plot.top(), plot.bottom(),
                          m_style.color(ColorSlot::CursorLine, 150));
    ValueBox box;
    box.lines = lines;
    box.cornerRadius = 5;
    drawValueBoxWhereRoom(painter, m_style, *m_scene.mouse, box, area);
}

void SpectrumPainter::paintSpectrum(QPainter &painter, const PixelGrid &pixels, const QRectF &area,
                                    const QRectF &plot) const
{
    const double height = QFontMetricsF(m_style.font).height();
    const double spacing = (plot.height() - LevelInset) / Divisions;
    const int stride = labelStride(spacing, height);
    painter.setPen(m_style.color(ColorSlot::Text));
    for (int k = 0; k <= Divisions; ++k) {
        const double level = m_scene.referenceDb - k * m_scene.dbPerDivision;
        const double y = yOf(plot, level);
        pixels.horizontal(y, plot.left(), plot.right(),
                          m_style.color(ColorSlot::GridLines, GridAlpha));
        if (k % stride == 0) {
            painter.drawText(QRectF(area.left(),
                                    std::min(y - height / 2, plot.bottom() + 3 - height),
                                    plot.left() - area.left() - 4, height),
                             Qt::AlignRight | Qt::AlignVCenter,
                             QString("%1 dB").arg(level == 0 ? 0.0 : level, 0, 'g', 5));
        }
    }
    // The texts stand under the middles of their points.
    const double shift = xOfShare(plot, m_scene.lowShare) - plot.left();
    paintHorizontalAxis(painter, pixels, m_style, area, plot.translated(shift, 0),
                        frequencyAxis(m_scene.clockHz, m_scene.lowShare, m_scene.highShare),
                        GridAlpha);
    painter.save();
    painter.setClipRect(plot);
    if (!m_scene.trace.maximum.empty()) {
        paintTrace(painter, pixels, plot, m_scene.trace.maximum, ColorSlot::PeakTrace);
    }
    paintTrace(painter, pixels, plot, m_scene.trace.level, ColorSlot::AverageTrace);
    painter.restore();
    paintMarkers(painter, plot);
    paintSpectrumTexts(painter, plot);
}

/// Of the points that share a column of pixels the greatest and the least are drawn, so that a line
/// between two columns is never lost.
void SpectrumPainter::paintTrace(QPainter &painter, const PixelGrid &pixels, const QRectF &plot,
                                 const std::vector<double> &levels, ColorSlot slot) const
{
    if (levels.empty()) {
        return;
    }
    const auto points = static_cast<double>(levels.size());
    const auto limited = [&](double place) {
        return static_cast<std::size_t>(std::clamp(place, 0.0, points - 1));
    };
    const std::size_t first = limited(std::floor((m_scene.lowShare + 0.5) * points) - 1);
    const std::size_t last = limited(std::ceil((m_scene.highShare + 0.5) * points) + 1);
    const auto place = [&](std::size_t point, double level) {
        const double share = static_cast<double>(point) / points - 0.5;
        return QPointF(xOfShare(plot, share), std::min(yOf(plot, level), plot.bottom() + 2));
    };
    QPolygonF line;
    const double column = 1 / pixels.ratio();
    std::size_t point = first;
    while (point <= last) {
        const double edge = place(point, 0).x() + column;
        double low = levels[point];
        double high = levels[point];
        std::size_t next = point + 1;
        for (; next <= last && place(next, 0).x() < edge; ++next) {
            low = std::min(low, levels[next]);
            high = std::max(high, levels[next]);
        }
        line += place(point, high);
        if (low < high) {
            line += place(point, low);
        }
        point = next;
    }
    painter.save();
    painter.setRenderHint(QPainter::Antialiasing);
    painter.setPen(QPen(m_style.color(slot), 1));
    painter.translate(pixels.lineWidth() / 2, pixels.lineWidth() / 2); // onto the grid lines
    painter.drawPolyline(line);
    painter.restore();
}

void SpectrumPainter::paintMarkers(QPainter &painter, const QRectF &plot) const
{
    constexpr double FlagSize = 8;
    const SpectrumTrace &trace = m_scene.trace;
    if (trace.level.empty()) {
        return;
    }
    const auto levelAt = [&](double share) { return trace.level[trace.pointAt(share)]; };
    const auto flag = [&](double share, ColorSlot slot) {
        const double x = xOfShare(plot, trace.shareOf(trace.pointAt(share)));
        if (x >= plot.left() && x <= plot.right()) {
            const double y =
                std::clamp(yOf(plot, levelAt(share)), plot.top() + FlagSize, plot.bottom());
            drawFlag(painter, x, y, FlagShape::Top, FlagSize, m_style.color(slot));
        }
    };
    if (m_scene.deltaMarker) {
        flag(*m_scene.deltaMarker, ColorSlot::SecondaryMarker);
    }
    if (m_scene.marker) {
        flag(*m_scene.marker, ColorSlot::PrimaryMarker);
    }
    const QStringList lines = markerTexts();
    if (!lines.isEmpty()) {
        drawCaption(painter, m_style, plot, Qt::AlignRight | Qt::AlignBottom, lines.join('\n'));
    }
}

QStringList SpectrumPainter::markerTexts() const
{
    const SpectrumTrace &trace = m_scene.trace;
    QStringList lines;
    if (trace.level.empty()) {
        return lines;
    }
    const auto levelAt = [&](double share) { return trace.level[trace.pointAt(share)]; };
    const auto frequencyAt = [&](double share) {
        return trace.shareOf(trace.pointAt(share)) * bandwidth();
    };
    if (m_scene.deltaMarker) {
        lines += translated("Ref  %1  %2 dBFS")
                     .arg(frequencyText(frequencyAt(*m_scene.deltaMarker)))
                     .arg(levelAt(*m_scene.deltaMarker), 0, 'f', 2);
    }
    if (m_scene.marker) {
        lines.prepend(translated("Mkr  %1  %2 dBFS")
                          .arg(frequencyText(frequencyAt(*m_scene.marker)))
                          .arg(levelAt(*m_scene.marker), 0, 'f', 2));
    }
    if (m_scene.marker && m_scene.deltaMarker) {
        lines += translated("\u0394  %1  %2 dB")
                     .arg(frequencyText(frequencyAt(*m_scene.marker) -
                                        frequencyAt(*m_scene.deltaMarker)))
                     .arg(levelAt(*m_scene.marker) - levelAt(*m_scene.deltaMarker), 0, 'f', 2);
    }
    return lines;
}

void SpectrumPainter::paintSpectrumTexts(QPainter &painter, const QRectF &plot) const
{
    const QFontMetricsF metrics(m_style.font);
    QString text = translated("%1 dB/div").arg(m_scene.dbPerDivision);
    const SpectrumTrace &trace = m_scene.trace;
    if (!trace.level.empty()) {
        const QString resolution = frequencyText(trace.resolution() * bandwidth());
        const QString details = translated("dBFS, %1, RBW %2, %3, %4")
                                    .arg(text, resolution, QString(trace.window))
                                    .arg(trace.frames);
        const QString whole = translated("%1 frames").arg(details);
        if (metrics.horizontalAdvance(whole) < plot.width() * 0.7) {
            text = whole;
        }
    }
    drawCaption(painter, m_style, plot, Qt::AlignLeft | Qt::AlignTop, text);
    if (trace.maximum.empty() || plot.width() < metrics.horizontalAdvance(text) * 1.5) {
        return;
    }
    QString name = translated("Mean (dB)");
    if (trace.level == trace.maximum) {
        return;
    }
    if (trace.level.size() != Bins || trace.window != SpectrumTrace().window) {
        name = translated("Power");
    }
    // In the colours of the traces.
    double top = plot.top() + 3;
    for (const auto &[label, slot] : {std::pair{name, ColorSlot::AverageTrace},
                                      std::pair{translated("Max"), ColorSlot::PeakTrace}}) {
        const double width = metrics.horizontalAdvance(label) + 1;
        const QRectF place(plot.right() - width - 8, top, width, metrics.height());
        fillArea(painter, place.adjusted(-3, 0, 3, 0),
                 m_style.color(ColorSlot::PanelBackground, 190));
        painter.setPen(m_style.color(slot));
        painter.drawText(place, Qt::AlignCenter, label);
        top += metrics.height();
    }
}

void SpectrumPainter::paintWaterfall(QPainter &painter, const PixelGrid &pixels, const QRectF &area,
                                     const QRectF &plot) const
{
    const QSize size = waterfallSize(plot, pixels.ratio());
    if (m_scene.waterfall.size() != size) {
        m_scene.waterfall =
            waterfallImage(m_scene.lines.lines(), m_scene.colors, size, m_scene.levels);
    }
    painter.drawImage(QRectF(pixels.snap(plot.left()), pixels.snap(plot.top()),
                             size.width() / pixels.ratio(), size.height() / pixels.ratio()),
                      m_scene.waterfall);
    const double half = plot.width() / Bins / 2;
    paintHorizontalAxis(painter, pixels, m_style, area, plot.translated(half, 0),
                        frequencyAxis(m_scene.clockHz, -0.5, 0.5), 0);
    paintTimeAxis(painter, pixels, area, plot);
    paintColorBar(painter, pixels, area, plot);
}

void SpectrumPainter::paintColorBar(QPainter &painter, const PixelGrid &pixels, const QRectF &area,
                                    const QRectF &plot) const
{
    const QRectF bar = colorBar(plot);
    const int rows = static_cast<int>(std::lround(bar.height() * pixels.ratio()));
    for (int row = 0; row < rows; ++row) {
        const double level = static_cast<double>(row) / rows * ColorTable::LowestDb;
        fillArea(painter,
                 QRectF(bar.left(), pixels.snap(bar.top()) + row / pixels.ratio(), bar.width(),
                        1 / pixels.ratio()),
                 QColor(ColorTable::colorOfLevel(m_scene.colors.mode(), level)));
    }
    pixels.frame(bar, m_style.color(ColorSlot::GridLines));
    painter.setPen(m_style.color(ColorSlot::Text));
    const double height = QFontMetricsF(m_style.font).height();
    const PlotAxis axis{m_scene.levels.low, m_scene.levels.high, {}};
    for (const double level : axisTicks(axis, axisStep(axis, plot.height(), height * 2))) {
        const double share = (axis.high - level) / (axis.high - axis.low);
        const double y = std::clamp(bar.top() + bar.height() * share - height / 2, area.top(),
                                    bar.bottom() + 3 - height);
        painter.drawText(QRectF(bar.right() + 3, y, area.right() - bar.right() - 3, height),
                         Qt::AlignLeft | Qt::AlignVCenter,
                         QString("%1 dB").arg(level == 0 ? 0.0 : level, 0, 'g', 4));
    }
}

/// A line of the waterfall tells of the middle of its frame.
PlotAxis SpectrumPainter::timeAxis() const
{
    const auto &lines = m_scene.lines.lines();
    if (lines.empty()) {
        return {0, 0, {}};
    }
    const double unit = m_scene.clockHz > 0 ? 1 / m_scene.clockHz : 1;
    const double first = static_cast<double>(lines.front().position) + Bins / 2.0;
    const double count = static_cast<double>(lines.size()) * SpectrumLines::FrameStep;
    return {first * unit, (first + count) * unit, m_scene.clockHz > 0 ? "s" : ""};
}

void SpectrumPainter::paintTimeAxis(QPainter &painter, const PixelGrid &pixels, const QRectF &area,
                                    const QRectF &plot) const
{
    const PlotAxis axis = timeAxis();
    if (!(axis.high > axis.low)) {
        return;
    }
    paintVerticalAxis(painter, pixels, m_style, area, plot, axis, 0, true);
    if (m_scene.cursor) {
        const double unit = m_scene.clockHz > 0 ? 1 / m_scene.clockHz : 1;
        const double share =
            (static_cast<double>(*m_scene.cursor) * unit - axis.low) / (axis.high - axis.low);
        if (share >= 0 && share <= 1) {
            pixels.horizontal(plot.top() + share * plot.height(), plot.left(), plot.right(),
                              m_style.color(ColorSlot::PrimaryMarker));
        }
    }
}

void SpectrumPainter::paintHint(QPainter &painter, const QRectF &plot) const
{
    if (m_scene.mode != SpectrumMode::Ccdf && m_scene.sampleCount > 0 &&
        m_scene.sampleCount < Bins && m_scene.trace.level.empty()) {
        drawCaption(painter, m_style, plot, Qt::AlignCenter,
                    translated("A transform needs %1 samples; there are only %2 here.")
                        .arg(Bins)
                        .arg(m_scene.sampleCount));
    } else if (const QString hint = scaleHint(); !hint.isEmpty()) {
        drawCaption(painter, m_style, plot, Qt::AlignCenter, hint);
    }
}

QString SpectrumPainter::scaleHint() const
{
    const SpectrumTrace &trace = m_scene.trace;
    if (m_scene.mode != SpectrumMode::Spectrum || trace.level.empty()) {
        return {};
    }
    const auto &highest = trace.maximum.empty() ? trace.level : trace.maximum;
    if (*std::max_element(highest.begin(), highest.end()) <
        m_scene.referenceDb - Divisions * m_scene.dbPerDivision) {
        return translated("The signal lies below the scale.");
    }
    return *std::min_element(trace.level.begin(), trace.level.end()) > m_scene.referenceDb
               ? translated("The signal lies above the scale.")
               : QString();
}

QStringList SpectrumPainter::readOut(const QPointF &place, const QRectF &plot) const
{
    const auto &lines = m_scene.lines.lines();
    if (!plot.contains(place)) {
        return {};
    }
    if (m_scene.mode == SpectrumMode::Ccdf) {
        return CcdfPainter(m_style, m_scene.figures).readOut(place, plot);
    }
    if (m_scene.mode == SpectrumMode::Spectrum) {
        const SpectrumTrace &trace = m_scene.trace;
        if (trace.level.empty()) {
            return {};
        }
        // The stretch of a point begins half a step before its frequency.
        const std::size_t point = trace.pointAt(shareAt(plot, place.x()));
        QStringList result{
            translated("F %1").arg(frequencyText(trace.shareOf(point) * bandwidth()))};
        if (!trace.maximum.empty()) {
            result += translated("Max %1 dB").arg(trace.maximum[point], 0, 'f', 2);
        }
        result += translated("L %1 dB").arg(trace.level[point], 0, 'f', 2);
        return result;
    }
    if (lines.empty()) {
        return {};
    }
    const auto limited = [](double share, std::size_t count) {
        return std::min(static_cast<std::size_t>(share * static_cast<double>(count)), count - 1);
    };
    const std::size_t bin = limited((place.x() - plot.left()) / plot.width(), Bins);
    const double frequency = (static_cast<double>(bin) - Bins / 2.0) / Bins * bandwidth();
    const SpectrumLines::Line &line =
        lines[limited((place.y() - plot.top()) / plot.height(), lines.size())];
    const qint64 middle = line.position + Bins / 2;
    return {translated("F %1").arg(frequencyText(frequency)),
            m_scene.clockHz > 0
                ? translated("T %1").arg(formatNumber(static_cast<double>(middle) / m_scene.clockHz,
                                                      NumberFormat{.unit = "s", .precision = 3}))
                : translated("Sample %1").arg(middle),
            translated("L %1 dB").arg(line.level[bin], 0, 'f', 2)};
}

QString SpectrumPainter::frequencyText(double hz) const
{
    if (m_scene.clockHz > 0) {
        return formatNumber(hz, NumberFormat{.unit = "Hz", .precision = 3});
    }
    return translated("%1 clock").arg(QString::number(hz, 'g', 4));
}

PlotAxis frequencyAxis(double clockHz, double lowShare, double highShare)
{
    return clockHz > 0 ? PlotAxis{lowShare * clockHz, highShare * clockHz, "Hz"}
                       : PlotAxis{lowShare, highShare, {}};
}
