// SPDX-License-Identifier: Apache-2.0
#include "QtColorTriangle.h"

#include <QConicalGradient>
#include <QKeyEvent>
#include <QMouseEvent>
#include <QPainter>
#include <QPainterPath>

#include <algorithm>
#include <cmath>
#include <numbers>

namespace {

constexpr double RingShare = 0.16; // of the outer radius
constexpr double KnobRadius = 5;
constexpr double KeyStep = 0.01;

/// The shares of the three corners that a point is the mean of; outside of it some are below 0.
struct Weights
{
    double hue = 0;
    double white = 0;
    double black = 0;
};

Weights weightsOf(const QPointF &point, const QPointF &hue, const QPointF &white,
                  const QPointF &black)
{
    const QPointF toHue = hue - black;
    const QPointF toWhite = white - black;
    const QPointF toPoint = point - black;
    const auto cross = [](const QPointF &a, const QPointF &b) {
        return a.x() * b.y() - a.y() * b.x();
    };
    const double area = cross(toHue, toWhite);
    if (area == 0) {
        return {0, 0, 1};
    }
    const double first = cross(toPoint, toWhite) / area;
    const double second = cross(toHue, toPoint) / area;
    return {first, second, 1 - first - second};
}

/// The nearest of what lies inside, near enough for a hand at the mouse.
Weights inside(Weights weights)
{
    weights.hue = std::max(weights.hue, 0.0);
    weights.white = std::max(weights.white, 0.0);
    weights.black = std::max(weights.black, 0.0);
    const double sum = weights.hue + weights.white + weights.black;
    return {weights.hue / sum, weights.white / sum, weights.black / sum};
}

void drawKnob(QPainter &painter, const QPointF &place, const QColor &color)
{
    painter.setBrush(color);
    painter.setPen(QPen(Qt::black, 3));
    painter.drawEllipse(place, KnobRadius, KnobRadius);
    painter.setPen(QPen(Qt::white, 1.5));
    painter.drawEllipse(place, KnobRadius, KnobRadius);
}

} // namespace

QtColorTriangle::QtColorTriangle(QWidget *parent)
    : QWidget(parent)
{
    setFocusPolicy(Qt::StrongFocus);
    setAccessibleName("Colour triangle");
    setAccessibleDescription("Left and Right change the hue, Up and Down the value, Page Up and "
                             "Page Down the saturation.");
}

QColor QtColorTriangle::color() const
{
    return QColor::fromHsvF(static_cast<float>(m_hue), static_cast<float>(m_saturation),
                            static_cast<float>(m_value))
        .toRgb();
}

QSize QtColorTriangle::sizeHint() const
{
    return {210, 210};
}

QSize QtColorTriangle::minimumSizeHint() const
{
    return {120, 120};
}

void QtColorTriangle::setColor(const QColor &color)
{
    if (!color.isValid() || color.rgb() == this->color().rgb()) {
        return; // rounded as a colour it is what is shown
    }
    const QColor hsv = color.toHsv();
    if (hsv.hsvHueF() >= 0) {
        m_hue = static_cast<double>(hsv.hsvHueF());
    }
    m_saturation = static_cast<double>(hsv.hsvSaturationF());
    m_value = static_cast<double>(hsv.valueF());
    m_triangle = QImage();
    update();
}

QPointF QtColorTriangle::center() const
{
    return QRectF(rect()).center();
}

double QtColorTriangle::outerRadius() const
{
    return std::max(std::min(width(), height()) / 2.0 - 2, 1.0);
}

double QtColorTriangle::innerRadius() const
{
    return outerRadius() * (1 - RingShare);
}

QtColorTriangle::Corners QtColorTriangle::corners() const
{
    const auto at = [this](double turn) {
        const double angle = 2 * std::numbers::pi * turn;
        return center() + QPointF(std::cos(angle), -std::sin(angle)) * (innerRadius() - 2);
    };
    return {at(m_hue), at(m_hue + 1.0 / 3), at(m_hue + 2.0 / 3)};
}

QImage QtColorTriangle::triangleImage() const
{
    const double ratio = devicePixelRatioF();
    QImage image((QSizeF(size()) * ratio).toSize(), QImage::Format_RGB32);
    const auto [hue, white, black] = corners();
    const QColor full = QColor::fromHsvF(static_cast<float>(m_hue), 1, 1);
    for (int y = 0; y < image.height(); ++y) {
        auto *line = reinterpret_cast<QRgb *>(image.scanLine(y));
        for (int x = 0; x < image.width(); ++x) {
            const Weights part =
                inside(weightsOf(QPointF(x + 0.5, y + 0.5) / ratio, hue, white, black));
            const auto mix = [&part](int channel) {
                return static_cast<int>(std::lround(part.hue * channel + part.white * 255));
            };
            line[x] = qRgb(mix(full.red()), mix(full.green()), mix(full.blue()));
        }
    }
    image.setDevicePixelRatio(ratio);
    return image;
}

