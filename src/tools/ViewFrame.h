// SPDX-License-Identifier: Apache-2.0
#pragma once

#include "view/Overview.h"
#include "view/PlayInterval.h"
#include "view/ViewWindow.h"

#include <QTimer>
#include <QWidget>

#include <array>

class BufferedIO;
class CWidgetIQTrace;
class CWidgetOverview;
class CWidgetTimeline;
class QHBoxLayout;
class QSplitter;
class QToolButton;
class QVBoxLayout;

/// The frame in which tools look at a whole waveform: a trace "w_iqtrace" of the window's samples,
/// the overview bar "w_timeline", and the buttons that move, zoom and play. Keeps the window and
/// the two cursors; places of cursors are samples of the waveform, counted from 0.
class ViewFrame : public QWidget
{
    Q_OBJECT

public:
    enum Cursor { Measuring = 1, Reference = 2 };
    static constexpr qint64 NoSample = -1;

    explicit ViewFrame(QWidget *parent = nullptr);

    /// Shows a waveform from its start, with no cursors. The streams aren't owned and stay until
    /// clear() or the next waveform. False, with the reason logged, if they can't be read; the
    /// frame is then empty.
    [[nodiscard]] bool setWaveform(BufferedIO *iqStream, BufferedIO *markerStream, qint64 samples,
                                   double clockHz);
    void clear();

    /// Shows the markers of another stream, or those of the same one after it was written, with
    /// the window where it is.
    void showMarkers(BufferedIO *markerStream);

    /// Marks the samples from `first` to `last`, both included.
    void setRange(qint64 first, qint64 last);

    /// Adds a display that follows the window below the trace, with a grip between them.
    void addPlots(QWidget *plots);

    /// Shows or hides the upper plot: the trace, or the whole waveform in its place.
    void setUpperPlotVisible(bool visible);
    [[nodiscard]] bool isUpperPlotVisible() const;

    /// The trace and what was added, for whoever keeps their sizes.
    [[nodiscard]] QSplitter &splitter() { return *m_splitter; }

    /// The name of the shown file, for the overview that is kept of it; before setWaveform.
    void setFileName(const QString &fileName) { m_fileName = fileName; }

    /// Appends a widget to the row of buttons.
    void addButton(QWidget *button);

    [[nodiscard]] const ViewWindow &window() const { return m_window; }
    /// Samples about the middle of the view, see ViewWindow::around.
    [[nodiscard]] IqList around(qint64 count, qint64 &first)
    {
        return m_window.around(count, first);
    }
    [[nodiscard]] double clockHz() const { return m_clockHz; }
    [[nodiscard]] CWidgetIQTrace &trace() { return *m_trace; }

    /// NoSample where there is none.
    [[nodiscard]] qint64 cursor(Cursor which) const;

    /// Puts a cursor on a sample; NoSample takes it away. Sends nothing.
    void setCursor(Cursor which, qint64 sample);
    using QWidget::setCursor;

public slots:
    void slot_reverse();
    void slot_forward();
    void slot_reverse_little();
    void slot_forward_little();
    void slot_play();
    void slot_stop();
    void slot_playstep();
    void slot_zoomin();
    void slot_zoomout();
    void slot_zoomin_y();
    void slot_zoomout_y();
    void slot_move_start();
    void slot_move_end();
    /// Shows the whole waveform's envelope instead of the trace, until a click in it chooses where
    /// the view goes.
    void showWhole(bool whole);
    /// Moves the view to a first sample, as the overview bar asks.
    void update_position(double firstSample);
    /// The same from elsewhere; the bar follows.
    void set_position(double firstSample);
    /// A drag on the bar begins or ends; playback pauses meanwhile.
    void state_position(bool dragging);
    /// The measuring cursor went to a sample of the view.
    void set_csr_data(qlonglong sample, double i, double q);
    /// Zooms in about a sample of the view.
    void set_zoom_position(int sample);

signals:
    /// The window holds other samples.
    void windowChanged();
    /// The user moved the measuring cursor.
    void cursorMoved(qlonglong sample, double i, double q);
    void zoomedInY();
    void zoomedOutY();

protected:
    void hideEvent(QHideEvent *event) override;

private:
    void addNavigation();
    void moveTo(qint64 first);
    void refresh();
    void placeCursors();
    void readOverview();
    void showOverview();
    void addWholeView();
    void zoom(bool outwards, qint64 kept);
    void moveCursor(qint64 step);
    [[nodiscard]] bool isEmpty() const { return m_window.sampleCount() == 0; }

    CWidgetIQTrace *m_trace = nullptr;
    CWidgetOverview *m_whole = nullptr;
    CWidgetTimeline *m_timeline = nullptr;
    QToolButton *m_wholeButton = nullptr;
    QVBoxLayout *m_column = nullptr;
    QHBoxLayout *m_buttons = nullptr;
    QSplitter *m_splitter = nullptr;
    BufferedIO *m_data = nullptr;
    BufferedIO *m_markerBytes = nullptr;
    QString m_fileName;
    Overview m_overview;
    QTimer m_overviewTimer; ///< each turn reads a piece of the file
    ViewWindow m_window;
    QTimer m_playTimer;
    PlayInterval m_playInterval;
    double m_clockHz = 0;
    std::array<qint64, 2> m_cursors{NoSample, NoSample};
    std::array<qint64, 2> m_range{NoSample, NoSample};
    bool m_resumePlayback = false;
};
