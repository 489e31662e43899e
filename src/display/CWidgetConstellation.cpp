// SPDX-License-Identifier: Apache-2.0
#include "CWidgetConstellation.h"

#include "colormenu.h"
#include "plotexport.h"

#include <QMouseEvent>

#include <utility>

CWidgetConstellation::CWidgetConstellation(QWidget *parent)
    : CWidgetBase(parent)
{
    setPlotMargins(ConstellationPainter::margins(plotStyle().font));
    setMouseTracking(true);
    setAccessibleName("Constellation");
}

void CWidgetConstellation::setData(const QList<CWidgetBase::IQData> &samples)
{
    m_samples = samples;
    m_scene.sampleCount = m_samples.size();
    m_scene.dots = std::as_const(m_samples);
    m_dirty = true;
    update();
}

void CWidgetConstellation::setScale(double scaleI, double scaleQ)
{
    m_scene.scaleI = scaleI > 0 ? scaleI : 1;
    m_scene.scaleQ = scaleQ > 0 ? scaleQ : 1;
    m_dirty = true;
    update();
}

void CWidgetConstellation::setColorMode(int mode)
{
    if (mode < 0 || mode >= ColorModeCount) {
        return;
    }
    m_scene.colorMode = static_cast<ColorMode>(mode);
    update();
}

const ConstellationScene &CWidgetConstellation::scene()
{
    updateGrid();
    return m_scene;
}

void CWidgetConstellation::clear()
{
    setData({});
}

void CWidgetConstellation::col_rainbow()
{
    setColorMode(static_cast<int>(ColorMode::Rainbow));
}

void CWidgetConstellation::col_blackwhite()
{
    setColorMode(static_cast<int>(ColorMode::BlackWhite));
}

void CWidgetConstellation::col_blue()
{
    setColorMode(static_cast<int>(ColorMode::Blue));
}

void CWidgetConstellation::col_noise()
{
    setColorMode(static_cast<int>(ColorMode::NoiseBlue));
}

void CWidgetConstellation::col_viridis()
{
    setColorMode(static_cast<int>(ColorMode::Viridis));
}

void CWidgetConstellation::setCursorSample(const std::optional<IqSample> &sample)
{
    m_scene.cursor = sample;
    setAccessibleDescription(
        sample ? QString::asprintf("Cursor: I %.6f, Q %.6f", sample->i, sample->q) : QString());
    update();
}

void CWidgetConstellation::drawPlot(QPainter &painter, const QRectF &area)
{
    updateGrid();
    ConstellationPainter(plotStyle(), m_scene).paint(painter, area);
}

void CWidgetConstellation::writeData(QTextStream &stream)
{
    writeSampleTable(stream, m_samples, {}, 0);
}

void CWidgetConstellation::extendContextMenu(QMenu &menu)
{
    addColorModes<CWidgetConstellation>(
        menu, this, colorMode(),
        {&CWidgetConstellation::col_rainbow, &CWidgetConstellation::col_blackwhite,
         &CWidgetConstellation::col_blue, &CWidgetConstellation::col_noise,
         &CWidgetConstellation::col_viridis});
}

void CWidgetConstellation::mouseMoveEvent(QMouseEvent *event)
{
    m_scene.mouse = event->position();
    update();
}

void CWidgetConstellation::leaveEvent(QEvent *)
{
    m_scene.mouse.reset();
    update();
}

void CWidgetConstellation::updateGrid()
{
    if (m_dirty) {
        m_scene.grid.compute(std::as_const(m_samples), m_scene.scaleI, m_scene.scaleQ);
        m_dirty = false;
    }
}
