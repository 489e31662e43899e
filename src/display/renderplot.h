// SPDX-License-Identifier: Apache-2.0
#pragma once

#include "IqSample.h"

#include <QImage>
#include <QSize>
#include <QString>
#include <QStringList>

#include <optional>
#include <span>

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
};

/// The names of the views on a command line, in the order of PlotView: "iq", "logmag", "logavg",
/// "linavg", "phase", "frequency", "spectrum", "waterfall", "constellation".
[[nodiscard]] QStringList plotViewNames();

/// Nothing for a name that is none of them.
[[nodiscard]] std::optional<PlotView> plotViewOf(const QString &name);

struct PlotRequest
{
    PlotView view = PlotView::Iq;
    std::span<const IqSample> samples;
    std::span<const quint8> markers; ///< may be shorter than the samples
    qint64 firstSample = 0;          ///< position of the first one in the waveform
    double clockHz = 0;              ///< 0 labels the axes in samples
    QSize size{800, 600};            ///< logical pixels
    double pixelRatio = 1;           ///< device pixels to a logical one
    bool showMarkers = false;        ///< the marker rows, in the views over time
};

/// The picture that the display of this view would show. Needs a QGuiApplication (the "offscreen"
/// platform will do) for its fonts, but no display. A null image if the size is empty.
[[nodiscard]] QImage renderPlot(const PlotRequest &request);

/// The divisor of a constellation for a peak magnitude: the peak rounded up to a whole multiple of
/// a power of ten, 1 for a peak of 0.
[[nodiscard]] double constellationScale(double peak);

/// The greatest magnitude of the samples.
[[nodiscard]] double peakMagnitude(std::span<const IqSample> samples);
