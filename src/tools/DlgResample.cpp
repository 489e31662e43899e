// SPDX-License-Identifier: Apache-2.0
#include "DlgResample.h"

#include "toolpages.h"
#include "ui_DlgResample.h"

#include "base/EngineeringNumber.h"
#include "log/Tracer.h"
#include "toolframe/questions.h"
#include "toolframe/runjob.h"
#include "toolframe/windowplace.h"
#include "wvfile/HvFileIO.h"

#include <QFileInfo>
#include <QSettings>

namespace {

enum Page { SourcePage, TargetPage, OutputPage, StatusPage };

} // namespace

DlgResample::DlgResample(QWidget *parent)
    : DlgBase(parent)
    , m_ui(std::make_unique<Ui::DlgResample>())
{
    m_ui->setupUi(this);
    QtNumericEdit &clock = *m_ui->le_target_clock;
    clock.setName(tr("Target File Clockrate"));
    clock.setUnit("Hz");
    clock.setScaled(true);
    clock.setMax(ResampleTarget::MaxClockHz);
    clock.setMin(ResampleTarget::MinClockHz);
    clock.setVal(ResampleTarget().clockHz);
    QtNumericEdit &samples = *m_ui->le_target_samples;
    samples.setName(tr("Target File Samples"));
    samples.setMax(static_cast<double>(ResampleTarget::MaxSamples));
    samples.setMin(1);
    QtNumericEdit &outputClock = *m_ui->le_clockrate;
    outputClock.setName(tr("ARB Clockrate"));
    outputClock.setUnit("Hz");
    outputClock.setScaled(true);
    outputClock.setMax(ResampleTarget::MaxClockHz);

    connect(m_ui->pb_infile, &QPushButton::clicked, this, &DlgResample::slot_infile);
    connect(m_ui->pb_outfile, &QPushButton::clicked, this, &DlgResample::slot_outfile);
    connect(m_ui->rb_clock, &QRadioButton::toggled, this, &DlgResample::slot_mode);
    connect(&clock, &QtNumericEdit::valueUpdated, this, &DlgResample::slot_updatesettings);
    connect(&samples, &QtNumericEdit::valueUpdated, this, &DlgResample::slot_updatesettings);
    connect(m_ui->le_outfile, &QLineEdit::textChanged, this, &DlgResample::updateButtons);
    connect(m_ui->pb_next, &QPushButton::clicked, this, &DlgResample::slot_next);
    connect(m_ui->pb_prev, &QPushButton::clicked, this, &DlgResample::slot_prev);
    connect(m_ui->cb_close, &QPushButton::clicked, this, &DlgResample::reject);
    m_ui->sw_assist->setCurrentIndex(SourcePage);
    slot_mode();
}

DlgResample::~DlgResample() = default;

bool DlgResample::startModule(const QString &path)
{
    if (!loadSource(path)) {
        return false;
    }
    m_ui->sw_assist->setCurrentIndex(SourcePage);
    updateButtons();
    return true;
}

QString DlgResample::moduleName() const
{
    return "Resample";
}

QString DlgResample::menuPath() const
{
    return "/Edit/Resample";
}

bool DlgResample::extensionAllowed(const QString &upperCaseExtension) const
{
    return upperCaseExtension == "WV";
}

void DlgResample::writeSettings(QSettings &settings)
{
    settings.beginGroup("Resample");
    writeWindowPlace(settings, *this);
    settings.setValue("infile", m_ui->le_infile->text());
    settings.setValue("clkmode", m_ui->rb_clock->isChecked() ? 1 : 0);
    settings.endGroup();
}

void DlgResample::readSettings(QSettings &settings)
{
    settings.beginGroup("Resample");
    readWindowPlace(settings, *this, {220, 160}, {560, 420});
    m_ui->le_infile->setText(settings.value("infile").toString());
    const bool clockDecides = settings.value("clkmode", 1).toInt() != 0;
    settings.endGroup();
    (clockDecides ? m_ui->rb_clock : m_ui->rb_samples)->setChecked(true);
    slot_mode();
}

