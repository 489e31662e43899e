// SPDX-License-Identifier: Apache-2.0
#include "LogPanel.h"

#include "appearance/lineicon.h"
#include "base/OutputFile.h"
#include "instrument/Transcript.h"

#include <QAction>
#include <QApplication>
#include <QClipboard>
#include <QComboBox>
#include <QFileDialog>
#include <QHBoxLayout>
#include <QLabel>
#include <QLineEdit>
#include <QListWidget>
#include <QMenu>
#include <QSplitter>
#include <QVBoxLayout>

#include <array>

namespace {

constexpr int MaxLines = 256;
constexpr int IconSize = 16;
constexpr int LevelRole = Qt::UserRole;
constexpr int Errors = Tracer::Error | Tracer::Severe;

/// What the choice of a level shows.
struct LevelChoice
{
    const char *name;
    int mask; ///< levels that are shown
};

constexpr std::array<LevelChoice, 3> LevelChoices{{
    {"All messages", ~0},
    {"Warnings and errors", Errors | Tracer::Warning},
    {"Errors", Errors},
}};

QIcon levelIcon(int level)
{
    if ((level & Errors) != 0) {
        return lineIcon("redflag");
    }
    if ((level & Tracer::Warning) != 0) {
        return lineIcon("yellowled");
    }
    return lineIcon((level & Tracer::Debug) != 0 ? "debug" : "bulb");
}

} // namespace

LogPanel::LogPanel(QListWidget *list)
    : m_list(list)
    , m_level(new QComboBox)
    , m_text(new QLineEdit)
    , m_lastError(new QLabel)
{
    if (auto *splitter = qobject_cast<QSplitter *>(list->parentWidget())) {
        setSizePolicy(list->sizePolicy());
        splitter->replaceWidget(splitter->indexOf(list), this);
    }
    auto *column = new QVBoxLayout(this);
    column->setContentsMargins(0, 0, 0, 0);
    column->setSpacing(2);
    addChoices();
    m_list->setIconSize(QSize(IconSize, IconSize));
    column->addWidget(m_list);
    m_list->show();
    m_list->setContextMenuPolicy(Qt::CustomContextMenu);
    connect(m_list, &QWidget::customContextMenuRequested, this, &LogPanel::openMenu);
    auto *copyAction = new QAction("Copy", m_list);
    copyAction->setShortcut(QKeySequence::Copy);
    copyAction->setShortcutContext(Qt::WidgetShortcut);
    connect(copyAction, &QAction::triggered, this, &LogPanel::copy);
    m_list->addAction(copyAction);
}

void LogPanel::addChoices()
{
    m_level->setObjectName("cb_logLevel");
    m_level->setAccessibleName("Messages that are shown");
    m_level->setToolTip("Messages that are shown");
    for (const LevelChoice &choice : LevelChoices) {
        m_level->addItem(choice.name, choice.mask);
    }
    m_text->setObjectName("le_logFilter");
    m_text->setAccessibleName("Filter of the messages");
    m_text->setPlaceholderText("Filter");
    m_text->setToolTip("Shows the messages that hold this text");
    m_text->setClearButtonEnabled(true);
    constexpr int TextWidth = 160;
    m_text->setMaximumWidth(TextWidth);
    m_lastError->setObjectName("l_lastError");
    m_lastError->setTextFormat(Qt::PlainText);
    m_lastError->setSizePolicy(QSizePolicy::Ignored, QSizePolicy::Preferred);
    auto *row = new QHBoxLayout;
    row->addWidget(m_level);
    row->addWidget(m_text);
    row->addWidget(m_lastError, 1);
    static_cast<QVBoxLayout *>(layout())->addLayout(row);
    connect(m_level, &QComboBox::currentIndexChanged, this, &LogPanel::applyFilter);
    connect(m_text, &QLineEdit::textChanged, this, &LogPanel::applyFilter);
}

