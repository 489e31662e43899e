// SPDX-License-Identifier: Apache-2.0
#include "DlgView.h"

#include "ui_DlgView.h"

#include "FiguresBox.h"
#include "saveselection.h"

#include "appearance/lineicon.h"
#include "base/EngineeringNumber.h"
#include "display/CWidgetConstellation.h"
#include "display/CWidgetIQTrace.h"
#include "display/CWidgetSpectrum.h"
#include "display/renderplot.h"
#include "dsp/windows.h"
#include "jobs/LoadJob.h"
#include "toolframe/runjob.h"
#include "toolframe/windowplace.h"
#include "view/AveragedSpectrum.h"

#include <QComboBox>
#include <QFileInfo>
#include <QPushButton>
#include <QScrollArea>
#include <QSettings>
#include <QSplitter>

#include <algorithm>
#include <cmath>
#include <cstdlib>
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
    m_ui->cb_SpectrumMode->addItems({"Spectrum", "Waterfall", "CCDF"});
    m_ui->pb_fix_ref->setIcon(lineIcon("set_ref"));
    m_ui->pb_fix_ref->setToolButtonStyle(Qt::ToolButtonTextBesideIcon);
    m_ui->cb_close->setIcon(lineIcon("close"));
    addPlots();
    addSideColumn();
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
    m_plots = new QSplitter(Qt::Horizontal);
    m_plots->setChildrenCollapsible(false);
    constexpr QSize Smallest(200, 140);
    for (const auto &[plot, stretch] : {std::pair<CWidgetBase *, int>(m_spectrum, 3),
                                        std::pair<CWidgetBase *, int>(m_constellation, 2)}) {
        plot->setMinimumSize(Smallest);
        m_plots->addWidget(plot);
        m_plots->setStretchFactor(m_plots->count() - 1, stretch);
        connect(plot, &CWidgetBase::enlargeRequested, this, [this, plot = plot] { enlarge(plot); });
    }
    m_ui->w_view->addPlots(m_plots);
    connect(m_ui->w_view, &ViewFrame::zoomedInY, m_spectrum, &CWidgetSpectrum::zoomInY);
    connect(m_ui->w_view, &ViewFrame::zoomedOutY, m_spectrum, &CWidgetSpectrum::zoomOutY);
    connect(m_ui->w_view, &ViewFrame::zoomedInY, this, &DlgView::showFrequencyLimits);
    connect(m_ui->w_view, &ViewFrame::zoomedOutY, this, &DlgView::showFrequencyLimits);
    connect(m_spectrum, &CWidgetSpectrum::markersChanged, this,
            [this] { m_figures->setBand(m_spectrum->markedBand()); });
}

/// The values stand in a column that scrolls, or the window would be higher than small screens.
void DlgView::addSideColumn()
{
    auto *side = new QWidget;
    m_ui->hl_main->removeItem(m_ui->vl_side);
    m_ui->vl_side->setParent(nullptr);
    side->setLayout(m_ui->vl_side);
    m_figures = new FiguresBox;
    m_figures->setObjectName("gb_figures");
    addSpectrumChoices();
    m_ui->vl_side->insertWidget(m_ui->vl_side->indexOf(m_ui->gb_file), m_figures);
    m_saveSelection = new QPushButton("Save Se&lection...");
    m_saveSelection->setObjectName("pb_save_selection");
    m_saveSelection->setIcon(lineIcon("save"));
    m_saveSelection->setToolTip("Save the samples from the one cursor to the other, both included");
    m_saveSelection->setAutoDefault(false);
    m_ui->vl_side->insertWidget(m_ui->vl_side->indexOf(m_ui->gb_delta) + 1, m_saveSelection);
    connect(m_saveSelection, &QPushButton::clicked, this, &DlgView::saveSelection);
    // No value that comes and goes moves the plots.
    const int widest = fontMetrics().horizontalAdvance("-888.888888 ms ");
    for (QLabel *label : {m_ui->l_csr_time, m_ui->l_delta_time, m_ui->l_file_time, m_ui->l_fmin}) {
        label->setMinimumWidth(widest);
    }
    auto *scroll = new QScrollArea;
    scroll->setFrameShape(QFrame::NoFrame);
    scroll->setFocusPolicy(Qt::NoFocus); // its fields scroll into view by themselves
    scroll->setWidgetResizable(true);
    scroll->setHorizontalScrollBarPolicy(Qt::ScrollBarAlwaysOff);
    scroll->setWidget(side);
    scroll->setFixedWidth(side->sizeHint().width() +
                          style()->pixelMetric(QStyle::PM_ScrollBarExtent) + 2);
    m_ui->vl_side->removeItem(m_ui->hl_buttons);
    m_ui->hl_buttons->setParent(nullptr);
    auto *column = new QVBoxLayout;
    column->addWidget(scroll, 1);
    column->addLayout(m_ui->hl_buttons);
    m_ui->hl_main->addLayout(column);
    // From top to bottom, as they stand.
    QWidget *before = m_ui->cb_SpectrumMode;
    for (QWidget *next : std::initializer_list<QWidget *>{
             m_average, m_length, m_window, m_saveSelection, m_ui->pb_fix_ref, m_ui->cb_close}) {
        setTabOrder(before, next);
        before = next;
    }
}