bool DlgResample::loadSource(const QString &fileName)
{
    WvFileSummary summary;
    HvFileIO file;
    if (!file.readWaveformInfo(fileName, &summary) || summary.clock <= 0 || summary.samples < 1) {
        return Tracer::fail("Cannot read waveform information.");
    }
    m_sourceClockHz = summary.clock;
    m_sourceSamples = summary.samples;
    m_ui->le_infile->setText(fileName);
    m_ui->l_src_clock->setText(engineeringText(m_sourceClockHz, "Hz"));
    m_ui->l_src_samples->setText(QString::number(m_sourceSamples));
    m_ui->le_outfile->setText(fileNameWithSuffix(fileName, "_resample"));
    m_ui->te_comment->setPlainText(summary.comment);
    m_ui->le_copyright->setText(summary.copyright);
    slot_updatesettings();
    return true;
}

void DlgResample::slot_infile()
{
    const QString before = m_ui->le_infile->text();
    if (chooseSourceFile(this, *m_ui->le_infile) && !loadSource(m_ui->le_infile->text())) {
        m_ui->le_infile->setText(before);
    }
    updateButtons();
}

void DlgResample::slot_outfile()
{
    chooseTargetFile(this, *m_ui->le_outfile);
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
    if (m_sourceSamples < 1) {
        return;
    }
    ResampleTarget wanted = target();
    wanted.follow(m_sourceClockHz, m_sourceSamples);
    if (wanted.clockDecides) {
        m_ui->le_target_samples->setVal(static_cast<qlonglong>(wanted.samples));
    } else {
        m_ui->le_target_clock->setVal(wanted.clockHz);
    }
    m_ui->le_clockrate->setVal(wanted.clockHz);
    const QString problem = wanted.problem();
    m_ui->l_warn->setText(problem);
    m_ui->l_warn->setVisible(!problem.isEmpty());
    updateButtons();
}

ResampleRequest DlgResample::options() const
{
    ResampleRequest request;
    request.inputFile = m_ui->le_infile->text();
    request.output = {m_ui->le_outfile->text(), m_ui->te_comment->toPlainText(),
                      m_ui->le_copyright->text()};
    request.target = target();
    return request;
}

void DlgResample::updateButtons()
{
    const int page = m_ui->sw_assist->currentIndex();
    m_ui->pb_prev->setEnabled(page != SourcePage);
    m_ui->pb_next->setVisible(page != StatusPage);
    m_ui->pb_next->setText(page == OutputPage ? tr("&Run") : tr("&Next"));
    m_ui->pb_next->setEnabled(m_sourceSamples > 0 &&
                              (page == SourcePage || m_ui->l_warn->text().isEmpty()));
    m_ui->pb_next->setDefault(page != StatusPage);
    m_ui->cb_close->setDefault(page == StatusPage);
}

void DlgResample::slot_next()
{
    const int page = m_ui->sw_assist->currentIndex();
    if (page == OutputPage) {
        slot_create();
        return;
    }
    m_ui->sw_assist->setCurrentIndex(page + 1);
    updateButtons();
}

void DlgResample::slot_prev()
{
    m_ui->sw_assist->setCurrentIndex(m_ui->sw_assist->currentIndex() - 1);
    updateButtons();
}

void DlgResample::slot_create()
{
    m_ui->te_result->clear();
    m_ui->sw_assist->setCurrentIndex(StatusPage);
    updateButtons();
    if (!confirmOverwrite(this, m_ui->le_outfile->text())) {
        appendReport(*m_ui->te_result, ReportLine::failure("Resampling aborted"));
        return;
    }
    m_ui->pb_prev->setEnabled(false);
    ResampleJob job(options());
    if (runJob(job, this, m_ui->te_result) == JobOutcome::Cancelled) {
        Tracer::Trace(Tracer::Information, "Resampling was cancelled.");
    }
    updateButtons();
}
