// SPDX-License-Identifier: Apache-2.0
#include "TrackPainter.h"

#include "base/EngineeringNumber.h"
#include "composer/wholenumbers.h"
#include "display/plotdraw.h"
#include "view/plotscale.h"

#include <QFileInfo>
#include <QFontMetrics>
#include <QPainterPath>

#include <algorithm>
#include <cmath>

namespace {

const QColor MissingColor(0xC0, 0x50, 0x18);
constexpr int TornDepth = 4; ///< pixels of a torn edge

/// The outline of a block; where the source goes on beyond it, its edge is torn.
QPainterPath outline(const QRect &block, bool tornLeft, bool tornRight)
{
    QPainterPath path;
    const auto edge = [&](int x, int inward, bool downward) {
        const int steps = std::max(2, block.height() / 6);
        for (int i = 0; i <= steps; ++i) {
            const int part = downward ? i : steps - i;
            const double y = block.top() + double(block.height()) * part / steps;
            const QPointF point(x + (part % 2 == 1 ? inward : 0), y);
            path.elementCount() == 0 ? path.moveTo(point) : path.lineTo(point);
        }
    };
    const int left = block.left();
    const int right = block.left() + block.width();
    const int depth = std::min(TornDepth, block.width() / 3);
    edge(left, tornLeft ? depth : 0, false);
    edge(right, tornRight ? -depth : 0, true);
    path.closeSubpath();
    return path;
}

} // namespace

int TrackGeometry::rowHeight() const
{
    return trackCount > 0 ? std::max(0, (area.height() - UnusedHeight) / trackCount) : 0;
}

QRect TrackGeometry::row(int track) const
{
    return {area.left(), rowsTop() + track * rowHeight(), area.width(), rowHeight()};
}

int TrackGeometry::trackAt(int y) const
{
    const int height = rowHeight();
    if (height < 1 || y < rowsTop()) {
        return -1;
    }
    const int track = (y - rowsTop()) / height;
    return track < trackCount ? track : -1;
}

bool TrackGeometry::isValid() const
{
    return firstSample >= 0 && lastSample > firstSample && axisWidth() > 0;
}

int TrackGeometry::xOf(qint64 sample) const
{
    const double share = (static_cast<double>(sample) - static_cast<double>(firstSample)) *
                         static_cast<double>(axisWidth()) /
                         static_cast<double>(lastSample - firstSample);
    // Far outside the widget one pixel is as good as another.
    constexpr double Far = 1e6;
    return static_cast<int>(std::clamp(share, -Far, Far)) + axisLeft();
}

qint64 TrackGeometry::sampleAt(int x) const
{
    const double share = static_cast<double>(x - axisLeft()) / static_cast<double>(axisWidth());
    return firstSample + static_cast<qint64>(share * static_cast<double>(lastSample - firstSample));
}

TrackPainter::TrackPainter(const PlotStyle &style, const TrackScene &scene,
                           const TrackGeometry &geometry)
    : m_style(style)
    , m_scene(scene)
    , m_geometry(geometry)
{
}

void TrackPainter::paint(QPainter &painter, const QRectF &background) const
{
    painter.save();
    painter.setFont(m_style.font);
    fillArea(painter, background, m_style.color(ColorSlot::PanelBackground));
    if (m_geometry.trackCount == 0) {
        painter.setPen(m_style.color(ColorSlot::Text));
        painter.drawText(background, Qt::AlignCenter, QStringLiteral("Add a track to begin."));
    } else if (m_geometry.isValid()) {
        drawAxis(painter);
        for (int track = 0; track < m_geometry.trackCount; ++track) {
            drawRow(painter, track);
        }
        drawCursor(painter);
    }
    painter.restore();
}

