// SPDX-License-Identifier: Apache-2.0
#include "DlgView.h"

#include "ui_DlgView.h"

#include "base/EngineeringNumber.h"
#include "display/renderplot.h"
#include "jobs/LoadJob.h"
#include "log/Tracer.h"
#include "toolframe/runjob.h"
#include "toolframe/windowplace.h"

#include <QElapsedTimer>
#include <QFileInfo>
#include <QSettings>

#include <cmath>
#include <numbers>

namespace {

QString noValue()
{
    return "---";
}

} // namespace

DlgView::DlgView(QWidget *parent)
    : DlgBase(parent)
    , m_ui(std::make_unique<Ui::DlgView>())
{
    m_ui->setupUi(this);
    // The trailing blank is part of the established text.
    m_ui->cb_ViewMode->addItems({"I/Q Envelope", "Log Mag Envelope", "Log Mag Average ",
                                 "Lin Mag Average", "Phase", "Frequency"});
    m_ui->cb_SpectrumMode->addItems({"Spectrum", "Waterfall"});
    m_ui->w_iqtrace->setShowMarkers(true);
    connect(&m_playTimer, &QTimer::timeout, this, &DlgView::slot_playstep);
    connect(m_ui->cb_ViewMode, &QComboBox::currentIndexChanged, this, &DlgView::slot_view_mode);
    connect(m_ui->cb_SpectrumMode, &QComboBox::currentIndexChanged, this,
            &DlgView::slot_spectrum_mode);
    connect(m_ui->w_timeline, &CWidgetTimeline::mouse_xpos, this, &DlgView::update_position);
    connect(m_ui->w_timeline, &CWidgetTimeline::state_xpos, this, &DlgView::state_position);
    connect(m_ui->w_iqtrace, &CWidgetIQTrace::mouseCsrData, this, &DlgView::set_csr_data);
    connect(m_ui->w_iqtrace, &CWidgetIQTrace::mouseZoomSet, this, &DlgView::set_zoom_position);
    connect(m_ui->w_iqtrace, &CWidgetIQTrace::zoom_in, this, &DlgView::slot_zoomin);
    connect(m_ui->w_iqtrace, &CWidgetIQTrace::zoom_out, this, &DlgView::slot_zoomout);
    connectButtons();
    slot_view_mode(m_ui->cb_ViewMode->currentIndex());
    slot_spectrum_mode(m_ui->cb_SpectrumMode->currentIndex());
}

DlgView::~DlgView() = default;

void DlgView::connectButtons()
{
    using Slot = void (DlgView::*)();
    const std::pair<QAbstractButton *, Slot> buttons[] = {
        {m_ui->pb_start, &DlgView::slot_move_start},
        {m_ui->pb_reverse, &DlgView::slot_reverse},
        {m_ui->pb_reverse_little, &DlgView::slot_reverse_little},
        {m_ui->pb_zoomin, &DlgView::slot_zoomin},
        {m_ui->pb_zoomout, &DlgView::slot_zoomout},
        {m_ui->pb_play, &DlgView::slot_play},
        {m_ui->pb_stop, &DlgView::slot_stop},
        {m_ui->pb_forward_little, &DlgView::slot_forward_little},
        {m_ui->pb_forward, &DlgView::slot_forward},
        {m_ui->pb_end, &DlgView::slot_move_end},
        {m_ui->pb_zoomin_y, &DlgView::slot_zoomin_y},
        {m_ui->pb_zoomout_y, &DlgView::slot_zoomout_y},
    };
    for (const auto &[button, slot] : buttons) {
        connect(button, &QAbstractButton::clicked, this, slot);
    }
    connect(m_ui->pb_fix_ref, &QAbstractButton::clicked, this, &DlgView::fix_ref_csr);
    connect(m_ui->cb_close, &QAbstractButton::clicked, this, &DlgView::reject);
}

