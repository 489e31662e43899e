// SPDX-License-Identifier: Apache-2.0
#include "DlgWvEdit.h"

#include "formfields.h"

#include "composer/wholenumbers.h"
#include "wvfile/HvFileIO.h"

#include <QCheckBox>
#include <QFileDialog>
#include <QLabel>
#include <QRadioButton>
#include <QTabWidget>
#include <QVBoxLayout>

#include <algorithm>

namespace {

/// Lets the fields of a page stand at its top.
QWidget *page(QLayout *content)
{
    auto *widget = new QWidget;
    auto *layout = new QVBoxLayout(widget);
    layout->addLayout(content);
    layout->addStretch(1);
    return widget;
}

QComboBox *makeShapes(const char *objectName, QWidget *parent)
{
    auto *box = named(objectName, new QComboBox(parent));
    box->addItems({QStringLiteral("Linear"), QStringLiteral("Raised Cosine"),
                   QStringLiteral("Square Root"), QStringLiteral("Blank")});
    return box;
}

} // namespace

DlgWvEdit::DlgWvEdit(const ComposerSegment &segment, const SegmentBorders &starts,
                     const Composition &composition, QWidget *parent)
    : QDialog(parent)
    , m_segment(segment)
    , m_starts(starts)
    , m_composition(composition)
    , le_file(named("le_file", new QLineEdit(this)))
{
    auto *tabs = new QTabWidget(this);
    tabs->addTab(generalPage(), QStringLiteral("General"));
    tabs->addTab(truncationPage(), QStringLiteral("Truncation"));
    tabs->addTab(positionPage(), QStringLiteral("Position in Output"));
    tabs->addTab(fadingPage(), QStringLiteral("Fading"));
    tabs->addTab(flagsPage(), QStringLiteral("Flags"));
    auto *browseButton = named("pb_browse", new QPushButton(QStringLiteral("..."), this));
    browseButton->setToolTip(QStringLiteral("Select waveform file"));
    browseButton->setAutoDefault(false);
    auto *file = new QHBoxLayout;
    file->addWidget(new QLabel(QStringLiteral("Source File"), this));
    le_file->setAccessibleName(QStringLiteral("Waveform file"));
    file->addWidget(le_file, 1);
    file->addWidget(browseButton);
    auto *layout = new QVBoxLayout(this);
    layout->addLayout(file);
    layout->addWidget(tabs, 1);
    layout->addWidget(makeButtons(this));
    connect(browseButton, &QPushButton::clicked, this, &DlgWvEdit::browse);
    connect(le_file, &QLineEdit::editingFinished, this, [this] {
        if (le_file->text() != m_segment.sName) {
            takeFile(le_file->text());
        }
    });
    showSegment();
    resize(560, 320);
}

QWidget *DlgWvEdit::generalPage()
{
    le_levoffset = makeField({"le_levoffset", "Level Offset", "dB", 0, 100, 1, 2}, this);
    le_freqoffset =
        makeField({"le_freqoffset", "Frequency Offset", "Hz", -1e8, 1e8, 1e6, 6, true}, this);
    le_fofsdev = makeField(
        {"le_fofsdev", "Maximum Permissible Deviation in Percent", "%", 0, 100, 1, 3}, this);
    cb_fofsdev = named(
        "cb_fofsdev",
        new QCheckBox(QStringLiteral("Allow Frequency Offset Adjustments to Solve Wrap Around "
                                     "Problems"),
                      this));
    connect(cb_fofsdev, &QCheckBox::toggled, le_fofsdev, &QWidget::setEnabled);
    auto *form = new QFormLayout;
    form->addRow(QStringLiteral("Attenuation"), le_levoffset);
    form->addRow(QStringLiteral("Freq. Offset"), le_freqoffset);
    form->addRow(cb_fofsdev);
    form->addRow(QStringLiteral("Allow Deviation"), le_fofsdev);
    return page(form);
}

