// SPDX-License-Identifier: Apache-2.0
#include "DlgComposer.h"

#include "CWidgetTrackEdit.h"
#include "DlgProgress.h"
#include "formfields.h"

#include "appearance/lineicon.h"
#include "base/EngineeringNumber.h"
#include "jobs/ComposeJob.h"
#include "log/Tracer.h"
#include "toolframe/questions.h"
#include "toolframe/windowplace.h"
#include "wvfile/WvTypes.h"

#include <QCloseEvent>
#include <QCoreApplication>
#include <QDir>
#include <QFileDialog>
#include <QLabel>
#include <QLockFile>
#include <QMessageBox>
#include <QSettings>
#include <QShortcut>
#include <QStandardPaths>
#include <QVBoxLayout>

#include <functional>

namespace {

constexpr int AutosaveDelayMs = 1000;
constexpr QPoint FirstPosition(120, 90);
constexpr QSize FirstSize(980, 640);

} // namespace

DlgComposer::DlgComposer(QWidget *parent)
    : DlgBase(parent)
    , m_tracks(new CWidgetTrackEdit(this))
    , le_wvname(named("le_wvname", new QLineEdit(this)))
    , le_csr_sample(makeField(
          {"le_csr_sample", "Cursor Position", "", 0, static_cast<double>(MaxSamples), 1, 6}, this))
    , le_csr_time(makeField({"le_csr_time", "Cursor Time", "s", 0, 1e9, 1e-3, 9, true}, this))
    , l_duration(named("l_duration", new QLabel(this)))
    , l_rate(named("l_rate", new QLabel(this)))
{
    buildWindow();
    addKeys();
    connect(m_tracks, &CWidgetTrackEdit::mouse_xcsr, this, &DlgComposer::slot_set_xcsr);
    connect(m_tracks, &CWidgetTrackEdit::undoSize, this, &DlgComposer::slot_bufsize);
    connect(m_tracks, &CWidgetTrackEdit::targetChanged, this, &DlgComposer::slot_target_changed);
    connect(le_csr_sample, &QtNumericEdit::valueUpdated, m_tracks, &CWidgetTrackEdit::setCsrSample);
    connect(le_csr_time, &QtNumericEdit::valueUpdated, m_tracks, &CWidgetTrackEdit::setCsrTime);
    m_autosaveTimer.setSingleShot(true);
    m_autosaveTimer.setInterval(AutosaveDelayMs);
    connect(&m_autosaveTimer, &QTimer::timeout, this, &DlgComposer::writeAutosave);
    setFile({});
    slot_bufsize(0);
    setModified(false);
    refreshLabels();
    resize(FirstSize);
}

DlgComposer::~DlgComposer() = default;

QPushButton *DlgComposer::addButton(QLayout *row, const char *objectName, const char *icon,
                                    const char *text, const char *toolTip,
                                    const std::function<void()> &action)
{
    auto *button = named(objectName, new QPushButton(QString::fromLatin1(text), this));
    button->setToolTip(QString::fromLatin1(toolTip));
    button->setAccessibleName(QString::fromLatin1(toolTip));
    if (*icon != 0) {
        button->setIcon(lineIcon(QString::fromLatin1(icon)));
    }
    button->setAutoDefault(false);
    connect(button, &QPushButton::clicked, this, action);
    row->addWidget(button);
    return button;
}

void DlgComposer::buildWindow()
{
    auto *layout = new QVBoxLayout(this);
    layout->addLayout(insertRow());
    layout->addWidget(m_tracks, 1);
    layout->addLayout(viewRow());
    layout->addLayout(documentRow());
}

QLayout *DlgComposer::insertRow()
{
    auto *row = new QHBoxLayout;
    row->addWidget(new QLabel(QStringLiteral("Waveform"), this));
    le_wvname->setAccessibleName(QStringLiteral("Waveform to insert"));
    row->addWidget(le_wvname, 1);
    addButton(row, "pb_select", "", "...", "Select the Waveform to Insert", [this] {
        slot_wvselect();
    })->setMaximumWidth(36);
    row->addSpacing(8);
    addButton(row, "pb_insert", "insert", "Insert", "Insert at the Cursor, Moving What Follows",
              [this] { slot_insert(); });
    addButton(row, "pb_overwrite", "overwrite", "Overwrite", "Replace What Lies Behind the Cursor",
              [this] { slot_overwrite(); });
    addButton(row, "pb_extract", "extract", "Extract",
              "Remove the Segments at the Cursor, Closing the Gap", [this] { slot_extract(); });
    addButton(row, "pb_lift", "lift", "Lift", "Remove the Segments at the Cursor, Leaving a Gap",
              [this] { slot_lift(); });
    pb_undo = addButton(row, "pb_undo", "undo", "Undo", "Undo the last Action",
                        [this] { m_tracks->popUndo(); });
    pb_undo->setMinimumWidth(fontMetrics().horizontalAdvance(QStringLiteral("Undo (256)")) +
                             pb_undo->iconSize().width() + 32);
    return row;
}

