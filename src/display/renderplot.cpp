// SPDX-License-Identifier: Apache-2.0
#include "renderplot.h"

#include "ConstellationPainter.h"
#include "OverviewPainter.h"
#include "SpectrumPainter.h"
#include "TracePainter.h"
#include "base/parallel.h"
#include "base/vectorstate.h"
#include "plotdraw.h"
#include "waterfall.h"

#include <QFontMetricsF>
#include <QPainter>

#include <algorithm>
#include <cmath>
#include <utility>
#include <vector>

namespace {

constexpr qint64 BlockSamples = 1 << 16;

/// Calls `take` with block after block of the source.
template <typename Take>
bool forEachBlock(SampleSource &source, const Take &take)
{
    if (!source.restart()) {
        return false;
    }
    std::vector<IqSample> samples;
    std::vector<quint8> markers;
    for (qint64 done = 0; done < source.count();) {
        const auto count = static_cast<std::size_t>(std::min(BlockSamples, source.count() - done));
        samples.resize(count);
        markers.resize(count);
        if (!source.next(samples, markers)) {
            return false;
        }
        take(std::span<const IqSample>(samples), std::span<const quint8>(markers));
        done += static_cast<qint64>(count);
    }
    return true;
}

bool paintTrace(QPainter &painter, const PlotStyle &style, const QRectF &area,
                const PlotRequest &request, SampleSource &source)
{
    TraceScene scene;
    scene.bins.begin(source.count());
    const bool read = forEachBlock(
        source, [&scene](auto samples, auto markers) { scene.bins.append(samples, markers); });
    scene.sampleCount = source.count();
    scene.mode = static_cast<TraceMode>(request.view);
    scene.showMarkers = request.showMarkers;
    scene.clockHz = request.clockHz;
    scene.firstSample = source.first();
    if (request.range) {
        constexpr double WholeRange = 100; // dB without zoom
        scene.topDb = request.range->high;
        scene.zoomY = WholeRange / (request.range->high - request.range->low);
    }
    TracePainter(style, scene).paint(painter, area);
    return read;
}

/// Transforms a source frame by frame. Of the lines, only those that a waterfall of `rows` rows
/// looks at keep their levels; the others count in the mean alone.
bool readLines(SampleSource &source, int rows, SpectrumScene &scene)
{
    const qint64 count = source.count();
    const qint64 lineCount =
        count < SpectrumLines::FrameSize
            ? 0
            : (count - SpectrumLines::FrameSize) / SpectrumLines::FrameStep + 1;
    std::vector<SpectrumLines::Line> lines(static_cast<std::size_t>(lineCount));
    std::vector<bool> looked(lines.size(), false);
    for (int y = 0; y < rows && !lines.empty(); ++y) {
        const std::size_t line = waterfallLine(y, rows, lines.size());
        looked[line] = true;
        looked[std::min(line + 1, lines.size() - 1)] = true;
    }
    std::vector<double> &mean = scene.trace.level;
    std::vector<double> &maximum = scene.trace.maximum;
    scene.trace.frames = lineCount;
    if (!lines.empty()) {
        constexpr double Lowest = -1e9;
        mean.assign(SpectrumLines::FrameSize, 0.0);
        maximum.assign(SpectrumLines::FrameSize, Lowest);
    }
    std::vector<IqSample> pending;
    std::size_t made = 0;
    return forEachBlock(source, [&](std::span<const IqSample> samples, auto) {
        pending.insert(pending.end(), samples.begin(), samples.end());
        const std::size_t from = made;
        std::size_t offset = 0;
        for (; offset + SpectrumLines::FrameSize <= pending.size();
             offset += SpectrumLines::FrameStep) {
            lines[made].position =
                source.first() + static_cast<qint64>(made) * SpectrumLines::FrameStep;
            ++made;
        }
        parallelFor(made - from, [&](std::size_t k) {
            lines[from + k].level = SpectrumLines::transform(
                std::span(pending).subspan(k * SpectrumLines::FrameStep, SpectrumLines::FrameSize));
        });
        for (std::size_t k = from; k < made; ++k) {
            for (std::size_t bin = 0; bin < mean.size(); ++bin) {
                mean[bin] += lines[k].level[bin] / static_cast<double>(lineCount);
                maximum[bin] = std::max(maximum[bin], lines[k].level[bin]);
            }
            if (!looked[k]) {
                lines[k].level = std::vector<double>(); // gives the memory back, as {} doesn't
            }
        }
        pending.erase(pending.begin(), pending.begin() + static_cast<std::ptrdiff_t>(offset));
        if (made == lines.size()) {
            scene.lines.setLines(std::move(lines));
        }
    });
}

bool paintSpectrum(QPainter &painter, const PlotStyle &style, const QRectF &area,
                   const PlotRequest &request, SampleSource &source)
{
    SpectrumScene scene;
    scene.mode =
        request.view == PlotView::Spectrum ? SpectrumMode::Spectrum : SpectrumMode::Waterfall;
    scene.sampleCount = source.count();
    scene.clockHz = request.clockHz;
    scene.colors = ColorTable(request.palette);
    const QRectF plot = area.marginsRemoved(SpectrumPainter::margins(style.font, scene.mode));
    const int rows = scene.mode == SpectrumMode::Waterfall
                         ? SpectrumPainter::waterfallSize(plot, PixelGrid(painter).ratio()).height()
                         : 0;
    const bool read = readLines(source, rows, scene);
    scene.levels = request.range.value_or(fittedRange(scene.lines.lines()));
    if (request.range) {
        scene.referenceDb = request.range->high;
        scene.dbPerDivision =
            (request.range->high - request.range->low) / SpectrumPainter::Divisions;
    }
    SpectrumPainter(style, scene).paint(painter, area);
    return read;
}

bool paintCcdf(QPainter &painter, const PlotStyle &style, const QRectF &area,
               const PlotRequest &request, SampleSource &source)
{
    const auto figures = measureFigures(source, request.clockHz);
    if (!figures) {
        return false;
    }
    SpectrumScene scene;
    scene.mode = SpectrumMode::Ccdf;
    scene.figures = *figures;
    SpectrumPainter(style, scene).paint(painter, area);
    return true;
}

bool paintOverview(QPainter &painter, const PlotStyle &style, const QRectF &area,
                   const PlotRequest &request, SampleSource &source)
{
    Overview overview(source.count());
    std::vector<float> iq;
    const bool read = forEachBlock(source, [&](std::span<const IqSample> samples, auto markers) {
        iq.clear();
        for (const IqSample &sample : samples) {
            iq.push_back(static_cast<float>(sample.i));
            iq.push_back(static_cast<float>(sample.q));
        }
        overview.append(iq, markers);
    });
    OverviewPainter(style, overview).paint(painter, area, request.clockHz);
    return read;
}

bool paintConstellation(QPainter &painter, const PlotStyle &style, const QRectF &area,
                        const PlotRequest &request, SampleSource &source)
{
    double peak = 0;
    if (!forEachBlock(source, [&peak](auto samples, auto) {
            peak = std::max(peak, peakMagnitude(samples));
        })) {
        return false;
    }
    ConstellationScene scene;
    scene.scaleI = scene.scaleQ = constellationScale(peak);
    std::vector<IqSample> dots;
    const bool read = forEachBlock(source, [&](std::span<const IqSample> samples, auto) {
        scene.grid.append(samples, scene.scaleI, scene.scaleQ);
        if (source.count() <= ConstellationPainter::DotLimit) {
            dots.insert(dots.end(), samples.begin(), samples.end());
        }
    });
    scene.sampleCount = source.count();
    scene.dots = dots;
    scene.colorMode = request.palette;
    ConstellationPainter(style, scene).paint(painter, area);
    return read;
}

} // namespace

