// SPDX-License-Identifier: Apache-2.0
#include "ViewFrame.h"

#include "appearance/lineicon.h"
#include "display/CWidgetIQTrace.h"
#include "display/CWidgetOverview.h"
#include "display/CWidgetTimeline.h"
#include "log/Tracer.h"
#include "streams/samplestream.h"
#include "view/TraceBins.h"

#include <QElapsedTimer>
#include <QHBoxLayout>
#include <QKeyEvent>
#include <QShortcut>
#include <QSplitter>
#include <QToolButton>
#include <QVBoxLayout>

#include <algorithm>
#include <cmath>
#include <utility>
#include <vector>

namespace {

/// A button whose key acts at once: the toolkit's own way waits for the picture of a pressed
/// button, and for ever while the key is held.
class KeyButton : public QToolButton
{
public:
    using QToolButton::QToolButton;

protected:
    bool event(QEvent *event) override
    {
        if (event->type() != QEvent::Shortcut ||
            static_cast<QShortcutEvent *>(event)->isAmbiguous()) {
            return QToolButton::event(event);
        }
        click();
        return true;
    }
};

} // namespace

ViewFrame::ViewFrame(QWidget *parent)
    : QWidget(parent)
    , m_trace(new CWidgetIQTrace)
    , m_whole(new CWidgetOverview)
    , m_timeline(new CWidgetTimeline)
    , m_wholeButton(new KeyButton)
    , m_column(new QVBoxLayout(this))
    , m_buttons(new QHBoxLayout)
    , m_splitter(new QSplitter(Qt::Vertical))
{
    m_trace->setObjectName("w_iqtrace");
    m_trace->setMinimumSize(200, 120);
    m_trace->setShowMarkers(true);
    m_timeline->setObjectName("w_timeline");
    m_timeline->setToolTip("The whole waveform; drag the visible range");
    m_column->setContentsMargins(0, 0, 0, 0);
    m_splitter->addWidget(m_trace);
    m_splitter->addWidget(m_whole);
    m_splitter->setChildrenCollapsible(false);
    m_column->addWidget(m_splitter, 1);
    m_column->addWidget(m_timeline);
    m_column->addLayout(m_buttons);
    addNavigation();
    addWholeView();
    connect(&m_playTimer, &QTimer::timeout, this, &ViewFrame::slot_playstep);
    connect(m_timeline, &CWidgetTimeline::mouse_xpos, this, &ViewFrame::update_position);
    connect(m_timeline, &CWidgetTimeline::state_xpos, this, &ViewFrame::state_position);
    connect(m_trace, &CWidgetIQTrace::mouseCsrData, this, &ViewFrame::set_csr_data);
    connect(m_trace, &CWidgetIQTrace::mouseZoomSet, this, &ViewFrame::set_zoom_position);
    // What lies under the mouse stays there.
    const auto underMouse = [this] {
        const int sample = m_trace->wheelSample();
        return sample < 0 ? NoSample : m_window.first() + sample;
    };
    connect(m_trace, &CWidgetIQTrace::zoom_in, this, [=, this] { zoom(false, underMouse()); });
    connect(m_trace, &CWidgetIQTrace::zoom_out, this, [=, this] { zoom(true, underMouse()); });
    connect(m_timeline, &CWidgetTimeline::zoomRequested, this,
            [this](bool outwards) { zoom(outwards, NoSample); });
    connect(&m_overviewTimer, &QTimer::timeout, this, &ViewFrame::readOverview);
    const std::pair<const char *, qint64> steps[] = {{"Alt+Left", -1}, {"Alt+Right", 1}};
    for (const auto &[key, step] : steps) {
        auto *shortcut = new QShortcut(QKeySequence(key), this);
        connect(shortcut, &QShortcut::activated, this, [this, step = step] { moveCursor(step); });
    }
}

