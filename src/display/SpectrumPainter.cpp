// SPDX-License-Identifier: Apache-2.0
#include "SpectrumPainter.h"

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
constexpr double LevelInset = 10; ///< pixels above 0 dB, where overdriven signals still show
constexpr double ColorBarGap = 6;
constexpr double ColorBarWidth = 10;
constexpr char AxisTemplate[] = " -QQQ.QQQ XXX"; ///< the widest text of a frequency axis

/// From the plot down to the frequency texts: clear of the ticks and of a text beside the corner.
double axisTextGap(const QFontMetricsF &metrics)
{
    return std::max(metrics.height() / 2 + 1, 5.0);
}

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
    const double bottom = axisTextGap(metrics) + metrics.height() + 2;
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
    return plot.top() + LevelInset - db / range * (plot.height() - LevelInset);
}

void SpectrumPainter::paint(QPainter &painter, const QRectF &area) const
{
    painter.save();
    fillArea(painter, area, m_style.color(ColorSlot::PanelBackground));
    painter.setFont(m_style.font);
    const QRectF plot = area.marginsRemoved(margins(m_style.font, m_scene.mode));
    if (plot.width() > 0 && plot.height() > LevelInset) {
        const PixelGrid pixels(painter);
        if (m_scene.mode == SpectrumMode::Waterfall) {
            paintWaterfall(painter, pixels, area, plot);
        } else {
            paintSpectrum(painter, pixels, area, plot);
        }
        pixels.frame(plot, m_style.color(ColorSlot::GridLines));
        paintHint(painter, plot);
        const QStringList lines = m_scene.mouse ? readOut(*m_scene.mouse, plot) : QStringList();
        if (!lines.isEmpty()) {
            pixels.dashedVertical(m_scene.mouse->x(), plot.top(), plot.bottom(),
                                  m_style.color(ColorSlot::CursorLine, 150));
            ValueBox box;
            box.lines = lines;
            box.cornerRadius = 5;
            drawValueBoxWhereRoom(painter, m_style, *m_scene.mouse, box, area);
        }
    }
    painter.restore();
}

void SpectrumPainter::paintSpectrum(QPainter &painter, const PixelGrid &pixels, const QRectF &area,
                                    const QRectF &plot) const
{
    const double height = QFontMetricsF(m_style.font).height();
    const double spacing = (plot.height() - LevelInset) / Divisions;
    const int stride = labelStride(spacing, height);
    painter.setPen(m_style.color(ColorSlot::Text));
    for (int k = 0; k <= Divisions; ++k) {
        const double level = k == 0 ? 0.0 : -k * m_scene.dbPerDivision;
        const double y = yOf(plot, level);
        pixels.horizontal(y, plot.left(), plot.right(),
                          m_style.color(ColorSlot::GridLines, GridAlpha));
        if (k % stride == 0) {
            painter.drawText(
                QRectF(area.left(), y - height / 2, plot.left() - area.left() - 4, height),
                Qt::AlignRight | Qt::AlignVCenter, QString("%1 dB").arg(level));
        }
    }
    paintFrequencyAxis(painter, pixels, area, plot, GridAlpha);
    if (!m_scene.mean.empty()) {
        QPolygonF line;
        line.reserve(Bins);
        for (int bin = 0; bin < Bins; ++bin) {
            const double level = m_scene.mean[static_cast<std::size_t>(bin)];
            line += QPointF(xOf(plot, bin), std::min(yOf(plot, level), plot.bottom() + 2));
        }
        painter.save();
        painter.setClipRect(plot);
        painter.setRenderHint(QPainter::Antialiasing);
        painter.setPen(QPen(m_style.color(ColorSlot::AverageTrace), 1));
        painter.translate(pixels.lineWidth() / 2, pixels.lineWidth() / 2); // onto the grid lines
        painter.drawPolyline(line);
        painter.restore();
    }
    drawCaption(painter, m_style, plot, Qt::AlignLeft | Qt::AlignTop,
                translated("%1 dB/div").arg(m_scene.dbPerDivision));
}

void SpectrumPainter::paintWaterfall(QPainter &painter, const PixelGrid &pixels, const QRectF &area,
                                     const QRectF &plot) const
{
    const QSize size = waterfallSize(plot, pixels.ratio());
    if (m_scene.waterfall.size() != size) {
        m_scene.waterfall = waterfallImage(m_scene.lines.lines(), m_scene.colors, size);
    }
    painter.drawImage(QRectF(pixels.snap(plot.left()), pixels.snap(plot.top()),
                             size.width() / pixels.ratio(), size.height() / pixels.ratio()),
                      m_scene.waterfall);
    paintFrequencyAxis(painter, pixels, area, plot, 0);
    paintTimeAxis(painter, pixels, area, plot);
    paintColorBar(painter, pixels, area, plot);
}

void SpectrumPainter::paintColorBar(QPainter &painter, const PixelGrid &pixels, const QRectF &area,
                                    const QRectF &plot) const
{
    const QRectF bar(plot.right() + ColorBarGap, plot.top(), ColorBarWidth, plot.height());
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
    constexpr int LabelCount = 4;
    const int stride = labelStride(plot.height() / (LabelCount - 1), height);
    for (int k = 0; k < LabelCount; k += stride) {
        const double level = k * ColorTable::LowestDb / (LabelCount - 1);
        const double y = bar.top() + bar.height() * k / (LabelCount - 1) - height / 2;
        painter.drawText(QRectF(bar.right() + 3, y, area.right() - bar.right() - 3, height),
                         Qt::AlignLeft | Qt::AlignVCenter,
                         QString("%1 dB").arg(k == 0 ? 0.0 : level));
    }
}

