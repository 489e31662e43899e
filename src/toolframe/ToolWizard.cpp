// SPDX-License-Identifier: Apache-2.0
#include "ToolWizard.h"

#include "appearance/lineicon.h"
#include "jobs/ReportText.h"
#include "log/Tracer.h"
#include "questions.h"
#include "runjob.h"
#include "windowplace.h"

#include <QBoxLayout>
#include <QFileDialog>
#include <QFileInfo>
#include <QLabel>
#include <QLineEdit>
#include <QMenu>
#include <QMessageBox>
#include <QPlainTextEdit>
#include <QPushButton>
#include <QRegularExpression>
#include <QScopedValueRollback>
#include <QSettings>
#include <QStackedWidget>
#include <QTextEdit>

#include <algorithm>
#include <utility>
#include <vector>

namespace {

QString presetFilter()
{
    return "Settings File (*.ini)";
}

} // namespace

ToolWizard::ToolWizard(Frame frame, QWidget *parent)
    : DlgBase(parent)
    , m_frame(std::move(frame))
{
}

void ToolWizard::setUpWizard()
{
    m_pages = findChild<QStackedWidget *>("sw_assist");
    m_next = findChild<QPushButton *>("pb_next");
    m_previous = findChild<QPushButton *>("pb_prev");
    m_close = findChild<QPushButton *>("cb_close");
    m_report = findChild<QTextEdit *>("te_result");
    Q_ASSERT(m_pages && m_next && m_previous && m_close && m_report);
    m_report->setAccessibleName("Report");
    limitTagTexts();
    addPresetMenu();
    addResultButtons();
    addProblemLine();
    connect(m_next, &QPushButton::clicked, this, &ToolWizard::goOn);
    connect(m_previous, &QPushButton::clicked, this, &ToolWizard::goBack);
    m_close->setIcon(lineIcon("close"));
    connect(m_close, &QPushButton::clicked, this, &ToolWizard::reject);
    showPage(0);
}

/// A file can't be read with longer texts, nor with line breaks in them.
void ToolWizard::limitTagTexts()
{
    if (auto *copyright = findChild<QLineEdit *>("le_copyright")) {
        copyright->setMaxLength(static_cast<int>(MaxTagText));
    }
    auto *comment = findChild<QPlainTextEdit *>("te_comment");
    if (comment == nullptr) {
        return;
    }
    connect(comment, &QPlainTextEdit::textChanged, this, [comment] {
        static const QRegularExpression lineBreaks("[\\r\\n]+");
        QString text = comment->toPlainText();
        text.replace(lineBreaks, " ").truncate(MaxTagText);
        if (text != comment->toPlainText()) {
            const int position = comment->textCursor().position();
            comment->setPlainText(text);
            QTextCursor cursor = comment->textCursor();
            cursor.setPosition(std::min(position, static_cast<int>(text.size())));
            comment->setTextCursor(cursor);
        }
    });
}

void ToolWizard::addPresetMenu()
{
    const QList<QBoxLayout *> rows = findChildren<QBoxLayout *>();
    const auto row = std::find_if(rows.begin(), rows.end(), [this](const QBoxLayout *layout) {
        return layout->indexOf(m_previous) >= 0;
    });
    // A tool may have such buttons of its own.
    if (row == rows.end() || findChild<QPushButton *>("pb_saveprofile") != nullptr) {
        return;
    }
    m_preset = new QPushButton(lineIcon("settings"), "Preset");
    QPushButton *button = m_preset;
    button->setObjectName("pb_preset");
    button->setToolTip("Save the fields of this tool in a file, or load them from one");
    button->setAutoDefault(false);
    auto *menu = new QMenu(button);
    menu->addAction("&Load Preset...", this, &ToolWizard::askAndLoad);
    menu->addAction("&Save Preset...", this, &ToolWizard::askAndSave);
    button->setMenu(menu);
    (*row)->insertWidget(0, button);
}

void ToolWizard::addResultButtons()
{
    m_view = addResultButton("pb_view", "&View", "Look at the new file");
    m_view->setIcon(lineIcon("view"));
    connect(m_view, &QPushButton::clicked, this, [this] { emit openRequested(m_result); });
    m_send = addResultButton("pb_send", "&Send to Instrument", {});
    m_send->setIcon(lineIcon("copy_to"));
    sendTargetChanged({});
    connect(m_send, &QPushButton::clicked, this, [this] { emit sendRequested(m_result); });
}

