// SPDX-License-Identifier: Apache-2.0
#pragma once

#include "PlotStyle.h"
#include "plotaxis.h"
#include "view/TraceBins.h"

#include <QList>
#include <QMargins>
#include <QRectF>

#include <array>

class PixelGrid;
class QPainter;

/// What the trace shows over time; the numbers are those of the mode lists of the tools.
enum class TraceMode {
    IqEnvelope = 0,
    LogMagEnvelope = 1,
    LogMagAverage = 2,
    LinMagAverage = 3,
    Phase = 4,
    Frequency = 5,
};

constexpr int TraceModeCount = 6;

/// Everything a painted trace depends on, apart from its size and style.
struct TraceScene
{
    TraceBins bins;
    qint64 sampleCount = 0;
    TraceMode mode = TraceMode::IqEnvelope;
    bool showMarkers = false;
    double clockHz = 0;     ///< 0 labels the time axis in samples
    qint64 firstSample = 0; ///< position of the first one in the waveform
    double zoomY = 1;       ///< magnifies the value axis: about zero, for the log modes at its top
    double topDb = 0;       ///< the level at the top of the log modes
    int mouseBin = -1;      ///< bin numbers of the cursors, -1 for none
    std::array<int, 2> cursorBins{-1, -1}; ///< the measuring and the reference cursor
    std::array<int, 2> rangeBins{-1, -1};  ///< first and last of a range to be marked
};

/// Draws a scene into any painter: one or two value panes and, if wanted, the pane of the four
/// marker rows below them. Walks the bin table alone, so the cost doesn't grow with the samples.
class TracePainter
{
public:
    TracePainter(const PlotStyle &style, const TraceScene &scene);

    void paint(QPainter &painter, const QRectF &area) const;

    /// Room for the axis texts around the panes.
    [[nodiscard]] static QMargins margins(const QFont &font);

    /// The panes from top to bottom within the plot area (the area without the margins); the last
    /// one holds the markers if they are shown.
    [[nodiscard]] QList<QRectF> panes(const QRectF &plot) const;

    /// Vertical place of a fraction (0 bottom, 1 top) of a pane.
    [[nodiscard]] static double yOf(const QRectF &pane, double fraction);

    /// Horizontal place of a bin.
    [[nodiscard]] static double xOf(const QRectF &plot, int bin);

private:
    struct Label
    {
        double fraction;
        QString text;
    };

    [[nodiscard]] QList<Label> labels() const;
    [[nodiscard]] double fractionOf(double value) const;
    void paintAxis(QPainter &painter, const PixelGrid &grid, const QRectF &area, const QRectF &pane,
                   const QList<Label> &texts) const;
    void paintValues(QPainter &painter, const QRectF &plot, const QRectF &pane,
                     double TraceBin::*upper, double TraceBin::*lower, ColorSlot place) const;
    void paintPaneOfMode(QPainter &painter, const QRectF &plot, const QRectF &pane,
                         int index) const;
    void paintMarkers(const PixelGrid &grid, const QRectF &plot, const QRectF &pane) const;
    void paintRange(QPainter &painter, const QRectF &plot) const;
    void paintCursors(QPainter &painter, const PixelGrid &grid, const QRectF &plot,
                      const QList<QRectF> &panes) const;
    void paintCaptions(QPainter &painter, const QList<QRectF> &panes) const;
    /// Whether the next bin that holds samples has the marker low throughout.
    [[nodiscard]] bool isLowBehind(int bin, quint8 bit) const;
    /// What is shown, and how much of the time axis a division is.
    void paintQuantity(QPainter &painter, const QRectF &pane, double division) const;
    [[nodiscard]] PlotAxis timeAxis() const;
    [[nodiscard]] QString quantity() const;
    [[nodiscard]] QString scaleHint() const;

    const PlotStyle &m_style;
    const TraceScene &m_scene;
};
