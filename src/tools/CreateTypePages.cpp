// SPDX-License-Identifier: Apache-2.0
#include "CreateTypePages.h"

#include "DlgWvCreate.h"
#include "ui_DlgWvCreate.h"

#include <QFormLayout>
#include <QSettings>

CreateTypePages::CreateTypePages(Ui::DlgWvCreate &form)
{
    setUp(*form.le_maxclock, createfields::maxClock);
    setUp(*form.le_minclock, createfields::minClock);
    setUp(*form.le_clockrate, createfields::clockRate);
    fillFunctionPage(form);
    fillPulsePages(form);
    fillModulationPages(form);
    fillOtherPages(form);
}

void CreateTypePages::setUp(QtNumericEdit &edit, const CreateField &field)
{
    const QString unit = field.unit;
    edit.setObjectName(field.object);
    edit.setName(field.text);
    edit.setUnit(unit);
    edit.setScaled(unit == "Hz" || unit == "s");
    edit.setLowerPrefix(unit == "s");
    edit.setMax(field.max);
    edit.setMin(field.min);
    edit.setVal(field.start);
    m_fields[&field] = &edit;
}

QFormLayout *CreateTypePages::layoutOf(QWidget *page, const QString &title)
{
    auto *outer = new QVBoxLayout(page);
    auto *group = new QGroupBox(title, page);
    outer->addWidget(group);
    outer->addStretch();
    auto *layout = new QFormLayout(group);
    layout->setFieldGrowthPolicy(QFormLayout::AllNonFixedFieldsGrow);
    return layout;
}

void CreateTypePages::add(QFormLayout *layout, const QString &label, const CreateField &field)
{
    auto *edit = new QtNumericEdit;
    setUp(*edit, field);
    layout->addRow(label, edit);
}

QComboBox *CreateTypePages::addRamp(QFormLayout *layout, const char *name)
{
    auto *ramp = new QComboBox;
    ramp->setObjectName(name);
    ramp->setToolTip(DlgWvCreate::tr("Shape of the edges"));
    ramp->addItems({"Linear", "RCOS"});
    layout->addRow(DlgWvCreate::tr("Ramp &Type"), ramp);
    return ramp;
}

void CreateTypePages::fillFunctionPage(const Ui::DlgWvCreate &form)
{
    using namespace createfields;
    QFormLayout *layout = layoutOf(form.page_function, DlgWvCreate::tr("Function"));
    add(layout, DlgWvCreate::tr("&Frequency"), frequency);
    add(layout, DlgWvCreate::tr("&I Amplitude"), amplitudeI);
    add(layout, DlgWvCreate::tr("&Q Amplitude"), amplitudeQ);
    add(layout, DlgWvCreate::tr("I &Offset"), offsetI);
    add(layout, DlgWvCreate::tr("Q O&ffset"), offsetQ);
    add(layout, DlgWvCreate::tr("Q P&hase Offset"), phaseQ);
    m_oversampling = new QCheckBox(DlgWvCreate::tr("&Custom\nOversampling"));
    m_oversampling->setObjectName("cb_over");
    m_oversampling->setToolTip(DlgWvCreate::tr("Start from this number of samples per period"));
    auto *ratio = new QtNumericEdit;
    setUp(*ratio, oversampling);
    layout->addRow(m_oversampling, ratio);
}

void CreateTypePages::fillPulsePages(const Ui::DlgWvCreate &form)
{
    using namespace createfields;
    QFormLayout *layout = layoutOf(form.page_pulse, DlgWvCreate::tr("Pulse"));
    add(layout, DlgWvCreate::tr("&Rise Time"), pulseRise);
    add(layout, DlgWvCreate::tr("&On Time"), pulseOn);
    add(layout, DlgWvCreate::tr("&Fall Time"), pulseFall);
    add(layout, DlgWvCreate::tr("&Blank Time"), pulseBlank);
    m_pulseRamp = addRamp(layout, "cb_rtype");
    add(layout, DlgWvCreate::tr("Time R&esolution"), pulseResolution);

    layout = layoutOf(form.page_chirp, DlgWvCreate::tr("Chirp"));
    add(layout, DlgWvCreate::tr("&Rise Time"), chirpRise);
    add(layout, DlgWvCreate::tr("&On Time"), chirpOn);
    add(layout, DlgWvCreate::tr("&Fall Time"), chirpFall);
    add(layout, DlgWvCreate::tr("&Blank Time"), chirpBlank);
    m_chirpRamp = addRamp(layout, "cb_rtype_2");
    add(layout, DlgWvCreate::tr("Time R&esolution"), chirpResolution);
    add(layout, DlgWvCreate::tr("&Chirp Range"), chirpRange);
}

