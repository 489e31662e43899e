// SPDX-License-Identifier: Apache-2.0
#include "DlgWrapAround.h"

#include "ui_DlgWrapAround.h"

#include "jobs/WrapPreview.h"
#include "log/Tracer.h"
#include "view/iqlevels.h"

#include <QPlainTextEdit>
#include <QSettings>

#include <cmath>

namespace {

constexpr int FirstPage = 0;

/// The levels of what the correction can change.
IqList changedPart(const Joint &joint, int range)
{
    IqList samples;
    for (int i = JointHalf - range; i < JointHalf + range; ++i) {
        const std::complex<double> &sample = joint[static_cast<std::size_t>(i)];
        samples.append({sample.real(), sample.imag()});
    }
    return samples;
}

QString stepText(double before, double after)
{
    return QString("%1 → %2").arg(before, 0, 'f', 4).arg(after, 0, 'f', 4);
}

} // namespace

DlgWrapAround::DlgWrapAround(QWidget *parent)
    : SourceWizard({.settingsGroup = "WrapAround",
                    .position = {190, 110},
                    .size = {940, 660},
                    .abortedText = "Wrap around removal aborted"},
                   "_wrap", parent)
    , m_ui(std::make_unique<Ui::DlgWrapAround>())
{
    m_ui->setupUi(this);
    setUpFields();
    m_ui->w_spectrum->setView(static_cast<int>(SpectrumMode::Spectrum));
    m_ui->w_levels->setSignals({"Uncorrected", "Corrected"});
    m_ui->page_output->clockRate().setName("ARB clock rate");
    for (QtNumericEdit *field :
         {m_ui->le_sample_start, m_ui->le_sample_end, m_ui->le_filterfreq, m_ui->le_filterrange}) {
        connect(field, &QtNumericEdit::valueUpdated, this, &DlgWrapAround::createPreview);
    }
    // The other button of the two always changes along.
    connect(m_ui->rb_corrected, &QRadioButton::toggled, this, &DlgWrapAround::createPreview);
    setUpEditWizard();
    showProblem({});
}

DlgWrapAround::~DlgWrapAround() = default;

void DlgWrapAround::setUpFields()
{
    constexpr double MaxPosition = 1e9;
    for (QtNumericEdit *field : {m_ui->le_sample_start, m_ui->le_sample_end}) {
        field->setMax(MaxPosition);
        field->setMin(1);
        field->setStep(1);
        field->setPrecision(9);
        field->setVal(1);
    }
    m_ui->le_sample_start->setName("First sample from waveform (one based)");
    m_ui->le_sample_end->setName("The corrected waveform ends before this sample (one based)");
    QtNumericEdit &cutoff = *m_ui->le_filterfreq;
    cutoff.setName("One-sided filter bandwidth");
    cutoff.setUnit("Hz");
    cutoff.setScaled(true);
    QtNumericEdit &range = *m_ui->le_filterrange;
    range.setName("Number of samples that are modified on each side.");
    range.setMax(WrapSettings::MaxRange);
    range.setMin(WrapSettings::MinRange);
    range.setStep(1);
    range.setVal(WrapSettings().range);
}

bool DlgWrapAround::sourceRead()
{
    const WvFileInfo &info = source()->info();
    m_uncorrected.reset();
    m_ui->le_sample_start->setVal(1);
    m_ui->le_sample_end->setVal(static_cast<qlonglong>(info.samples));
    QtNumericEdit &cutoff = *m_ui->le_filterfreq;
    cutoff.setMax(0.5 * info.clock);
    cutoff.setMin(0.01 * info.clock);
    cutoff.setVal(0.25 * info.clock);
    m_ui->w_spectrum->setClock(info.clock);
    m_ui->w_iq_head->setClock(info.clock);
    m_ui->w_iq_tail->setClock(info.clock);
    resetClock(*m_ui->page_output);
    return true;
}

void DlgWrapAround::sourceReleased()
{
    m_uncorrected.reset();
    m_ui->w_iq_tail->clear();
    m_ui->w_iq_head->clear();
    m_ui->w_spectrum->clear();
    m_ui->w_levels->clear();
    m_ui->l_step->clear();
    m_ui->l_largest->clear();
    showProblem({});
}

void DlgWrapAround::createPreview()
{
    requestPreview();
}

