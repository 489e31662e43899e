// SPDX-License-Identifier: Apache-2.0
#include "plotaxis.h"

#include "plotdraw.h"
#include "view/plotscale.h"

#include <algorithm>
#include <array>
#include <cmath>

namespace {

constexpr double Tick = 3;     ///< pixels
constexpr double TextGap = 10; ///< pixels between neighbouring texts

struct Prefix
{
    double factor;
    const char *text;
};

constexpr std::array Prefixes{Prefix{1e9, "G"},  Prefix{1e6, "M"},  Prefix{1e3, "k"},
                              Prefix{1, ""},     Prefix{1e-3, "m"}, Prefix{1e-6, "\u00b5"},
                              Prefix{1e-9, "n"}, Prefix{1e-12, "p"}};

int digitsOf(double step)
{
    constexpr int Most = 9;
    return step > 0 ? std::clamp(static_cast<int>(std::ceil(-std::log10(step) - 1e-9)), 0, Most)
                    : 0;
}

double spanOf(const PlotAxis &axis)
{
    return axis.high - axis.low;
}

/// Draws texts in order of their weight, those left out that would touch one that is there.
class TextRow
{
public:
    TextRow(QPainter &painter, double gap)
        : m_painter(painter)
        , m_gap(gap)
    {
    }

    bool add(const QRectF &place, Qt::Alignment alignment, const QString &text)
    {
        const QRectF room = place.adjusted(-m_gap, 0, m_gap, 0);
        const auto touches = [&](const QRectF &other) { return other.intersects(room); };
        if (std::any_of(m_places.begin(), m_places.end(), touches)) {
            return false;
        }
        m_places.push_back(place);
        m_painter.drawText(place, static_cast<int>(alignment) | Qt::TextDontClip, text);
        return true;
    }

private:
    QPainter &m_painter;
    double m_gap;
    std::vector<QRectF> m_places;
};

} // namespace

AxisTexts::AxisTexts(const PlotAxis &axis)
    : m_span(spanOf(axis))
{
    if (axis.unit.isEmpty()) {
        return;
    }
    const double largest = std::max(std::fabs(axis.low), std::fabs(axis.high));
    const auto *prefix = std::find_if(Prefixes.begin(), Prefixes.end(), [&](const Prefix &p) {
        return largest >= p.factor * (1 - 1e-9);
    });
    if (prefix == Prefixes.end()) {
        prefix = largest > 0 ? Prefixes.end() - 1 : Prefixes.begin() + 3;
    }
    m_factor = prefix->factor;
    m_suffix = " " + QString::fromUtf8(prefix->text) + axis.unit;
}

QString AxisTexts::tick(double value, double step) const
{
    return text(value, digitsOf(step / m_factor));
}

QString AxisTexts::exact(double value) const
{
    QString number = text(value, digitsOf(m_span / 1000 / m_factor));
    number.chop(m_suffix.size());
    if (number.contains('.')) {
        while (number.endsWith('0')) {
            number.chop(1);
        }
        if (number.endsWith('.')) {
            number.chop(1);
        }
    }
    return number + m_suffix;
}

QString AxisTexts::text(double value, int digits) const
{
    QString number = QString::number(value / m_factor, 'f', digits);
    if (number.toDouble() == 0 && number.startsWith('-')) {
        number.remove(0, 1);
    }
    return number + m_suffix;
}

double axisStep(const PlotAxis &axis, double pixels, double extent)
{
    return niceStep(spanOf(axis) * extent / std::max(pixels, 1.0));
}

std::vector<double> axisTicks(const PlotAxis &axis, double step)
{
    constexpr double MostTicks = 1000;
    std::vector<double> ticks;
    if (!(step > 0) || !(spanOf(axis) / step < MostTicks)) {
        return ticks;
    }
    constexpr double Tolerance = 1e-6; // a tick at an end is on the axis
    const double first = std::ceil(axis.low / step - Tolerance);
    const double last = std::floor(axis.high / step + Tolerance);
    for (double k = first; k <= last; ++k) {
        ticks.push_back(k * step);
    }
    return ticks;
}