void QtColorTriangle::paintEvent(QPaintEvent * /*event*/)
{
    QPainter painter(this);
    painter.setRenderHint(QPainter::Antialiasing);
    QConicalGradient hues(center(), 0);
    for (int step = 0; step <= 12; ++step) {
        hues.setColorAt(step / 12.0, QColor::fromHsv(step * 30 % 360, 255, 255));
    }
    QPainterPath ring;
    ring.addEllipse(center(), outerRadius(), outerRadius());
    ring.addEllipse(center(), innerRadius(), innerRadius());
    painter.fillPath(ring, hues);

    if (m_triangle.isNull()) {
        m_triangle = triangleImage();
    }
    const auto [hue, white, black] = corners();
    painter.setPen(Qt::NoPen);
    painter.setBrush(m_triangle);
    painter.drawPolygon(QPolygonF({hue, white, black}));

    const double angle = 2 * std::numbers::pi * m_hue;
    const double middle = (outerRadius() + innerRadius()) / 2;
    drawKnob(painter, center() + QPointF(std::cos(angle), -std::sin(angle)) * middle,
             QColor::fromHsvF(static_cast<float>(m_hue), 1, 1));
    drawKnob(painter,
             hue * (m_saturation * m_value) + white * ((1 - m_saturation) * m_value) +
                 black * (1 - m_value),
             color());
    if (hasFocus()) {
        painter.setBrush(Qt::NoBrush);
        painter.setPen(QPen(palette().color(QPalette::WindowText), 1, Qt::DotLine));
        painter.drawEllipse(center(), outerRadius() + 1, outerRadius() + 1);
    }
}

void QtColorTriangle::resizeEvent(QResizeEvent *event)
{
    m_triangle = QImage();
    QWidget::resizeEvent(event);
}

void QtColorTriangle::mousePressEvent(QMouseEvent *event)
{
    if (event->button() != Qt::LeftButton) {
        QWidget::mousePressEvent(event);
        return;
    }
    const QPointF off = event->position() - center();
    m_dragged = std::hypot(off.x(), off.y()) >= innerRadius() ? Part::Ring : Part::Triangle;
    drag(event->position());
}

void QtColorTriangle::mouseMoveEvent(QMouseEvent *event)
{
    drag(event->position());
}

void QtColorTriangle::mouseReleaseEvent(QMouseEvent * /*event*/)
{
    m_dragged = Part::None;
}

void QtColorTriangle::keyPressEvent(QKeyEvent *event)
{
    switch (event->key()) {
    case Qt::Key_Left:
        pick(m_hue + 1 - KeyStep, m_saturation, m_value);
        break;
    case Qt::Key_Right:
        pick(m_hue + KeyStep, m_saturation, m_value);
        break;
    case Qt::Key_Up:
        pick(m_hue, m_saturation, m_value + KeyStep);
        break;
    case Qt::Key_Down:
        pick(m_hue, m_saturation, m_value - KeyStep);
        break;
    case Qt::Key_PageUp:
        pick(m_hue, m_saturation + KeyStep, m_value);
        break;
    case Qt::Key_PageDown:
        pick(m_hue, m_saturation - KeyStep, m_value);
        break;
    default:
        QWidget::keyPressEvent(event);
    }
}

void QtColorTriangle::drag(const QPointF &position)
{
    if (m_dragged == Part::Ring) {
        const QPointF off = position - center();
        const double turn = std::atan2(-off.y(), off.x()) / (2 * std::numbers::pi);
        pick(turn + 1, m_saturation, m_value);
    } else if (m_dragged == Part::Triangle) {
        const auto [hue, white, black] = corners();
        const Weights part = inside(weightsOf(position, hue, white, black));
        const double value = part.hue + part.white;
        pick(m_hue, value > 0 ? part.hue / value : m_saturation, value);
    }
}

void QtColorTriangle::pick(double hue, double saturation, double value)
{
    const double turn = hue - std::floor(hue);
    if (turn != m_hue) {
        m_triangle = QImage();
    }
    m_hue = turn;
    m_saturation = std::clamp(saturation, 0.0, 1.0);
    m_value = std::clamp(value, 0.0, 1.0);
    update();
    emit colorChanged(color());
}
