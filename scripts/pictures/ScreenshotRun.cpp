// SPDX-License-Identifier: Apache-2.0
#include "ScreenshotRun.h"

#include "app/MainWindow.h"
#include "app/QCustomTreeView.h"
#include "app/settingsstores.h"
#include "toolframe/DlgBase.h"
#include "toolframe/QtProgressDialog.h"

#include <QAction>
#include <QApplication>
#include <QComboBox>
#include <QDir>
#include <QEventLoop>
#include <QFileInfo>
#include <QPainter>
#include <QPixmap>
#include <QPushButton>
#include <QSettings>
#include <QStackedWidget>
#include <QTemporaryDir>
#include <QTimer>
#include <QToolButton>
#include <QTreeWidget>

#include <algorithm>
#include <cstdio>

namespace {

constexpr int TimeOutMs = 20000;
constexpr int SketchMs = 600;
constexpr int FieldsPage = 1; ///< where a tool with a sketch has its fields
constexpr QSize PictureSize(1060, 640);

void complain(const QString &text)
{
    std::fprintf(stderr, "corvane-pictures: %s\n", qPrintable(text));
}

} // namespace

ScreenshotRun::ScreenshotRun(MainWindow &window, QString folder, const QString &file)
    : m_window(window)
    , m_firstPaint(window)
    , m_folder(std::move(folder))
    , m_file(file.isEmpty() ? QString() : QFileInfo(file).absoluteFilePath())
{
    const auto trees = m_window.findChildren<QCustomTreeView *>();
    for (QCustomTreeView *tree : trees) {
        connect(tree, &QCustomTreeView::folderLoaded, this,
                [this, tree](const QString &path) { folderArrived(tree, path); });
    }
}

void ScreenshotRun::detachSettings()
{
    static const QTemporaryDir folder;
    const auto users = openMainStore();
    QSettings::setPath(QSettings::IniFormat, QSettings::UserScope, folder.path());
    const auto detached = openMainStore();
    users->beginGroup("InstrConfig");
    detached->beginGroup("InstrConfig");
    const QStringList keys = users->childKeys();
    for (const QString &key : keys) {
        detached->setValue(key, users->value(key));
    }
}

void ScreenshotRun::start()
{
    constexpr int PollMs = 20;
    if (!m_window.knowsInstruments()) {
        QTimer::singleShot(PollMs, this, &ScreenshotRun::start);
        return;
    }
    if (!QDir().mkpath(m_folder)) {
        complain(QString("the folder '%1' cannot be created").arg(m_folder));
        finish(1);
        return;
    }
    if (!m_file.isEmpty() && !QFileInfo::exists(m_file)) {
        complain(QString("there is no file '%1'").arg(m_file));
        finish(1);
        return;
    }
    m_window.resize(PictureSize);
    QTimer::singleShot(TimeOutMs, this, [this] {
        if (m_started) {
            complain("the panes were not loaded in time");
            finish(1);
        }
    });
    if (offersInstruments() && !makeTransferFile()) {
        finish(1);
        return;
    }
    const QString shown = m_file.isEmpty() ? QDir::homePath() : m_file;
    const QString folder = QFileInfo(shown).path();
    auto *first = m_window.findChild<QCustomTreeView *>("tv_dev_1");
    auto *second = m_window.findChild<QCustomTreeView *>("tv_dev_2");
    second->updateAndExpandTree(folder);
    awaitFolders(*second, folder);
    first->updateAndExpandTree(shown);
    awaitFolders(*first, folder);
    first->setFocus();
    m_started = true;
    folderArrived(nullptr, {});
}

void ScreenshotRun::awaitFolders(const QCustomTreeView &tree, const QString &path)
{
    QDir folder(path);
    do {
        m_awaited.insert({&tree, folder.path()});
    } while (folder.cdUp());
}

void ScreenshotRun::folderArrived(const QCustomTreeView *tree, const QString &folder)
{
    m_arrived.insert({tree, QDir(folder).path()});
    if (m_started && m_arrived.contains(m_awaited)) {
        // The views sort, scroll and paint in later turns of the event loop.
        constexpr int SettleMs = 200;
        m_started = false;
        QTimer::singleShot(SettleMs, this, &ScreenshotRun::takePictures);
    }
}

void ScreenshotRun::takePictures()
{
    if (m_finished) {
        return;
    }
    bool done = true;
    if (!m_file.isEmpty()) {
        // The tools first, since their reading fills the log of the main window.
        const QList<const ToolInfo *> tools = m_window.modules().allAllowed(m_file, true);
        for (const ToolInfo *tool : tools) {
            done = done && m_window.modules().start(*tool, m_file) && saveTool(*tool);
            m_window.modules().dialog(*tool).close();
        }
        if (!done) {
            complain(QString("not all tools could show '%1'").arg(m_file));
        }
    }
    done = save(m_window, "main-window.png") && done;
    auto *colors = m_window.findChild<QDialog *>("DlgColors");
    m_window.findChild<QAction *>("actionColors")->trigger();
    QCoreApplication::processEvents();
    done = save(*colors, "colors.png") && done;
    colors->close();
    if (offersInstruments()) {
        done = saveInstruments() && done;
    }
    std::printf("first paint %lld ms after the start\n",
                static_cast<long long>(m_firstPaint.ageMs()));
    finish(done ? 0 : 1);
}