QLayout *DlgComposer::viewRow()
{
    auto *row = new QHBoxLayout;
    addButton(row, "pb_start", "jump_start", "Start", "Show the Beginning",
              [this] { m_tracks->moveStart(); });
    addButton(row, "pb_zoomin", "zoom_in", "Zoom In", "Zoom In", [this] { m_tracks->zoomIn(); });
    addButton(row, "pb_zoomout", "zoom_out", "Zoom Out", "Zoom Out",
              [this] { m_tracks->zoomOut(); });
    addButton(row, "pb_zoomfit", "zoom_fit", "Fit", "Show All", [this] { m_tracks->zoomFit(); });
    addButton(row, "pb_end", "jump_end", "End", "Show the End", [this] { m_tracks->moveEnd(); });
    row->addStretch(1);
    row->addWidget(l_duration);
    row->addSpacing(12);
    row->addWidget(l_rate);
    row->addStretch(1);
    row->addWidget(new QLabel(QStringLiteral("Cursor"), this));
    addButton(row, "pb_csr_begin", "cursor_start", "", "Cursor to the Beginning", [this] {
        m_tracks->setCsrBegin();
    })->setMaximumWidth(36);
    row->addWidget(le_csr_sample);
    row->addWidget(new QLabel(QStringLiteral("Cursor Time"), this));
    row->addWidget(le_csr_time);
    addButton(row, "pb_csr_end", "cursor_end", "", "Cursor to the End", [this] {
        m_tracks->setCsrEnd();
    })->setMaximumWidth(36);
    for (QtNumericEdit *field : {le_csr_sample, le_csr_time}) {
        field->setFixedWidth(fontMetrics().horizontalAdvance(QStringLiteral("888.888888 ms")) + 16);
    }
    // The style makes buttons wider than their texts, which this row has no room for.
    for (const char *name : {"pb_start", "pb_zoomin", "pb_zoomout", "pb_zoomfit", "pb_end"}) {
        auto *button = findChild<QPushButton *>(QLatin1String(name));
        button->setMaximumWidth(fontMetrics().horizontalAdvance(button->text()) +
                                button->iconSize().width() + 28);
    }
    return row;
}

QLayout *DlgComposer::documentRow()
{
    auto *row = new QHBoxLayout;
    addButton(row, "pb_addtrack", "track_add", "Add Track", "Add an Empty Track",
              [this] { slot_addtrack(); });
    addButton(row, "pb_deltrack", "track_delete", "Delete Track", "Delete the Selected Tracks",
              [this] { slot_deltrack(); });
    addButton(row, "pb_clearall", "delete", "Clear All", "Delete Everything",
              [this] { slot_clearall(); });
    row->addStretch(1);
    addButton(row, "pb_settings", "settings", "Settings", "Clock, Length and File of the Target",
              [this] { m_tracks->targetSettings(); });
    addButton(row, "pb_load", "open", "Load", "Load a Composition (Ctrl+O)",
              [this] { slot_load(); });
    addButton(row, "pb_save", "save", "Save", "Save the Composition (Ctrl+S)",
              [this] { slot_save(); });
    row->addStretch(1);
    addButton(row, "pb_create", "render", "Create", "Render the Waveform",
              [this] { slot_create(); });
    addButton(row, "pb_close", "close", "Close", "Close the Window", [this] { close(); });
    return row;
}

void DlgComposer::addKeys()
{
    const auto key = [this](const QKeySequence &sequence, const std::function<void()> &action) {
        connect(new QShortcut(sequence, this), &QShortcut::activated, this, action);
    };
    key(Qt::CTRL | Qt::Key_Z, [this] { m_tracks->popUndo(); });
    key(Qt::CTRL | Qt::Key_Y, [this] { m_tracks->redo(); });
    key(Qt::CTRL | Qt::SHIFT | Qt::Key_Z, [this] { m_tracks->redo(); });
    key(Qt::CTRL | Qt::Key_S, [this] { slot_save(); });
    key(Qt::CTRL | Qt::Key_O, [this] { slot_load(); });
}

bool DlgComposer::startModule(const QString &path)
{
    if (path.endsWith(QLatin1Char('/'))) {
        m_settingsFile = m_settingsFile.isEmpty() ? path : m_settingsFile;
    }
    offerAutosave();
    if (path.endsWith(QLatin1String(".cms"), Qt::CaseInsensitive)) {
        return mayDiscard() && loadFile(path);
    }
    return true;
}

