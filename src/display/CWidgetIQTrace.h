// SPDX-License-Identifier: Apache-2.0
#pragma once

#include "CWidgetBase.h"
#include "TracePainter.h"

#include <QList>

/// Shows a stretch of a waveform over time in six view modes, with the marker rows and three
/// cursors. The samples are handed over as a whole; positions in signals and setCursor count from
/// the first of them.
class CWidgetIQTrace : public CWidgetBase
{
    Q_OBJECT

public:
    explicit CWidgetIQTrace(QWidget *parent = nullptr);

    void setData(const QList<CWidgetBase::IQData> &samples, const QList<quint8> &markers);
    void setData(const QList<CWidgetBase::IQData> &samples);

    /// One of the modes of TraceMode; any other number is ignored.
    void setView(int mode);
    [[nodiscard]] int view() const { return static_cast<int>(m_scene.mode); }

    /// Puts cursor 1 (measuring) or 2 (reference) on a sample; one outside the data hides it.
    /// Cursors stay in their column when new data come.
    void setCursor(int which, int sample);
    using QWidget::setCursor;

    /// Marks the samples from `first` to `last`, both included, as far as they lie in the data;
    /// none if they don't.
    void setRange(qint64 first, qint64 last);

    void setShowMarkers(bool show);
    /// Clock rate in Hz, so that the axis shows time; 0 shows samples.
    void setClock(double hz);
    /// Position of the first sample in the waveform, for the time axis and for tables.
    void setFirstSample(qint64 first) { m_scene.firstSample = first; }

    /// While zoom_in and zoom_out are sent: the sample under the mouse, -1 if there is none.
    [[nodiscard]] int wheelSample() const { return m_wheelSample; }

    [[nodiscard]] const TraceScene &scene();

public slots:
    /// Forgets the data; background and grid stay.
    void clear();
    void zoomInY();
    void zoomOutY();

signals:
    void mouseLeftPress(int sample);
    void mouseRightPress(int sample);
    /// A double click asks for a view around this sample.
    void mouseZoomSet(int sample);
    void zoom_in();
    void zoom_out();
    /// The mouse cursor went to another column.
    void mouseCsrData(qlonglong sample, double i, double q);

protected:
    void drawPlot(QPainter &painter, const QRectF &area) override;
    void writeData(QTextStream &stream) override;
    [[nodiscard]] bool hasData() const override { return !m_samples.isEmpty(); }
    void dropHover() override { m_scene.mouseBin = -1; }
    void mousePressEvent(QMouseEvent *event) override;
    void mouseMoveEvent(QMouseEvent *event) override;
    void mouseDoubleClickEvent(QMouseEvent *event) override;
    void wheelEvent(QWheelEvent *event) override;

private:
    [[nodiscard]] int sampleAt(const QPointF &position) const;
    void moveMouseCursor(int sample);
    void updateBins();
    void keepPeakOnView();

    QList<CWidgetBase::IQData> m_samples;
    QList<quint8> m_markers;
    TraceScene m_scene;
    bool m_dirty = false;
    bool m_mouseReported = false; ///< the shown data were reported at the mouse cursor
    int m_wheel = 0;              ///< of a step, in eighths of a degree
    int m_wheelSample = -1;
};