void LogPanel::append(const QList<Tracer::Entry> &entries)
{
    for (const auto &[text, level] : entries) {
        if (text.isEmpty()) {
            continue;
        }
        while (m_list->count() >= MaxLines) {
            delete m_list->takeItem(0);
        }
        // All rows have the height of one line.
        auto *row = new QListWidgetItem(levelIcon(level), QString(text).replace('\n', ' '), m_list);
        row->setToolTip(text);
        row->setData(LevelRole, level);
        row->setHidden(!passes(*row));
        if ((level & Errors) != 0) {
            m_lastError->setText("Last error: " + row->text());
            m_lastError->setToolTip(text);
        }
    }
    m_list->scrollToBottom();
}

bool LogPanel::passes(const QListWidgetItem &row) const
{
    return (row.data(LevelRole).toInt() & m_level->currentData().toInt()) != 0 &&
           row.toolTip().contains(m_text->text(), Qt::CaseInsensitive);
}

void LogPanel::applyFilter()
{
    for (int row = 0; row < m_list->count(); ++row) {
        m_list->item(row)->setHidden(!passes(*m_list->item(row)));
    }
    m_list->scrollToBottom();
}

QString LogPanel::shownText() const
{
    const bool selectedOnly = !m_list->selectedItems().isEmpty();
    QString text;
    for (int row = 0; row < m_list->count(); ++row) {
        const QListWidgetItem *item = m_list->item(row);
        if (!item->isHidden() && (item->isSelected() || !selectedOnly)) {
            text += item->toolTip() + '\n';
        }
    }
    return text;
}

void LogPanel::copy() const
{
    QApplication::clipboard()->setText(shownText());
}

bool LogPanel::save(const QString &fileName) const
{
    OutputFile file(fileName);
    return (file.open() && file.write(shownText().toUtf8()) && file.commit()) ||
           Tracer::fail(
               QString("Cannot save the log as '%1': %2").arg(fileName, file.errorString()));
}

void LogPanel::chooseFile()
{
    const QString fileName =
        QFileDialog::getSaveFileName(this, "Save Log", "corvane.log", "Log (*.log *.txt)");
    if (!fileName.isEmpty()) {
        save(fileName);
    }
}

/// Asks for a file and records there what is said to instruments, or ends that.
void LogPanel::toggleTranscript(bool starts)
{
    if (!starts) {
        Transcript::stop();
        return;
    }
    const QString fileName =
        QFileDialog::getSaveFileName(this, "Record Instrument Transcript", "corvane-transcript.txt",
                                     "Text (*.txt)", nullptr, QFileDialog::DontConfirmOverwrite);
    if (!fileName.isEmpty() && Transcript::start(fileName)) {
        Tracer::Trace(Tracer::Information,
                      QString("What instruments are told and answer goes to '%1'.").arg(fileName));
    }
}

void LogPanel::clear()
{
    m_list->clear();
    m_lastError->clear();
    m_lastError->setToolTip({});
}

void LogPanel::openMenu(const QPoint &position)
{
    auto *menu = new QMenu(this);
    menu->setAttribute(Qt::WA_DeleteOnClose);
    menu->addAction(lineIcon("copy"), "Copy", this, &LogPanel::copy);
    menu->addAction(lineIcon("save"), "Save...", this, &LogPanel::chooseFile);
    menu->addAction(lineIcon("select_all"), "Select All", m_list, &QListWidget::selectAll);
    menu->addSeparator();
    QAction *transcript = menu->addAction("Record Instrument Transcript...");
    transcript->setToolTip("Adds each command and answer, with its time, to a text file");
    transcript->setCheckable(true);
    transcript->setChecked(Transcript::isRunning());
    connect(transcript, &QAction::triggered, this, &LogPanel::toggleTranscript);
    menu->addSeparator();
    menu->addAction(lineIcon("clear"), "Clear", this, &LogPanel::clear);
    menu->popup(m_list->viewport()->mapToGlobal(position));
}
