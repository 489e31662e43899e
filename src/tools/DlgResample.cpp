// SPDX-License-Identifier: Apache-2.0
#include "DlgResample.h"

#include "ui_DlgResample.h"

#include "log/Tracer.h"
#include "toolframe/toolpages.h"

#include <QSettings>

namespace {

constexpr int FirstPage = 0;

} // namespace

DlgResample::DlgResample(QWidget *parent)
    : EditWizard({.settingsGroup = "Resample",
                  .position = {220, 160},
                  .size = {560, 420},
                  .abortedText = "Resampling aborted"},
                 "_resample", parent)
    , m_ui(std::make_unique<Ui::DlgResample>())
{
    m_ui->setupUi(this);
    QtNumericEdit &clock = *m_ui->le_target_clock;
    QtNumericEdit &samples = *m_ui->le_target_samples;
    setUpTarget(clock, samples);
    samples.setMin(1);
    roundInput(samples);
    QtNumericEdit &outputClock = m_ui->page_output->clockRate();
    outputClock.setName("ARB Clockrate");
    outputClock.setReadOnly(true);
    outputClock.setMin(0);

    connect(m_ui->rb_clock, &QRadioButton::toggled, this, &DlgResample::slot_mode);
    connect(&clock, &QtNumericEdit::valueUpdated, this, &DlgResample::slot_updatesettings);
    connect(&samples, &QtNumericEdit::valueUpdated, this, &DlgResample::slot_updatesettings);
    setUpEditWizard();
    slot_mode();
}

DlgResample::~DlgResample() = default;

void DlgResample::writeFields(QSettings &settings) const
{
    EditWizard::writeFields(settings);
    settings.setValue("clkmode", m_ui->rb_clock->isChecked() ? 1 : 0);
    settings.setValue("clock", m_ui->le_target_clock->getVal());
    settings.setValue("samples", m_ui->le_target_samples->getVal());
}

void DlgResample::readFields(const QSettings &settings)
{
    EditWizard::readFields(settings);
    const bool clockDecides = settings.value("clkmode", 1).toInt() != 0;
    (clockDecides ? m_ui->rb_clock : m_ui->rb_samples)->setChecked(true);
    QtNumericEdit &clock = *m_ui->le_target_clock;
    QtNumericEdit &samples = *m_ui->le_target_samples;
    clock.setVal(settings.value("clock", clock.getVal()).toDouble());
    samples.setVal(settings.value("samples", samples.getVal()).toDouble());
    slot_mode();
}

void DlgResample::sourceChanged()
{
    // Nothing changes until the user says what is to.
    if (m_ui->rb_samples->isChecked() && hasSource()) {
        m_ui->le_target_samples->setVal(static_cast<qlonglong>(sourceSamples()));
    }
    slot_updatesettings();
}

void DlgResample::slot_mode()
{
    const bool clockDecides = m_ui->rb_clock->isChecked();
    m_ui->le_target_clock->setEnabled(clockDecides);
    m_ui->le_target_samples->setEnabled(!clockDecides);
    slot_updatesettings();
}

ResampleTarget DlgResample::target() const
{
    ResampleTarget target;
    target.clockDecides = m_ui->rb_clock->isChecked();
    target.clockHz = m_ui->le_target_clock->getVal();
    target.samples = m_ui->le_target_samples->getValInt();
    return target;
}

void DlgResample::slot_updatesettings()
{
    if (!hasSource()) {
        return;
    }
    ResampleTarget wanted = target();
    wanted.follow(sourceClockHz(), sourceSamples());
    if (wanted.clockDecides) {
        m_ui->le_target_samples->setVal(static_cast<qlonglong>(wanted.samples));
    } else {
        m_ui->le_target_clock->setVal(wanted.clockHz);
    }
    m_ui->page_output->clockRate().setVal(wanted.clockHz);
    const QString problem = wanted.problem();
    m_ui->l_warn->setText(problem);
    m_ui->l_warn->setVisible(!problem.isEmpty());
    updateButtons();
}

ResampleRequest DlgResample::options() const
{
    return {sourceFile(), outputOptions(), target()};
}

std::unique_ptr<ToolJob> DlgResample::makeJob() const
{
    return std::make_unique<ResampleJob>(options());
}

bool DlgResample::isComplete(int page) const
{
    return EditWizard::isComplete(page) && (page == FirstPage || m_ui->l_warn->text().isEmpty());
}

void DlgResample::jobEnded(JobOutcome outcome)
{
    if (outcome == JobOutcome::Cancelled) {
        Tracer::Trace(Tracer::Information, "Resampling was cancelled.");
    }
}
