// SPDX-License-Identifier: Apache-2.0
#include "DlgRescale.h"

#include "display/QtNumericEdit.h"
#include "jobs/LevelJob.h"
#include "jobs/RangeJob.h"
#include "toolframe/runjob.h"

#include <QFormLayout>
#include <QGroupBox>
#include <QHBoxLayout>
#include <QLabel>
#include <QPushButton>

namespace {

QLabel *makeValue(const char *name)
{
    auto *label = new QLabel("---");
    label->setObjectName(QLatin1String(name));
    label->setTextInteractionFlags(Qt::TextSelectableByMouse);
    return label;
}

QString levelText(double levelDb)
{
    // Without the sign of a zero.
    return QString("%1 dB").arg(levelDb + 0.0, 0, 'f', 2);
}

} // namespace

DlgRescale::DlgRescale(QWidget *parent)
    : RangeTool("Level", "Rescale", "_rescale", parent)
    , l_PkOfsTag(makeValue("l_PkOfsTag"))
    , l_RmsOfsTag(makeValue("l_RmsOfsTag"))
    , l_PkOfsData(makeValue("l_PkOfsData"))
    , l_RmsOfsData(makeValue("l_RmsOfsData"))
    , l_peak(makeValue("l_peak"))
    , l_rms(makeValue("l_rms"))
    , l_crest(makeValue("l_crest"))
    , l_warn(new QLabel)
    , le_peak(new QtNumericEdit)
    , le_pkrms(new QtNumericEdit)
    , pb_update(new QPushButton("Update"))
    , pb_measured(new QPushButton("Measured"))
{
    auto *boxes = new QWidget;
    auto *row = new QHBoxLayout(boxes);
    row->setContentsMargins(0, 0, 0, 0);
    row->addWidget(makeTagBox());
    row->addWidget(makeTargetBox(), 1);
    addControls(boxes);
    l_warn->setObjectName("l_warn");
    l_warn->setWordWrap(true);
    addControls(l_warn);
    runButton().setToolTip("Create waveform with above level settings");
    connect(pb_update, &QPushButton::clicked, this, &DlgRescale::slot_update);
    connect(pb_measured, &QPushButton::clicked, this, &DlgRescale::slot_measured);
}

QWidget *DlgRescale::makeTagBox()
{
    auto *box = new QGroupBox("Entire Data");
    auto *form = new QFormLayout(box);
    form->addRow("Peak Offset from Level Offset Tag", l_PkOfsTag);
    form->addRow("RMS Offset from Level Offset Tag", l_RmsOfsTag);
    form->addRow("Peak Offset from I/Q Data", l_PkOfsData);
    form->addRow("RMS Offset from I/Q Data", l_RmsOfsData);
    form->addRow("Crest Factor from I/Q Data", l_crest);
    form->addRow("Peak of Tag above Data", l_peak);
    form->addRow("RMS of Tag above Data", l_rms);
    l_peak->setToolTip("Known after an update");
    l_rms->setToolTip("Known after an update");
    return box;
}

QWidget *DlgRescale::makeTargetBox()
{
    auto *box = new QGroupBox("Target Levels");
    auto *form = new QFormLayout(box);
    const auto setUp = [this](QtNumericEdit &field, const char *name, const QString &toolTip) {
        field.setObjectName(QLatin1String(name));
        field.setName(toolTip);
        field.setUnit("dB");
        field.setMax(LevelRequest::MaxDb);
        field.setMin(LevelRequest::MinDb);
        field.setStep(1);
        field.setPrecision(3);
        connect(&field, &QtNumericEdit::valueUpdated, this, &DlgRescale::checkCrest);
    };
    setUp(*le_peak, "le_peak", "Peak Level Offset. Negative values decrease level.");
    setUp(*le_pkrms, "le_pkrms", "Peak to RMS level, the crest factor.");
    form->addRow("Peak", le_peak);
    form->addRow("Peak/RMS", le_pkrms);
    auto *buttons = new QHBoxLayout;
    pb_update->setObjectName("pb_update");
    pb_update->setToolTip("Calculate Peak and RMS values based on cursors");
    pb_measured->setObjectName("pb_measured");
    pb_measured->setToolTip("Take the levels that the samples have, over the whole waveform");
    for (QPushButton *button : {pb_update, pb_measured}) {
        button->setAutoDefault(false);
        buttons->addWidget(button);
    }
    form->addRow(buttons);
    return box;
}

void DlgRescale::sourceChanged()
{
    const bool loaded = source() != nullptr;
    pb_update->setEnabled(loaded);
    pb_measured->setEnabled(loaded);
    l_peak->setText("---");
    l_rms->setText("---");
    if (!loaded) {
        return;
    }
    const WvFileInfo &info = source()->info();
    l_PkOfsTag->setText(levelText(info.peakOffsetTag));
    l_RmsOfsTag->setText(levelText(info.rmsOffsetTag));
    l_PkOfsData->setText(levelText(info.peakOffset));
    l_RmsOfsData->setText(levelText(info.rmsOffset));
    l_crest->setText(levelText(info.rmsOffset - info.peakOffset));
    slot_measured();
}

void DlgRescale::slot_measured()
{
    if (source() != nullptr) {
        const WvFileInfo &info = source()->info();
        le_peak->setVal(-info.peakOffset);
        le_pkrms->setVal(info.rmsOffset - info.peakOffset);
        checkCrest();
    }
}

void DlgRescale::slot_update()
{
    if (source() == nullptr) {
        return;
    }
    const auto [first, last] = range();
    const WvFileInfo &info = source()->info();
    if (first < 0 || last >= info.samples) {
        return;
    }
    RangeJob job(*source(), first, last);
    pb_update->setEnabled(false);
    runButton().setEnabled(false);
    const JobOutcome outcome = runJob(job, this, nullptr);
    pb_update->setEnabled(true);
    runButton().setEnabled(true);
    if (outcome != JobOutcome::Finished) {
        return;
    }
    le_peak->setVal(-info.peakOffsetTag);
    l_peak->setText(levelText(-(info.peakOffsetTag - info.peakOffset)));
    l_rms->setText(levelText(-(info.rmsOffsetTag - info.rmsOffset)));
    le_pkrms->setVal(-(info.rmsOffsetTag - levelOffset(job.rmsLevel())));
    checkCrest();
}

void DlgRescale::checkCrest()
{
    const WvFileInfo &info = source()->info();
    const QString problem = crestProblem(le_pkrms->getVal(), info.rmsOffset - info.peakOffset);
    l_warn->setText(problem.isEmpty() ? problem : "Warning: " + problem);
}

std::unique_ptr<EditJob> DlgRescale::makeJob(const QString &inputFile,
                                             const OutputOptions &output) const
{
    return std::make_unique<LevelJob>(
        LevelRequest{inputFile, output, le_peak->getVal(), le_pkrms->getVal()});
}
