// SPDX-License-Identifier: Apache-2.0
#pragma once

#include "toolframe/DlgBase.h"

#include "view/PlayInterval.h"
#include "view/ViewWindow.h"

#include <QTimer>

#include <memory>

class QLabel;
class SourceWaveform;

namespace Ui {
class DlgView;
}

/// Looks at a waveform: a window of samples as trace, spectrum and constellation, with an overview
/// bar, zoom, playback and two cursors. Reads the file once; changes nothing.
class DlgView : public DlgBase
{
    Q_OBJECT

public:
    explicit DlgView(QWidget *parent = nullptr);
    ~DlgView() override;

    [[nodiscard]] bool startModule(const QString &path) override;
    void writeSettings(QSettings &settings) override;
    void readSettings(QSettings &settings) override;

    [[nodiscard]] const ViewWindow &window() const { return m_window; }

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
    void slot_view_mode(int mode);
    void slot_spectrum_mode(int mode);
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
    /// Copies the measuring cursor to the reference cursor.
    void fix_ref_csr(bool checked);

protected:
    void hideEvent(QHideEvent *event) override;
    void done(int result) override;

private:
    void connectButtons();
    void moveTo(qint64 first);
    void refresh();
    void showCursors();
    void showDelta();
    void showFile();
    [[nodiscard]] QString timeText(qint64 samples) const;
    void unload();

    std::unique_ptr<Ui::DlgView> m_ui;
    std::unique_ptr<SourceWaveform> m_source;
    ViewWindow m_window;
    QTimer m_playTimer;
    PlayInterval m_playInterval;
    double m_clockHz = 0;
    qint64 m_cursor = -1;    ///< measuring cursor, sample of the file, -1 for none
    qint64 m_reference = -1; ///< reference cursor
    bool m_resumePlayback = false;
};
