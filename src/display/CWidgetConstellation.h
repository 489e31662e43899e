// SPDX-License-Identifier: Apache-2.0
#pragma once

#include "CWidgetBase.h"
#include "ConstellationPainter.h"

/// Shows I against Q as a density or, for up to 500 samples, as dots, with the values at the mouse.
class CWidgetConstellation : public CWidgetBase
{
    Q_OBJECT

public:
    explicit CWidgetConstellation(QWidget *parent = nullptr);

    void setData(const QList<CWidgetBase::IQData> &samples);
    /// The values of I and Q at the edges; values that aren't above 0 count as 1.
    void setScale(double scaleI, double scaleQ);
    /// One of the modes of ColorMode; any other number is ignored.
    void setColorMode(int mode);
    [[nodiscard]] int colorMode() const { return static_cast<int>(m_scene.colorMode); }

    /// Marks the sample of the measuring cursor; nothing marks none.
    void setCursorSample(const std::optional<IqSample> &sample);

    [[nodiscard]] const ConstellationScene &scene();

public slots:
    void clear();
    void col_rainbow();
    void col_blackwhite();
    void col_blue();
    void col_noise();
    void col_viridis();

protected:
    void drawPlot(QPainter &painter, const QRectF &area) override;
    void writeData(QTextStream &stream) override;
    [[nodiscard]] bool hasData() const override { return !m_samples.isEmpty(); }
    void extendContextMenu(QMenu &menu) override;
    void mouseMoveEvent(QMouseEvent *event) override;
    void leaveEvent(QEvent *event) override;
    void dropHover() override { m_scene.mouse.reset(); }

private:
    void updateGrid();

    QList<CWidgetBase::IQData> m_samples;
    ConstellationScene m_scene;
    bool m_dirty = false;
};