void CreateTypePages::fillModulationPages(const Ui::DlgWvCreate &form)
{
    using namespace createfields;
    QFormLayout *layout = layoutOf(form.page_fm, DlgWvCreate::tr("FM"));
    add(layout, DlgWvCreate::tr("&Modulation Frequency"), fmFrequency);
    add(layout, DlgWvCreate::tr("&Deviation"), fmDeviation);
    add(layout, DlgWvCreate::tr("Modulation &Frequency, 2nd Tone"), fmFrequency2);
    add(layout, DlgWvCreate::tr("D&eviation, 2nd Tone"), fmDeviation2);

    layout = layoutOf(form.page_sweep, DlgWvCreate::tr("FM Sweep"));
    add(layout, DlgWvCreate::tr("&Deviation"), sweepDeviation);
    add(layout, DlgWvCreate::tr("Sweep &Time"), sweepTime);
    add(layout, DlgWvCreate::tr("&Start Phase"), sweepStart);
    add(layout, DlgWvCreate::tr("St&op Phase"), sweepStop);

    layout = layoutOf(form.page_am, DlgWvCreate::tr("AM"));
    add(layout, DlgWvCreate::tr("&Modulation Frequency"), amFrequency);
    add(layout, DlgWvCreate::tr("&Depth"), amDepth);
    add(layout, DlgWvCreate::tr("Modulation &Frequency, 2nd Tone"), amFrequency2);
    add(layout, DlgWvCreate::tr("D&epth, 2nd Tone"), amDepth2);

    layout = layoutOf(form.page_pm, DlgWvCreate::tr("PM"));
    add(layout, DlgWvCreate::tr("&Modulation Frequency"), pmFrequency);
    add(layout, DlgWvCreate::tr("&Deviation"), pmDeviation);
}

void CreateTypePages::fillOtherPages(const Ui::DlgWvCreate &form)
{
    using namespace createfields;
    QFormLayout *layout = layoutOf(form.page_multicarrier, DlgWvCreate::tr("Multi Carrier"));
    add(layout, DlgWvCreate::tr("Frequency &Spacing"), spacing);
    add(layout, DlgWvCreate::tr("Number of &Carriers"), carriers);
    add(layout, DlgWvCreate::tr("&I Offset"), carrierOffsetI);
    m_randomPhase = new QCheckBox(DlgWvCreate::tr("&Random Phase"));
    m_randomPhase->setObjectName("cb_randomphase");
    m_randomPhase->setToolTip(
        DlgWvCreate::tr("Give each carrier a random phase, for a lower peak"));
    m_randomPhase->setChecked(true);
    layout->addRow(QString(), m_randomPhase);

    layout = layoutOf(form.page_noise, DlgWvCreate::tr("Noise"));
    add(layout, DlgWvCreate::tr("&Bandwidth"), noiseBandwidth);
    add(layout, DlgWvCreate::tr("&Duration"), noiseDuration);
}

double CreateTypePages::value(const CreateField &field) const
{
    return m_fields.at(&field)->getVal();
}

CreateChoices CreateTypePages::choices(CreateKind kind) const
{
    CreateChoices choices;
    const QComboBox &ramp = kind == CreateKind::Chirp ? *m_chirpRamp : *m_pulseRamp;
    choices.ramp = static_cast<RampKind>(ramp.currentIndex());
    choices.customOversampling = m_oversampling->isChecked();
    choices.randomPhase = m_randomPhase->isChecked();
    return choices;
}

void CreateTypePages::setEnabled(const CreateField &field, bool enabled) const
{
    m_fields.at(&field)->setEnabled(enabled);
}

void CreateTypePages::writeSettings(QSettings &settings) const
{
    for (const auto &[field, edit] : m_fields) {
        if (*field->key != 0) {
            settings.setValue(field->key, edit->getVal());
        }
    }
    settings.setValue("fn.overen", m_oversampling->isChecked());
    settings.setValue("pulse.ramp", m_pulseRamp->currentIndex());
    settings.setValue("chirp.ramp", m_chirpRamp->currentIndex());
    settings.setValue("mc.rndp", m_randomPhase->isChecked());
}

void CreateTypePages::readSettings(const QSettings &settings) const
{
    for (const auto &[field, edit] : m_fields) {
        if (*field->key != 0) {
            edit->setVal(settings.value(field->key, field->start).toDouble());
        }
    }
    m_oversampling->setChecked(settings.value("fn.overen", false).toBool());
    readChoice(settings, "pulse.ramp", *m_pulseRamp);
    readChoice(settings, "chirp.ramp", *m_chirpRamp);
    m_randomPhase->setChecked(settings.value("mc.rndp", true).toBool());
}

void readChoice(const QSettings &settings, const QString &key, QComboBox &box)
{
    const int index = settings.value(key, 0).toInt();
    box.setCurrentIndex(index >= 0 && index < box.count() ? index : 0);
}
