// SPDX-License-Identifier: Apache-2.0
#include "DlgWvSettings.h"

#include "formfields.h"

#include "composer/wholenumbers.h"
#include "wvfile/WvTypes.h"

#include <QButtonGroup>
#include <QFileDialog>
#include <QGroupBox>
#include <QLabel>
#include <QRadioButton>
#include <QVBoxLayout>

#include <algorithm>

namespace {

constexpr double MaxPlayTime = 3600.0; ///< s
constexpr double LeastClockHz = 100.0;

QRadioButton *addChoice(const char *objectName, const char *text, QWidget *parent,
                        QButtonGroup *group)
{
    auto *button = named(objectName, new QRadioButton(QString::fromLatin1(text), parent));
    group->addButton(button);
    return button;
}

} // namespace

DlgWvSettings::DlgWvSettings(const Composition &composition, QWidget *parent)
    : QDialog(parent)
    , m_target(composition.target)
{
    setWindowTitle(QStringLiteral("Target Waveform Settings"));
    auto *layout = new QVBoxLayout(this);
    layout->addWidget(clockGroup());
    layout->addWidget(lengthGroup());
    layout->addWidget(fileGroup());
    layout->addStretch(1);
    layout->addWidget(makeButtons(this));
    showTarget();
    connect(le_targetsamples, &QtNumericEdit::valueUpdated, this,
            &DlgWvSettings::slot_change_samples);
    connect(le_playtime, &QtNumericEdit::valueUpdated, this, &DlgWvSettings::slot_change_playtime);
    connect(le_clockrate, &QtNumericEdit::valueUpdated, this,
            &DlgWvSettings::slot_change_clockrate);
    resize(520, sizeHint().height());
}

QWidget *DlgWvSettings::clockGroup()
{
    auto *box = new QGroupBox(QStringLiteral("Clock"), this);
    auto *group = new QButtonGroup(box);
    rb_highest = addChoice("rb_highest", "Highest of All Segments", box, group);
    rb_fixed = addChoice("rb_fixed", "User Defined", box, group);
    le_clockrate = makeField({"le_clockrate", "User Defined Target Clock Rate", "Hz", LeastClockHz,
                              MaxClockHz, std::max(m_target.dUsrClk / 10, 1.0), 6, true},
                             box);
    auto *layout = new QFormLayout(box);
    layout->addRow(rb_highest);
    layout->addRow(rb_fixed, le_clockrate);
    connect(rb_fixed, &QRadioButton::toggled, this, &DlgWvSettings::updateEnabled);
    return box;
}

QWidget *DlgWvSettings::lengthGroup()
{
    auto *box = new QGroupBox(QStringLiteral("Length"), this);
    auto *modes = new QButtonGroup(box);
    rb_longesttrack = addChoice("rb_longesttrack", "Longest Track Wins", box, modes);
    rb_longestsegment = addChoice("rb_longestsegment", "Longest Segment Wins", box, modes);
    rb_user = addChoice("rb_user", "User Defined", box, modes);
    l_explanation = named("l_explanation", new QLabel(box));
    l_explanation->setWordWrap(true);
    auto *units = new QButtonGroup(box);
    rb_samples = addChoice("rb_samples", "Samples", box, units);
    rb_playtime = addChoice("rb_playtime", "Time", box, units);
    le_targetsamples = makeField({"le_targetsamples", "Number Of Samples in Target Waveform", "", 0,
                                  static_cast<double>(MaxSamples), 1, 6},
                                 box);
    le_playtime = makeField(
        {"le_playtime", "Play Time Of Target Waveform", "s", 0, MaxPlayTime, 1e6, 6, true}, box);
    auto *layout = new QFormLayout(box);
    layout->addRow(rb_longesttrack);
    layout->addRow(rb_longestsegment);
    layout->addRow(rb_user);
    layout->addRow(l_explanation);
    layout->addRow(rb_samples, le_targetsamples);
    layout->addRow(rb_playtime, le_playtime);
    for (QRadioButton *button : {rb_longesttrack, rb_longestsegment, rb_user, rb_samples}) {
        connect(button, &QRadioButton::toggled, this, &DlgWvSettings::updateEnabled);
    }
    return box;
}

