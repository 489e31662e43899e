// SPDX-License-Identifier: Apache-2.0
#include "DlgWvFromData.h"

#include "display/QtNumericEdit.h"
#include "jobs/DataImportJob.h"

#include <QCheckBox>
#include <QComboBox>
#include <QFileDialog>
#include <QFileInfo>
#include <QGridLayout>
#include <QGroupBox>
#include <QHBoxLayout>
#include <QLineEdit>
#include <QMessageBox>
#include <QPlainTextEdit>
#include <QPushButton>
#include <QRadioButton>
#include <QSettings>
#include <QSignalBlocker>
#include <QTextEdit>
#include <QVBoxLayout>

namespace {

constexpr qint64 PreviewSamples = 10240;
constexpr char PresetFilter[] = "Settings File (*.ini)";

QComboBox *comboBox(const char *name, const QStringList &items)
{
    auto *box = new QComboBox;
    box->setObjectName(name);
    for (int i = 0; i < items.size(); ++i) {
        box->addItem(items[i], i);
    }
    return box;
}

void select(QComboBox &box, int value)
{
    const int index = box.findData(value);
    box.setCurrentIndex(index >= 0 ? index : box.currentIndex());
}

} // namespace

DlgWvFromData::DlgWvFromData(QWidget *parent)
    : ImportWizard("WvImport", "Create Waveform From Data", parent)
{
    addFilesPage();
    addFormatPage();
    addSharedPages();
    setPreviewSamples(PreviewSamples);
    setUpWizard();
    fillPrecisions();
    enableChoices();
}

void DlgWvFromData::addFilesPage()
{
    QVBoxLayout *column = addPage("page");
    auto *group = new QGroupBox("Input Files");
    auto *grid = new QGridLayout(group);
    addInputRow(*grid, "Select import file 1", "Data File (*.txt *.bin *.wfm *.i)");
    m_useSecond = new QCheckBox("I and Q Stand in Two Files");
    m_useSecond->setObjectName("cb_secin");
    grid->addWidget(m_useSecond, grid->rowCount(), 1);
    m_second = addFileRow(*grid, "File with &Q", "2", "Select import file 2",
                          "Data File (*.txt *.bin *.wfm *.q)");
    column->addWidget(group);
    column->addStretch(1);
    connect(m_useSecond, &QCheckBox::stateChanged, this, &DlgWvFromData::slot_secin);
    connect(m_second, &QLineEdit::textChanged, this, [this] { updateButtons(); });
}

void DlgWvFromData::addFormatPage()
{
    QVBoxLayout *column = addPage("page_2");
    auto *group = new QGroupBox("File Type and Format");
    auto *grid = new QGridLayout(group);
    auto *types = new QWidget;
    types->setObjectName("w_type");
    auto *row = new QHBoxLayout(types);
    row->setContentsMargins({});
    m_text = new QRadioButton("Text");
    m_text->setObjectName("rb_ft_txt");
    m_binary = new QRadioButton("Binary");
    m_binary->setObjectName("rb_ft_bin");
    m_text->setChecked(true);
    row->addWidget(m_text);
    row->addWidget(m_binary);
    row->addStretch(1);
    addRow(*grid, "File Type", types);
    m_format = comboBox("cb_fmt", {"Integer", "Rational", "Hexadecimal"});
    m_endianness = comboBox("cb_end", {"Little-Endian (x86)", "Big-Endian (PPC, Motorola)"});
    m_precision = comboBox("cb_prec", {});
    m_signedness = comboBox("cb_sign", {"Unsigned", "Signed (Two's Complement)"});
    addRow(*grid, "Fo&rmat", m_format, "Kind of the numbers");
    addRow(*grid, "&Byte Order", m_endianness, "Order of the bytes of a number");
    addRow(*grid, "Pre&cision", m_precision, "Width of a number");
    addRow(*grid, "&Sign", m_signedness, "Whether numbers have a sign");
    column->addWidget(group);
    m_head = new QTextEdit;
    m_head->setObjectName("te_preview");
    m_head->setAccessibleName("Start of the file");
    m_head->setReadOnly(true);
    m_head->setFont(QFont("Courier"));
    m_head->setLineWrapMode(QTextEdit::NoWrap);
    column->addWidget(m_head, 1);
    auto *presets = new QHBoxLayout;
    const auto addButton = [this, presets](const char *name, const QString &text,
                                           void (DlgWvFromData::*slot)()) {
        auto *button = new QPushButton(text);
        button->setObjectName(name);
        presets->addWidget(button);
        connect(button, &QPushButton::clicked, this, slot);
    };
    addButton("pb_loadprofile", "Load Predefined Conversion Settings", &DlgWvFromData::slot_Load);
    addButton("pb_saveprofile", "Save Conversion Settings As Preset", &DlgWvFromData::slot_Save);
    presets->addStretch(1);
    column->addLayout(presets);
    connect(m_text, &QRadioButton::toggled, this, &DlgWvFromData::slot_type);
    connect(m_format, &QComboBox::currentIndexChanged, this, &DlgWvFromData::slot_format);
}