void DlgView::addSpectrumChoices()
{
    const auto add = [this](const char *name, const QString &label, const QString &toolTip) {
        auto *title = new QLabel(label);
        auto *box = new QComboBox;
        box->setObjectName(name);
        box->setToolTip(toolTip);
        title->setBuddy(box);
        const int place = m_ui->vl_side->indexOf(m_ui->gb_csr);
        m_ui->vl_side->insertWidget(place, title);
        m_ui->vl_side->insertWidget(place + 1, box);
        connect(box, &QComboBox::currentIndexChanged, this, &DlgView::applySpectrumChoices);
        return box;
    };
    m_average = add("cb_Average", "Spectrum &Average",
                    "How the frames of a spectrum become one; the maximum is drawn beside it");
    m_length = add("cb_SpectrumLength", "Spectrum &Points",
                   "Points of the power and maximum averages; more resolve finer");
    m_window = add("cb_SpectrumWindow", "Spectrum &Window",
                   "Weighting of the samples in the power and maximum averages");
    const QSignalBlocker blockers[] = {QSignalBlocker(m_average), QSignalBlocker(m_length),
                                       QSignalBlocker(m_window)};
    m_average->addItems({"Mean (dB)", "Power", "Maximum"});
    for (int length = AveragedSpectrum::SmallestLength; length <= AveragedSpectrum::LargestLength;
         length *= 2) {
        m_length->addItem(QString::number(length), length);
    }
    for (int window = 0; window < NamedWindowCount; ++window) {
        m_window->addItem(windowName(window), window);
    }
    const SpectrumSettings &settings = m_spectrum->settings();
    m_length->setCurrentIndex(m_length->findData(settings.length));
    m_window->setCurrentIndex(settings.window);
    for (QComboBox *box : {m_length, m_window}) {
        box->setEnabled(false);
    }
}

void DlgView::applySpectrumChoices()
{
    SpectrumSettings settings = m_spectrum->settings();
    settings.average = static_cast<SpectrumAverage>(m_average->currentIndex());
    settings.length = m_length->currentData().toInt();
    settings.window = m_window->currentIndex();
    for (QComboBox *box : {m_length, m_window}) {
        box->setEnabled(settings.average != SpectrumAverage::MeanDb);
    }
    m_spectrum->setSettings(settings);
    showWindow(); // long frames reach beyond a short view
}

/// One plot alone, or all of them again.
void DlgView::enlarge(QWidget *plot)
{
    const bool isAlone = !m_ui->w_view->isUpperPlotVisible();
    m_ui->w_view->setUpperPlotVisible(isAlone);
    for (QWidget *other :
         {static_cast<QWidget *>(m_spectrum), static_cast<QWidget *>(m_constellation)}) {
        other->setVisible(isAlone || other == plot);
    }
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
    m_ui->w_view->setFileName(path);
    for (CWidgetBase *plot :
         {static_cast<CWidgetBase *>(&m_ui->w_view->trace()),
          static_cast<CWidgetBase *>(m_spectrum), static_cast<CWidgetBase *>(m_constellation)}) {
        plot->setExportName(QFileInfo(path).completeBaseName());
    }
    m_ui->w_view->trace().setShowMarkers(info.hasMarkers);
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
    for (const QComboBox *box :
         {m_ui->cb_ViewMode, m_ui->cb_SpectrumMode, m_average, m_length, m_window}) {
        settings.setValue(box->objectName(), box->currentIndex());
    }
    settings.setValue("waterfallColors", m_spectrum->colorMode());
    settings.setValue("constellationColors", m_constellation->colorMode());
    settings.setValue("rows", m_ui->w_view->splitter().saveState());
    settings.setValue("columns", m_plots->saveState());
    settings.endGroup();
}

