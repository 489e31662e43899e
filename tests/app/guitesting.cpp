// SPDX-License-Identifier: Apache-2.0
#include "guitesting.h"

#include "app/QCustomTreeView.h"
#include "toolframe/QtProgressDialog.h"
#include "wvfile/HvFileIO.h"

#include <QAbstractButton>
#include <QApplication>
#include <QContextMenuEvent>
#include <QDir>
#include <QFile>
#include <QInputDialog>
#include <QLineEdit>
#include <QListWidget>
#include <QMenu>
#include <QMessageBox>
#include <QSettings>
#include <QTest>
#include <QTimer>
#include <QWindow>

#include <algorithm>

Desk::Desk()
{
    qputenv("HOME", QFile::encodeName(m_home.path()));
    QSettings::setPath(QSettings::IniFormat, QSettings::UserScope, m_config.path());
    const bool made = writeTone(path("tone.wv")) && writeText(path("data.txt"), "1 2\n") &&
                      writeText(path("readme"), "text\n") && QDir().mkpath(path("sub"));
    Q_ASSERT_X(made, "Desk", "the files of the test could not be made");
    Q_UNUSED(made)
}

Desk::~Desk()
{
    close();
}

QString Desk::path(const QString &name) const
{
    return m_home.filePath(name);
}

void Desk::open()
{
    m_window = new MainWindow;
    m_window->show();
    m_window->activateWindow();
    QVERIFY(QTest::qWaitForWindowActive(m_window));
    QTRY_VERIFY(m_window->knowsInstruments());
    for (int pane = 1; pane <= 2; ++pane) {
        QTRY_VERIFY(tree(pane)->currentIndex().isValid());
        QTRY_VERIFY(!tree(pane)->isLocal() ||
                    tree(pane)->model()->rowCount(tree(pane)->currentIndex()) > 0);
    }
    tree(1)->setFocus();
}

void Desk::close()
{
    if (m_window) {
        m_window->close();
        QTRY_VERIFY(!m_window);
    }
}

QCustomTreeView *Desk::tree(int pane) const
{
    return find<QCustomTreeView>(QString("tv_dev_%1").arg(pane));
}

void Desk::select(int pane, const QString &name) const
{
    tree(pane)->updateAndExpandTree(path(name));
    QTRY_VERIFY(tree(pane)->currentPath().startsWith(path(name)));
}

QStringList Desk::log() const
{
    const auto *list = find<QListWidget>("lw_log");
    QStringList texts;
    for (int row = 0; row < list->count(); ++row) {
        texts.append(list->item(row)->text().section("  ", 1));
    }
    return texts;
}

bool writeTone(const QString &path, const QString &comment)
{
    WvWriteJob job;
    job.clock = 1e6;
    job.samples = 1000;
    job.comment = comment;
    job.iSamples = QList<float>(job.samples, 0.5F);
    job.qSamples = QList<float>(job.samples, 0.0F);
    return HvFileIO().writeWaveform(job, path, nullptr, nullptr, nullptr);
}

bool writeText(const QString &path, const QByteArray &text)
{
    QFile file(path);
    return file.open(QIODevice::WriteOnly) && file.write(text) == text.size();
}

void pressKey(QWidget *widget, const QKeySequence &key)
{
    // Nobody manages the windows here: a closed box leaves none of them active.
    widget->activateWindow();
    QVERIFY(QTest::qWaitForWindowActive(widget));
    QTest::keySequence(widget, key);
}

QMenu *openMenu()
{
    return qobject_cast<QMenu *>(QApplication::activePopupWidget());
}

QStringList visibleEntries(const QMenu &menu)
{
    QStringList texts;
    const QList<QAction *> actions = menu.actions();
    for (const QAction *action : actions) {
        if (action->isVisible()) {
            texts.append(action->isSeparator() ? "-" : QString(action->text()).remove('&'));
        }
    }
    return texts;
}

void rightClick(QCustomTreeView *tree, const QString &name)
{
    const QModelIndex folder = tree->currentIndex().parent();
    const QModelIndexList found = tree->model()->match(tree->model()->index(0, 0, folder),
                                                       Qt::DisplayRole, name, 1, Qt::MatchExactly);
    QVERIFY(!found.isEmpty());
    tree->scrollTo(found.first());
    const QPoint position = tree->visualRect(found.first()).center();
    QTest::mouseClick(tree->viewport(), Qt::RightButton, {}, position);
    QContextMenuEvent event(QContextMenuEvent::Mouse, position,
                            tree->viewport()->mapToGlobal(position));
    QApplication::sendEvent(tree->viewport(), &event);
}

void dragBetween(QWidget &top, QCustomTreeView &from, QCustomTreeView &to)
{
    if (QGuiApplication::platformName() == "offscreen") {
        // This platform has no drags: only what follows the drop can be driven.
        to.offerCopy(from, {from.currentPath()}, to.visualRect(to.currentIndex()).center());
        return;
    }
    QWindow *window = top.windowHandle();
    const auto inWindow = [&](QCustomTreeView &tree) {
        return tree.viewport()->mapTo(&top, tree.visualRect(tree.currentIndex()).center());
    };
    const QPoint start = inWindow(from);
    const QPoint end = inWindow(to);
    // The drag runs an event loop of its own, in which the mouse goes on.
    QTimer mouse;
    QObject::connect(&mouse, &QTimer::timeout, [&] {
        mouse.stop();
        QTest::mouseMove(window, end - QPoint(2, 2));
        QTest::mouseMove(window, end);
        QTest::mouseRelease(window, Qt::LeftButton, {}, end);
    });
    mouse.start(50);
    QTest::mousePress(window, Qt::LeftButton, {}, start);
    QTest::mouseMove(window, start + QPoint(3, 0));
    QTest::mouseMove(window, start + QPoint(40, 5));
}