void ViewFrame::addNavigation()
{
    struct Button
    {
        const char *name;
        const char *icon;
        const char *toolTip;
        const char *shortcut;
        void (ViewFrame::*slot)();
    };
    const Button buttons[] = {
        {"pb_start", "jump_start", "Move to Beginning", "Home", &ViewFrame::slot_move_start},
        {"pb_reverse", "move_back", "Move Backwards", "PgUp", &ViewFrame::slot_reverse},
        {"pb_reverse_little", "step_back", "Step Backwards", "Left",
         &ViewFrame::slot_reverse_little},
        {"pb_play", "play", "Start Playback", "Space", &ViewFrame::slot_play},
        {"pb_stop", "stop", "Stop Playback", "S", &ViewFrame::slot_stop},
        {"pb_forward_little", "step_forward", "Step Forward", "Right",
         &ViewFrame::slot_forward_little},
        {"pb_forward", "move_forward", "Move Forward", "PgDown", &ViewFrame::slot_forward},
        {"pb_end", "jump_end", "Move to End", "End", &ViewFrame::slot_move_end},
        {"pb_zoomin", "zoom_in_x", "X Zoom In", "+", &ViewFrame::slot_zoomin},
        {"pb_zoomout", "zoom_out_x", "X Zoom Out", "-", &ViewFrame::slot_zoomout},
        {"pb_zoomin_y", "zoom_in_y", "Y Zoom In", "Ctrl++", &ViewFrame::slot_zoomin_y},
        {"pb_zoomout_y", "zoom_out_y", "Y Zoom Out", "Ctrl+-", &ViewFrame::slot_zoomout_y},
    };
    constexpr int Side = 30;
    constexpr int Gap = 12;
    for (const Button &button : buttons) {
        if (button.slot == &ViewFrame::slot_zoomin) {
            m_buttons->addSpacing(Gap);
        }
        auto *made = new KeyButton;
        made->setObjectName(button.name);
        made->setIcon(lineIcon(button.icon));
        made->setAccessibleName(button.toolTip);
        made->setToolTip(button.toolTip);
        made->setShortcut(QKeySequence(button.shortcut));
        made->setMinimumSize(Side, Side);
        connect(made, &QToolButton::clicked, this, button.slot);
        m_buttons->addWidget(made);
    }
    m_wholeButton->setObjectName("pb_whole");
    m_wholeButton->setText("All");
    m_wholeButton->setToolTip("Show the Whole Waveform");
    m_wholeButton->setShortcut(QKeySequence("A"));
    m_wholeButton->setCheckable(true);
    m_wholeButton->setMinimumSize(Side, Side);
    m_buttons->addWidget(m_wholeButton);
    m_buttons->addStretch();
}

void ViewFrame::addWholeView()
{
    m_whole->setObjectName("w_whole");
    m_whole->setMinimumSize(m_trace->minimumSize());
    m_whole->setToolTip("Click to view a part");
    m_whole->hide();
    connect(m_wholeButton, &QToolButton::toggled, this, &ViewFrame::showWhole);
    connect(m_whole, &CWidgetOverview::sampleChosen, this, [this](qlonglong sample) {
        m_wholeButton->setChecked(false);
        moveTo(m_window.centredOn(sample));
    });
}

void ViewFrame::showWhole(bool whole)
{
    const bool visible = isUpperPlotVisible();
    m_wholeButton->setChecked(whole);
    setUpperPlotVisible(visible);
}

void ViewFrame::setUpperPlotVisible(bool visible)
{
    m_trace->setVisible(visible && !m_wholeButton->isChecked());
    m_whole->setVisible(visible && m_wholeButton->isChecked());
}

bool ViewFrame::isUpperPlotVisible() const
{
    return !m_trace->isHidden() || !m_whole->isHidden();
}

void ViewFrame::addPlots(QWidget *plots)
{
    m_splitter->addWidget(plots);
    m_splitter->setStretchFactor(0, 3);
    m_splitter->setStretchFactor(1, 3);
    m_splitter->setStretchFactor(m_splitter->count() - 1, 2);
}

void ViewFrame::addButton(QWidget *button)
{
    m_buttons->addWidget(button);
}

