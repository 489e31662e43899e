// SPDX-License-Identifier: Apache-2.0
#pragma once

#include "ColorTable.h"
#include "PlotStyle.h"
#include "view/SampleSource.h"

#include <QImage>
#include <QRectF>
#include <QSize>
#include <QString>
#include <QStringList>

#include <optional>
#include <span>

class QPainter;

/// The pictures that can be made of a waveform.
enum class PlotView {
    Iq,
    LogMag,
    LogAvg,
    LinAvg,
    Phase,
    Frequency,
    Spectrum,
    Waterfall,
    Constellation,
    Ccdf,
    Overview, ///< of all samples, as one envelope
};

/// The names of the views on a command line, in the order of PlotView: "iq", "logmag", "logavg",
/// "linavg", "phase", "frequency", "spectrum", "waterfall", "constellation", "ccdf", "overview".
[[nodiscard]] QStringList plotViewNames();

/// Nothing for a name that is none of them.
[[nodiscard]] std::optional<PlotView> plotViewOf(const QString &name);

struct PlotRequest
{
    PlotView view = PlotView::Iq;
    // The samples, for the form of renderPlot that takes them from here.
    std::span<const IqSample> samples;
    std::span<const quint8> markers; ///< may be shorter than the samples
    qint64 firstSample = 0;   ///< position of the first one in the waveform, of the same form
    double clockHz = 0;       ///< 0 labels the axes in samples
    QSize size{800, 600};     ///< logical pixels
    double pixelRatio = 1;    ///< device pixels to a logical one
    bool showMarkers = false; ///< the marker rows, in the views over time
    ColorMode palette = DefaultColorMode;
    std::optional<LevelRange> range; ///< dB; nothing: what the view chooses; see takesRange
    PlotTheme theme = PlotTheme::Dark;
    QString title; ///< over the plot; empty for none
};

/// Whether a view has a scale in dB that a range can set.
[[nodiscard]] bool takesRange(PlotView view);

/// The picture that the display of this view would show of the samples. Reads them block by block,
/// so that the memory needed doesn't grow with their number. Needs a QGuiApplication for its fonts
/// (the "offscreen" platform will do), but no display. A null image if the size is empty or, after
/// a line in the log, if the source fails.
[[nodiscard]] QImage renderPlot(const PlotRequest &request, SampleSource &source);

/// As above, of the samples in the request.
[[nodiscard]] QImage renderPlot(const PlotRequest &request);

/// As renderPlot, into a part of any painter; size and pixel ratio of the request don't count.
/// False if the source fails.
[[nodiscard]] bool paintPlot(QPainter &painter, const QRectF &area, const PlotRequest &request,
                             SampleSource &source);

/// The divisor of a constellation for a peak magnitude: the peak rounded up to a whole multiple of
/// a power of ten, 1 for a peak of 0.
[[nodiscard]] double constellationScale(double peak);

/// The greatest magnitude of the samples.
[[nodiscard]] double peakMagnitude(std::span<const IqSample> samples);
