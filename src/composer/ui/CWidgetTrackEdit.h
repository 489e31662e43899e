// SPDX-License-Identifier: Apache-2.0
#pragma once

#include "EnvelopeStore.h"
#include "TrackPainter.h"

#include "composer/CompositionEditor.h"
#include "display/CWidgetBase.h"

#include <QPoint>
#include <QUndoStack>

class QActionGroup;

/// The track editor: owns the composition, its cursor and its undo stack, and shows the tracks
/// below each other on one time axis. All edits run through it.
///
/// A press sets the cursor, to the nearest border with the Control key; a block is dragged in time;
/// a double click opens its settings; dropped waveform files go to the cursor.
class CWidgetTrackEdit : public CWidgetBase
{
    Q_OBJECT

public:
    /// States that can be undone; edits beyond them can't.
    static constexpr int UndoLimit = 256;

    explicit CWidgetTrackEdit(QWidget *parent = nullptr);

    [[nodiscard]] const Composition &composition() const { return m_editor.composition(); }
    [[nodiscard]] qint64 cursor() const { return m_editor.cursor(); }
    [[nodiscard]] double viewStart() const { return m_viewStart; } ///< s
    [[nodiscard]] double viewEnd() const { return m_viewEnd; }     ///< s
    [[nodiscard]] QUndoStack &undoStack() { return m_undo; }
    [[nodiscard]] TrackGeometry geometryOfTracks() const;

    void insertFile(const QString &name);
    void overwriteFile(const QString &name);
    void extract();
    void lift();
    void setTargetName(const QString &name);

    [[nodiscard]] bool saveAll(const QString &fileName);
    /// An autosave is loaded like any other file.
    [[nodiscard]] bool loadAll(const QString &fileName);

    [[nodiscard]] QSize minimumSizeHint() const override { return {480, 420}; }

public slots:
    void clearAll(bool bQuiet);
    void clearAll() { clearAll(false); }
    void addTrack();
    void deleteTrack();
    void zoomIn();
    void zoomOut();
    void zoomFit();
    void moveStart();
    void moveEnd();
    void targetSettings();
    void popUndo();
    void redo();
    void setCsrSample(double sample);
    void setCsrTime(double seconds);
    void setCsrBegin();
    void setCsrEnd();
    void info_samples() { showInfo(CenterInfo::UsedSamples); }
    void info_playtime() { showInfo(CenterInfo::PlayTime); }
    void info_clock() { showInfo(CenterInfo::ClockRate); }
    void info_start() { showInfo(CenterInfo::FirstSample); }
    void info_freq() { showInfo(CenterInfo::FrequencyOffset); }
    void info_lev() { showInfo(CenterInfo::Attenuation); }
    void info_targetstart() { showInfo(CenterInfo::StartSample); }
    void info_targetstarttime() { showInfo(CenterInfo::StartTime); }
    void set_wvend();

signals:
    void mouse_xcsr(qlonglong sample, double seconds);
    void undoSize(int states);
    void targetChanged();

protected:
    void drawPlot(QPainter &painter, const QRectF &area) override;
    void extendContextMenu(QMenu &menu) override;
    void mousePressEvent(QMouseEvent *event) override;
    void mouseMoveEvent(QMouseEvent *event) override;
    void mouseReleaseEvent(QMouseEvent *event) override;
    void mouseDoubleClickEvent(QMouseEvent *event) override;
    void wheelEvent(QWheelEvent *event) override;
    void keyPressEvent(QKeyEvent *event) override;
    void keyReleaseEvent(QKeyEvent *event) override;
    void focusOutEvent(QFocusEvent *event) override;
    void dragEnterEvent(QDragEnterEvent *event) override;
    void dropEvent(QDropEvent *event) override;

private:
    void pushUndo();
    void editSegment(int track, qint64 sample);
    void edited();
    void showInfo(CenterInfo info);
    void showRange(double startSeconds, double endSeconds);
    void zoom(double factor, const char *words);
    void moveCursor(qint64 sample);
    void tellCursor();
    void beginDrag(int track, qint64 sample);
    [[nodiscard]] qint64 snapped(qint64 target) const;

    CompositionEditor m_editor;
    QUndoStack m_undo;
    EnvelopeStore m_envelopes;
    double m_viewStart = 0; ///< s
    double m_viewEnd = 1;   ///< s
    CenterInfo m_info = CenterInfo::UsedSamples;
    QActionGroup *m_infoActions = nullptr;
    int m_pressedTrack = -1;
    bool m_pressedEnable = false;
    bool m_pressedSelect = false;
    bool m_ctrlHeld = false;
    QPoint m_pressedAt;
    bool m_dragging = false;
    DraggedSegment m_dragged;
    qint64 m_grabOffset = 0; ///< from the start of the dragged block to the pointer, samples
};
