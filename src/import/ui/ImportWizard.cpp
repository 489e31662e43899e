// SPDX-License-Identifier: Apache-2.0
#include "ImportWizard.h"

#include "ContentTree.h"

#include "display/CWidgetConstellation.h"
#include "display/CWidgetIQTrace.h"
#include "display/CWidgetSpectrum.h"
#include "display/QtNumericEdit.h"
#include "toolframe/toolpages.h"

#include <QFileDialog>
#include <QFileInfo>
#include <QGridLayout>
#include <QGroupBox>
#include <QHBoxLayout>
#include <QLabel>
#include <QLineEdit>
#include <QPlainTextEdit>
#include <QPushButton>
#include <QRadioButton>
#include <QSettings>
#include <QStackedWidget>
#include <QTextEdit>
#include <QVBoxLayout>

#include <algorithm>

namespace {

constexpr QPoint StartPosition(200, 140);
constexpr QSize StartSize(760, 560);

template <typename Widget>
Widget *named(const char *name)
{
    auto *widget = new Widget;
    widget->setObjectName(name);
    return widget;
}

constexpr int PlotHeight = 120;

} // namespace

ImportWizard::ImportWizard(const QString &settingsGroup, const QString &title, QWidget *parent)
    : ToolWizard({.settingsGroup = settingsGroup,
                  .position = StartPosition,
                  .size = StartSize,
                  .abortedText = "Import aborted"},
                 parent)
    , m_stack(named<QStackedWidget>("sw_assist"))
{
    setWindowTitle(title);
    resize(StartSize);
    auto *column = new QVBoxLayout(this);
    column->addWidget(m_stack, 1);
    auto *buttons = new QHBoxLayout;
    const auto addButton = [buttons](const char *name, const QString &text) {
        auto *button = named<QPushButton>(name);
        button->setText(text);
        buttons->addWidget(button);
    };
    buttons->addStretch(1);
    addButton("pb_prev", "&Previous");
    addButton("pb_next", "&Next");
    addButton("cb_close", "Close");
    column->addLayout(buttons);
}

QVBoxLayout *ImportWizard::addPage(const QString &name)
{
    auto *page = new QWidget;
    page->setObjectName(name);
    m_stack->addWidget(page);
    return new QVBoxLayout(page);
}

void ImportWizard::addRow(QGridLayout &grid, const QString &label, QWidget *field,
                          const QString &toolTip)
{
    const int row = grid.rowCount();
    auto *title = new QLabel(label);
    title->setObjectName("t_" + field->objectName());
    title->setBuddy(field);
    if (!toolTip.isEmpty()) {
        field->setToolTip(toolTip);
    }
    grid.addWidget(title, row, 0);
    grid.addWidget(field, row, 1, 1, 2);
}

QVBoxLayout *ImportWizard::addInputPage(const QString &dialogTitle, const QString &filter)
{
    QVBoxLayout *column = addPage("page");
    auto *group = new QGroupBox("Input File");
    addInputRow(*new QGridLayout(group), dialogTitle, filter);
    column->addWidget(group);
    return column;
}

ContentTree *ImportWizard::addContentTree(QVBoxLayout &column)
{
    auto *tree = named<ContentTree>("tw_content");
    column.addWidget(tree, 1);
    connect(tree, &ContentTree::checkChanged, this, [this] { updateButtons(); });
    return tree;
}

QtNumericEdit *ImportWizard::addFact(QGridLayout &grid, const char *name, const QString &title,
                                     const QString &unit, double min, double max)
{
    auto *edit = new QtNumericEdit;
    edit->setObjectName(name);
    edit->setReadOnly(true);
    edit->setName(title);
    edit->setUnit(unit);
    edit->setScaled(!unit.isEmpty());
    edit->setLowerPrefix(unit == "s");
    edit->setMax(max);
    edit->setMin(min);
    addRow(grid, title, edit);
    return edit;
}

QLineEdit *ImportWizard::addFileRow(QGridLayout &grid, const QString &label, const QString &number,
                                    const QString &dialogTitle, const QString &filter)
{
    auto *field = new QLineEdit;
    field->setObjectName("le_infile" + number);
    addRow(grid, label, field, "File to read");
    const int row = grid.rowCount() - 1;
    grid.removeWidget(field);
    grid.addWidget(field, row, 1);
    auto *button = new QPushButton("Browse...");
    button->setObjectName("pb_infile" + number);
    button->setToolTip("Choose the file to read");
    grid.addWidget(button, row, 2);
    connect(button, &QPushButton::clicked, this, [this, field, dialogTitle, filter] {
        const QString name = QFileDialog::getOpenFileName(this, dialogTitle, field->text(), filter);
        if (!name.isEmpty()) {
            field->setText(name);
            emit field->editingFinished();
        }
    });
    return field;
}