double horizontalStep(const PlotAxis &axis, const QFontMetricsF &metrics, double pixels)
{
    const AxisTexts texts(axis);
    double step = axisStep(axis, pixels, metrics.averageCharWidth() * 4);
    for (int turn = 0; turn < 8; ++turn) {
        const double widest = std::max(metrics.horizontalAdvance(texts.tick(axis.low, step)),
                                       metrics.horizontalAdvance(texts.tick(axis.high, step)));
        const double needed = axisStep(axis, pixels, widest + TextGap);
        if (!(needed > step)) {
            break;
        }
        step = needed;
    }
    return step;
}

double paintHorizontalAxis(QPainter &painter, const PixelGrid &pixels, const PlotStyle &style,
                           const QRectF &area, const QRectF &plot, const PlotAxis &axis,
                           int gridAlpha)
{
    if (!(spanOf(axis) > 0)) {
        return 0;
    }
    const QFontMetricsF metrics(style.font);
    const AxisTexts texts(axis);
    const double step = horizontalStep(axis, metrics, plot.width());
    const auto xOf = [&](double value) {
        return plot.left() + (value - axis.low) / spanOf(axis) * plot.width();
    };
    painter.setFont(style.font);
    painter.setPen(style.color(ColorSlot::Text));
    TextRow row(painter, TextGap / 2);
    const double top = plot.bottom() + Tick + 1;
    const auto addText = [&](double x, const QString &text) {
        const double width = metrics.horizontalAdvance(text) + 1;
        const double left = std::clamp(x - width / 2, area.left() + 1,
                                       std::max(area.left() + 1, area.right() - width - 1));
        (void)row.add(QRectF(left, top, width, metrics.height()), Qt::AlignCenter, text);
    };
    // The ends first: where the view lies matters more than a round number beside it.
    addText(plot.left(), texts.exact(axis.low));
    addText(plot.right(), texts.exact(axis.high));
    for (const double value : axisTicks(axis, step)) {
        const double x = std::min(xOf(value), plot.right() - pixels.lineWidth());
        pixels.vertical(x, plot.bottom(), plot.bottom() + Tick, style.color(ColorSlot::GridLines));
        if (gridAlpha > 0) {
            pixels.vertical(x, plot.top(), plot.bottom(),
                            style.color(ColorSlot::GridLines, gridAlpha));
        }
        addText(x, texts.tick(value, step));
    }
    return step;
}

double paintVerticalAxis(QPainter &painter, const PixelGrid &pixels, const PlotStyle &style,
                         const QRectF &area, const QRectF &plot, const PlotAxis &axis,
                         int gridAlpha, bool reversed)
{
    if (!(spanOf(axis) > 0)) {
        return 0;
    }
    const QFontMetricsF metrics(style.font);
    const AxisTexts texts(axis);
    const double height = metrics.height();
    const double step = axisStep(axis, plot.height(), height * 1.25);
    const auto yOf = [&](double value) {
        const double share = (value - axis.low) / spanOf(axis);
        return plot.top() + (reversed ? share : 1 - share) * plot.height();
    };
    painter.setFont(style.font);
    painter.setPen(style.color(ColorSlot::Text));
    TextRow row(painter, 0);
    const auto addText = [&](double y, const QString &text) {
        const double top =
            std::clamp(y - height / 2, area.top(),
                       std::max(area.top(), plot.bottom() + Tick - height)); // clear of the corner
        (void)row.add(
            QRectF(area.left(), top, std::max(plot.left() - Tick - 2 - area.left(), 1.0), height),
            Qt::AlignRight | Qt::AlignVCenter, text);
    };
    addText(yOf(axis.low), texts.exact(axis.low));
    addText(yOf(axis.high), texts.exact(axis.high));
    for (const double value : axisTicks(axis, step)) {
        const double y = std::min(yOf(value), plot.bottom() - pixels.lineWidth());
        pixels.horizontal(y, plot.left() - Tick, plot.left(), style.color(ColorSlot::GridLines));
        if (gridAlpha > 0) {
            pixels.horizontal(y, plot.left(), plot.right(),
                              style.color(ColorSlot::GridLines, gridAlpha));
        }
        addText(y, texts.tick(value, step));
    }
    return step;
}
