// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <QObject>
#include <QString>

class QComboBox;
class QCompleter;
class QFileSystemModel;
class QHBoxLayout;

/// The path of a pane's current entry as a line that takes a typed path, with those shown before
/// as its choices, and with buttons for the folder above and the default folder.
class PathBox : public QObject
{
    Q_OBJECT

public:
    static constexpr int MaxHistory = 11;

    /// Works on a box and the row in which it stands, neither of which is owned.
    PathBox(QComboBox *box, QHBoxLayout *row);

    /// Shows a path and keeps it among the choices. Sends nothing.
    void show(const QString &path);

    /// Takes a path that leads nowhere out of the choices, and shows another one.
    void forget(const QString &path, const QString &shown);

    /// Forgets all paths, as for another device; typed paths are completed from the local file
    /// system or not at all.
    void restart(bool local);

signals:
    /// The user has chosen or typed a path.
    void pathChosen(const QString &path);
    void upRequested();
    void homeRequested();

private:
    QComboBox *m_box;
    QFileSystemModel *m_files; ///< of the completion; reads nothing before it is asked
    QCompleter *m_completer;
    bool m_isLocal = true;
};