QWidget *DlgWvEdit::truncationPage()
{
    le_startsample =
        makeField({"le_startsample", "Start Sample in Source File", "", 0, 0, 1, 6}, this);
    le_usedsamples = makeField(
        {"le_usedsamples", "Number of Samples Used From Source File", "", 1, 1, 1, 6}, this);
    // The one gives the room of the other; fields that are set by a program send nothing.
    connect(le_startsample, &QtNumericEdit::valueUpdated, this, &DlgWvEdit::limitUsedSamples);
    connect(le_usedsamples, &QtNumericEdit::valueUpdated, this, &DlgWvEdit::limitUsedSamples);
    auto *form = new QFormLayout;
    form->addRow(QStringLiteral("First Sample"), le_startsample);
    form->addRow(QStringLiteral("Last Sample"), le_usedsamples);
    auto *hint = new QLabel(QStringLiteral("The last sample is counted from the first one on: it "
                                           "is the number of samples used."),
                            this);
    hint->setWordWrap(true);
    form->addRow(hint);
    return page(form);
}

QWidget *DlgWvEdit::positionPage()
{
    le_pos_sample =
        makeField({"le_pos_sample", "Start Sample in Target Waveform", "", 0, 0, 1, 6}, this);
    le_pos_time =
        makeField({"le_pos_time", "Start Time in Target Waveform", "s", 0, 0, 1, 6, true}, this);
    connect(le_pos_sample, &QtNumericEdit::valueUpdated, this,
            [this](double sample) { le_pos_time->setVal(sample / m_composition.target.dUsrClk); });
    connect(le_pos_time, &QtNumericEdit::valueUpdated, this, [this](double seconds) {
        le_pos_sample->setVal(wholePart(seconds * m_composition.target.dUsrClk + 0.5));
    });
    auto *form = new QFormLayout;
    form->addRow(QStringLiteral("Start Sample"), le_pos_sample);
    form->addRow(QStringLiteral("Start Time"), le_pos_time);
    return page(form);
}

QWidget *DlgWvEdit::fadingPage()
{
    le_fadein = makeField({"le_fadein", "Fade-In Time", "s", 0, 0, 1, 6, true}, this);
    le_fadeout = makeField({"le_fadeout", "Fade-Out Time", "s", 0, 0, 1, 6, true}, this);
    cb_fadein = makeShapes("cb_fadein", this);
    cb_fadeout = makeShapes("cb_fadeout", this);
    auto *form = new QFormLayout;
    form->addRow(QStringLiteral("Fade In Time"), le_fadein);
    form->addRow(QStringLiteral("Fade In Shape"), cb_fadein);
    form->addRow(QStringLiteral("Fade Out Time"), le_fadeout);
    form->addRow(QStringLiteral("Fade Out Shape"), cb_fadeout);
    return page(form);
}

QWidget *DlgWvEdit::flagsPage()
{
    rb_truncate = named("rb_truncate", new QRadioButton(QStringLiteral("Truncate"), this));
    rb_wraparound = named("rb_wraparound", new QRadioButton(QStringLiteral("Wrap Around"), this));
    cb_markers = named("cb_markers", new QCheckBox(QStringLiteral("Use Markers"), this));
    auto *layout = new QVBoxLayout;
    layout->addWidget(
        new QLabel(QStringLiteral("What runs past the end of the target waveform:"), this));
    layout->addWidget(rb_truncate);
    layout->addWidget(rb_wraparound);
    layout->addSpacing(8);
    layout->addWidget(cb_markers);
    return page(layout);
}

