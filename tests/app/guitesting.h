// SPDX-License-Identifier: Apache-2.0
#pragma once

#include "support/modals.h"

#include <QKeySequence>
#include <QPointer>
#include <QString>
#include <QStringList>
#include <QTemporaryDir>

class MainWindow;
class QCustomTreeView;
class QMenu;
class QWidget;

/// What the tests of the window share: a home and settings of their own, a main window on them,
/// and the answering of modal boxes.
class Desk
{
public:
    /// A fresh home with the files "tone.wv", "data.txt", "readme" and the folder "sub".
    Desk();
    ~Desk();

    /// Path of an entry of the home.
    [[nodiscard]] QString path(const QString &name) const;

    /// Opens the main window and waits until both panes show the home.
    void open();

    /// Closes it, which saves the settings, and waits for its end.
    void close();

    [[nodiscard]] MainWindow *window() const { return m_window; }
    [[nodiscard]] QCustomTreeView *tree(int pane) const;

    /// Makes an entry of the home current in a pane, without its slash for a folder.
    void select(int pane, const QString &name) const;

    /// Texts of the log list.
    [[nodiscard]] QStringList log() const;

    template <typename Widget>
    [[nodiscard]] Widget *find(const QString &name) const;

private:
    QTemporaryDir m_home;
    QTemporaryDir m_config;
    QPointer<MainWindow> m_window;
};

/// Writes a waveform of 1000 samples at 1 MHz with a comment.
[[nodiscard]] bool writeTone(const QString &path, const QString &comment = "a tone");

[[nodiscard]] bool writeText(const QString &path, const QByteArray &text);

void pressKey(QWidget *widget, const QKeySequence &key);

/// The menu that is open, or null.
[[nodiscard]] QMenu *openMenu();

[[nodiscard]] QStringList visibleEntries(const QMenu &menu);

/// A click with the right button on a neighbour of the current entry.
void rightClick(QCustomTreeView *tree, const QString &name);

/// Drags the current entry of one pane to that of the other and waits for the copy menu.
void dragBetween(QWidget &top, QCustomTreeView &from, QCustomTreeView &to);

#include "app/MainWindow.h"

template <typename Widget>
Widget *Desk::find(const QString &name) const
{
    return m_window->findChild<Widget *>(name);
}
