// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <QColor>
#include <QImage>
#include <QWidget>

/// A picker of colours: a ring of all hues, and in it a triangle between the full hue, white and
/// black. The mouse drags on both; Left and Right turn the hue, Up and Down change the value,
/// Page Up and Page Down the saturation.
class QtColorTriangle : public QWidget
{
    Q_OBJECT
    Q_PROPERTY(QColor color READ color WRITE setColor NOTIFY colorChanged)

public:
    explicit QtColorTriangle(QWidget *parent = nullptr);

    [[nodiscard]] QColor color() const;
    [[nodiscard]] QSize sizeHint() const override;
    [[nodiscard]] QSize minimumSizeHint() const override;

public slots:
    /// Shows a colour, without a signal. A grey keeps the hue that was shown.
    void setColor(const QColor &color);

signals:
    /// The user picked another colour.
    void colorChanged(const QColor &color);

protected:
    void paintEvent(QPaintEvent *event) override;
    void resizeEvent(QResizeEvent *event) override;
    void mousePressEvent(QMouseEvent *event) override;
    void mouseMoveEvent(QMouseEvent *event) override;
    void mouseReleaseEvent(QMouseEvent *event) override;
    void keyPressEvent(QKeyEvent *event) override;

private:
    enum class Part {
        None,
        Ring,
        Triangle,
    };

    /// The corners of the triangle: full hue, white and black.
    struct Corners
    {
        QPointF hue;
        QPointF white;
        QPointF black;
    };

    [[nodiscard]] QPointF center() const;
    [[nodiscard]] double outerRadius() const;
    [[nodiscard]] double innerRadius() const;
    [[nodiscard]] Corners corners() const;
    [[nodiscard]] QImage triangleImage() const;
    void drag(const QPointF &position);
    void pick(double hue, double saturation, double value);

    double m_hue = 0;        ///< of a full turn, 0 to 1
    double m_saturation = 0; ///< 0 to 1
    double m_value = 1;      ///< 0 to 1
    Part m_dragged = Part::None;
    QImage m_triangle; ///< of the current hue and size; null when it is to be drawn anew
};
