// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <QDialog>

class QProgressBar;
class QPushButton;
class QTextEdit;
struct ReportLine;

/// The status window of a render. It stays open behind it, to be read and closed by the user.
class DlgProgress : public QDialog
{
    Q_OBJECT

public:
    explicit DlgProgress(QWidget *parent = nullptr);

    void addMessage(const ReportLine &line);

    /// While a run is on, the window can't be closed, only the run be cancelled.
    void setRunning(bool running);

public slots:
    /// In percent; both let the event loop run once.
    void setOverallProgress(int percent);
    void setTaskProgress(int percent);
    void reject() override;

signals:
    void canceled();

private:
    QProgressBar *p_overall;
    QProgressBar *p_task;
    QTextEdit *te_messages;
    QPushButton *pb_close;
    QPushButton *pb_cancel;
};
