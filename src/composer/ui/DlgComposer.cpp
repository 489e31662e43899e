// SPDX-License-Identifier: Apache-2.0
#include "DlgComposer.h"

#include "CWidgetTrackEdit.h"
#include "DlgProgress.h"
#include "formfields.h"

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
#include <QStandardPaths>

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
    // The user was asked about the file that stands there, not about one that appears later.
    ComposeJob job({m_tracks->composition(), !single, QFileInfo::exists(name)});
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