void ToolWizard::sendTargetChanged(const QString &instrument)
{
    m_send->setEnabled(!instrument.isEmpty());
    m_send->setToolTip(instrument.isEmpty()
                           ? "No pane of the main window shows a generator. Choose one in the list "
                             "above a pane to send the new file to it."
                           : QString("Copy the new file to %1").arg(instrument));
}

/// Above the buttons, where the user looks after a press of "Next".
void ToolWizard::addProblemLine()
{
    m_problem = new QLabel(this);
    m_problem->setObjectName("l_problem");
    m_problem->setTextFormat(Qt::PlainText);
    m_problem->setWordWrap(true);
    QFont font = m_problem->font();
    font.setBold(true);
    m_problem->setFont(font);
    m_problem->hide();
    auto *column = qobject_cast<QBoxLayout *>(layout());
    for (int i = 0; column != nullptr && i < column->count(); ++i) {
        const QLayout *row = column->itemAt(i)->layout();
        const QWidget *box = column->itemAt(i)->widget();
        if ((row != nullptr && row->indexOf(m_previous) >= 0) ||
            (box != nullptr && box->isAncestorOf(m_previous))) {
            column->insertWidget(i, m_problem);
            return;
        }
    }
}

void ToolWizard::showProblem(const QString &text)
{
    m_problem->setText(text);
    m_problem->setVisible(!text.isEmpty());
}

QPushButton *ToolWizard::addResultButton(const char *name, const QString &text, const QString &tip)
{
    auto *button = new QPushButton(text, this);
    button->setObjectName(name);
    button->setToolTip(tip);
    button->setAutoDefault(false);
    button->hide();
    const QList<QBoxLayout *> rows = findChildren<QBoxLayout *>();
    for (QBoxLayout *row : rows) {
        if (row->indexOf(m_previous) >= 0) {
            row->insertWidget(row->indexOf(m_previous), button);
        }
    }
    return button;
}

void ToolWizard::askAndLoad()
{
    const QString name = QFileDialog::getOpenFileName(this, "Load Preset", {}, presetFilter());
    if (name.isEmpty()) {
        return;
    }
    QSettings settings(name, QSettings::IniFormat);
    settings.beginGroup(m_frame.settingsGroup);
    if (settings.status() != QSettings::NoError || settings.childKeys().isEmpty()) {
        QMessageBox::warning(this, windowTitle(),
                             "The file holds no settings of this tool.\n" + name);
        return;
    }
    // The settings are wanted for the files that were chosen here.
    std::vector<std::pair<QLineEdit *, QString>> files;
    for (QLineEdit *field : findChildren<QLineEdit *>()) {
        if (field->objectName().contains(QRegularExpression("^le_(in|out)file"))) {
            files.emplace_back(field, field->text());
        }
    }
    readFields(settings);
    for (const auto &[field, text] : files) {
        field->setText(text);
    }
    // Whatever a page has made of the fields is made anew on the way.
    showPage(0);
}

void ToolWizard::askAndSave()
{
    takeTypedValues();
    QString name = QFileDialog::getSaveFileName(this, "Save Preset", {}, presetFilter());
    if (name.isEmpty()) {
        return;
    }
    if (!name.endsWith(".ini", Qt::CaseInsensitive)) {
        name += ".ini";
    }
    QSettings settings(name, QSettings::IniFormat);
    settings.beginGroup(m_frame.settingsGroup);
    writeFields(settings);
    settings.endGroup();
    settings.sync();
    if (settings.status() != QSettings::NoError) {
        QMessageBox::warning(this, windowTitle(), "The settings file cannot be written.\n" + name);
    }
}

int ToolWizard::pageAfter(int page)
{
    return page + 1;
}

int ToolWizard::pageBefore(int page)
{
    return page - 1;
}

bool ToolWizard::isComplete(int /*page*/) const
{
    return true;
}

void ToolWizard::pageShown(int /*page*/) {}

QStringList ToolWizard::outputFiles() const
{
    return {outputOptions().fileName};
}

void ToolWizard::jobEnded(JobOutcome /*outcome*/) {}

void ToolWizard::writeFields(QSettings & /*settings*/) const {}

void ToolWizard::readFields(const QSettings & /*settings*/) {}

int ToolWizard::currentPage() const
{
    return m_pages->currentIndex();
}

int ToolWizard::outputPage() const
{
    return m_pages->count() - 2;
}