QString DlgComposer::folder() const
{
    return m_settingsFile.isEmpty() ? QDir::homePath() : QFileInfo(m_settingsFile).absolutePath();
}

void DlgComposer::slot_set_xcsr(qlonglong sample, double seconds)
{
    le_csr_sample->setVal(sample);
    le_csr_time->setVal(seconds);
}

void DlgComposer::slot_bufsize(int states)
{
    pb_undo->setText(states > 0 ? QStringLiteral("Undo (%1)").arg(states) : QStringLiteral("Undo"));
    pb_undo->setEnabled(states > 0);
    refreshLabels();
    setModified(true);
}

void DlgComposer::slot_wvselect()
{
    const QString name =
        QFileDialog::getOpenFileName(this, QStringLiteral("Select Waveform"),
                                     le_wvname->text().isEmpty() ? folder() : le_wvname->text(),
                                     QStringLiteral("Waveform (*.wv)"));
    if (!name.isEmpty()) {
        le_wvname->setText(name);
    }
}

void DlgComposer::slot_insert()
{
    m_tracks->insertFile(le_wvname->text());
}

void DlgComposer::slot_overwrite()
{
    m_tracks->overwriteFile(le_wvname->text());
}

void DlgComposer::slot_extract()
{
    m_tracks->extract();
}

void DlgComposer::slot_lift()
{
    m_tracks->lift();
}

void DlgComposer::slot_addtrack()
{
    m_tracks->addTrack();
}

void DlgComposer::slot_deltrack()
{
    m_tracks->deleteTrack();
}

void DlgComposer::slot_clearall()
{
    m_tracks->clearAll();
}

bool DlgComposer::save()
{
    QString name = QFileDialog::getSaveFileName(this, QStringLiteral("Save Settings"),
                                                m_shownFile.isEmpty() ? folder() : m_shownFile,
                                                QStringLiteral("Composer Settings (*.cms)"));
    if (name.isEmpty()) {
        return false;
    }
    if (!name.endsWith(QLatin1String(".cms")) && !name.endsWith(QLatin1String(".CMS"))) {
        name += QLatin1String(".cms");
    }
    Tracer::Trace(Tracer::Information, "Saving composer settings to file " + name);
    if (!m_tracks->saveAll(name)) {
        return false;
    }
    setFile(name);
    setModified(false);
    dropAutosave();
    return true;
}

void DlgComposer::slot_save()
{
    // A failure has been logged, and the title still shows the change.
    static_cast<void>(save());
}

void DlgComposer::slot_load()
{
    if (!mayDiscard()) {
        return;
    }
    const QString name =
        QFileDialog::getOpenFileName(this, QStringLiteral("Load Settings"), folder(),
                                     QStringLiteral("Composer Settings (*.cms)"));
    if (!name.isEmpty()) {
        static_cast<void>(loadFile(name));
    }
}

bool DlgComposer::loadFile(const QString &fileName)
{
    Tracer::Trace(Tracer::Information, "Reading composer settings from file " + fileName);
    if (!m_tracks->loadAll(fileName)) {
        return false;
    }
    setFile(fileName);
    setModified(false);
    dropAutosave();
    return true;
}

void DlgComposer::slot_target_changed()
{
    refreshLabels();
    setModified(true);
}

void DlgComposer::refreshLabels()
{
    const ComposerTarget &target = m_tracks->composition().target;
    l_duration->setText("Signal Duration: " + engineeringText(target.dTime, QStringLiteral("s")));
    l_rate->setText("Sample Rate: " + engineeringText(target.dUsrClk, QStringLiteral("Hz")));
}

void DlgComposer::setFile(const QString &fileName)
{
    m_shownFile = fileName;
    if (!fileName.isEmpty()) {
        m_settingsFile = fileName;
    }
    setWindowTitle(fileName.isEmpty() ? QStringLiteral("Waveform Composer[*]")
                                      : QFileInfo(fileName).fileName() + "[*] - Composer");
}

void DlgComposer::setModified(bool modified)
{
    setWindowModified(modified);
    if (modified) {
        m_autosaveTimer.start();
    } else {
        m_autosaveTimer.stop();
    }
}

bool DlgComposer::mayDiscard()
{
    if (!isWindowModified()) {
        return true;
    }
    const auto answer = QMessageBox::question(
        this, QStringLiteral("Composer"),
        QStringLiteral("The waveform has been modified.\nDo you want to save your changes?"),
        QMessageBox::Save | QMessageBox::Discard | QMessageBox::Cancel, QMessageBox::Save);
    return answer == QMessageBox::Discard || (answer == QMessageBox::Save && save());
}