void DlgWvEdit::showSegment()
{
    const double clockHz = m_composition.target.dUsrClk;
    le_file->setText(m_segment.sName);
    le_levoffset->setVal(m_segment.dLOfs);
    le_freqoffset->setVal(m_segment.dFOfs);
    le_fofsdev->setVal(m_segment.dAdjLim);
    cb_fofsdev->setChecked(m_segment.bAdjOfs);
    le_fofsdev->setEnabled(m_segment.bAdjOfs);
    const auto samples = static_cast<double>(std::max<qint64>(m_segment.lSamples, 1));
    le_startsample->setMax(samples - 1);
    le_usedsamples->setMax(samples);
    le_startsample->setVal(m_segment.lStart);
    le_usedsamples->setVal(m_segment.lUsed);
    limitUsedSamples();
    le_pos_sample->setMax(static_cast<double>(m_starts.last));
    le_pos_sample->setMin(static_cast<double>(m_starts.first));
    le_pos_time->setMax(static_cast<double>(m_starts.last) / clockHz);
    le_pos_time->setMin(static_cast<double>(m_starts.first) / clockHz);
    le_pos_sample->setVal(m_segment.lTarget);
    le_pos_time->setVal(static_cast<double>(m_segment.lTarget) / clockHz);
    const double length =
        m_segment.dSrcClk > 0 ? static_cast<double>(m_segment.lUsed) / m_segment.dSrcClk : 0;
    le_fadein->setMax(length);
    le_fadeout->setMax(length);
    le_fadein->setVal(m_segment.dFadeIn);
    le_fadeout->setVal(m_segment.dFadeOut);
    cb_fadein->setCurrentIndex(m_segment.iFadeIn);
    cb_fadeout->setCurrentIndex(m_segment.iFadeOut);
    (m_segment.bWrap ? rb_wraparound : rb_truncate)->setChecked(true);
    cb_markers->setChecked(m_segment.bMkr);
}

void DlgWvEdit::limitUsedSamples()
{
    const auto samples = static_cast<double>(m_segment.lSamples);
    le_usedsamples->setMax(std::max(samples - le_startsample->getVal(), 1.0));
    const double length = m_segment.dSrcClk > 0 ? le_usedsamples->getVal() / m_segment.dSrcClk : 0;
    le_fadein->setMax(length);
    le_fadeout->setMax(length);
}

void DlgWvEdit::browse()
{
    const QString name =
        QFileDialog::getOpenFileName(this, QStringLiteral("Select waveform file"), m_segment.sName,
                                     QStringLiteral("Waveform File (*.wv)"));
    if (!name.isEmpty()) {
        takeFile(name);
    }
}

void DlgWvEdit::takeFile(const QString &name)
{
    takeTypedValues(*this);
    m_segment.sName = name;
    le_file->setText(name);
    WvFileSummary summary;
    // The render compares these with the file; without one they stay as they were.
    if (HvFileIO().readWaveformInfo(name, &summary) && summary.samples > 0 && summary.clock > 0) {
        m_segment.lSamples = summary.samples;
        m_segment.dSrcClk = summary.clock;
        le_startsample->setMax(static_cast<double>(summary.samples - 1));
        limitUsedSamples();
    }
}

void DlgWvEdit::accept()
{
    takeTypedValues(*this);
    m_segment.sName = le_file->text();
    m_segment.bMkr = cb_markers->isChecked();
    m_segment.bWrap = rb_wraparound->isChecked();
    m_segment.dLOfs = le_levoffset->getVal();
    m_segment.dFOfs = le_freqoffset->getVal();
    m_segment.lStart = le_startsample->getValInt();
    m_segment.lUsed = le_usedsamples->getValInt();
    m_segment.lTarget = le_pos_sample->getValInt();
    m_segment.dFadeIn = le_fadein->getVal();
    m_segment.dFadeOut = le_fadeout->getVal();
    m_segment.iFadeIn = cb_fadein->currentIndex();
    m_segment.iFadeOut = cb_fadeout->currentIndex();
    m_segment.bAdjOfs = cb_fofsdev->isChecked();
    m_segment.dAdjLim = le_fofsdev->getVal();
    QDialog::accept();
}