void DlgWrapAround::makePreview()
{
    Tracer::Trace(Tracer::Information, "Creating preview...");
    const WvFileInfo &info = source()->info();
    const WrapSettings settings = options().settings;
    const QString problem = wrapProblem(settings, info.samples, info.clock);
    showProblem(problem);
    if (!problem.isEmpty()) {
        Tracer::Trace(Tracer::Warning, problem);
        return;
    }
    if (!readUncorrected(settings)) {
        return;
    }
    const Joint corrected = smoothedJoint(
        m_uncorrected->joint, m_ui->le_filterfreq->getVal() / info.clock, settings.range);
    showJoint(m_ui->rb_corrected->isChecked() ? corrected : m_uncorrected->joint);
    showSteps(corrected, settings);
}

/// A change of the filter alone needs no other samples.
bool DlgWrapAround::readUncorrected(const WrapSettings &settings)
{
    const qint64 samples = source()->info().samples;
    const qint64 end = settings.endOf(samples);
    if (m_uncorrected && m_uncorrected->start == settings.start && m_uncorrected->end == end) {
        return true;
    }
    m_uncorrected.reset();
    auto joint = readJoint(*source()->data(), settings, samples);
    if (joint) {
        m_uncorrected = Uncorrected{settings.start, end, std::move(*joint)};
    }
    return m_uncorrected.has_value();
}

void DlgWrapAround::showJoint(const Joint &joint)
{
    m_ui->w_iq_tail->setData(jointTail(joint));
    m_ui->w_iq_head->setData(jointHead(joint));
    m_ui->w_spectrum->setData(jointSpectrumInput(joint));
}

void DlgWrapAround::showSteps(const Joint &corrected, const WrapSettings &settings)
{
    const Joint &before = m_uncorrected->joint;
    m_ui->l_step->setText(stepText(stepAtJoint(before), stepAtJoint(corrected)));
    m_ui->l_largest->setText(
        stepText(largestStep(before, settings.range), largestStep(corrected, settings.range)));
    const IqList lists[] = {changedPart(before, settings.range),
                            changedPart(corrected, settings.range)};
    for (int row = 0; row < 2; ++row) {
        m_ui->w_levels->setLevels(row, levelsOf(lists[row]), lists[row].size());
    }
}

void DlgWrapAround::showProblem(const QString &problem)
{
    m_ui->l_warn->setText(problem);
    m_ui->l_warn->setVisible(!problem.isEmpty());
    updateButtons();
}

bool DlgWrapAround::isComplete(int page) const
{
    return SourceWizard::isComplete(page) && (page == FirstPage || m_ui->l_warn->text().isEmpty());
}

WrapRequest DlgWrapAround::options() const
{
    WrapRequest request;
    request.inputFile = sourceFile();
    request.output = outputOptions();
    request.settings.start = m_ui->le_sample_start->getValInt() - 1;
    request.settings.end = m_ui->le_sample_end->getValInt() - 1;
    request.settings.cutoffHz = m_ui->le_filterfreq->getVal();
    request.settings.range = static_cast<int>(m_ui->le_filterrange->getValInt());
    request.clockHz = wantedClockHz(*m_ui->page_output);
    return request;
}

std::unique_ptr<ToolJob> DlgWrapAround::makeJob() const
{
    auto job = std::make_unique<WrapJob>(options());
    giveSource(*job);
    return job;
}

void DlgWrapAround::writeFields(QSettings &settings) const
{
    // Under another name than the one that is read: the source of the last time isn't offered
    // again.
    settings.setValue("infile1", sourceFile());
    const OutputOptions output = outputOptions();
    settings.setValue("range", m_ui->le_filterrange->getVal());
    settings.setValue("filter", m_ui->le_filterfreq->getVal());
    settings.setValue("outfile", output.fileName);
    settings.setValue("comment", *output.comment);
    settings.setValue("copyright", *output.copyright);
    settings.setValue("clock", m_ui->page_output->clockRate().getVal());
}

void DlgWrapAround::readFields(const QSettings &settings)
{
    SourceWizard::readFields(settings);
    m_ui->le_filterrange->setVal(settings.value("range", WrapSettings().range).toDouble());
    m_ui->le_filterfreq->setVal(settings.value("filter").toDouble());
    findChild<QLineEdit *>("le_outfile")->setText(settings.value("outfile").toString());
    findChild<QPlainTextEdit *>("te_comment")->setPlainText(settings.value("comment").toString());
    findChild<QLineEdit *>("le_copyright")->setText(settings.value("copyright").toString());
    m_ui->page_output->clockRate().setVal(
        settings.value("clock", m_ui->page_output->clockRate().getVal()).toDouble());
}