void TrackPainter::drawAxis(QPainter &painter) const
{
    const PixelGrid pixels(painter);
    const double span = m_scene.viewEnd - m_scene.viewStart;
    const QFontMetrics metrics(m_style.font);
    const int labelWidth = metrics.horizontalAdvance(QStringLiteral("888.888 ms  "));
    const double step = niceStep(span * labelWidth / std::max(m_geometry.axisWidth(), 1));
    const int bottom = m_geometry.rowsTop() + m_geometry.trackCount * m_geometry.rowHeight();
    painter.setPen(m_style.color(ColorSlot::Text));
    const auto first = static_cast<qint64>(std::ceil(m_scene.viewStart / step - 1e-9));
    const auto last = static_cast<qint64>(std::floor(m_scene.viewEnd / step + 1e-9));
    for (qint64 i = first; i <= last && i - first < 1000; ++i) {
        const double time = static_cast<double>(i) * step;
        const double x =
            m_geometry.axisLeft() + (time - m_scene.viewStart) / span * m_geometry.axisWidth();
        pixels.vertical(x, m_geometry.rowsTop(), bottom + 4, m_style.color(ColorSlot::GridLines));
        const QRectF label(x - labelWidth / 2.0, bottom + 6, labelWidth, metrics.height());
        if (label.right() <= m_geometry.area.right() + labelWidth / 4.0) {
            painter.drawText(
                label, Qt::AlignCenter,
                formatNumber(time, NumberFormat{.unit = QStringLiteral("s"), .precision = 3}));
        }
    }
    // Beyond the end of the target nothing is rendered.
    const int end =
        std::max(m_geometry.xOf(m_scene.composition->target.lSamples), m_geometry.axisLeft());
    const int right = m_geometry.axisLeft() + m_geometry.axisWidth();
    if (end < right) {
        fillArea(painter,
                 QRectF(end, m_geometry.rowsTop(), right - end, bottom - m_geometry.rowsTop()),
                 m_style.color(ColorSlot::GridLines, 70));
    }
}

void TrackPainter::drawRow(QPainter &painter, int track) const
{
    const PixelGrid pixels(painter);
    const QRect row = m_geometry.row(track).adjusted(0, 1, 0, -1);
    const ComposerTrack &content = m_scene.composition->tracks()[static_cast<std::size_t>(track)];
    const QRect enable(row.left(), row.top(), TrackGeometry::EnableWidth - 2, row.height());
    const QRect select(row.left() + TrackGeometry::EnableWidth, row.top(),
                       TrackGeometry::SelectWidth - 2, row.height());
    fillArea(painter, enable,
             content.bEnable ? m_style.color(ColorSlot::AverageTrace, 150)
                             : m_style.color(ColorSlot::MarkedBackground));
    fillArea(painter, select,
             content.bSelect ? m_style.color(ColorSlot::CursorLine, 180)
                             : m_style.color(ColorSlot::MarkedBackground));
    pixels.frame(enable, m_style.color(ColorSlot::GridLines));
    pixels.frame(select, m_style.color(ColorSlot::GridLines));
    painter.setPen(m_style.color(ColorSlot::Text));
    painter.drawText(enable, Qt::AlignCenter,
                     content.bEnable ? QString::number(track + 1) : QStringLiteral("off"));
    pixels.horizontal(row.bottom() + 1, m_geometry.axisLeft(),
                      m_geometry.axisLeft() + m_geometry.axisWidth(),
                      m_style.color(ColorSlot::GridLines));
    painter.save();
    painter.setClipRect(
        QRect(m_geometry.axisLeft(), row.top(), m_geometry.axisWidth(), row.height()));
    for (int i = 0; i < static_cast<int>(content.segments.size()); ++i) {
        const ComposerSegment &segment = content.segments[static_cast<std::size_t>(i)];
        auto borders = m_scene.composition->segmentBorders(segment);
        if (!borders) {
            continue;
        }
        if (m_scene.dragged.track == track && m_scene.dragged.index == i) {
            borders = SegmentBorders{m_scene.dragged.target,
                                     m_scene.dragged.target + borders->count() - 1};
        }
        drawBlock(painter, track, i, *borders);
        const qint64 length = m_scene.composition->target.lSamples;
        if (segment.bWrap && borders->last >= length) {
            drawBlock(painter, track, i,
                      {boundedDifference(borders->first, length), borders->last - length});
        }
    }
    painter.restore();
}

QColor TrackPainter::colorFor(const ComposerSegment &segment, bool enabled) const
{
    QColor color = segment.missing ? MissingColor : m_style.color(ColorSlot::PeakTrace);
    // Dark enough for the texts upon it; what is selected shows by its frame.
    color.setAlpha(enabled ? (segment.selected ? 125 : 90) : 40);
    return color;
}

