// SPDX-License-Identifier: Apache-2.0
#include "editpages.h"

#include "ui_OutputPage.h"
#include "ui_SourcePage.h"
#include "ui_StatusPage.h"
#include "ui_WizardButtons.h"

#include "jobs/ResampleJob.h"

namespace {

void setUpClock(QtNumericEdit &clock)
{
    clock.setUnit("Hz");
    clock.setScaled(true);
    clock.setMax(ResampleTarget::MaxClockHz);
    clock.setMin(ResampleTarget::MinClockHz);
    clock.setVal(ResampleTarget().clockHz);
}

} // namespace

void setUpTarget(QtNumericEdit &clock, QtNumericEdit &samples)
{
    clock.setName("Target File Clockrate");
    setUpClock(clock);
    samples.setName("Target File Samples");
    samples.setMax(static_cast<double>(ResampleTarget::MaxSamples));
}

SourcePage::SourcePage(QWidget *parent)
    : QWidget(parent)
{
    Ui::SourcePage().setupUi(this);
}

OutputPage::OutputPage(QWidget *parent)
    : QWidget(parent)
{
    Ui::OutputPage().setupUi(this);
    setUpClock(clockRate());
}

QtNumericEdit &OutputPage::clockRate() const
{
    return *findChild<QtNumericEdit *>("le_clockrate");
}

StatusPage::StatusPage(QWidget *parent)
    : QWidget(parent)
{
    Ui::StatusPage().setupUi(this);
}

WizardButtons::WizardButtons(QWidget *parent)
    : QWidget(parent)
{
    Ui::WizardButtons().setupUi(this);
}
