// SPDX-License-Identifier: Apache-2.0
#include "ScreenshotRun.h"

#include "MainWindow.h"
#include "QCustomTreeView.h"
#include "toolframe/DlgBase.h"

#include <QApplication>
#include <QDir>
#include <QFileInfo>
#include <QPixmap>
#include <QSettings>
#include <QTemporaryDir>
#include <QTimer>

#include <cstdio>

namespace {

constexpr int TimeOutMs = 20000;
constexpr QSize PictureSize(1060, 640);

void complain(const QString &text)
{
    std::fprintf(stderr, "corvane: %s\n", qPrintable(text));
}

} // namespace

ScreenshotRun::ScreenshotRun(MainWindow &window, QString folder, const QString &file)
    : m_window(window)
    , m_folder(std::move(folder))
    , m_file(file.isEmpty() ? QString() : QFileInfo(file).absoluteFilePath())
{
}

void ScreenshotRun::detachSettings()
{
    static const QTemporaryDir store;
    QSettings::setPath(QSettings::IniFormat, QSettings::UserScope, store.path());
}

void ScreenshotRun::start()
{
    if (!QDir().mkpath(m_folder)) {
        complain(QString("the folder '%1' cannot be created").arg(m_folder));
        finish(1);
        return;
    }
    m_window.resize(PictureSize);
    QTimer::singleShot(TimeOutMs, this, [this] {
        complain("the panes were not loaded in time");
        finish(1);
    });
    if (m_file.isEmpty()) {
        connect(&m_window, &MainWindow::firstPainted, this, &ScreenshotRun::takePictures);
        return;
    }
    const QString folder = QFileInfo(m_file).absolutePath();
    const auto trees = m_window.findChildren<QCustomTreeView *>();
    auto *first = m_window.findChild<QCustomTreeView *>("tv_dev_1");
    for (QCustomTreeView *tree : trees) {
        tree->updateAndExpandTree(tree == first ? m_file : folder);
    }
    first->setFocus();
    // The second pane is filled later than the first.
    connect(trees.last(), &QCustomTreeView::folderLoaded, this,
            [this, folder](const QString &path) {
                if (QDir(path) == QDir(folder)) {
                    QTimer::singleShot(0, this, &ScreenshotRun::takePictures);
                }
            });
}

void ScreenshotRun::takePictures()
{
    if (m_finished) {
        return;
    }
    bool done = save(m_window, "main-window.png");
    if (!m_file.isEmpty()) {
        DlgBase *tool = m_window.modules().firstAllowed(m_file, true);
        done = done && tool && m_window.modules().start(*tool, m_file) &&
               save(*tool, "waveform-info.png");
        if (!done) {
            complain(QString("no report on '%1'").arg(m_file));
        }
    }
    std::printf("first paint %lld ms after the start\n",
                static_cast<long long>(m_window.firstPaintMs()));
    finish(done ? 0 : 1);
}

bool ScreenshotRun::save(QWidget &window, const QString &name) const
{
    const QString path = QDir(m_folder).filePath(name);
    if (!window.grab().save(path)) {
        complain(QString("the picture '%1' cannot be written").arg(path));
        return false;
    }
    return true;
}

void ScreenshotRun::finish(int status)
{
    m_finished = true;
    m_window.close();
    QCoreApplication::exit(status);
}
