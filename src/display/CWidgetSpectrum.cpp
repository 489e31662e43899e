// SPDX-License-Identifier: Apache-2.0
#include "CWidgetSpectrum.h"

#include "colormenu.h"
#include "plotexport.h"

#include <QMouseEvent>
#include <QTextStream>

#include <algorithm>
#include <array>
#include <utility>

namespace {

constexpr std::array DbPerDivision{1.0, 2.0, 5.0, 10.0, 15.0};

} // namespace

CWidgetSpectrum::CWidgetSpectrum(QWidget *parent)
    : CWidgetBase(parent)
{
    setMouseTracking(true);
    setView(static_cast<int>(m_scene.mode));
}

void CWidgetSpectrum::setData(const QList<CWidgetBase::IQData> &samples, qint64 first, qint64 last)
{
    if (first < 0 || last < 0) {
        m_scene.lines.clear();
        first = 0;
    }
    m_samples = samples;
    m_first = first;
    m_scene.sampleCount = samples.size();
    m_dirty = true;
    update();
}

void CWidgetSpectrum::setData(const QList<CWidgetBase::IQData> &samples)
{
    setData(samples, -1, -1);
}

void CWidgetSpectrum::setView(int mode)
{
    if (mode < 0 || mode >= SpectrumModeCount) {
        return;
    }
    m_scene.mode = static_cast<SpectrumMode>(mode);
    setPlotMargins(SpectrumPainter::margins(plotStyle().font, m_scene.mode));
    update();
}

void CWidgetSpectrum::setColorMode(int mode)
{
    if (mode < 0 || mode >= ColorModeCount) {
        return;
    }
    m_scene.colors = ColorTable(static_cast<ColorMode>(mode));
    m_scene.waterfall = {};
    update();
}

void CWidgetSpectrum::setClock(double hz)
{
    m_scene.clockHz = hz;
    update();
}

const SpectrumScene &CWidgetSpectrum::scene()
{
    updateLines();
    return m_scene;
}

void CWidgetSpectrum::clear()
{
    setData({});
}

void CWidgetSpectrum::col_rainbow()
{
    setColorMode(static_cast<int>(ColorMode::Rainbow));
}

void CWidgetSpectrum::col_blackwhite()
{
    setColorMode(static_cast<int>(ColorMode::BlackWhite));
}

void CWidgetSpectrum::col_blue()
{
    setColorMode(static_cast<int>(ColorMode::Blue));
}

void CWidgetSpectrum::col_noise()
{
    setColorMode(static_cast<int>(ColorMode::NoiseBlue));
}

void CWidgetSpectrum::zoomInY()
{
    zoomY(-1);
}

void CWidgetSpectrum::zoomOutY()
{
    zoomY(1);
}

void CWidgetSpectrum::zoomY(int direction)
{
    const auto here = std::find(DbPerDivision.begin(), DbPerDivision.end(), m_scene.dbPerDivision);
    const auto index = (here - DbPerDivision.begin()) + direction;
    if (index >= 0 && index < static_cast<std::ptrdiff_t>(DbPerDivision.size())) {
        m_scene.dbPerDivision = DbPerDivision[static_cast<std::size_t>(index)];
        update();
    }
}

void CWidgetSpectrum::drawPlot(QPainter &painter, const QRectF &area)
{
    updateLines();
    SpectrumPainter(plotStyle(), m_scene).paint(painter, area);
}

void CWidgetSpectrum::writeData(QTextStream &stream)
{
    writeSpectrumTable(stream, scene());
}

void CWidgetSpectrum::extendContextMenu(QMenu &menu)
{
    addColorModes<CWidgetSpectrum>(menu, this, colorMode(),
                                   {&CWidgetSpectrum::col_rainbow, &CWidgetSpectrum::col_blackwhite,
                                    &CWidgetSpectrum::col_blue, &CWidgetSpectrum::col_noise});
}

void CWidgetSpectrum::mouseMoveEvent(QMouseEvent *event)
{
    m_scene.mouse = event->position();
    update();
}

void CWidgetSpectrum::leaveEvent(QEvent *)
{
    m_scene.mouse.reset();
    update();
}

void CWidgetSpectrum::updateLines()
{
    if (!m_dirty) {
        return;
    }
    m_scene.lines.update(std::as_const(m_samples), m_first);
    m_scene.mean = m_scene.lines.mean();
    m_scene.waterfall = {};
    m_dirty = false;
}