bool ViewFrame::setWaveform(BufferedIO *iqStream, BufferedIO *markerStream, qint64 samples,
                            double clockHz)
{
    clear();
    m_clockHz = clockHz;
    m_window.setSource(iqStream, markerStream, samples);
    m_trace->setClock(clockHz);
    m_timeline->setWaveform(samples, clockHz);
    if (!m_window.show(0)) {
        clear();
        return false;
    }
    refresh();
    m_data = iqStream;
    m_markerBytes = markerStream;
    m_overview = m_fileName.isEmpty() ? Overview(samples) : Overview::kept(m_fileName, samples);
    showOverview();
    if (!m_overview.isComplete()) {
        m_overviewTimer.start(0);
    }
    return true;
}

void ViewFrame::showOverview()
{
    m_timeline->setOverview(m_overview);
    m_whole->setOverview(m_overview, m_clockHz);
}

/// A piece at a time, between the events of the window: the streams are those of the view, too.
void ViewFrame::readOverview()
{
    constexpr qint64 PieceSamples = 1 << 19;
    constexpr qint64 PicturePieces = 16; // after how many the bar is painted again
    const qint64 taken = m_overview.taken();
    const auto count =
        static_cast<std::size_t>(std::min(PieceSamples, m_overview.samples() - taken));
    std::vector<float> iq(2 * count);
    std::vector<quint8> markers(count);
    const qint64 start = BufferedIO::HeaderSize + BufferedIO::RecordSize * taken;
    const bool read = m_data->restartAtPosition(start) &&
                      readSamples(*m_data, iq) == static_cast<int>(count) &&
                      m_markerBytes->restartAtPosition(taken) &&
                      m_markerBytes->readBlock(static_cast<int>(count), markers.data()) ==
                          static_cast<int>(count);
    if (!read) {
        m_overviewTimer.stop(); // the view itself tells of a file that can't be read
        return;
    }
    m_overview.append(iq, markers);
    if (m_overview.isComplete()) {
        m_overviewTimer.stop();
        if (!m_fileName.isEmpty()) {
            m_overview.save(m_fileName);
        }
    }
    if (m_overview.isComplete() || taken / PieceSamples % PicturePieces == 0) {
        showOverview();
    }
}

void ViewFrame::zoom(bool outwards, qint64 kept)
{
    if (!isEmpty() && (outwards ? m_window.zoomOut(kept) : m_window.zoomIn(kept))) {
        refresh();
    }
}

void ViewFrame::moveCursor(qint64 step)
{
    if (isEmpty()) {
        return;
    }
    // A key press is a column where a column is more than a sample.
    const qint64 width = std::max<qint64>(m_window.points() / TraceBins::BinCount, 1);
    const qint64 first = m_window.first();
    const qint64 here = cursor(Measuring) == NoSample ? first : cursor(Measuring) + step * width;
    const qint64 sample = std::clamp<qint64>(here, first, first + m_window.points() - 1);
    const IqSample &value = m_window.samples().at(sample - first);
    set_csr_data(sample - first, value.i, value.q);
}

void ViewFrame::clear()
{
    m_trace->setAccessibleDescription({});
    slot_stop();
    m_overviewTimer.stop();
    m_window.release();
    m_clockHz = 0;
    m_cursors.fill(NoSample);
    m_range.fill(NoSample);
    m_trace->clear();
    m_timeline->setWaveform(0, 0);
    m_whole->setOverview({}, 0);
    placeCursors();
}

void ViewFrame::setRange(qint64 first, qint64 last)
{
    m_range = {first, last};
    placeCursors();
}

void ViewFrame::showMarkers(BufferedIO *markerStream)
{
    m_window.setMarkers(markerStream);
    if (!isEmpty() && m_window.show(m_window.first())) {
        refresh();
    }
}

qint64 ViewFrame::cursor(Cursor which) const
{
    return m_cursors.at(static_cast<size_t>(which - 1));
}

void ViewFrame::setCursor(Cursor which, qint64 sample)
{
    m_cursors.at(static_cast<size_t>(which - 1)) = sample;
    placeCursors();
}

