// SPDX-License-Identifier: Apache-2.0
#pragma once

#include "ColorTable.h"
#include "PlotStyle.h"
#include "view/SpectrumLines.h"

#include <QImage>
#include <QMargins>
#include <QPointF>
#include <QRectF>

#include <optional>

class PixelGrid;
class QPainter;

/// How lines are shown; the numbers are those of the mode list of the tools.
enum class SpectrumMode {
    Spectrum = 0,
    Waterfall = 1,
};

constexpr int SpectrumModeCount = 2;

/// Everything a painted spectrum depends on, apart from its size and style.
struct SpectrumScene
{
    SpectrumLines lines;
    std::vector<double> mean; ///< of the lines, as SpectrumLines::mean gives it
    qint64 sampleCount = 0;
    SpectrumMode mode = SpectrumMode::Waterfall;
    ColorTable colors;
    double clockHz = 0; ///< 0 labels the axes in shares of the clock and in samples
    double dbPerDivision = 15;
    std::optional<QPointF> mouse; ///< place of the mouse within the painted area
    /// The waterfall as last painted; made anew when it is null or has another size.
    mutable QImage waterfall;
};

/// Draws the mean spectrum or the waterfall of a scene into any painter.
class SpectrumPainter
{
public:
    static constexpr int Divisions = 10; ///< of the level axis, from 0 dB downwards

    SpectrumPainter(const PlotStyle &style, const SpectrumScene &scene);

    void paint(QPainter &painter, const QRectF &area) const;

    [[nodiscard]] static QMargins margins(const QFont &font, SpectrumMode mode);

    /// The waterfall's size in device pixels, of which there are `ratio` to a logical one.
    [[nodiscard]] static QSize waterfallSize(const QRectF &plot, double ratio);

    /// Horizontal place of a bin's centre (0 to 511, zero frequency at 256).
    [[nodiscard]] static double xOf(const QRectF &plot, double bin);
    /// Vertical place of a level in the spectrum view.
    [[nodiscard]] double yOf(const QRectF &plot, double db) const;

    /// The lines of the read-out at a place, empty outside the plot or without data.
    [[nodiscard]] QStringList readOut(const QPointF &place, const QRectF &plot) const;

private:
    void paintSpectrum(QPainter &painter, const PixelGrid &pixels, const QRectF &area,
                       const QRectF &plot) const;
    void paintWaterfall(QPainter &painter, const PixelGrid &pixels, const QRectF &area,
                        const QRectF &plot) const;
    void paintColorBar(QPainter &painter, const PixelGrid &pixels, const QRectF &area,
                       const QRectF &plot) const;
    void paintFrequencyAxis(QPainter &painter, const PixelGrid &pixels, const QRectF &area,
                            const QRectF &plot, int gridAlpha) const;
    void paintTimeAxis(QPainter &painter, const PixelGrid &pixels, const QRectF &area,
                       const QRectF &plot) const;
    void paintHint(QPainter &painter, const QRectF &plot) const;
    [[nodiscard]] QString frequencyText(double hz) const;
    [[nodiscard]] double bandwidth() const { return m_scene.clockHz > 0 ? m_scene.clockHz : 1; }

    const PlotStyle &m_style;
    const SpectrumScene &m_scene;
};