void DlgWvFromData::fillPrecisions()
{
    m_precision->clear();
    const auto add = [this](const QString &text, DataPrecision precision) {
        m_precision->addItem(text, static_cast<int>(precision));
    };
    if (m_format->currentData().toInt() == static_cast<int>(DataFormat::Rational)) {
        add("Single (32 Bit)", DataPrecision::Bits32);
        add("Double (64 Bit)", DataPrecision::Bits64);
        return;
    }
    add("8 Bit", DataPrecision::Bits8);
    add("14 Bit", DataPrecision::Bits14);
    add("16 Bit", DataPrecision::Bits16);
    add("32 Bit", DataPrecision::Bits32);
    select(*m_precision, static_cast<int>(DataPrecision::Bits16));
}

void DlgWvFromData::enableChoices()
{
    const bool binary = m_binary->isChecked();
    const bool hex = m_format->currentData().toInt() == static_cast<int>(DataFormat::Hexadecimal);
    m_endianness->setEnabled(binary);
    m_signedness->setEnabled(binary || hex);
    if (!m_signedness->isEnabled()) {
        select(*m_signedness, 1);
    }
}

void DlgWvFromData::slot_type()
{
    fillPrecisions();
    enableChoices();
    showHead();
}

void DlgWvFromData::slot_format(int /*index*/)
{
    fillPrecisions();
    enableChoices();
}

void DlgWvFromData::slot_secin(int /*state*/)
{
    const bool used = m_useSecond->isChecked();
    m_second->setEnabled(used);
    findChild<QPushButton *>("pb_infile2")->setEnabled(used);
    updateButtons();
}

bool DlgWvFromData::startModule(const QString &path)
{
    m_second->clear();
    m_useSecond->setChecked(false);
    slot_secin(0);
    return ImportWizard::startModule(path);
}

/// Guesses the type of the file, and finds the one with the other half of its samples.
void DlgWvFromData::inputChanged()
{
    if (guessData(inputFile(), m_guess)) {
        (m_guess.binary ? m_binary : m_text)->setChecked(true);
        if (!m_guess.partner.isEmpty()) {
            m_second->setText(m_guess.partner);
            m_useSecond->setChecked(true);
        }
    }
    showHead();
}

void DlgWvFromData::showHead()
{
    m_head->setPlainText(previewText(m_guess.head, m_binary->isChecked()));
}

bool DlgWvFromData::isComplete(int page) const
{
    return page > 0 || (QFileInfo(inputFile()).isFile() &&
                        (!m_useSecond->isChecked() || QFileInfo(m_second->text()).isFile()));
}

