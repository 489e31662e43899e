// SPDX-License-Identifier: Apache-2.0
#include "GeneratorLine.h"

#include "appearance/lineicon.h"
#include "base/EngineeringNumber.h"
#include "display/QtNumericEdit.h"
#include "instrument/VisaDevice.h"
#include "instrument/remotepaths.h"
#include "jobs/instrument/GeneratorJob.h"
#include "toolframe/QtProgressDialog.h"
#include "toolframe/runjob.h"

#include <QGridLayout>
#include <QLabel>
#include <QPushButton>
#include <QTimer>
#include <QToolButton>

GeneratorLine::GeneratorLine(QWidget *parent)
    : QWidget(parent)
    , m_waveform(new QLabel(this))
    , m_stop(new QPushButton(lineIcon("stop"), "Stop ARB", this))
    , m_frequency(new QtNumericEdit(this))
    , m_level(new QtNumericEdit(this))
    , m_output(new QPushButton("RF Off", this))
    , m_refresh(new QToolButton(this))
{
    m_waveform->setObjectName("l_genwaveform");
    m_waveform->setTextFormat(Qt::PlainText);
    m_waveform->setSizePolicy(QSizePolicy::Ignored, QSizePolicy::Preferred);
    m_stop->setObjectName("pb_genstop");
    m_stop->setToolTip("Ends the playing; the RF output stays as it is");
    m_refresh->setObjectName("tb_genrefresh");
    m_refresh->setIcon(lineIcon("refresh"));
    m_refresh->setToolTip("Ask the generator for its state");
    m_refresh->setAccessibleName("Ask the generator for its state");
    m_frequency->setObjectName("ne_genfrequency");
    m_frequency->setName("Frequency of the RF output");
    m_frequency->setAccessibleName("RF frequency");
    m_frequency->setUnit("Hz");
    m_frequency->setScaled(true);
    m_frequency->setPrecision(9);
    m_frequency->setMin(GeneratorChange::MinFrequencyHz);
    m_frequency->setMax(GeneratorChange::MaxFrequencyHz);
    m_level->setObjectName("ne_genlevel");
    m_level->setName("Level of the RF output");
    m_level->setAccessibleName("RF level");
    m_level->setUnit("dBm");
    m_level->setScaled(false);
    m_level->setPrecision(2);
    m_level->setMin(GeneratorChange::MinLevelDbm);
    m_level->setMax(GeneratorChange::MaxLevelDbm);
    m_output->setObjectName("pb_genoutput");
    m_output->setCheckable(true);
    m_output->setToolTip("Switches the RF output on or off");

    auto *grid = new QGridLayout(this);
    grid->setContentsMargins(0, 0, 0, 2);
    grid->setHorizontalSpacing(6);
    grid->setVerticalSpacing(4);
    grid->addWidget(m_waveform, 0, 0, 1, 2);
    grid->addWidget(m_stop, 0, 2);
    grid->addWidget(m_refresh, 0, 3);
    grid->addWidget(m_frequency, 1, 0);
    grid->addWidget(m_level, 1, 1);
    grid->addWidget(m_output, 1, 2);
    grid->setColumnStretch(0, 3);
    grid->setColumnStretch(1, 2);

    connect(m_refresh, &QToolButton::clicked, this, &GeneratorLine::refresh);
    connect(m_stop, &QPushButton::clicked, this, &GeneratorLine::stop);
    connect(m_frequency, &QtNumericEdit::valueUpdated, this, [this](double value) {
        change({.frequencyHz = value},
               QString("The RF frequency is %1.").arg(engineeringText(value, "Hz")));
    });
    connect(m_level, &QtNumericEdit::valueUpdated, this, [this](double value) {
        change({.levelDbm = value}, QString("The RF level is %1 dBm.").arg(value));
    });
    connect(m_output, &QPushButton::clicked, this, [this](bool on) {
        change({.output = on},
               on ? QString("The RF output is on.") : QString("The RF output is off."));
    });
    hide();
}

void GeneratorLine::showDevice(VisaDevice *device)
{
    m_device = device && device->isOpen() && !device->isAnalyzer() ? device : nullptr;
    m_isKnown = false;
    m_state = {};
    setVisible(m_device != nullptr);
    showState();
    if (m_device) {
        QTimer::singleShot(0, this, &GeneratorLine::refresh);
    }
}

void GeneratorLine::refresh()
{
    if (m_device && !m_device->isOpen()) {
        showDevice(nullptr); // what it showed is known no more
    } else if (m_device) {
        GeneratorJob job({.device = m_device}, GeneratorJob::Operation::Read);
        run(job, {});
    }
}

void GeneratorLine::change(const GeneratorChange &change, const QString &done)
{
    if (m_device) {
        GeneratorJob job({.device = m_device}, GeneratorJob::Operation::Change, change);
        run(job, done);
    }
}

void GeneratorLine::stop()
{
    if (m_device) {
        GeneratorJob job({.device = m_device}, GeneratorJob::Operation::StopArb);
        run(job, "The ARB is stopped.");
    }
}

void GeneratorLine::run(GeneratorJob &job, const QString &done)
{
    if (QtProgressDialog::running() == nullptr) {
        const bool isDone = runJob(job, window(), nullptr) == JobOutcome::Finished;
        m_isKnown = isDone;
        m_state = isDone ? job.state() : GeneratorState();
        if (!isDone) {
            emit said("The generator didn't do as it was told; see the log.");
        } else if (!done.isEmpty()) {
            emit said(done);
        }
    }
    showState();
}

QString GeneratorLine::waveformText() const
{
    if (!m_isKnown) {
        return "The state of the generator is not known.";
    }
    if (m_state.waveform.isEmpty()) {
        return "No waveform is loaded.";
    }
    const QString name = entryName(QString(m_state.waveform).replace('\\', '/'));
    const QString clock =
        m_state.clockHz ? " at " + engineeringText(*m_state.clockHz, "Hz") : QString();
    return name + (m_state.arb.value_or(false) ? " plays" + clock : QString(" is loaded"));
}

void GeneratorLine::showState()
{
    m_waveform->setText(waveformText());
    m_waveform->setToolTip(m_state.waveform);
    m_stop->setEnabled(m_state.arb.value_or(false));
    // A value that it doesn't tell can't be shown, and none is to be set by mistake.
    m_frequency->setEnabled(m_state.frequencyHz.has_value());
    m_frequency->setVal(m_state.frequencyHz.value_or(0));
    m_level->setEnabled(m_state.levelDbm.has_value());
    m_level->setVal(m_state.levelDbm.value_or(0));
    m_output->setEnabled(m_state.output.has_value());
    m_output->setChecked(m_state.output.value_or(false));
    m_output->setText(!m_state.output ? "RF ?" : *m_state.output ? "RF On" : "RF Off");
}