QStringList plotViewNames()
{
    return {"iq",       "logmag",    "logavg",        "linavg", "phase",   "frequency",
            "spectrum", "waterfall", "constellation", "ccdf",   "overview"};
}

std::optional<PlotView> plotViewOf(const QString &name)
{
    const qsizetype index = plotViewNames().indexOf(name);
    return index < 0 ? std::nullopt : std::optional(static_cast<PlotView>(index));
}

bool takesRange(PlotView view)
{
    return view == PlotView::LogMag || view == PlotView::LogAvg || view == PlotView::Spectrum ||
           view == PlotView::Waterfall;
}

bool paintPlot(QPainter &painter, const QRectF &area, const PlotRequest &request,
               SampleSource &source)
{
    clearVectorState();
    const PlotStyle style = PlotStyle::themed(request.theme);
    QRectF plot = area;
    if (!request.title.isEmpty()) {
        const QRectF strip(area.left(), area.top(), area.width(),
                           QFontMetricsF(style.font).height() + 8);
        fillArea(painter, strip, style.color(ColorSlot::PanelBackground));
        painter.setFont(style.font);
        painter.setPen(style.color(ColorSlot::Text));
        painter.drawText(strip, Qt::AlignCenter,
                         QFontMetricsF(style.font)
                             .elidedText(request.title, Qt::ElideMiddle, strip.width() - 8));
        plot.setTop(strip.bottom());
    }
    switch (request.view) {
    case PlotView::Iq:
    case PlotView::LogMag:
    case PlotView::LogAvg:
    case PlotView::LinAvg:
    case PlotView::Phase:
    case PlotView::Frequency:
        return paintTrace(painter, style, plot, request, source);
    case PlotView::Spectrum:
    case PlotView::Waterfall:
        return paintSpectrum(painter, style, plot, request, source);
    case PlotView::Ccdf:
        return paintCcdf(painter, style, plot, request, source);
    case PlotView::Overview:
        return paintOverview(painter, style, plot, request, source);
    case PlotView::Constellation:
        break;
    }
    return paintConstellation(painter, style, plot, request, source);
}

QImage renderPlot(const PlotRequest &request, SampleSource &source)
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
    const bool done = paintPlot(painter, QRectF(QPointF(), QSizeF(request.size)), request, source);
    painter.end();
    return done ? image : QImage();
}

QImage renderPlot(const PlotRequest &request)
{
    MemorySource source(request.samples, request.markers, request.firstSample);
    return renderPlot(request, source);
}

double constellationScale(double peak)
{
    if (!(peak > 0) || !std::isfinite(peak)) {
        return 1;
    }
    // A peak that is round but for the last digits isn't given twice the room.
    constexpr double Tolerance = 1e-4;
    const double power = std::pow(10.0, std::floor(std::log10(peak * 0.5)));
    return std::max(std::ceil(peak / power - Tolerance) * power, peak);
}

double peakMagnitude(std::span<const IqSample> samples)
{
    double square = 0;
    for (const IqSample &sample : samples) {
        square = std::max(square, sample.i * sample.i + sample.q * sample.q);
    }
    return std::sqrt(square);
}