void ViewFrame::placeCursors()
{
    const qint64 first = m_window.first();
    for (const Cursor which : {Measuring, Reference}) {
        const qint64 sample = cursor(which);
        const bool visible = sample >= first && sample < first + m_window.points();
        m_trace->setCursor(which, visible ? static_cast<int>(sample - first) : -1);
        m_timeline->setCursor(which, sample);
    }
    m_trace->setRange(m_range[0] - first, m_range[1] - first);
}

void ViewFrame::hideEvent(QHideEvent *event)
{
    slot_stop();
    QWidget::hideEvent(event);
}

void ViewFrame::moveTo(qint64 first)
{
    if (!isEmpty() && first == m_window.first() && !m_window.samples().isEmpty()) {
        return; // at the end already
    }
    Tracer::Trace(Tracer::Information, QString("New start sample: %1").arg(first));
    if (m_window.show(first)) {
        refresh();
    }
}

void ViewFrame::refresh()
{
    m_trace->setFirstSample(m_window.first());
    m_trace->setData(m_window.samples(), m_window.markers());
    m_timeline->setRange(m_window.first(), m_window.points());
    m_whole->setRange(m_window.first(), m_window.points());
    placeCursors();
    emit windowChanged();
}

void ViewFrame::slot_reverse()
{
    moveTo(m_window.reverse());
}

void ViewFrame::slot_forward()
{
    moveTo(std::min(m_window.forward(), m_window.end()));
}

void ViewFrame::slot_reverse_little()
{
    moveTo(m_window.reverseLittle());
}

void ViewFrame::slot_forward_little()
{
    moveTo(std::min(m_window.forwardLittle(), m_window.end()));
}

void ViewFrame::slot_move_start()
{
    moveTo(0);
}

void ViewFrame::slot_move_end()
{
    moveTo(m_window.end());
}

void ViewFrame::slot_play()
{
    if (!isEmpty()) {
        m_playInterval.reset();
        m_playTimer.start(m_playInterval.milliseconds());
    }
}

void ViewFrame::slot_stop()
{
    m_playTimer.stop();
}

void ViewFrame::slot_playstep()
{
    QElapsedTimer timer;
    timer.start();
    const qint64 next = m_window.playTarget();
    if (next == m_window.first() || !m_window.show(next)) {
        slot_stop();
        return;
    }
    refresh();
    if (m_playInterval.fit(timer.elapsed())) {
        m_playTimer.setInterval(m_playInterval.milliseconds());
    }
}

void ViewFrame::slot_zoomin()
{
    zoom(false, NoSample);
}

void ViewFrame::slot_zoomout()
{
    zoom(true, NoSample);
}

void ViewFrame::slot_zoomin_y()
{
    m_trace->zoomInY();
    emit zoomedInY();
}

void ViewFrame::slot_zoomout_y()
{
    m_trace->zoomOutY();
    emit zoomedOutY();
}

void ViewFrame::update_position(double firstSample)
{
    const qint64 first = std::clamp<qint64>(std::llround(firstSample), 0, m_window.end());
    if (!isEmpty() && m_window.show(first)) {
        refresh();
    }
}

void ViewFrame::set_position(double firstSample)
{
    m_timeline->set_xpos(firstSample);
    update_position(firstSample);
}

void ViewFrame::state_position(bool dragging)
{
    if (dragging) {
        m_resumePlayback = m_playTimer.isActive();
        slot_stop();
    } else if (m_resumePlayback) {
        slot_play();
    }
}

void ViewFrame::set_csr_data(qlonglong sample, double i, double q)
{
    setCursor(Measuring, m_window.first() + sample);
    m_trace->setAccessibleDescription(
        QString::asprintf("Cursor at sample %lld: I %.6f, Q %.6f", cursor(Measuring), i, q));
    emit cursorMoved(cursor(Measuring), i, q);
}

void ViewFrame::set_zoom_position(int sample)
{
    const qint64 centre = m_window.first() + sample;
    if (!isEmpty() && m_window.show(m_window.centredOn(centre)) && m_window.zoomIn()) {
        refresh();
    }
}