void DlgView::readSettings(QSettings &settings)
{
    settings.beginGroup("View");
    readWindowPlace(settings, *this, {120, 80}, {1100, 760});
    for (QComboBox *box :
         {m_ui->cb_ViewMode, m_ui->cb_SpectrumMode, m_average, m_length, m_window}) {
        const int index = settings.value(box->objectName(), box->currentIndex()).toInt();
        if (index >= 0 && index < box->count()) {
            box->setCurrentIndex(index);
        }
    }
    m_spectrum->setColorMode(settings.value("waterfallColors", m_spectrum->colorMode()).toInt());
    m_constellation->setColorMode(
        settings.value("constellationColors", m_constellation->colorMode()).toInt());
    m_ui->w_view->splitter().restoreState(settings.value("rows").toByteArray());
    m_plots->restoreState(settings.value("columns").toByteArray());
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
    m_spectrum->clearMarkers();
    m_constellation->clear();
    m_figures->clear();
    clearCursorValues();
}

void DlgView::showWindow()
{
    const IqList &samples = window().samples();
    showSpectrum();
    const double scale = constellationScale(peakMagnitude(samples));
    m_constellation->setScale(scale, scale);
    m_constellation->setData(samples);
    m_figures->setSamples(samples, m_ui->w_view->clockHz());
    showCursorSample();
}

/// A view that is shorter than a frame shows the frame about it: the file has the samples.
void DlgView::showSpectrum()
{
    const SpectrumSettings &settings = m_spectrum->settings();
    const qint64 needed =
        settings.average == SpectrumAverage::MeanDb ? SpectrumLines::FrameSize : settings.length;
    qint64 first = window().first();
    IqList samples = window().samples();
    if (!samples.isEmpty() && samples.size() < needed) {
        samples = m_ui->w_view->around(needed, first);
    }
    m_spectrum->setData(samples, first, first + samples.size() - 1);
}

void DlgView::showCursorSample()
{
    const qint64 cursor = m_ui->w_view->cursor(ViewFrame::Measuring);
    const IqList &samples = window().samples();
    const qint64 place = cursor - window().first();
    const bool isShown = cursor >= 0 && place >= 0 && place < samples.size();
    m_constellation->setCursorSample(isShown ? std::optional(samples.at(place)) : std::nullopt);
    m_spectrum->setCursorSample(cursor >= 0 ? std::optional(cursor) : std::nullopt);
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
    showCursorSample();
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
    m_saveSelection->setEnabled(both);
    m_ui->l_delta_time->setText(both ? timeText(cursor - reference) : noValue());
    m_ui->l_delta_samples->setText(both ? QString::number(cursor - reference) : noValue());
    const double clockHz = m_ui->w_view->clockHz();
    const bool hasRate = both && cursor != reference && clockHz > 0;
    m_ui->l_delta_rate->setText(
        hasRate ? engineeringText(clockHz / static_cast<double>(std::abs(cursor - reference)), "Hz")
                : noValue());
}

void DlgView::saveSelection()
{
    const qint64 cursor = m_ui->w_view->cursor(ViewFrame::Measuring);
    const qint64 reference = m_ui->w_view->cursor(ViewFrame::Reference);
    ::saveSelection(this, {.fileName = m_source->info().fileName,
                           .from = std::min(cursor, reference),
                           .count = std::abs(cursor - reference) + 1});
}

void DlgView::showFile()
{
    const qint64 samples = window().sampleCount();
    const double clockHz = m_ui->w_view->clockHz();
    m_ui->l_file_clock->setText(engineeringText(clockHz, "Hz"));
    m_ui->l_file_samples->setText(QString::number(samples));
    m_ui->l_file_time->setText(timeText(samples));
    showFrequencyLimits();
}

void DlgView::showFrequencyLimits()
{
    const double limit = m_ui->w_view->clockHz() / 2 / m_ui->w_view->trace().scene().zoomY;
    m_ui->l_fmin->setText(engineeringText(-limit, "Hz"));
    m_ui->l_fmax->setText(engineeringText(limit, "Hz"));
}

QString DlgView::timeText(qint64 samples) const
{
    const double clockHz = m_ui->w_view->clockHz();
    return clockHz > 0 ? engineeringText(static_cast<double>(samples) / clockHz, "s") : noValue();
}