void SpectrumPainter::paintFrequencyAxis(QPainter &painter, const PixelGrid &pixels,
                                         const QRectF &area, const QRectF &plot,
                                         int gridAlpha) const
{
    const double range = bandwidth() / 2;
    // The power of ten nearest to a quarter of the range, so that a division is a round number.
    const double step = niceStep(std::pow(10.0, std::round(std::log10(range / 4))));
    const int divisions = static_cast<int>(std::floor(range / step * (1 + 1e-12)));
    const QFontMetricsF metrics(m_style.font);
    const double spacing = step / bandwidth() * plot.width();
    const int stride = labelStride(spacing, metrics.horizontalAdvance(AxisTemplate));
    constexpr double Tick = 3;
    painter.setPen(m_style.color(ColorSlot::Text));
    for (int k = -divisions; k <= divisions; ++k) {
        const double frequency = k * step;
        // The centres of the bins end half a bin before the upper edge.
        const double x =
            std::min(xOf(plot, frequency / bandwidth() * Bins + Bins / 2.0), plot.right());
        pixels.vertical(x, plot.bottom(), plot.bottom() + Tick,
                        m_style.color(ColorSlot::GridLines));
        if (gridAlpha > 0) {
            pixels.vertical(x, plot.top(), plot.bottom(),
                            m_style.color(ColorSlot::GridLines, gridAlpha));
        }
        if (k % stride == 0) {
            const QString text = frequencyText(frequency);
            const double width = metrics.horizontalAdvance(text) + 1;
            const double left = std::clamp(x - width / 2, area.left(), area.right() - width);
            painter.drawText(
                QRectF(left, plot.bottom() + axisTextGap(metrics), width, metrics.height()),
                Qt::AlignCenter, text);
        }
    }
}

void SpectrumPainter::paintTimeAxis(QPainter &painter, const PixelGrid &pixels, const QRectF &area,
                                    const QRectF &plot) const
{
    const auto &lines = m_scene.lines.lines();
    if (lines.empty()) {
        return;
    }
    constexpr int WantedLabels = 5;
    constexpr double Tick = 3;
    const bool inSeconds = m_scene.clockHz > 0;
    const double unit = inSeconds ? 1 / m_scene.clockHz : 1;
    const double start = static_cast<double>(lines.front().position) * unit;
    const double duration = static_cast<double>(lines.size()) * SpectrumLines::FrameStep * unit;
    const double step = niceStep(duration / WantedLabels);
    const double height = QFontMetricsF(m_style.font).height();
    const int stride = labelStride(step / duration * plot.height(), height);
    painter.setPen(m_style.color(ColorSlot::Text));
    const auto firstTick = static_cast<qint64>(std::ceil(start / step));
    for (qint64 k = firstTick; static_cast<double>(k) * step < start + duration; ++k) {
        const double time = static_cast<double>(k) * step;
        const double y = plot.top() + (time - start) / duration * plot.height();
        pixels.horizontal(y, plot.left() - Tick, plot.left(), m_style.color(ColorSlot::GridLines));
        if (k % stride == 0) {
            const QString text = inSeconds
                                     ? formatNumber(time, NumberFormat{.unit = "s", .precision = 3})
                                     : QString::number(time, 'f', 0);
            painter.drawText(
                QRectF(area.left(), y - height / 2, plot.left() - Tick - 2 - area.left(), height),
                Qt::AlignRight | Qt::AlignVCenter, text);
        }
    }
}

void SpectrumPainter::paintHint(QPainter &painter, const QRectF &plot) const
{
    if (m_scene.sampleCount > 0 && m_scene.sampleCount < SpectrumLines::FrameSize) {
        drawCaption(painter, m_style, plot, Qt::AlignCenter,
                    translated("A transform needs %1 samples, here are %2.")
                        .arg(SpectrumLines::FrameSize)
                        .arg(m_scene.sampleCount));
    }
}

QStringList SpectrumPainter::readOut(const QPointF &place, const QRectF &plot) const
{
    const auto &lines = m_scene.lines.lines();
    if (lines.empty() || !plot.contains(place)) {
        return {};
    }
    const auto limited = [](double share, std::size_t count) {
        return std::min(static_cast<std::size_t>(share * static_cast<double>(count)), count - 1);
    };
    const std::size_t bin = limited((place.x() - plot.left()) / plot.width(), Bins);
    const double frequency = (static_cast<double>(bin) - Bins / 2.0) / Bins * bandwidth();
    QStringList result{translated("F %1").arg(frequencyText(frequency))};
    double level = 0;
    if (m_scene.mode == SpectrumMode::Waterfall) {
        const SpectrumLines::Line &line =
            lines[limited((place.y() - plot.top()) / plot.height(), lines.size())];
        level = line.level[bin];
        const auto position = static_cast<double>(line.position);
        result += m_scene.clockHz > 0
                      ? translated("T %1").arg(formatNumber(
                            position / m_scene.clockHz, NumberFormat{.unit = "s", .precision = 3}))
                      : translated("Sample %1").arg(line.position);
    } else {
        level = m_scene.mean[bin];
    }
    result += translated("L %1 dB").arg(level, 0, 'f', 2);
    return result;
}

QString SpectrumPainter::frequencyText(double hz) const
{
    if (m_scene.clockHz > 0) {
        return formatNumber(hz, NumberFormat{.unit = "Hz", .precision = 3});
    }
    return translated("%1 clock").arg(QString::number(hz, 'g', 4));
}
