// SPDX-License-Identifier: Apache-2.0
#pragma once

#include "ColorTable.h"
#include "PlotStyle.h"
#include "plotaxis.h"
#include "view/SignalFigures.h"
#include "view/SpectrumLines.h"
#include "view/SpectrumTrace.h"

#include <QImage>
#include <QMargins>
#include <QPointF>
#include <QRectF>
#include <QStringList>

#include <optional>

class PixelGrid;
class QPainter;

/// What is shown; the numbers are those of the mode list of the tools.
enum class SpectrumMode {
    Spectrum = 0,
    Waterfall = 1,
    Ccdf = 2, ///< how likely the power exceeds its mean by so much
};

constexpr int SpectrumModeCount = 3;

/// Everything a painted spectrum depends on, apart from its size and style.
struct SpectrumScene
{
    SpectrumLines lines;
    SpectrumTrace trace;
    SignalFigures figures; ///< of the distribution alone
    qint64 sampleCount = 0;
    SpectrumMode mode = SpectrumMode::Waterfall;
    ColorTable colors;
    LevelRange levels;  ///< of the waterfall's colours
    double clockHz = 0; ///< 0 labels the axes in shares of the clock and in samples
    double dbPerDivision = 15;
    double referenceDb = 0; ///< level of the uppermost grid line
    double lowShare = -0.5; ///< edges of the spectrum view as shares of the clock
    double highShare = 0.5;
    std::optional<double> marker; ///< frequencies as shares of the clock
    std::optional<double> deltaMarker;
    std::optional<qint64> cursor; ///< sample of the measuring cursor
    std::optional<QPointF> mouse; ///< place of the mouse within the painted area
    /// The waterfall as last painted; made anew when it is null or has another size.
    mutable QImage waterfall;
};

/// Draws the spectrum, the waterfall or the power distribution of a scene into any painter.
class SpectrumPainter
{
public:
    static constexpr int Divisions = 10; ///< of the level axis, from the reference level downwards

    SpectrumPainter(const PlotStyle &style, const SpectrumScene &scene);

    void paint(QPainter &painter, const QRectF &area) const;

    [[nodiscard]] static QMargins margins(const QFont &font, SpectrumMode mode);

    /// The waterfall's size in device pixels, of which there are `ratio` to a logical one.
    [[nodiscard]] static QSize waterfallSize(const QRectF &plot, double ratio);

    /// Horizontal place of the centre of a bin of 512 (0 to 511, zero frequency at 256), with the
    /// whole range on view.
    [[nodiscard]] static double xOf(const QRectF &plot, double bin);
    /// Vertical place of a level in the spectrum view.
    [[nodiscard]] double yOf(const QRectF &plot, double db) const;
    /// Horizontal place of a frequency in the spectrum view, and the way back.
    [[nodiscard]] double xOfShare(const QRectF &plot, double share) const;
    [[nodiscard]] double shareAt(const QRectF &plot, double x) const;

    /// The strip beside the waterfall that shows its colours.
    [[nodiscard]] static QRectF colorBar(const QRectF &plot);

    /// The lines of the read-out at a place, empty outside the plot or without data.
    [[nodiscard]] QStringList readOut(const QPointF &place, const QRectF &plot) const;

    /// Frequency and level of the marker, of the reference, and their difference, as far as they
    /// are set.
    [[nodiscard]] QStringList markerTexts() const;

private:
    void paintSpectrum(QPainter &painter, const PixelGrid &pixels, const QRectF &area,
                       const QRectF &plot) const;
    void paintTrace(QPainter &painter, const PixelGrid &pixels, const QRectF &plot,
                    const std::vector<double> &levels, ColorSlot slot) const;
    void paintMarkers(QPainter &painter, const QRectF &plot) const;
    void paintSpectrumTexts(QPainter &painter, const QRectF &plot) const;
    void paintWaterfall(QPainter &painter, const PixelGrid &pixels, const QRectF &area,
                        const QRectF &plot) const;
    void paintColorBar(QPainter &painter, const PixelGrid &pixels, const QRectF &area,
                       const QRectF &plot) const;
    void paintTimeAxis(QPainter &painter, const PixelGrid &pixels, const QRectF &area,
                       const QRectF &plot) const;
    void paintHint(QPainter &painter, const QRectF &plot) const;
    void paintMouse(QPainter &painter, const PixelGrid &pixels, const QRectF &area,
                    const QRectF &plot) const;
    [[nodiscard]] PlotAxis timeAxis() const;
    [[nodiscard]] QString frequencyText(double hz) const;
    [[nodiscard]] QString scaleHint() const;
    [[nodiscard]] double bandwidth() const { return m_scene.clockHz > 0 ? m_scene.clockHz : 1; }

    const PlotStyle &m_style;
    const SpectrumScene &m_scene;
};

/// The axis of frequencies between two shares of a clock; without one (0) of the shares themselves.
[[nodiscard]] PlotAxis frequencyAxis(double clockHz, double lowShare, double highShare);