bool DlgView::startModule(const QString &path)
{
    slot_stop();
    auto source = std::make_unique<SourceWaveform>();
    LoadJob job(path, *source);
    if (runJob(job, this, nullptr) != JobOutcome::Finished) {
        return false;
    }
    unload();
    m_source = std::move(source);
    const WvFileInfo &info = m_source->info();
    m_clockHz = info.clock;
    m_window.setSource(m_source->data(), m_source->markers(), info.samples);
    m_ui->w_iqtrace->setClock(m_clockHz);
    m_ui->w_spectrum->setClock(m_clockHz);
    m_ui->w_timeline->setWaveform(info.samples, m_clockHz);
    setWindowTitle(QString("View Waveform") + " - " + QFileInfo(path).fileName());
    showFile();
    if (!m_window.show(0)) {
        unload();
        return false;
    }
    refresh();
    return true;
}

void DlgView::writeSettings(QSettings &settings)
{
    settings.beginGroup("View");
    writeWindowPlace(settings, *this);
    settings.endGroup();
}

void DlgView::readSettings(QSettings &settings)
{
    settings.beginGroup("View");
    readWindowPlace(settings, *this, {120, 80}, {1000, 720});
    settings.endGroup();
}

/// A waveform can fill gigabytes of temporary files; they go when nobody looks at it any more.
void DlgView::done(int result)
{
    DlgBase::done(result);
    unload();
}

void DlgView::hideEvent(QHideEvent *event)
{
    slot_stop();
    DlgBase::hideEvent(event);
}

void DlgView::unload()
{
    slot_stop();
    m_window.release();
    m_source.reset();
    m_cursor = -1;
    m_reference = -1;
    m_ui->w_iqtrace->clear();
    m_ui->w_spectrum->clear();
    m_ui->w_constellation->clear();
    m_ui->w_timeline->setWaveform(0, 0);
    m_ui->w_timeline->setCursor(1, m_cursor);
    m_ui->w_timeline->setCursor(2, m_reference);
}

void DlgView::moveTo(qint64 first)
{
    Tracer::Trace(Tracer::Information, QString("New start sample: %1").arg(first));
    if (m_window.show(first)) {
        refresh();
    }
}

void DlgView::refresh()
{
    const IqList &samples = m_window.samples();
    const qint64 first = m_window.first();
    m_ui->w_iqtrace->setFirstSample(first);
    m_ui->w_iqtrace->setData(samples, m_window.markers());
    m_ui->w_spectrum->setData(samples, first, first + samples.size() - 1);
    const double scale = constellationScale(peakMagnitude(samples));
    m_ui->w_constellation->setScale(scale, scale);
    m_ui->w_constellation->setData(samples);
    m_ui->w_timeline->setRange(first, m_window.points());
    showCursors();
}

void DlgView::slot_reverse()
{
    moveTo(m_window.reverse());
}

void DlgView::slot_forward()
{
    moveTo(m_window.forward());
}

void DlgView::slot_reverse_little()
{
    moveTo(m_window.reverseLittle());
}

void DlgView::slot_forward_little()
{
    moveTo(m_window.forwardLittle());
}

void DlgView::slot_move_start()
{
    moveTo(0);
}

void DlgView::slot_move_end()
{
    moveTo(m_window.end());
}

void DlgView::slot_play()
{
    if (m_source) {
        m_playInterval.reset();
        m_playTimer.start(m_playInterval.milliseconds());
    }
}

void DlgView::slot_stop()
{
    m_playTimer.stop();
}

void DlgView::slot_playstep()
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

void DlgView::slot_zoomin()
{
    if (m_source && m_window.zoomIn()) {
        refresh();
    }
}

void DlgView::slot_zoomout()
{
    if (m_source && m_window.zoomOut()) {
        refresh();
    }
}

void DlgView::slot_zoomin_y()
{
    m_ui->w_iqtrace->zoomInY();
    m_ui->w_spectrum->zoomInY();
}

void DlgView::slot_zoomout_y()
{
    m_ui->w_iqtrace->zoomOutY();
    m_ui->w_spectrum->zoomOutY();
}

