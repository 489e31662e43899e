// SPDX-License-Identifier: Apache-2.0
#include "EditWizard.h"

#include "base/EngineeringNumber.h"
#include "log/Tracer.h"
#include "toolframe/toolpages.h"
#include "wvfile/HvFileIO.h"

#include <QLabel>
#include <QLineEdit>
#include <QPlainTextEdit>
#include <QPushButton>
#include <QSettings>

#include <utility>

EditWizard::EditWizard(Frame frame, QString suffix, QWidget *parent)
    : ToolWizard(std::move(frame), parent)
    , m_suffix(std::move(suffix))
{
}

void EditWizard::setUpEditWizard(const QString &targetTitle)
{
    setUpWizard();
    connect(findChild<QPushButton *>("pb_infile"), &QPushButton::clicked, this,
            &EditWizard::chooseSource);
    auto *output = findChild<QLineEdit *>("le_outfile");
    connect(findChild<QPushButton *>("pb_outfile"), &QPushButton::clicked, this,
            [this, output, title = targetTitle.isEmpty() ? waveformTitle() : targetTitle] {
                chooseTargetFile(this, *output, title);
            });
}

bool EditWizard::startModule(const QString &path)
{
    if (!loadSource(path)) {
        return false;
    }
    showPage(0);
    return true;
}

QString EditWizard::sourceFile() const
{
    return findChild<QLineEdit *>("le_infile")->text();
}

bool EditWizard::isComplete(int /*page*/) const
{
    return hasSource();
}

void EditWizard::writeFields(QSettings &settings) const
{
    settings.setValue("infile", sourceFile());
}

void EditWizard::readFields(const QSettings &settings)
{
    findChild<QLineEdit *>("le_infile")->setText(settings.value("infile").toString());
}

bool EditWizard::loadSource(const QString &fileName)
{
    WvFileSummary summary;
    HvFileIO file;
    if (!file.readWaveformInfo(fileName, &summary) || summary.clock <= 0 || summary.samples < 1) {
        return Tracer::fail("Cannot read waveform information.");
    }
    m_sourceClockHz = summary.clock;
    m_sourceSamples = summary.samples;
    findChild<QLineEdit *>("le_infile")->setText(fileName);
    findChild<QLabel *>("l_src_clock")->setText(engineeringText(m_sourceClockHz, "Hz"));
    findChild<QLabel *>("l_src_samples")->setText(QString::number(m_sourceSamples));
    findChild<QLineEdit *>("le_outfile")->setText(fileNameWithSuffix(fileName, m_suffix));
    findChild<QPlainTextEdit *>("te_comment")->setPlainText(summary.comment);
    findChild<QLineEdit *>("le_copyright")->setText(summary.copyright);
    sourceChanged();
    updateButtons();
    return true;
}

void EditWizard::chooseSource()
{
    auto *field = findChild<QLineEdit *>("le_infile");
    const QString before = field->text();
    if (chooseSourceFile(this, *field) && !loadSource(field->text())) {
        field->setText(before);
    }
}