void DlgComposer::reject()
{
    close();
}

void DlgComposer::closeEvent(QCloseEvent *event)
{
    if (m_running || !isVisible()) {
        event->setAccepted(!m_running);
        return;
    }
    if (!mayDiscard()) {
        event->ignore();
        return;
    }
    // What was not saved is thrown away, so that the next start doesn't bring it back.
    if (isWindowModified()) {
        m_tracks->clearAll(true);
        setFile({});
        setModified(false);
    }
    dropAutosave();
    event->accept();
}

void DlgComposer::slot_create()
{
    QString name = m_tracks->composition().target.sName;
    if (!name.contains(QLatin1Char('/'))) {
        name = folder() + "/composer.wv";
        m_tracks->setTargetName(name);
    }
    if (m_running || !confirmOverwrite(this, name)) {
        return;
    }
    auto *progress = new DlgProgress(this);
    progress->setAttribute(Qt::WA_DeleteOnClose);
    const bool single =
        QCoreApplication::arguments().contains(QStringLiteral("--no-multi-process"));
    ComposeJob job({m_tracks->composition(), !single});
    connect(&job, &ToolJob::report, progress, &DlgProgress::addMessage);
    connect(&job.engine(), &ComposerEngine::overallProgress, progress,
            &DlgProgress::setOverallProgress);
    connect(&job.engine(), &ComposerEngine::taskProgress, progress, &DlgProgress::setTaskProgress);
    connect(progress, &DlgProgress::canceled, &job, &ToolJob::cancel);
    progress->setRunning(true);
    progress->show();
    m_running = true;
    const JobOutcome outcome = job.run();
    m_running = false;
    if (outcome == JobOutcome::Cancelled) {
        progress->addMessage(ReportLine::failure("Cancelled. No file was written."));
    } else if (outcome == JobOutcome::Failed) {
        progress->addMessage(ReportLine::failure(
            job.refusal().isEmpty()
                ? QStringLiteral("No file was written. The message log tells why.")
                : job.refusal()));
    }
    progress->setRunning(false);
}

QString DlgComposer::autosaveFile()
{
    return QStandardPaths::writableLocation(QStandardPaths::AppLocalDataLocation) +
           "/composer-autosave.cms";
}

bool DlgComposer::hasLeftWork()
{
    if (!QFileInfo::exists(autosaveFile())) {
        return false;
    }
    QLockFile lock(autosaveFile() + ".lock");
    lock.setStaleLockTime(0);
    // Else another window of the program keeps its changes there.
    return lock.tryLock(0);
}

void DlgComposer::offerAutosave()
{
    if (std::exchange(m_autosaveOffered, true)) {
        return;
    }
    QDir().mkpath(QFileInfo(autosaveFile()).absolutePath());
    m_autosaveLock = std::make_unique<QLockFile>(autosaveFile() + ".lock");
    m_autosaveLock->setStaleLockTime(0);
    if (!m_autosaveLock->tryLock(0)) {
        // Another window of the program keeps its changes there.
        m_autosaveLock.reset();
        return;
    }
    if (!QFileInfo::exists(autosaveFile())) {
        return;
    }
    const auto answer = QMessageBox::question(
        this, QStringLiteral("Composer"),
        QStringLiteral("The Composer was not closed the last time.\n"
                       "Do you want to go on with the changes that were not saved?"),
        QMessageBox::Yes | QMessageBox::No, QMessageBox::Yes);
    if (answer == QMessageBox::Yes && m_tracks->loadAll(autosaveFile())) {
        setFile({});
        setModified(true);
    } else {
        dropAutosave();
    }
}

void DlgComposer::writeAutosave()
{
    if (m_autosaveLock && isWindowModified()) {
        static_cast<void>(m_tracks->saveAll(autosaveFile()));
    }
}

void DlgComposer::dropAutosave()
{
    m_autosaveTimer.stop();
    if (m_autosaveLock) {
        QFile::remove(autosaveFile());
    }
}

void DlgComposer::writeSettings(QSettings &settings)
{
    settings.beginGroup(QStringLiteral("Composer"));
    writeWindowPlace(settings, *this);
    settings.setValue(QStringLiteral("settingsfile"), m_settingsFile);
    settings.endGroup();
}

void DlgComposer::readSettings(QSettings &settings)
{
    settings.beginGroup(QStringLiteral("Composer"));
    readWindowPlace(settings, *this, FirstPosition, FirstSize);
    m_settingsFile = settings.value(QStringLiteral("settingsfile")).toString();
    settings.endGroup();
}