void DlgView::slot_view_mode(int mode)
{
    m_ui->w_iqtrace->setView(mode);
    const bool isFrequency = mode == static_cast<int>(TraceMode::Frequency);
    for (QLabel *label : {m_ui->l_fmin, m_ui->l_fmax}) {
        label->setEnabled(isFrequency);
    }
}

void DlgView::slot_spectrum_mode(int mode)
{
    m_ui->w_spectrum->setView(mode);
}

void DlgView::update_position(double firstSample)
{
    const qint64 first = std::clamp<qint64>(std::llround(firstSample), 0, m_window.end());
    if (m_source && m_window.show(first)) {
        refresh();
    }
}

void DlgView::set_position(double firstSample)
{
    m_ui->w_timeline->set_xpos(firstSample);
    update_position(firstSample);
}

void DlgView::state_position(bool dragging)
{
    if (dragging) {
        m_resumePlayback = m_playTimer.isActive();
        slot_stop();
    } else if (m_resumePlayback) {
        slot_play();
    }
}

void DlgView::set_csr_data(qlonglong sample, double i, double q)
{
    m_cursor = m_window.first() + sample;
    m_ui->w_timeline->setCursor(1, m_cursor);
    const double magnitude = std::hypot(i, q);
    m_ui->l_csr_time->setText(timeText(m_cursor));
    m_ui->l_csr_sample->setText(QString::number(m_cursor));
    m_ui->l_csr_i->setText(QString::number(i, 'f', 6));
    m_ui->l_csr_q->setText(QString::number(q, 'f', 6));
    m_ui->l_csr_mag->setText(
        magnitude > 0 ? QString::asprintf("%.2f dB", 20 * std::log10(magnitude)) : noValue());
    m_ui->l_csr_phase->setText(
        QString::asprintf("%.2f deg", std::atan2(q, i) * 180 / std::numbers::pi));
    showCursors();
}

void DlgView::set_zoom_position(int sample)
{
    const qint64 centre = m_window.first() + sample;
    if (m_source && m_window.show(m_window.centredOn(centre)) && m_window.zoomIn()) {
        refresh();
    }
}

void DlgView::fix_ref_csr(bool)
{
    m_reference = m_cursor;
    m_ui->w_timeline->setCursor(2, m_reference);
    showCursors();
}

void DlgView::showCursors()
{
    const qint64 first = m_window.first();
    const auto place = [&](int which, qint64 sample) {
        const bool visible = sample >= first && sample < first + m_window.points();
        m_ui->w_iqtrace->setCursor(which, visible ? static_cast<int>(sample - first) : -1);
    };
    place(1, m_cursor);
    place(2, m_reference);
    if (m_cursor < 0) {
        for (QLabel *label : {m_ui->l_csr_time, m_ui->l_csr_sample, m_ui->l_csr_i, m_ui->l_csr_q,
                              m_ui->l_csr_mag, m_ui->l_csr_phase}) {
            label->setText(noValue());
        }
    }
    showDelta();
}

void DlgView::showDelta()
{
    const bool both = m_cursor >= 0 && m_reference >= 0;
    const qint64 delta = m_cursor - m_reference;
    m_ui->l_delta_time->setText(both ? timeText(delta) : noValue());
    m_ui->l_delta_samples->setText(both ? QString::number(delta) : noValue());
}

void DlgView::showFile()
{
    const qint64 samples = m_window.sampleCount();
    m_ui->l_file_clock->setText(engineeringText(m_clockHz, "Hz"));
    m_ui->l_file_samples->setText(QString::number(samples));
    m_ui->l_file_time->setText(timeText(samples));
    m_ui->l_fmin->setText(engineeringText(-m_clockHz / 2, "Hz"));
    m_ui->l_fmax->setText(engineeringText(m_clockHz / 2, "Hz"));
}

QString DlgView::timeText(qint64 samples) const
{
    return m_clockHz > 0 ? engineeringText(static_cast<double>(samples) / m_clockHz, "s")
                         : noValue();
}
