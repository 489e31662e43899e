// SPDX-License-Identifier: Apache-2.0
#include "DlgPolar.h"

#include "toolframe/toolpages.h"
#include "ui_DlgPolar.h"

#include "jobs/PolarPreview.h"
#include "jobs/ResampleJob.h"

#include <QFileInfo>
#include <QSettings>

namespace {

constexpr int FirstPage = 0;

QString phaseTitle()
{
    return "Select phase waveform file";
}

QString amplitudeTitle()
{
    return "Select amplitude waveform file";
}

} // namespace

DlgPolar::DlgPolar(QWidget *parent)
    : SourceWizard({.settingsGroup = "Polar",
                    .position = {210, 140},
                    .size = {760, 560},
                    .abortedText = "Polar conversion aborted"},
                   "_phase", parent)
    , m_ui(std::make_unique<Ui::DlgPolar>())
{
    m_ui->setupUi(this);
    const PolarRequest start;
    const auto setUpLevel = [this](QtNumericEdit &field, const QString &name, double value) {
        field.setName(name);
        field.setMax(1);
        field.setMin(-1);
        field.setStep(0.1);
        field.setVal(value);
        connect(&field, &QtNumericEdit::valueUpdated, this, &DlgPolar::slot_levels);
    };
    setUpLevel(*m_ui->le_am_offset, "Offset", start.offset);
    setUpLevel(*m_ui->le_am_amplitude, "Amplitude", start.gain);
    setUpTarget(*m_ui->le_target_clock, *m_ui->le_target_samples);
    m_ui->page_phase->clockRate().setName("Target File Clockrate");
    m_ui->page_phase->findChild<QGroupBox *>("gb_page_output")->setTitle("Phase File");
    m_ui->w_compare->setSignals({"&Source", "P&hase", "&Amplitude"});
    connect(m_ui->pb_outfile_2, &QPushButton::clicked, this,
            [this] { chooseTargetFile(this, *m_ui->le_outfile_2, amplitudeTitle()); });
    setUpEditWizard(phaseTitle());
    slot_levels();
}

DlgPolar::~DlgPolar() = default;

void DlgPolar::sourceChanged()
{
    m_ui->le_outfile_2->setText(fileNameWithSuffix(sourceFile(), "_amplitude"));
}

void DlgPolar::writeFields(QSettings &settings) const
{
    SourceWizard::writeFields(settings);
    settings.setValue("offset", m_ui->le_am_offset->getVal());
    settings.setValue("gain", m_ui->le_am_amplitude->getVal());
}

void DlgPolar::readFields(const QSettings &settings)
{
    SourceWizard::readFields(settings);
    const PolarRequest start;
    m_ui->le_am_offset->setVal(settings.value("offset", start.offset).toDouble());
    m_ui->le_am_amplitude->setVal(settings.value("gain", start.gain).toDouble());
    slot_levels();
}

bool DlgPolar::sourceRead()
{
    const WvFileInfo &info = source()->info();
    m_ui->le_target_samples->setVal(static_cast<qlonglong>(info.samples));
    m_ui->le_target_clock->setVal(info.clock);
    m_ui->w_compare->setClock(info.clock);
    resetClock(*m_ui->page_phase);
    return true;
}

void DlgPolar::sourceReleased()
{
    m_ui->w_compare->clear();
    m_ui->l_addinfo->clear();
}

void DlgPolar::slot_levels()
{
    const QString problem = options().levelProblem();
    m_ui->l_warn->setText(problem);
    m_ui->l_warn->setVisible(!problem.isEmpty());
    updateButtons();
    requestPreview();
}

void DlgPolar::makePreview()
{
    const PolarRequest request = options();
    const auto preview =
        makePolarPreview(*source()->data(), source()->info().samples, request.offset, request.gain);
    if (preview) {
        m_ui->w_compare->setSamples({preview->source, preview->phase, preview->amplitude});
        m_ui->l_addinfo->setText(
            QString("The preview is based on the first %1 samples.").arg(preview->source.size()));
    }
}

PolarRequest DlgPolar::options() const
{
    PolarRequest request;
    request.inputFile = sourceFile();
    request.phase = outputOptions();
    request.amplitude = request.phase;
    request.amplitude.fileName = m_ui->le_outfile_2->text();
    request.amplitude.overwrite = QFileInfo::exists(request.amplitude.fileName);
    request.offset = m_ui->le_am_offset->getVal();
    request.gain = m_ui->le_am_amplitude->getVal();
    request.clockHz = wantedClockHz(*m_ui->page_phase);
    return request;
}

QStringList DlgPolar::outputFiles() const
{
    return {outputOptions().fileName, m_ui->le_outfile_2->text()};
}

bool DlgPolar::isComplete(int page) const
{
    return SourceWizard::isComplete(page) && (page == FirstPage || m_ui->l_warn->text().isEmpty());
}

std::unique_ptr<ToolJob> DlgPolar::makeJob() const
{
    auto job = std::make_unique<PolarJob>(options());
    giveSource(*job);
    return job;
}