void TrackPainter::drawBlock(QPainter &painter, int track, int index,
                             const SegmentBorders &borders) const
{
    const ComposerTrack &content = m_scene.composition->tracks()[static_cast<std::size_t>(track)];
    const ComposerSegment &segment = content.segments[static_cast<std::size_t>(index)];
    const QRect row = m_geometry.row(track).adjusted(0, 2, 0, -3);
    const int left = m_geometry.xOf(borders.first);
    const int right = std::max(m_geometry.xOf(borders.last + 1), left + 2);
    const QRect block(left, row.top(), right - left, row.height());
    const QRect axis(m_geometry.axisLeft(), row.top(), m_geometry.axisWidth(), row.height());
    const QRect visible = block & axis;
    if (visible.isEmpty()) {
        return;
    }
    painter.setRenderHint(QPainter::Antialiasing, true);
    const QColor color = colorFor(segment, content.bEnable);
    const QPainterPath shape =
        outline(block, segment.isTruncatedAtStart(), segment.isTruncatedAtEnd());
    painter.fillPath(shape, color);
    if (segment.missing) {
        painter.fillPath(shape, QBrush(MissingColor, Qt::BDiagPattern));
    }
    painter.save();
    painter.setClipPath(shape, Qt::IntersectClip);
    drawEnvelope(painter, segment, block, visible);
    painter.restore();
    QColor frame = color;
    frame.setAlpha(255);
    painter.setPen(QPen(segment.selected ? m_style.color(ColorSlot::CursorLine) : frame,
                        segment.selected ? 2 : 1));
    painter.drawPath(shape);
    drawFades(painter, segment, block);
    painter.setRenderHint(QPainter::Antialiasing, false);
    drawTexts(painter, segment, visible);
}

void TrackPainter::drawEnvelope(QPainter &painter, const ComposerSegment &segment,
                                const QRect &block, const QRect &visible) const
{
    const Envelope *envelope =
        m_scene.envelope && !segment.missing ? m_scene.envelope(segment.sName) : nullptr;
    if (envelope == nullptr || block.width() < 4) {
        return;
    }
    const double gain = std::pow(10.0, segment.dLOfs / -20);
    const double middle = block.center().y() + 0.5;
    const double half = block.height() / 2.0 - 1;
    const double perPixel = static_cast<double>(segment.lUsed) / block.width();
    QColor color = m_style.color(ColorSlot::PeakTrace).lighter(130);
    color.setAlpha(110);
    for (int x = visible.left(); x <= visible.right(); ++x) {
        const double from = static_cast<double>(segment.lStart) + perPixel * (x - block.left());
        const double height =
            std::min(1.0, gain * static_cast<double>(envelope->peak(from, from + perPixel))) * half;
        painter.fillRect(QRectF(x, middle - height, 1, 2 * height), color);
    }
}

void TrackPainter::drawFades(QPainter &painter, const ComposerSegment &segment,
                             const QRect &block) const
{
    const double perSecond =
        m_geometry.axisWidth() / std::max(m_scene.viewEnd - m_scene.viewStart, 1e-12);
    painter.setPen(QPen(m_style.color(ColorSlot::CursorLine), 1.5));
    const auto ramp = [&](double seconds, int atX, int direction) {
        const double width = std::min(seconds * perSecond, 1e6);
        if (width >= 1) {
            painter.drawLine(QPointF(atX, block.bottom()),
                             QPointF(atX + direction * width, block.top() + 1));
        }
    };
    ramp(segment.dFadeIn, block.left(), 1);
    ramp(segment.dFadeOut, block.left() + block.width(), -1);
}

QStringList TrackPainter::marksOf(const ComposerSegment &segment) const
{
    QStringList marks;
    if (m_scene.composition->needsResampling(segment)) {
        marks.append(QStringLiteral("R"));
    }
    if (segment.hasLevelOffset()) {
        marks.append(QStringLiteral("dL"));
    }
    if (segment.hasFrequencyOffset()) {
        marks.append(m_scene.composition->effectiveOffset(segment).limited ? QStringLiteral("dF !")
                                                                           : QStringLiteral("dF"));
    }
    return marks;
}

