// SPDX-License-Identifier: Apache-2.0
#include "DlgView.h"

#include "ui_DlgView.h"

#include "base/EngineeringNumber.h"
#include "display/CWidgetConstellation.h"
#include "display/CWidgetIQTrace.h"
#include "display/CWidgetSpectrum.h"
#include "display/renderplot.h"
#include "jobs/LoadJob.h"
#include "toolframe/runjob.h"
#include "toolframe/windowplace.h"

#include <QFileInfo>
#include <QHBoxLayout>
#include <QSettings>

#include <cmath>
#include <numbers>
#include <utility>

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
    addPlots();
    connect(m_ui->w_view, &ViewFrame::windowChanged, this, &DlgView::showWindow);
    connect(m_ui->w_view, &ViewFrame::cursorMoved, this, &DlgView::set_csr_data);
    connect(m_ui->cb_ViewMode, &QComboBox::currentIndexChanged, this, &DlgView::slot_view_mode);
    connect(m_ui->cb_SpectrumMode, &QComboBox::currentIndexChanged, this,
            &DlgView::slot_spectrum_mode);
    connect(m_ui->pb_fix_ref, &QAbstractButton::clicked, this, &DlgView::fix_ref_csr);
    connect(m_ui->cb_close, &QAbstractButton::clicked, this, &DlgView::reject);
    slot_view_mode(m_ui->cb_ViewMode->currentIndex());
    slot_spectrum_mode(m_ui->cb_SpectrumMode->currentIndex());
}

DlgView::~DlgView() = default;

void DlgView::addPlots()
{
    m_spectrum = new CWidgetSpectrum;
    m_spectrum->setObjectName("w_spectrum");
    m_constellation = new CWidgetConstellation;
    m_constellation->setObjectName("w_constellation");
    auto *plots = new QWidget;
    auto *row = new QHBoxLayout(plots);
    row->setContentsMargins(0, 0, 0, 0);
    constexpr QSize Smallest(200, 140);
    for (const auto &[plot, stretch] : {std::pair<QWidget *, int>(m_spectrum, 3),
                                        std::pair<QWidget *, int>(m_constellation, 2)}) {
        plot->setMinimumSize(Smallest);
        row->addWidget(plot, stretch);
    }
    m_ui->w_view->addPlots(plots);
    connect(m_ui->w_view, &ViewFrame::zoomedInY, m_spectrum, &CWidgetSpectrum::zoomInY);
    connect(m_ui->w_view, &ViewFrame::zoomedOutY, m_spectrum, &CWidgetSpectrum::zoomOutY);
}

bool DlgView::startModule(const QString &path)
{
    m_ui->w_view->slot_stop();
    auto source = std::make_unique<SourceWaveform>();
    LoadJob job(path, *source);
    if (runJob(job, this, nullptr) != JobOutcome::Finished) {
        return false;
    }
    unload();
    m_source = std::move(source);
    const WvFileInfo &info = m_source->info();
    m_spectrum->setClock(info.clock);
    if (!m_ui->w_view->setWaveform(m_source->data(), m_source->markers(), info.samples,
                                   info.clock)) {
        unload();
        return false;
    }
    setWindowTitle("View Waveform - " + QFileInfo(path).fileName());
    showFile();
    return true;
}

const ViewWindow &DlgView::window() const
{
    return m_ui->w_view->window();
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

void DlgView::unload()
{
    m_ui->w_view->clear();
    m_source.reset();
    m_spectrum->clear();
    m_constellation->clear();
    clearCursorValues();
}

void DlgView::showWindow()
{
    const IqList &samples = window().samples();
    const qint64 first = window().first();
    m_spectrum->setData(samples, first, first + samples.size() - 1);
    const double scale = constellationScale(peakMagnitude(samples));
    m_constellation->setScale(scale, scale);
    m_constellation->setData(samples);
}

void DlgView::slot_view_mode(int mode)
{
    m_ui->w_view->trace().setView(mode);
    const bool isFrequency = mode == static_cast<int>(TraceMode::Frequency);
    for (QLabel *label : {m_ui->l_fmin, m_ui->l_fmax}) {
        label->setEnabled(isFrequency);
    }
}

void DlgView::slot_spectrum_mode(int mode)
{
    m_spectrum->setView(mode);
}

void DlgView::set_csr_data(qlonglong sample, double i, double q)
{
    const double magnitude = std::hypot(i, q);
    m_ui->l_csr_time->setText(timeText(sample));
    m_ui->l_csr_sample->setText(QString::number(sample));
    m_ui->l_csr_i->setText(QString::number(i, 'f', 6));
    m_ui->l_csr_q->setText(QString::number(q, 'f', 6));
    m_ui->l_csr_mag->setText(
        magnitude > 0 ? QString::asprintf("%.2f dB", 20 * std::log10(magnitude)) : noValue());
    m_ui->l_csr_phase->setText(
        QString::asprintf("%.2f deg", std::atan2(q, i) * 180 / std::numbers::pi));
    showDelta();
}

void DlgView::fix_ref_csr(bool)
{
    m_ui->w_view->setCursor(ViewFrame::Reference, m_ui->w_view->cursor(ViewFrame::Measuring));
    showDelta();
}

void DlgView::clearCursorValues()
{
    for (QLabel *label : {m_ui->l_csr_time, m_ui->l_csr_sample, m_ui->l_csr_i, m_ui->l_csr_q,
                          m_ui->l_csr_mag, m_ui->l_csr_phase}) {
        label->setText(noValue());
    }
    showDelta();
}

void DlgView::showDelta()
{
    const qint64 cursor = m_ui->w_view->cursor(ViewFrame::Measuring);
    const qint64 reference = m_ui->w_view->cursor(ViewFrame::Reference);
    const bool both = cursor >= 0 && reference >= 0;
    m_ui->l_delta_time->setText(both ? timeText(cursor - reference) : noValue());
    m_ui->l_delta_samples->setText(both ? QString::number(cursor - reference) : noValue());
}

void DlgView::showFile()
{
    const qint64 samples = window().sampleCount();
    const double clockHz = m_ui->w_view->clockHz();
    m_ui->l_file_clock->setText(engineeringText(clockHz, "Hz"));
    m_ui->l_file_samples->setText(QString::number(samples));
    m_ui->l_file_time->setText(timeText(samples));
    m_ui->l_fmin->setText(engineeringText(-clockHz / 2, "Hz"));
    m_ui->l_fmax->setText(engineeringText(clockHz / 2, "Hz"));
}

QString DlgView::timeText(qint64 samples) const
{
    const double clockHz = m_ui->w_view->clockHz();
    return clockHz > 0 ? engineeringText(static_cast<double>(samples) / clockHz, "s") : noValue();
}