bool ScreenshotRun::saveInstruments()
{
    auto *dialog = m_window.findChild<QDialog *>("DlgInstrConfig");
    m_window.findChild<QToolButton *>("tb_instruments_1")->click();
    // One by one, so that the columns follow; they are laid out in the event loop.
    const auto *tree = dialog->findChild<QTreeWidget *>();
    for (int row = 0; row < tree->topLevelItemCount(); ++row) {
        tree->topLevelItem(row)->setExpanded(true);
    }
    QCoreApplication::processEvents();
    bool done = save(*dialog, "instruments.png");
    dialog->close();

    auto *first = m_window.findChild<QComboBox *>("cb_dev_1");
    auto *second = m_window.findChild<QComboBox *>("cb_dev_2");
    second->setCurrentIndex(1);
    first->setCurrentIndex(std::min(2, first->count() - 1));
    QCoreApplication::processEvents();
    done = save(m_window, "two-instruments.png") && done;
    first->setCurrentIndex(0);
    return saveTransfer() && done;
}

bool ScreenshotRun::offersInstruments() const
{
    return m_window.findChild<QComboBox *>("cb_dev_2")->count() > 1;
}

/// A large file of zeros, which takes no room on the disk. Made before the panes are read.
bool ScreenshotRun::makeTransferFile()
{
    constexpr qint64 FileSize = 500'000'000;
    m_transferFile.setFileName(
        QFileInfo(QDir(m_folder).filePath("noise-100-MHz.wv")).absoluteFilePath());
    if (!m_transferFile.open(QIODevice::WriteOnly) || !m_transferFile.resize(FileSize)) {
        complain(QString("the file '%1' cannot be written").arg(m_transferFile.fileName()));
        return false;
    }
    m_transferFile.close();
    return true;
}

/// Sends the large file to the instrument in the second pane, for a picture of the progress, and
/// stops.
bool ScreenshotRun::saveTransfer()
{
    bool done = false;
    QTimer poll;
    connect(&poll, &QTimer::timeout, this, [&] {
        auto *progress = m_window.findChild<QtProgressDialog *>();
        if (!done && progress && progress->isVisible() && progress->value() >= 20) {
            QPixmap picture = m_window.grab();
            const QPixmap inner = progress->grab();
            QPainter painter(&picture);
            const QRect frame(QPoint((m_window.width() - inner.width()) / 2,
                                     (m_window.height() - inner.height()) / 2),
                              inner.size());
            painter.drawPixmap(frame.topLeft(), inner);
            painter.setPen(Qt::darkGray);
            painter.drawRect(frame.adjusted(-1, -1, 0, 0));
            painter.end();
            done = savePicture(picture, "transfer.png");
            progress->reject();
        }
    });
    poll.start(20);
    auto *first = m_window.findChild<QCustomTreeView *>("tv_dev_1");
    first->updateAndExpandTree(m_transferFile.fileName());
    QCoreApplication::processEvents();
    first->copyToPeer();
    return done;
}

/// A picture of the tool, or of each of its pages: first those on the way that "Next" leads, as a
/// user would see them, then the others. Nothing is run, so no file is written.
bool ScreenshotRun::saveTool(const ToolInfo &info) const
{
    DlgBase &tool = m_window.modules().dialog(info);
    const QString name = info.name.toLower().replace(' ', '-');
    auto *pages = tool.findChild<QStackedWidget *>("sw_assist");
    auto *next = tool.findChild<QPushButton *>("pb_next");
    if (!pages || !next) {
        return save(tool, name + ".png");
    }
    QSet<int> taken;
    const auto take = [&] {
        const int page = pages->currentIndex();
        taken.insert(page);
        if (const auto *sketch = tool.findChild<QWidget *>("w_sketch");
            page == FieldsPage && sketch != nullptr) {
            // Drawn a moment after the last change of a field.
            QEventLoop wait;
            QTimer::singleShot(SketchMs, &wait, &QEventLoop::quit);
            wait.exec();
        }
        return save(tool, QString("%1-%2.png").arg(name).arg(page + 1, 2, 10, QChar('0')));
    };
    bool done = take();
    while (done && next->isEnabled() && next->text().contains("Next")) {
        next->click();
        if (taken.contains(pages->currentIndex())) {
            break;
        }
        done = take();
    }
    for (int page = 0; page < pages->count() && done; ++page) {
        if (!taken.contains(page)) {
            pages->setCurrentIndex(page);
            done = take();
        }
    }
    return done;
}

bool ScreenshotRun::save(QWidget &window, const QString &name) const
{
    return savePicture(window.grab(), name);
}

bool ScreenshotRun::savePicture(const QPixmap &picture, const QString &name) const
{
    const QString path = QDir(m_folder).filePath(name);
    if (!picture.save(path)) {
        complain(QString("the picture '%1' cannot be written").arg(path));
        return false;
    }
    return true;
}

void ScreenshotRun::finish(int status)
{
    m_finished = true;
    if (!m_transferFile.fileName().isEmpty()) {
        m_transferFile.remove();
    }
    m_window.close();
    QCoreApplication::exit(status);
}
