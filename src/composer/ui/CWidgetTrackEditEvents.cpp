// SPDX-License-Identifier: Apache-2.0
#include "CWidgetTrackEdit.h"

#include <QApplication>
#include <QMimeData>
#include <QMouseEvent>
#include <QUrl>

#include <algorithm>
#include <cstdlib>

void CWidgetTrackEdit::mousePressEvent(QMouseEvent *event)
{
    const TrackGeometry geometry = geometryOfTracks();
    const int track = geometry.trackAt(event->pos().y());
    if (event->button() != Qt::LeftButton || track < 0 || !geometry.isValid()) {
        CWidgetBase::mousePressEvent(event);
        return;
    }
    m_pressedTrack = track;
    m_pressedAt = event->pos();
    const int x = event->pos().x() - geometry.area.left();
    m_pressedEnable = x >= 0 && x < TrackGeometry::EnableWidth;
    m_pressedSelect = x >= TrackGeometry::EnableWidth &&
                      x < TrackGeometry::EnableWidth + TrackGeometry::SelectWidth;
    if (!m_pressedEnable && !m_pressedSelect) {
        const qint64 sample = std::max<qint64>(geometry.sampleAt(event->pos().x()), 0);
        const bool snaps = m_ctrlHeld || (event->modifiers() & Qt::ControlModifier) != 0;
        beginDrag(track, sample);
        moveCursor(snaps ? composition().nearestBorder(sample) : sample);
        tellCursor();
    }
    update();
}

void CWidgetTrackEdit::beginDrag(int track, qint64 sample)
{
    m_dragged = DraggedSegment();
    if (const auto place = composition().segmentAt(track, sample)) {
        m_dragged = {track, place->index, place->borders.first};
        m_grabOffset = sample - place->borders.first;
    }
}

qint64 CWidgetTrackEdit::snapped(qint64 target) const
{
    // Its own borders are no goals for a block.
    Composition others = composition();
    ComposerTrack &track = *others.track(m_dragged.track);
    const qint64 length =
        others.targetSamples(track.segments[static_cast<std::size_t>(m_dragged.index)]);
    track.segments.erase(track.segments.begin() + m_dragged.index);
    const qint64 byStart = others.nearestBorder(target);
    const qint64 byEnd = others.nearestBorder(target + length) - length;
    return byEnd >= 0 && std::abs(byEnd - target) < std::abs(byStart - target) ? byEnd : byStart;
}

void CWidgetTrackEdit::mouseMoveEvent(QMouseEvent *event)
{
    const bool far =
        (event->pos() - m_pressedAt).manhattanLength() >= QApplication::startDragDistance();
    if ((event->buttons() & Qt::LeftButton) == 0 || m_dragged.track < 0 || (!m_dragging && !far)) {
        return;
    }
    m_dragging = true;
    const SegmentBorders room = m_editor.freeStarts(m_dragged.track, m_dragged.index);
    qint64 target = geometryOfTracks().sampleAt(event->pos().x()) - m_grabOffset;
    if ((event->modifiers() & Qt::ControlModifier) != 0) {
        target = snapped(target);
    }
    m_dragged.target = std::clamp(target, room.first, room.last);
    emit mouse_xcsr(m_dragged.target, composition().sampleToTime(m_dragged.target));
    update();
}

void CWidgetTrackEdit::mouseReleaseEvent(QMouseEvent *event)
{
    if (event->button() != Qt::LeftButton || m_pressedTrack < 0) {
        CWidgetBase::mouseReleaseEvent(event);
        return;
    }
    ComposerTrack *track = m_editor.composition().track(m_pressedTrack);
    if (track != nullptr && m_pressedEnable) {
        track->bEnable = !track->bEnable;
    }
    if (track != nullptr && m_pressedSelect) {
        track->bSelect = !track->bSelect;
    }
    if (track != nullptr && (m_pressedEnable || m_pressedSelect)) {
        emit targetChanged();
    }
    if (m_dragging && m_editor.moveSegment(m_dragged.track, m_dragged.index, m_dragged.target)) {
        m_editor.setCursor(m_dragged.target);
        edited();
    }
    m_editor.composition().markAt(cursor());
    m_pressedTrack = -1;
    m_pressedEnable = false;
    m_pressedSelect = false;
    m_dragging = false;
    m_dragged = DraggedSegment();
    update();
}

void CWidgetTrackEdit::mouseDoubleClickEvent(QMouseEvent *event)
{
    const TrackGeometry geometry = geometryOfTracks();
    const int track = geometry.trackAt(event->pos().y());
    m_pressedTrack = -1;
    m_dragged = DraggedSegment();
    if (event->button() == Qt::LeftButton && track >= 0 && geometry.isValid() &&
        event->pos().x() >= geometry.axisLeft()) {
        editSegment(track, geometry.sampleAt(event->pos().x()));
    }
}

void CWidgetTrackEdit::wheelEvent(QWheelEvent *event)
{
    if (event->angleDelta().y() > 0) {
        zoomIn();
    } else {
        zoomOut();
    }
    event->accept();
}

void CWidgetTrackEdit::keyPressEvent(QKeyEvent *event)
{
    const TrackGeometry geometry = geometryOfTracks();
    const qint64 pixel = std::max<qint64>(
        (geometry.lastSample - geometry.firstSample) / std::max(geometry.axisWidth(), 1), 1);
    switch (event->key()) {
    case Qt::Key_Control:
        m_ctrlHeld = true;
        return;
    case Qt::Key_Left:
        setCsrSample(static_cast<double>(std::max<qint64>(cursor() - pixel, 0)));
        return;
    case Qt::Key_Right:
        setCsrSample(static_cast<double>(cursor() + pixel));
        return;
    case Qt::Key_Home:
        setCsrBegin();
        return;
    case Qt::Key_End:
        setCsrEnd();
        return;
    case Qt::Key_Delete:
        lift();
        return;
    default:
        CWidgetBase::keyPressEvent(event);
    }
}

void CWidgetTrackEdit::keyReleaseEvent(QKeyEvent *event)
{
    if (event->key() == Qt::Key_Control) {
        m_ctrlHeld = false;
        return;
    }
    CWidgetBase::keyReleaseEvent(event);
}

void CWidgetTrackEdit::focusOutEvent(QFocusEvent *event)
{
    m_ctrlHeld = false;
    CWidgetBase::focusOutEvent(event);
}

void CWidgetTrackEdit::dragEnterEvent(QDragEnterEvent *event)
{
    const QList<QUrl> urls = event->mimeData()->urls();
    const bool takes = std::any_of(urls.begin(), urls.end(), [](const QUrl &url) {
        return url.toLocalFile().endsWith(QLatin1String(".wv"), Qt::CaseInsensitive);
    });
    if (takes) {
        event->acceptProposedAction();
    }
}

void CWidgetTrackEdit::dropEvent(QDropEvent *event)
{
    const QList<QUrl> urls = event->mimeData()->urls();
    for (const QUrl &url : urls) {
        if (url.toLocalFile().endsWith(QLatin1String(".wv"), Qt::CaseInsensitive)) {
            insertFile(url.toLocalFile());
        }
    }
    event->setDropAction(Qt::CopyAction);
    event->accept();
}