int ToolWizard::statusPage() const
{
    return m_pages->count() - 1;
}

OutputOptions ToolWizard::outputOptions() const
{
    OutputOptions options;
    if (const auto *name = findChild<QLineEdit *>("le_outfile")) {
        options.fileName = name->text();
        // The user was asked about the one that stands there, not about one that appears later.
        options.overwrite = QFileInfo::exists(options.fileName);
    }
    if (const auto *comment = findChild<QPlainTextEdit *>("te_comment")) {
        options.comment = comment->toPlainText();
    }
    if (const auto *copyright = findChild<QLineEdit *>("le_copyright")) {
        options.copyright = copyright->text();
    }
    return options;
}

void ToolWizard::showPage(int page)
{
    m_pages->setCurrentIndex(page);
    updateButtons();
    // A field of the page, or else the default button, takes the next key. Fields that were made
    // after the buttons stand behind them in the chain.
    QWidget *current = m_pages->currentWidget();
    QWidget *first = page == statusPage() ? current : current->nextInFocusChain();
    while (first != current &&
           (!current->isAncestorOf(first) || (first->focusPolicy() & Qt::TabFocus) == 0 ||
            !first->isEnabled() || !first->isVisibleTo(current))) {
        first = first->nextInFocusChain();
    }
    if (first == current) {
        first = page == statusPage() ? m_close : m_next;
    }
    first->setFocus(Qt::TabFocusReason);
    pageShown(page);
}

void ToolWizard::updateButtons()
{
    const int page = currentPage();
    m_previous->setEnabled(page > 0 && !m_isRunning);
    if (m_preset != nullptr) {
        m_preset->setEnabled(!m_isRunning);
    }
    m_next->setVisible(page != statusPage());
    m_next->setText(page == outputPage() ? "&Run" : "&Next");
    m_next->setEnabled(isComplete(page));
    m_next->setDefault(page != statusPage());
    m_close->setDefault(page == statusPage());
    const bool hasResult = page == statusPage() && !m_isRunning && !m_result.isEmpty();
    m_view->setVisible(hasResult);
    m_send->setVisible(hasResult && m_result.endsWith(".wv", Qt::CaseInsensitive));
}

/// A click on a button takes the focus, and with it the text, from a field; a key doesn't.
void ToolWizard::takeTypedValues() const
{
    if (QWidget *field = focusWidget(); field && m_pages->isAncestorOf(field)) {
        field->clearFocus();
    }
}

void ToolWizard::goOn()
{
    takeTypedValues();
    showProblem({});
    const int page = currentPage();
    // The values that were just taken may not do.
    if (!isComplete(page)) {
        updateButtons();
    } else if (page == outputPage()) {
        run();
    } else if (const int next = pageAfter(page); next != page) {
        showPage(next);
    }
}

void ToolWizard::goBack()
{
    takeTypedValues();
    showProblem({});
    showPage(pageBefore(currentPage()));
}

void ToolWizard::run()
{
    m_report->clear();
    m_result.clear();
    showPage(statusPage());
    const QStringList files = outputFiles();
    for (const QString &file : files) {
        if (!file.isEmpty() && !confirmOverwrite(this, file)) {
            appendReport(*m_report, ReportLine::failure(m_frame.abortedText));
            return;
        }
    }
    JobOutcome outcome = JobOutcome::Failed;
    {
        const std::unique_ptr<ToolJob> job = makeJob();
        const QScopedValueRollback<bool> running(m_isRunning, true);
        updateButtons();
        outcome = runJob(*job, this, m_report);
    }
    if (outcome == JobOutcome::Finished) {
        m_result = files.value(0);
    }
    updateButtons();
    jobEnded(outcome);
}

JobOutcome ToolWizard::runInPlace(ToolJob &job)
{
    const Tracer::ErrorWatch watch;
    const JobOutcome outcome = runJob(job, this, nullptr);
    showProblem(outcome == JobOutcome::Failed ? watch.text() : QString());
    return outcome;
}

void ToolWizard::writeSettings(QSettings &settings)
{
    settings.beginGroup(m_frame.settingsGroup);
    writeWindowPlace(settings, *this);
    writeFields(settings);
    settings.endGroup();
}

void ToolWizard::readSettings(QSettings &settings)
{
    settings.beginGroup(m_frame.settingsGroup);
    readWindowPlace(settings, *this, m_frame.position, m_frame.size);
    readFields(settings);
    settings.endGroup();
}
