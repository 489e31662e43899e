// SPDX-License-Identifier: Apache-2.0
#include "CreateTypePages.h"

#include "DlgWvCreate.h"
#include "ui_DlgWvCreate.h"

#include "toolframe/toolpages.h"

#include <QFormLayout>
#include <QSettings>

CreateTypePages::CreateTypePages(Ui::DlgWvCreate &form)
{
    setUp(*form.le_maxclock, signalfields::maxClock);
    setUp(*form.le_minclock, signalfields::minClock);
    setUp(*form.le_clockrate, signalfields::clockRate);
    fillFunctionPage(form);
    fillPulsePages(form);
    fillModulationPages(form);
    fillOtherPages(form);
}

void CreateTypePages::setUp(QtNumericEdit &edit, const SignalField &field)
{
    const QString unit = field.unit;
    edit.setName(field.help == nullptr ? QString(field.text)
                                       : QString("%1\n%2").arg(field.text, field.help));
    edit.setUnit(unit);
    edit.setScaled(unit == "Hz" || unit == "s");
    edit.setLowerPrefix(unit == "s");
    edit.setMax(field.max);
    edit.setMin(field.min);
    edit.setVal(field.start);
    m_fields[&field] = &edit;
    if (&field == &signalfields::oversampling || &field == &signalfields::carriers) {
        roundInput(edit);
    }
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

void CreateTypePages::add(QFormLayout *layout, const QString &label, const SignalField &field,
                          const char *name)
{
    auto *edit = new QtNumericEdit;
    edit->setObjectName(name);
    setUp(*edit, field);
    layout->addRow(label, edit);
}

QComboBox *CreateTypePages::addRamp(QFormLayout *layout, const char *name)
{
    auto *ramp = new QComboBox;
    ramp->setObjectName(name);
    ramp->setToolTip("Shape of the edges");
    ramp->addItems({"Linear", "RCOS"});
    layout->addRow("Ramp &Type", ramp);
    return ramp;
}

void CreateTypePages::fillFunctionPage(const Ui::DlgWvCreate &form)
{
    using namespace signalfields;
    QFormLayout *layout = layoutOf(form.page_function, "Function");
    add(layout, "&Frequency", frequency, "le_freq");
    add(layout, "&I Amplitude", amplitudeI, "le_ampi");
    add(layout, "&Q Amplitude", amplitudeQ, "le_ampq");
    add(layout, "I &Offset", offsetI, "le_ofsi");
    add(layout, "Q Offs&et", offsetQ, "le_ofsq");
    add(layout, "Q P&hase Offset", phaseQ, "le_phaseq");
    m_oversampling = new QCheckBox("&Custom\nOversampling");
    m_oversampling->setObjectName("cb_over");
    m_oversampling->setToolTip("Start from this number of samples per period");
    auto *ratio = new QtNumericEdit;
    ratio->setObjectName("le_over");
    setUp(*ratio, oversampling);
    layout->addRow(m_oversampling, ratio);
}

void CreateTypePages::fillPulsePages(const Ui::DlgWvCreate &form)
{
    using namespace signalfields;
    QFormLayout *layout = layoutOf(form.page_pulse, "Pulse");
    add(layout, "&Rise Time", pulseRise, "le_trise");
    add(layout, "&On Time", pulseOn, "le_ton");
    add(layout, "&Fall Time", pulseFall, "le_tfall");
    add(layout, "&Blank Time", pulseBlank, "le_tblank");
    m_pulseRamp = addRamp(layout, "cb_rtype");
    add(layout, "Time R&esolution", pulseResolution, "le_pulseresolution");

    layout = layoutOf(form.page_chirp, "Chirp");
    add(layout, "&Rise Time", chirpRise, "le_trise_2");
    add(layout, "&On Time", chirpOn, "le_ton_2");
    add(layout, "&Fall Time", chirpFall, "le_tfall_2");
    add(layout, "&Blank Time", chirpBlank, "le_tblank_2");
    m_chirpRamp = addRamp(layout, "cb_rtype_2");
    add(layout, "Time R&esolution", chirpResolution, "le_pulseresolution_2");
    add(layout, "&Chirp Range", chirpRange, "le_chirprange");
}

void CreateTypePages::fillModulationPages(const Ui::DlgWvCreate &form)
{
    using namespace signalfields;
    QFormLayout *layout = layoutOf(form.page_fm, "FM");
    add(layout, "&Modulation Frequency", fmFrequency, "le_modfreq");
    add(layout, "&Deviation", fmDeviation, "le_dev");
    add(layout, "Modulation &Frequency, 2nd Tone", fmFrequency2, "le_modfreq_2");
    add(layout, "D&eviation, 2nd Tone", fmDeviation2, "le_dev_2");

    layout = layoutOf(form.page_sweep, "FM Sweep");
    add(layout, "&Deviation", sweepDeviation, "le_sweepdev");
    add(layout, "Sweep &Time", sweepTime, "le_sweeptime");
    add(layout, "&Start Phase", sweepStart, "le_startphase");
    // The key keeps its name from another field of old.
    add(layout, "St&op Phase", sweepStop, "le_stopphase");

    layout = layoutOf(form.page_am, "AM");
    add(layout, "&Modulation Frequency", amFrequency, "le_ammodfreq");
    add(layout, "&Depth", amDepth, "le_amdepth");
    add(layout, "Modulation &Frequency, 2nd Tone", amFrequency2, "le_ammodfreq_2");
    add(layout, "D&epth, 2nd Tone", amDepth2, "le_amdepth_2");

    layout = layoutOf(form.page_pm, "PM");
    add(layout, "&Modulation Frequency", pmFrequency, "le_pmmodfreq");
    add(layout, "&Deviation", pmDeviation, "le_pmdev");
}

void CreateTypePages::fillOtherPages(const Ui::DlgWvCreate &form)
{
    using namespace signalfields;
    QFormLayout *layout = layoutOf(form.page_multicarrier, "Multi Carrier");
    add(layout, "Frequency &Spacing", spacing, "le_spacing");
    add(layout, "Number of &Carriers", carriers, "le_carriers");
    add(layout, "&I Offset", carrierOffsetI, "le_ioffset");
    m_randomPhase = new QCheckBox("&Random Phase");
    m_randomPhase->setObjectName("cb_randomphase");
    m_randomPhase->setToolTip("Give each carrier a random phase, for a lower peak");
    m_randomPhase->setChecked(true);
    layout->addRow(QString(), m_randomPhase);

    layout = layoutOf(form.page_noise, "Noise");
    add(layout, "&Bandwidth", noiseBandwidth, "le_noisebw");
    add(layout, "&Duration", noiseDuration, "le_noiseduration");
}

double CreateTypePages::value(const SignalField &field) const
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

void CreateTypePages::setEnabled(const SignalField &field, bool enabled) const
{
    m_fields.at(&field)->setEnabled(enabled);
}

void CreateTypePages::writeSettings(QSettings &settings) const
{
    for (const auto &[field, edit] : m_fields) {
        if (field->key) {
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
        if (field->key) {
            bool isNumber = false;
            const double value = settings.value(field->key, field->start).toDouble(&isNumber);
            edit->setVal(isNumber ? value : field->start);
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
