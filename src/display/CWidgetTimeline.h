// SPDX-License-Identifier: Apache-2.0
#pragma once

#include "PlotStyle.h"
#include "view/Overview.h"

#include <QRectF>
#include <QWidget>

#include <array>

class QPainter;

/// What the overview bar shows, all in samples.
struct TimelineScene
{
    qint64 total = 0; ///< length of the waveform
    qint64 first = 0; ///< the visible range
    qint64 count = 0;
    std::array<qint64, 2> cursors{-1, -1}; ///< measuring and reference cursor, -1 for none
    double clockHz = 0;                    ///< 0 labels the bar in samples
    Overview overview;                     ///< its columns may still be missing at the end
};

/// Draws the overview bar into any painter.
class TimelinePainter
{
public:
    TimelinePainter(const PlotStyle &style, const TimelineScene &scene);

    void paint(QPainter &painter, const QRectF &area) const;

    [[nodiscard]] static QRectF bar(const QRectF &area, const QFont &font);
    [[nodiscard]] double xOf(const QRectF &bar, double sample) const;

private:
    const PlotStyle &m_style;
    const TimelineScene &m_scene;
};

/// The overview bar: the whole waveform, the visible range and the two cursors. Pressing or
/// dragging with the left button asks for another view position.
class CWidgetTimeline : public QWidget
{
    Q_OBJECT

public:
    explicit CWidgetTimeline(QWidget *parent = nullptr);

    /// Length of the waveform in samples and its clock rate in Hz.
    void setWaveform(qint64 total, double clockHz);
    /// The envelope behind the bar, as far as it is known.
    void setOverview(const Overview &overview);
    /// The visible range.
    void setRange(qint64 first, qint64 count);
    /// Puts cursor 1 (measuring) or 2 (reference) on a sample; -1 hides it.
    void setCursor(int which, qint64 sample);
    using QWidget::setCursor;
    void setColors(int colorSet);

    [[nodiscard]] const TimelineScene &scene() const { return m_scene; }
    [[nodiscard]] QSize sizeHint() const override;
    [[nodiscard]] QSize minimumSizeHint() const override;

public slots:
    /// Moves the visible range, its length unchanged, to a first sample. Sends nothing.
    void set_xpos(double firstSample);

signals:
    /// The user asks for a view that starts at this sample, always within the waveform.
    void mouse_xpos(double firstSample);
    /// A drag begins (true) or has ended (false).
    void state_xpos(bool dragging);
    /// The wheel asks for a longer (true) or shorter view.
    void zoomRequested(bool outwards);

protected:
    void paintEvent(QPaintEvent *event) override;
    void mousePressEvent(QMouseEvent *event) override;
    void mouseMoveEvent(QMouseEvent *event) override;
    void mouseReleaseEvent(QMouseEvent *event) override;
    void wheelEvent(QWheelEvent *event) override;

private:
    [[nodiscard]] double sampleAt(double x) const;
    void askFor(double firstSample);

    PlotStyle m_style;
    TimelineScene m_scene;
    bool m_dragging = false;
    double m_grip = 0; ///< samples from the start of the range to the place where it was taken
};
