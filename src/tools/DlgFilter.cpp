// SPDX-License-Identifier: Apache-2.0
#include "DlgFilter.h"

#include "ui_DlgFilter.h"

#include "base/EngineeringNumber.h"
#include "dsp/windows.h"
#include "jobs/ResampleJob.h"

#include <QSettings>
#include <QSignalBlocker>

#include <algorithm>

namespace {

/// Selects the entry with these data; one that isn't there leaves the choice as it is.
void selectData(QComboBox &box, const QVariant &data)
{
    if (const int index = box.findData(data); index >= 0) {
        box.setCurrentIndex(index);
    }
}

} // namespace

DlgFilter::DlgFilter(QWidget *parent)
    : SourceWizard({.settingsGroup = "Filter",
                    .position = {200, 120},
                    .size = {940, 660},
                    .abortedText = "Filtering aborted"},
                   "_filter", parent)
    , m_ui(std::make_unique<Ui::DlgFilter>())
{
    m_ui->setupUi(this);
    setUpFields();
    m_ui->w_compare->setSignals({"&Before", "&After"});
    for (CWidgetSpectrum *spectrum : {m_ui->w_spectrum_1, m_ui->w_spectrum_2}) {
        spectrum->setView(static_cast<int>(SpectrumMode::Spectrum));
    }
    m_ui->page_output->clockRate().setName("Target File Clockrate");

    for (QtNumericEdit *field :
         {m_ui->le_filterfreq, m_ui->le_filterlength, m_ui->le_filterparam}) {
        connect(field, &QtNumericEdit::valueUpdated, this,
                qOverload<double>(&DlgFilter::slot_createpreview));
    }
    connect(m_ui->cb_filtertype, &QComboBox::currentIndexChanged, this, &DlgFilter::slot_ftype);
    for (QComboBox *box : {m_ui->cb_filtertype, m_ui->cb_windowtype}) {
        connect(box, &QComboBox::currentIndexChanged, this,
                qOverload<int>(&DlgFilter::slot_createpreview));
    }
    setUpEditWizard();
    slot_ftype(m_ui->cb_filtertype->currentIndex());
}

DlgFilter::~DlgFilter() = default;

void DlgFilter::setUpFields()
{
    const FilterRequest start;
    QtNumericEdit &clock = *m_ui->le_src_clock;
    clock.setName("Source File Clockrate");
    clock.setUnit("Hz");
    clock.setScaled(true);
    clock.setMax(ResampleTarget::MaxClockHz);
    clock.setVal(ResampleTarget().clockHz);
    QtNumericEdit &bandwidth = *m_ui->le_filterfreq;
    bandwidth.setName("One-sided Filter Bandwidth");
    bandwidth.setUnit("Hz");
    bandwidth.setScaled(true);
    bandwidth.setMax(0.5 * ResampleTarget::MaxClockHz);
    bandwidth.setMin(FilterRequest::MinBandwidthHz);
    bandwidth.setVal(0.5 * ResampleTarget().clockHz);
    QtNumericEdit &length = *m_ui->le_filterlength;
    length.setName("Filter Length");
    length.setMax(FilterRequest::MaxLength);
    length.setMin(FilterRequest::MinLength);
    length.setStep(1);
    length.setVal(start.length);
    QtNumericEdit &parameter = *m_ui->le_filterparam;
    parameter.setMax(0.99);
    parameter.setMin(0.05);
    parameter.setStep(0.01);
    parameter.setVal(start.parameter);
    const std::pair<const char *, FilterKind> kinds[] = {
        {"Rectangular", FilterKind::Rectangular},
        {"Cosine", FilterKind::Cosine},
        {"Root Cosine", FilterKind::RootCosine},
        {"Gauss", FilterKind::Gauss},
    };
    for (const auto &[name, kind] : kinds) {
        m_ui->cb_filtertype->addItem(QLatin1String(name), static_cast<int>(kind));
    }
    for (int window = 0; window < NamedWindowCount; ++window) {
        m_ui->cb_windowtype->addItem(QLatin1String(windowName(window)), window);
    }
}

FilterKind DlgFilter::kind() const
{
    return static_cast<FilterKind>(m_ui->cb_filtertype->currentData().toInt());
}

