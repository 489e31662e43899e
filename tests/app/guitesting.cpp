// SPDX-License-Identifier: Apache-2.0
#include "guitesting.h"

#include "app/QCustomTreeView.h"
#include "wvfile/HvFileIO.h"

#include <QAbstractButton>
#include <QApplication>
#include <QDir>
#include <QFile>
#include <QListWidget>
#include <QSettings>
#include <QTest>
#include <QTimer>

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
    for (int pane = 1; pane <= 2; ++pane) {
        QTRY_VERIFY(tree(pane)->currentIndex().isValid());
        QTRY_VERIFY(tree(pane)->model()->rowCount(tree(pane)->currentIndex()) > 0);
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

bool withModals(const std::function<void()> &action, const QList<Answer> &answers)
{
    qsizetype count = 0;
    QTimer poll;
    QObject::connect(&poll, &QTimer::timeout, [&] {
        QWidget *modal = QApplication::activeModalWidget();
        if (!modal || !modal->isVisible()) {
            return;
        }
        if (count < answers.size()) {
            answers.at(count)(*modal);
        } else {
            modal->close();
        }
        ++count;
    });
    poll.start(10);
    action();
    const bool done = QTest::qWaitFor([&] { return count >= answers.size(); }, 2000) &&
                      QTest::qWaitFor([] { return !QApplication::activeModalWidget(); }, 2000);
    return done && count == answers.size();
}

bool withModal(const std::function<void()> &action, const Answer &answer)
{
    return withModals(action, {answer});
}

Answer press(const QString &button)
{
    return [button](QWidget &box) {
        const QList<QAbstractButton *> buttons = box.findChildren<QAbstractButton *>();
        const auto found = std::find_if(buttons.begin(), buttons.end(), [&](QAbstractButton *each) {
            return each->text().remove('&') == button;
        });
        if (found == buttons.end()) {
            QTest::qFail(qPrintable("no button " + button), __FILE__, __LINE__);
            box.close();
            return;
        }
        QTest::mouseClick(*found, Qt::LeftButton);
    };
}