void ImportWizard::addInputRow(QGridLayout &grid, const QString &dialogTitle, const QString &filter)
{
    m_input = addFileRow(grid, "&File", "1", dialogTitle, filter);
    connect(m_input, &QLineEdit::editingFinished, this, &ImportWizard::slot_infile1);
}

void ImportWizard::addSharedPages()
{
    addPreviewPage();
    addOutputPage();
    addStatusPage();
}

void ImportWizard::addPreviewPage()
{
    QVBoxLayout *column = addPage(QString("page_%1").arg(m_stack->count() + 1));
    m_trace = named<CWidgetIQTrace>("w_iq");
    m_spectrum = named<CWidgetSpectrum>("w_spectrum");
    m_constellation = named<CWidgetConstellation>("w_constellation");
    m_trace->setMinimumHeight(PlotHeight);
    m_spectrum->setMinimumHeight(PlotHeight);
    m_constellation->setMinimumHeight(PlotHeight);
    m_trace->setView(0);
    m_spectrum->setView(0);
    auto *plots = new QHBoxLayout;
    plots->addWidget(m_spectrum, 3);
    plots->addWidget(m_constellation, 2);
    column->addWidget(m_trace, 1);
    column->addLayout(plots, 1);
    m_info = named<QLabel>("l_info");
    column->addWidget(m_info);
    auto *group = new QGroupBox("Level Scaling");
    auto *row = new QHBoxLayout(group);
    const auto addChoice = [this, row](const char *name, const QString &text) {
        auto *button = named<QRadioButton>(name);
        button->setText(text);
        row->addWidget(button);
        connect(button, &QRadioButton::clicked, this, &ImportWizard::slot_scaling);
        return button;
    };
    m_noScaling = addChoice("rb_sc_no", "Do Not Scale,\nClip if Required");
    m_scaleDown = addChoice("rb_sc_up", "Only Scale Down,\nif Required");
    m_autoScaling = addChoice("rb_sc_auto", "Full Auto Scaling");
    m_scaleDown->setChecked(true);
    column->addWidget(group);
}

void ImportWizard::addOutputPage()
{
    QVBoxLayout *column = addPage(QString("page_%1").arg(m_stack->count() + 1));
    auto *group = new QGroupBox("Output File");
    auto *grid = new QGridLayout(group);
    m_output = named<QLineEdit>("le_outfile");
    addRow(*grid, "&File", m_output, "Waveform file to write");
    grid->removeWidget(m_output);
    grid->addWidget(m_output, grid->rowCount() - 1, 1);
    auto *browse = named<QPushButton>("pb_outfile");
    browse->setText("&Browse...");
    browse->setToolTip("Choose the file to write");
    grid->addWidget(browse, grid->rowCount() - 1, 2);
    connect(browse, &QPushButton::clicked, this, &ImportWizard::slot_outfile);
    m_comment = named<QPlainTextEdit>("te_comment");
    m_comment->setTabChangesFocus(true);
    constexpr int CommentHeight = 90;
    m_comment->setMaximumHeight(CommentHeight);
    addRow(*grid, "Co&mment", m_comment, "Comment of the file");
    m_copyright = named<QLineEdit>("le_copyright");
    addRow(*grid, "C&opyright", m_copyright, "Copyright note of the file");
    m_clock = named<QtNumericEdit>("le_clockrate");
    m_clock->setName("ARB Clockrate");
    m_clock->setUnit("Hz");
    m_clock->setScaled(true);
    m_clock->setPrecision(6);
    m_clock->setMax(ImportTarget::MaxClockHz);
    m_clock->setMin(ImportTarget::MinClockHz);
    m_clock->setStep(1e6);
    m_clock->setVal(ImportTarget().clockHz);
    addRow(*grid, "&Clock Rate", m_clock);
    column->addWidget(group);
    column->addStretch(1);
}

void ImportWizard::addStatusPage()
{
    QVBoxLayout *column = addPage(QString("page_%1").arg(m_stack->count() + 1));
    auto *report = named<QTextEdit>("te_result");
    report->setReadOnly(true);
    column->addWidget(report);
}