void DlgFilter::slot_ftype(int /*index*/)
{
    QtNumericEdit &parameter = *m_ui->le_filterparam;
    const QSignalBlocker blocker(parameter);
    const auto range = parameterRange(kind());
    parameter.setEnabled(range.has_value());
    if (!range) {
        return;
    }
    const QString name = kind() == FilterKind::Gauss ? "B*T" : "Roll Off";
    parameter.setName(name);
    parameter.setMin(range->min);
    parameter.setMax(range->max);
    m_ui->l_filterparam->setText(name);
}

void DlgFilter::slot_createpreview(double /*value*/)
{
    requestPreview();
}

void DlgFilter::slot_createpreview(int /*index*/)
{
    requestPreview();
}

bool DlgFilter::sourceRead()
{
    const double clockHz = source()->info().clock;
    m_ui->le_src_clock->setVal(clockHz);
    m_ui->le_filterfreq->setMin(std::min(FilterRequest::MinBandwidthHz, 0.5 * clockHz));
    m_ui->le_filterfreq->setMax(0.5 * clockHz);
    m_ui->le_filterfreq->setVal(0.4 * clockHz);
    resetClock(*m_ui->page_output);
    m_ui->w_compare->setClock(clockHz);
    for (CWidgetSpectrum *spectrum : {m_ui->w_spectrum_1, m_ui->w_spectrum_2}) {
        spectrum->setClock(clockHz);
    }
    for (QLabel *label : {m_ui->l_f1_min, m_ui->l_f2_min}) {
        label->setText(engineeringText(-0.5 * clockHz, "Hz"));
    }
    for (QLabel *label : {m_ui->l_f1_max, m_ui->l_f2_max}) {
        label->setText(engineeringText(0.5 * clockHz, "Hz"));
    }
    return true;
}

void DlgFilter::sourceReleased()
{
    m_ui->w_compare->clear();
    m_ui->w_spectrum_1->clear();
    m_ui->w_spectrum_2->clear();
    m_ui->l_addinfo->clear();
}

void DlgFilter::makePreview()
{
    const WvFileInfo &info = source()->info();
    const auto preview =
        m_filterPreview.run(*source()->data(), info.samples, options().settings(info.clock));
    if (!preview) {
        return;
    }
    m_ui->w_spectrum_1->setData(FilterPreview::spectrumInput(preview->before));
    m_ui->w_spectrum_2->setData(FilterPreview::spectrumInput(preview->after));
    m_ui->w_compare->setSamples({preview->before, preview->after});
    m_ui->l_addinfo->setText(
        QString("The preview is based on the first %1 samples.").arg(preview->before.size()));
}

void DlgFilter::cancelPreview()
{
    m_filterPreview.cancel();
}

FilterRequest DlgFilter::options() const
{
    FilterRequest request;
    request.inputFile = sourceFile();
    request.output = outputOptions();
    request.kind = kind();
    request.window = m_ui->cb_windowtype->currentData().toInt();
    request.length = static_cast<int>(m_ui->le_filterlength->getValInt());
    request.parameter = m_ui->le_filterparam->getVal();
    request.bandwidthHz = m_ui->le_filterfreq->getVal();
    request.clockHz = wantedClockHz(*m_ui->page_output);
    return request;
}

std::unique_ptr<ToolJob> DlgFilter::makeJob() const
{
    auto job = std::make_unique<FilterJob>(options());
    giveSource(*job);
    return job;
}

void DlgFilter::writeFields(QSettings &settings) const
{
    SourceWizard::writeFields(settings);
    settings.setValue("filterfreq", m_ui->le_filterfreq->getVal());
    settings.setValue("filtertype", m_ui->cb_filtertype->currentData());
    settings.setValue("windowtype", m_ui->cb_windowtype->currentData());
    settings.setValue("filterlength", m_ui->le_filterlength->getVal());
    settings.setValue("filterparam", m_ui->le_filterparam->getVal());
}

void DlgFilter::readFields(const QSettings &settings)
{
    SourceWizard::readFields(settings);
    const FilterRequest start;
    selectData(*m_ui->cb_filtertype, settings.value("filtertype", static_cast<int>(start.kind)));
    selectData(*m_ui->cb_windowtype, settings.value("windowtype", start.window));
    m_ui->le_filterfreq->setVal(
        settings.value("filterfreq", m_ui->le_filterfreq->getVal()).toDouble());
    m_ui->le_filterlength->setVal(settings.value("filterlength", start.length).toDouble());
    m_ui->le_filterparam->setVal(settings.value("filterparam", start.parameter).toDouble());
}
