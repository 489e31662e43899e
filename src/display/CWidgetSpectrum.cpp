// SPDX-License-Identifier: Apache-2.0
#include "CWidgetSpectrum.h"

#include "colormenu.h"
#include "plotexport.h"
#include "waterfall.h"

#include <QMouseEvent>
#include <QTextStream>
#include <QWheelEvent>

#include <algorithm>
#include <array>
#include <cmath>
#include <utility>

namespace {

constexpr std::array DbPerDivision{1.0, 2.0, 5.0, 10.0, 15.0};

} // namespace

CWidgetSpectrum::CWidgetSpectrum(QWidget *parent)
    : CWidgetBase(parent)
{
    setMouseTracking(true);
    setAccessibleName("Spectrum");
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
    changed();
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
    changed(); // the figures of the distribution are made where they are looked at
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

void CWidgetSpectrum::setSettings(const SpectrumSettings &settings)
{
    m_settings = settings;
    changed();
}

void CWidgetSpectrum::setCursorSample(const std::optional<qint64> &sample)
{
    m_scene.cursor = sample;
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

void CWidgetSpectrum::col_viridis()
{
    setColorMode(static_cast<int>(ColorMode::Viridis));
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
    if (index < 0 || index >= static_cast<std::ptrdiff_t>(DbPerDivision.size())) {
        return;
    }
    updateLines();
    m_scene.dbPerDivision = DbPerDivision[static_cast<std::size_t>(index)];
    // The peak stays on view: at the top of a scale that doesn't reach down to it from 0 dB.
    const SpectrumTrace &trace = m_scene.trace;
    const auto &levels = trace.maximum.empty() ? trace.level : trace.maximum;
    const double step = m_scene.dbPerDivision;
    m_scene.referenceDb = 0;
    if (!levels.empty()) {
        const double peak = *std::max_element(levels.begin(), levels.end());
        constexpr double Lowest = -400;
        if (peak > Lowest && peak < -step * SpectrumPainter::Divisions / 2) {
            m_scene.referenceDb = std::ceil(peak / step + 0.1) * step;
        }
    }
    update();
}

void CWidgetSpectrum::resetScales()
{
    m_scene.lowShare = -0.5;
    m_scene.highShare = 0.5;
    m_scene.referenceDb = 0;
    m_scene.dbPerDivision = DbPerDivision.back();
    update();
}

void CWidgetSpectrum::zoomFrequency(double factor, double x)
{
    const QRectF plot = plotRect();
    const SpectrumPainter painter(plotStyle(), m_scene);
    const double centre = painter.shareAt(plot, x);
    constexpr double LeastPoints = 8;
    const double points = static_cast<double>(std::max<std::size_t>(m_scene.trace.level.size(), 1));
    const double span = std::clamp((m_scene.highShare - m_scene.lowShare) * factor,
                                   std::min(LeastPoints / points, 1.0), 1.0);
    const double share = (x - plot.left()) / plot.width();
    m_scene.lowShare = centre - share * span;
    m_scene.highShare = m_scene.lowShare + span;
    moveFrequency(0);
}

void CWidgetSpectrum::moveFrequency(double share)
{
    const double span = m_scene.highShare - m_scene.lowShare;
    m_scene.lowShare = std::clamp(m_scene.lowShare + share, -0.5, 0.5 - span);
    m_scene.highShare = m_scene.lowShare + span;
    update();
}

void CWidgetSpectrum::fitLevels(bool fit)
{
    m_fitLevels = fit;
    m_scene.levels = LevelRange();
    changed();
}

void CWidgetSpectrum::markPeak()
{
    updateLines();
    constexpr double Anything = 1e9;
    if (const auto peak = m_scene.trace.peakBelow(Anything)) {
        setMarker(m_scene.trace.shareOf(*peak));
    }
}

void CWidgetSpectrum::markNextPeak()
{
    updateLines();
    if (!m_scene.marker || m_scene.trace.level.empty()) {
        markPeak();
        return;
    }
    const double here = m_scene.trace.level[m_scene.trace.pointAt(*m_scene.marker)];
    if (const auto peak = m_scene.trace.peakBelow(here)) {
        setMarker(m_scene.trace.shareOf(*peak));
    }
}

void CWidgetSpectrum::markReference()
{
    m_scene.deltaMarker = m_scene.marker;
    setMarker(m_scene.marker);
}

void CWidgetSpectrum::clearMarkers()
{
    m_scene.deltaMarker.reset();
    setMarker(std::nullopt);
}

void CWidgetSpectrum::setMarker(std::optional<double> share)
{
    m_scene.marker = share;
    emit markersChanged();
    update();
}

std::optional<FrequencyBand> CWidgetSpectrum::markedBand() const
{
    if (!m_scene.marker || !m_scene.deltaMarker || *m_scene.marker == *m_scene.deltaMarker) {
        return std::nullopt;
    }
    const auto [low, high] = std::minmax(*m_scene.marker, *m_scene.deltaMarker);
    return FrequencyBand{low * m_scene.clockHz, high * m_scene.clockHz};
}

void CWidgetSpectrum::drawPlot(QPainter &painter, const QRectF &area)
{
    updateLines();
    const SpectrumPainter spectrum(plotStyle(), m_scene);
    spectrum.paint(painter, area);
    // The lines under the markers may have changed with the samples.
    if (const QString markers = spectrum.markerTexts().join(", ");
        markers != accessibleDescription()) {
        setAccessibleDescription(markers);
    }
}

void CWidgetSpectrum::writeData(QTextStream &stream)
{
    writeSpectrumTable(stream, scene());
}

void CWidgetSpectrum::extendContextMenu(QMenu &menu)
{
    if (m_scene.mode == SpectrumMode::Spectrum) {
        menu.addAction(tr("Marker to Peak"), this, &CWidgetSpectrum::markPeak);
        menu.addAction(tr("Marker to Next Peak"), this, &CWidgetSpectrum::markNextPeak);
        menu.addAction(tr("Set Reference Marker"), this, &CWidgetSpectrum::markReference)
            ->setEnabled(m_scene.marker.has_value());
        menu.addAction(tr("Clear Markers"), this, &CWidgetSpectrum::clearMarkers)
            ->setEnabled(m_scene.marker || m_scene.deltaMarker);
        menu.addAction(tr("Reset Scales"), this, &CWidgetSpectrum::resetScales);
        return;
    }
    if (m_scene.mode != SpectrumMode::Waterfall) {
        return;
    }
    addColorModes<CWidgetSpectrum>(menu, this, colorMode(),
                                   {&CWidgetSpectrum::col_rainbow, &CWidgetSpectrum::col_blackwhite,
                                    &CWidgetSpectrum::col_blue, &CWidgetSpectrum::col_noise,
                                    &CWidgetSpectrum::col_viridis});
    menu.addSeparator();
    QAction *fit = menu.addAction(tr("Fit Levels to the Data"));
    fit->setCheckable(true);
    fit->setChecked(m_fitLevels);
    connect(fit, &QAction::toggled, this, &CWidgetSpectrum::fitLevels);
}

void CWidgetSpectrum::mousePressEvent(QMouseEvent *event)
{
    if (event->button() == Qt::LeftButton && plotRect().contains(event->position())) {
        m_pressed = event->position();
        m_dragged = false;
    }
}

void CWidgetSpectrum::mouseMoveEvent(QMouseEvent *event)
{
    m_scene.mouse = event->position();
    constexpr double LeastDrag = 4; // pixels; less is a click
    if (m_pressed && m_scene.mode == SpectrumMode::Spectrum &&
        (m_dragged || std::fabs(event->position().x() - m_pressed->x()) >= LeastDrag)) {
        m_dragged = true;
        const double span = m_scene.highShare - m_scene.lowShare;
        moveFrequency((m_pressed->x() - event->position().x()) / plotRect().width() * span);
        m_pressed = event->position();
    }
    update();
}

void CWidgetSpectrum::mouseReleaseEvent(QMouseEvent *event)
{
    if (m_pressed && !m_dragged && m_scene.mode == SpectrumMode::Spectrum &&
        !scene().trace.level.empty()) {
        const double share =
            SpectrumPainter(plotStyle(), m_scene).shareAt(plotRect(), event->position().x());
        setMarker(m_scene.trace.shareOf(m_scene.trace.pointAt(share)));
    }
    m_pressed.reset();
}

void CWidgetSpectrum::mouseDoubleClickEvent(QMouseEvent *event)
{
    if (plotRect().contains(event->position())) {
        emit enlargeRequested();
    } else if (m_scene.mode == SpectrumMode::Spectrum) {
        resetScales();
    } else if (m_scene.mode == SpectrumMode::Waterfall) {
        fitLevels(true);
    }
}

void CWidgetSpectrum::wheelEvent(QWheelEvent *event)
{
    constexpr int Step = 120; // of a plain wheel; others send parts of it
    m_wheel += event->angleDelta().y();
    const int steps = m_wheel / Step;
    m_wheel -= steps * Step;
    event->accept();
    if (steps == 0) {
        return;
    }
    const QPointF place = event->position();
    const QRectF plot = plotRect();
    if (m_scene.mode == SpectrumMode::Spectrum && place.x() < plot.left()) {
        m_scene.referenceDb =
            std::clamp(m_scene.referenceDb + steps * m_scene.dbPerDivision, -300.0, 100.0);
    } else if (m_scene.mode == SpectrumMode::Spectrum) {
        constexpr double Factor = 0.8;
        zoomFrequency(std::pow(Factor, steps), place.x());
    } else if (m_scene.mode == SpectrumMode::Waterfall && place.x() > plot.right()) {
        // The end nearer to the mouse moves.
        constexpr double StepDb = 5;
        constexpr double LeastSpan = 10;
        m_fitLevels = false;
        LevelRange &levels = m_scene.levels;
        if (place.y() < plot.center().y()) {
            levels.high = std::clamp(levels.high + steps * StepDb, levels.low + LeastSpan, 20.0);
        } else {
            levels.low = std::clamp(levels.low + steps * StepDb, -300.0, levels.high - LeastSpan);
        }
        m_scene.waterfall = {};
    }
    update();
}

void CWidgetSpectrum::leaveEvent(QEvent *)
{
    m_scene.mouse.reset();
    update();
}

void CWidgetSpectrum::changed()
{
    m_dirty = true;
    update();
}

void CWidgetSpectrum::updateLines()
{
    if (!m_dirty) {
        return;
    }
    m_dirty = false;
    const std::span<const IqSample> samples = std::as_const(m_samples);
    if (m_scene.mode == SpectrumMode::Ccdf) {
        MemorySource source(samples);
        m_scene.figures = measureFigures(source, m_scene.clockHz).value_or(SignalFigures());
        return;
    }
    m_scene.lines.update(samples, m_first);
    m_scene.trace = makeTrace(m_settings, m_scene.lines, samples);
    if (m_fitLevels) {
        m_scene.levels = fittedRange(m_scene.lines.lines());
    }
    m_scene.waterfall = {};
}
