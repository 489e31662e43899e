// SPDX-License-Identifier: Apache-2.0
#pragma once

#include "EnvelopeStore.h"

#include "composer/Composition.h"
#include "display/PlotStyle.h"

#include <QMargins>
#include <QRectF>

#include <functional>

class QPainter;

/// What stands in the middle of a block.
enum class CenterInfo {
    UsedSamples,
    PlayTime,
    ClockRate,
    FirstSample,
    FrequencyOffset,
    Attenuation,
    StartSample,
    StartTime,
};

/// Where things lie in the track editor, in pixels. Rows have a box that enables the track, one
/// that selects it, and the time axis behind them.
struct TrackGeometry
{
    static constexpr int EnableWidth = 40;
    static constexpr int SelectWidth = 20;
    static constexpr int AxisOffset = 80; ///< of the time axis from the left margin
    static constexpr int TopSpace = 20;
    static constexpr int UnusedHeight = 69; ///< of the rows: space above, axis below

    QRect area; ///< the widget within its margins
    int trackCount = 0;
    qint64 firstSample = 0; ///< target sample at the left end of the axis
    qint64 lastSample = 0;  ///< target sample at the right end

    [[nodiscard]] int axisLeft() const { return area.left() + AxisOffset; }
    [[nodiscard]] int axisWidth() const { return area.width() - AxisOffset; }
    [[nodiscard]] int rowsTop() const { return area.top() + TopSpace; }
    [[nodiscard]] int rowHeight() const;
    [[nodiscard]] QRect row(int track) const;
    /// -1 outside the rows.
    [[nodiscard]] int trackAt(int y) const;
    [[nodiscard]] bool isValid() const;
    [[nodiscard]] int xOf(qint64 sample) const;
    [[nodiscard]] qint64 sampleAt(int x) const;
};

/// A block that is being dragged and has not been put down.
struct DraggedSegment
{
    int track = -1;
    int index = -1;
    qint64 target = 0;
};

struct TrackScene
{
    const Composition *composition = nullptr;
    qint64 cursor = 0;
    double viewStart = 0; ///< s
    double viewEnd = 0;   ///< s
    CenterInfo info = CenterInfo::UsedSamples;
    DraggedSegment dragged;
    std::function<const Envelope *(const QString &)> envelope; ///< may be empty
};

/// Draws the tracks of a composition into any painter.
class TrackPainter
{
public:
    TrackPainter(const PlotStyle &style, const TrackScene &scene, const TrackGeometry &geometry);

    void paint(QPainter &painter, const QRectF &background) const;

private:
    void drawAxis(QPainter &painter) const;
    void drawRow(QPainter &painter, int track) const;
    void drawBlock(QPainter &painter, int track, int index, const SegmentBorders &borders) const;
    void drawEnvelope(QPainter &painter, const ComposerSegment &segment, const QRect &block,
                      const QRect &visible) const;
    void drawFades(QPainter &painter, const ComposerSegment &segment, const QRect &block) const;
    void drawTexts(QPainter &painter, const ComposerSegment &segment, const QRect &block) const;
    void drawCursor(QPainter &painter) const;
    [[nodiscard]] QString infoText(const ComposerSegment &segment) const;
    [[nodiscard]] QStringList marksOf(const ComposerSegment &segment) const;
    [[nodiscard]] QColor colorFor(const ComposerSegment &segment, bool enabled) const;

    const PlotStyle &m_style;
    const TrackScene &m_scene;
    const TrackGeometry &m_geometry;
};