bool ImportWizard::startModule(const QString &path)
{
    QString name = path;
    name.replace('\\', '/');
    m_input->setText(name);
    const QFileInfo info(name);
    m_output->setText(info.path() + '/' + info.completeBaseName() + ".wv");
    m_source.clear();
    m_shownInput.clear();
    showPage(0);
    slot_infile1();
    return true;
}

/// The field has lost the focus, too, where its name stays: what was checked in the file stays.
void ImportWizard::slot_infile1()
{
    if (m_input->text() == m_shownInput) {
        return;
    }
    m_shownInput = m_input->text();
    showProblem({});
    inputChanged();
    updateButtons();
}

void ImportWizard::slot_outfile()
{
    chooseTargetFile(this, *m_output);
}

void ImportWizard::slot_scaling()
{
    if (currentPage() == previewPage()) {
        static_cast<void>(preview());
    }
}

void ImportWizard::previewMade(const ImportJob & /*job*/) {}

int ImportWizard::pageAfter(int page)
{
    return page + 1 == previewPage() && !preview() ? page : page + 1;
}

bool ImportWizard::preview()
{
    m_trace->clear();
    m_spectrum->clear();
    m_constellation->clear();
    m_info->clear();
    const std::unique_ptr<ImportJob> job = makeImportJob();
    job->setPreview(m_previewSamples);
    QString words;
    connect(job.get(), &ToolJob::report, this, [&words](const ReportLine &line) {
        words = line.kind == ReportLine::Kind::Text ? line.text : words;
    });
    if (runInPlace(*job) != JobOutcome::Finished) {
        if (!words.isEmpty()) {
            showProblem(words);
        }
        return false;
    }
    previewMade(*job);
    const IqList &samples = job->preview();
    m_trace->setClock(m_clock->getVal());
    m_trace->setData(samples);
    m_spectrum->setClock(m_clock->getVal());
    m_spectrum->setData(samples);
    m_constellation->setData(samples);
    m_info->setText(QString("%1 samples evaluated.").arg(samples.size()));
    return true;
}

ImportTarget ImportWizard::target() const
{
    ImportTarget target;
    target.output = outputOptions();
    target.clockHz = m_clock->getVal();
    target.scaling = scaling();
    return target;
}

QString ImportWizard::inputFile() const
{
    return m_input->text();
}

ImportScaling ImportWizard::scaling() const
{
    if (m_noScaling->isChecked()) {
        return ImportScaling::None;
    }
    return m_autoScaling->isChecked() ? ImportScaling::Auto : ImportScaling::Down;
}

void ImportWizard::setScaling(ImportScaling scaling)
{
    m_noScaling->setChecked(scaling == ImportScaling::None);
    m_scaleDown->setChecked(scaling == ImportScaling::Down);
    m_autoScaling->setChecked(scaling == ImportScaling::Auto);
}

bool ImportWizard::isNewSource(const QString &source)
{
    const bool isNew = source != m_source;
    m_source = source;
    return isNew;
}

void ImportWizard::proposeClock(double clockHz)
{
    m_clock->setVal(std::clamp(clockHz, ImportTarget::MinClockHz, ImportTarget::MaxClockHz));
}

std::unique_ptr<ToolJob> ImportWizard::makeJob() const
{
    return makeImportJob();
}

void ImportWizard::writeFields(QSettings &settings) const
{
    settings.setValue("infile1", inputFile());
    settings.setValue("scaling", static_cast<int>(scaling()));
    settings.setValue("outfile", m_output->text());
    settings.setValue("comment", m_comment->toPlainText());
    settings.setValue("copyright", m_copyright->text());
    settings.setValue("clock", m_clock->getVal());
}

void ImportWizard::readFields(const QSettings &settings)
{
    m_input->setText(settings.value("infile1", inputFile()).toString());
    const int stored = settings.value("scaling", static_cast<int>(scaling())).toInt();
    if (stored >= 0 && stored <= static_cast<int>(ImportScaling::Auto)) {
        setScaling(static_cast<ImportScaling>(stored));
    }
    m_output->setText(settings.value("outfile", m_output->text()).toString());
    m_comment->setPlainText(settings.value("comment").toString());
    m_copyright->setText(settings.value("copyright").toString());
    m_clock->setVal(settings.value("clock", m_clock->getVal()).toDouble());
}
