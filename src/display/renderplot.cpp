// SPDX-License-Identifier: Apache-2.0
#include "renderplot.h"

#include "ConstellationPainter.h"
#include "SpectrumPainter.h"
#include "TracePainter.h"

#include <QPainter>

#include <algorithm>
#include <cmath>

namespace {

void paintTrace(QPainter &painter, const QRectF &area, const PlotRequest &request, TraceMode mode)
{
    TraceScene scene;
    scene.bins.compute(request.samples, request.markers);
    scene.sampleCount = static_cast<qint64>(request.samples.size());
    scene.mode = mode;
    scene.showMarkers = request.showMarkers;
    scene.clockHz = request.clockHz;
    TracePainter(PlotStyle::current(), scene).paint(painter, area);
}

void paintSpectrum(QPainter &painter, const QRectF &area, const PlotRequest &request,
                   SpectrumMode mode)
{
    SpectrumScene scene;
    scene.lines.update(request.samples, request.firstSample);
    scene.mean = scene.lines.mean();
    scene.sampleCount = static_cast<qint64>(request.samples.size());
    scene.mode = mode;
    scene.clockHz = request.clockHz;
    SpectrumPainter(PlotStyle::current(), scene).paint(painter, area);
}

void paintConstellation(QPainter &painter, const QRectF &area, const PlotRequest &request)
{
    ConstellationScene scene;
    scene.samples = request.samples;
    scene.scaleI = scene.scaleQ = constellationScale(peakMagnitude(request.samples));
    scene.grid.compute(request.samples, scene.scaleI, scene.scaleQ);
    ConstellationPainter(PlotStyle::current(), scene).paint(painter, area);
}

} // namespace

QStringList plotViewNames()
{
    return {"iq",        "logmag",   "logavg",    "linavg",       "phase",
            "frequency", "spectrum", "waterfall", "constellation"};
}

std::optional<PlotView> plotViewOf(const QString &name)
{
    const qsizetype index = plotViewNames().indexOf(name);
    return index < 0 ? std::nullopt : std::optional(static_cast<PlotView>(index));
}

QImage renderPlot(const PlotRequest &request)
{
    if (request.size.isEmpty() || !(request.pixelRatio > 0)) {
        return {};
    }
    QImage image(QSizeF(QSizeF(request.size) * request.pixelRatio).toSize(), QImage::Format_RGB32);
    if (image.isNull()) {
        return {};
    }
    image.setDevicePixelRatio(request.pixelRatio);
    QPainter painter(&image);
    const QRectF area(QPointF(), QSizeF(request.size));
    switch (request.view) {
    case PlotView::Iq:
    case PlotView::LogMag:
    case PlotView::LogAvg:
    case PlotView::LinAvg:
    case PlotView::Phase:
    case PlotView::Frequency:
        paintTrace(painter, area, request, static_cast<TraceMode>(request.view));
        break;
    case PlotView::Spectrum:
        paintSpectrum(painter, area, request, SpectrumMode::Spectrum);
        break;
    case PlotView::Waterfall:
        paintSpectrum(painter, area, request, SpectrumMode::Waterfall);
        break;
    case PlotView::Constellation:
        paintConstellation(painter, area, request);
        break;
    }
    return image;
}

double constellationScale(double peak)
{
    if (!(peak > 0) || !std::isfinite(peak)) {
        return 1;
    }
    const double power = std::pow(10.0, std::trunc(std::log10(peak * 0.5)));
    return std::ceil(peak / power) * power;
}

double peakMagnitude(std::span<const IqSample> samples)
{
    double square = 0;
    for (const IqSample &sample : samples) {
        square = std::max(square, sample.i * sample.i + sample.q * sample.q);
    }
    return std::sqrt(square);
}