QString TrackPainter::infoText(const ComposerSegment &segment) const
{
    const Composition &document = *m_scene.composition;
    switch (m_scene.info) {
    case CenterInfo::UsedSamples:
        return QString::number(segment.lUsed);
    case CenterInfo::PlayTime:
        return engineeringText(static_cast<double>(segment.lUsed) / segment.dSrcClk,
                               QStringLiteral("s"));
    case CenterInfo::ClockRate:
        return engineeringText(segment.dSrcClk, QStringLiteral("Hz"));
    case CenterInfo::FirstSample:
        return QString::number(segment.lStart);
    case CenterInfo::FrequencyOffset:
        return engineeringText(segment.dFOfs, QStringLiteral("Hz"));
    case CenterInfo::Attenuation:
        return QStringLiteral("%1 dB").arg(segment.dLOfs);
    case CenterInfo::StartSample:
        return QString::number(segment.lTarget);
    case CenterInfo::StartTime:
        return engineeringText(static_cast<double>(segment.lTarget) / document.target.dUsrClk,
                               QStringLiteral("s"));
    }
    return {};
}

void TrackPainter::drawTexts(QPainter &painter, const ComposerSegment &segment,
                             const QRect &block) const
{
    const QFontMetrics metrics(m_style.font);
    const QRect inner = block.adjusted(5, 0, -5, 0);
    if (inner.width() < metrics.horizontalAdvance(QStringLiteral("QQ")) ||
        inner.height() < metrics.ascent()) {
        return;
    }
    // An envelope may be as light as the text.
    const auto draw = [&](const QRect &area, int alignment, const QString &text) {
        const QRect plate = metrics.boundingRect(area, alignment, text).adjusted(-3, 0, 3, 0);
        painter.fillRect(plate & block, m_style.color(ColorSlot::PanelBackground, 150));
        painter.setPen(m_style.color(ColorSlot::Text));
        painter.drawText(area, alignment, text);
    };
    const QString marks = marksOf(segment).join(QLatin1Char(' '));
    const QString info = infoText(segment);
    const QString name = (segment.missing ? QStringLiteral("missing: ") : QString()) +
                         QFileInfo(segment.sName).fileName();
    const int markWidth = marks.isEmpty()
                              ? 0
                              : std::max(metrics.horizontalAdvance(marks),
                                         metrics.horizontalAdvance(QStringLiteral("QQQ")));
    const int infoWidth = metrics.horizontalAdvance(info);
    const bool twoLines = inner.height() >= 2 * metrics.height();
    const QRect line(inner.left(), twoLines ? inner.center().y() : inner.top(), inner.width(),
                     twoLines ? metrics.height() : inner.height());
    const QRect nameLine = twoLines ? line.translated(0, -metrics.height()) : line;
    int room = inner.width();
    if (markWidth > 0 && markWidth < room) {
        draw(line, Qt::AlignRight | Qt::AlignVCenter, marks);
        room -= markWidth + 6;
    }
    if (twoLines) {
        draw(nameLine, Qt::AlignHCenter | Qt::AlignVCenter,
             metrics.elidedText(name, Qt::ElideMiddle, inner.width()));
        // Below the name, if the marks leave the room for it there.
        const int taken = inner.width() - room;
        const bool centred = infoWidth + 2 * taken <= inner.width();
        if (infoWidth <= room) {
            draw(centred ? line : line.adjusted(0, 0, -taken, 0), Qt::AlignCenter, info);
        }
        return;
    }
    // In one line the centre belongs to the information, and the name takes what is left of it.
    if (infoWidth <= room) {
        const int left = inner.left() + (room - infoWidth) / 2;
        draw(QRect(left, line.top(), infoWidth + 1, line.height()), Qt::AlignCenter, info);
        room = left - inner.left() - 8;
    }
    if (room > metrics.horizontalAdvance(QStringLiteral("QQQ"))) {
        draw(QRect(inner.left(), line.top(), room, line.height()), Qt::AlignLeft | Qt::AlignVCenter,
             metrics.elidedText(name, Qt::ElideMiddle, room));
    }
}

void TrackPainter::drawCursor(QPainter &painter) const
{
    const int x = m_geometry.xOf(m_scene.cursor);
    if (x < m_geometry.axisLeft() || x > m_geometry.axisLeft() + m_geometry.axisWidth()) {
        return;
    }
    const PixelGrid pixels(painter);
    const QColor color = m_style.color(ColorSlot::CursorLine);
    pixels.vertical(x, m_geometry.rowsTop(),
                    m_geometry.rowsTop() + m_geometry.trackCount * m_geometry.rowHeight(), color);
    drawFlag(painter, x, m_geometry.rowsTop(), FlagShape::Top, 9, color);
}
