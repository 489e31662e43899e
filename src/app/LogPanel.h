// SPDX-License-Identifier: Apache-2.0
#pragma once

#include "log/Tracer.h"

#include <QWidget>

class QComboBox;
class QLabel;
class QLineEdit;
class QListWidget;
class QListWidgetItem;

/// The log below the panes: the last 256 messages, of which a level and a text choose those that
/// are shown. The last error stays beside the choices until the log is cleared, so that what comes
/// after it can't carry it out of sight.
class LogPanel : public QWidget
{
    Q_OBJECT

public:
    /// Takes the place of the list in its splitter and owns it from then on.
    explicit LogPanel(QListWidget *list);

    void append(const QList<Tracer::Entry> &entries);

    /// The messages that are shown, a line each, oldest first; those that are selected if any are.
    [[nodiscard]] QString shownText() const;

    /// Writes shownText(). False if that fails, which is told in the log.
    bool save(const QString &fileName) const;

public slots:
    void copy() const;
    void chooseFile();
    void toggleTranscript(bool starts);
    void clear();

private:
    void addChoices();
    void applyFilter();
    [[nodiscard]] bool passes(const QListWidgetItem &row) const;
    void openMenu(const QPoint &position);

    QListWidget *m_list;
    QComboBox *m_level;
    QLineEdit *m_text;
    QLabel *m_lastError;
};