QWidget *DlgWvSettings::fileGroup()
{
    auto *box = new QGroupBox(QStringLiteral("Target File"), this);
    le_file = named("le_file", new QLineEdit(box));
    le_file->setAccessibleName(QStringLiteral("Target File"));
    auto *button = named("pb_browse", new QPushButton(QStringLiteral("..."), box));
    button->setAutoDefault(false);
    auto *layout = new QHBoxLayout(box);
    layout->addWidget(le_file, 1);
    layout->addWidget(button);
    connect(button, &QPushButton::clicked, this, &DlgWvSettings::browse);
    return box;
}

void DlgWvSettings::showTarget()
{
    (m_target.bClk ? rb_highest : rb_fixed)->setChecked(true);
    le_clockrate->setVal(m_target.dUsrClk);
    switch (m_target.iLenMode) {
    case LongestTrackWins:
        rb_longesttrack->setChecked(true);
        break;
    case LongestSegmentWins:
        rb_longestsegment->setChecked(true);
        break;
    default:
        rb_user->setChecked(true);
    }
    (m_target.bSamples ? rb_samples : rb_playtime)->setChecked(true);
    le_targetsamples->setVal(m_target.lSamples);
    le_playtime->setVal(m_target.dTime);
    le_file->setText(m_target.sName);
    updateEnabled();
}

void DlgWvSettings::updateEnabled()
{
    const bool user = rb_user->isChecked();
    le_clockrate->setEnabled(rb_fixed->isChecked());
    rb_samples->setEnabled(user);
    rb_playtime->setEnabled(user);
    le_targetsamples->setEnabled(user && rb_samples->isChecked());
    le_playtime->setEnabled(user && rb_playtime->isChecked());
    if (rb_longesttrack->isChecked()) {
        l_explanation->setText(QStringLiteral(
            "The end position of the longest track determines the target waveform length."));
    } else if (rb_longestsegment->isChecked()) {
        l_explanation->setText(QStringLiteral(
            "The end position of the longest segment determines the target waveform length."));
    } else {
        l_explanation->setText(
            QStringLiteral("The target waveform length is defined by the user."));
    }
}

void DlgWvSettings::slot_change_samples(double samples)
{
    m_target.lSamples = wholePart(samples);
    m_target.dTime = samples / m_target.dUsrClk;
    le_playtime->setVal(m_target.dTime);
}

void DlgWvSettings::slot_change_playtime(double seconds)
{
    m_target.dTime = seconds;
    m_target.lSamples = wholePart(seconds * m_target.dUsrClk);
    le_targetsamples->setVal(m_target.lSamples);
}

void DlgWvSettings::slot_change_clockrate(double clockHz)
{
    m_target.dTime *= clockHz / m_target.dUsrClk;
    m_target.lSamples = wholePart(m_target.dTime * clockHz);
    m_target.dUsrClk = clockHz;
    le_playtime->setVal(m_target.dTime);
    le_targetsamples->setVal(m_target.lSamples);
}

void DlgWvSettings::browse()
{
    const QString name = QFileDialog::getSaveFileName(
        this, QStringLiteral("Target File"), le_file->text(), QStringLiteral("Waveform (*.wv)"),
        nullptr, QFileDialog::DontConfirmOverwrite);
    if (!name.isEmpty()) {
        le_file->setText(name);
    }
}

void DlgWvSettings::accept()
{
    takeTypedValues(*this);
    m_target.bClk = rb_highest->isChecked();
    m_target.iLenMode = rb_longesttrack->isChecked()     ? LongestTrackWins
                        : rb_longestsegment->isChecked() ? LongestSegmentWins
                                                         : UserDefinedLength;
    m_target.bSamples = rb_samples->isChecked();
    m_target.sName = le_file->text();
    QDialog::accept();
}