WvImportJob DlgWvFromData::fillImportJob() const
{
    WvImportJob job;
    job.file1 = inputFile();
    job.file2 = m_second->text();
    job.useFile2 = m_useSecond->isChecked();
    job.binary = m_binary->isChecked();
    job.format.dataFormat = static_cast<DataFormat>(m_format->currentData().toInt());
    job.format.precision = static_cast<DataPrecision>(m_precision->currentData().toInt());
    job.format.isSigned = m_signedness->currentData().toInt() == 1;
    job.format.bigEndian = m_endianness->currentData().toInt() == 1;
    job.scaling = scaling();
    return job;
}

ImportPreset DlgWvFromData::preset() const
{
    const ImportTarget wanted = target();
    return {fillImportJob(), wanted.output.fileName, wanted.output.comment.value_or(QString()),
            wanted.output.copyright.value_or(QString()), wanted.clockHz};
}

void DlgWvFromData::setPreset(const ImportPreset &preset)
{
    const WvImportJob &job = preset.job;
    inputEdit().setText(job.file1);
    m_second->setText(job.file2);
    m_useSecond->setChecked(job.useFile2);
    slot_secin(0);
    (job.binary ? m_binary : m_text)->setChecked(true);
    select(*m_format, static_cast<int>(job.format.dataFormat));
    fillPrecisions();
    select(*m_precision, static_cast<int>(job.format.precision));
    select(*m_endianness, job.format.bigEndian ? 1 : 0);
    select(*m_signedness, job.format.isSigned ? 1 : 0);
    enableChoices();
    setScaling(job.scaling);
    outputEdit().setText(preset.outputFile);
    commentEdit().setPlainText(preset.comment);
    copyrightEdit().setText(preset.copyright);
    clockEdit().setVal(preset.clockHz);
}

void DlgWvFromData::writeFields(QSettings &settings) const
{
    writePreset(settings, preset());
}

void DlgWvFromData::readFields(const QSettings &settings)
{
    ImportPreset stored = preset();
    readPreset(settings, stored);
    setPreset(stored);
}

void DlgWvFromData::slot_Load()
{
    const QString name = QFileDialog::getOpenFileName(this, "Select settings", {}, PresetFilter);
    if (name.isEmpty()) {
        return;
    }
    ImportPreset loaded = preset();
    if (!loadPreset(name, loaded)) {
        QMessageBox::warning(this, windowTitle(), "The settings file cannot be read.\n" + name);
        return;
    }
    // The settings are wanted for the files that were chosen here.
    const ImportPreset present = preset();
    loaded.job.file1 = present.job.file1;
    loaded.job.file2 = present.job.file2;
    loaded.job.useFile2 = present.job.useFile2;
    loaded.outputFile = present.outputFile;
    setPreset(loaded);
}

void DlgWvFromData::slot_Save()
{
    QString name = QFileDialog::getSaveFileName(this, "Save Settings", {}, PresetFilter);
    if (name.isEmpty()) {
        return;
    }
    if (!name.endsWith(".ini", Qt::CaseInsensitive)) {
        name += ".ini";
    }
    if (!savePreset(name, preset())) {
        QMessageBox::warning(this, windowTitle(), "The settings file cannot be written.\n" + name);
    }
}

void DlgWvFromData::previewMade(const ImportJob &job)
{
    const auto &imported = static_cast<const DataImportJob &>(job);
    if (!isNewSource(inputFile())) {
        return;
    }
    if (imported.clockHz() != clockEdit().getVal()) {
        proposeClock(imported.clockHz());
    }
    if (!imported.tags().comment.isEmpty()) {
        commentEdit().setPlainText(imported.tags().comment);
    }
    if (!imported.tags().copyright.isEmpty()) {
        copyrightEdit().setText(imported.tags().copyright);
    }
}

std::unique_ptr<ImportJob> DlgWvFromData::makeImportJob() const
{
    DataImportRequest request;
    request.input = fillImportJob();
    request.target = target();
    // On the way to the output page the file proposes a clock; from there the field counts.
    request.clockFromFile = currentPage() < outputPage();
    return std::make_unique<DataImportJob>(request);
}
