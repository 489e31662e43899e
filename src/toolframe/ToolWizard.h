// SPDX-License-Identifier: Apache-2.0
#pragma once

#include "DlgBase.h"

#include "jobs/OutputOptions.h"
#include "jobs/ToolJob.h"

#include <QPoint>
#include <QSize>
#include <QString>
#include <QStringList>

#include <memory>

class QLabel;
class QPushButton;
class QStackedWidget;
class QTextEdit;

/// Base of the tools that lead through pages to one run of a job: pages, buttons, overwrite
/// question, report, settings and window place.
///
/// The form has a stack "sw_assist" whose last page is the status page, with the report "te_result"
/// on it, and below it the buttons "pb_prev", "pb_next" and "cb_close". The page before the last
/// one is the output page: there Next reads Run. Output fields, where a form has them, are
/// "le_outfile", "te_comment" and "le_copyright". A button with a menu saves the tool's fields as a
/// preset, the same file as --preset of the command takes, and loads them; beside the report of a
/// job that has ended well another one opens what it has written. A derived class calls
/// setUpWizard() once its form is set up, and answers a few questions; it moves no page and wires
/// no button itself.
class ToolWizard : public DlgBase
{
    Q_OBJECT

public:
    /// Opens the group of settings, and lets the window place and the fields be written or read.
    void writeSettings(QSettings &settings) final;
    void readSettings(QSettings &settings) final;
    void sendTargetChanged(const QString &instrument) final;

protected:
    struct Frame
    {
        QString settingsGroup;
        QPoint position;     ///< of the window on its first start
        QSize size;          ///< likewise
        QString abortedText; ///< last line of the report after a No to overwriting
    };

    ToolWizard(Frame frame, QWidget *parent);

    /// Finds the widgets of the form, wires the buttons and shows the first page.
    void setUpWizard();

    /// Makes the job that the fields ask for.
    [[nodiscard]] virtual std::unique_ptr<ToolJob> makeJob() const = 0;

    /// The page after this one, asked when Next was clicked and typed values were taken. May do
    /// work, such as a preview by runInPlace(); the same page means that it isn't left.
    [[nodiscard]] virtual int pageAfter(int page);

    /// The page before this one.
    [[nodiscard]] virtual int pageBefore(int page);

    /// Whether Next, or Run, can be clicked on a page. Call updateButtons() when the answer
    /// changes.
    [[nodiscard]] virtual bool isComplete(int page) const;

    /// A page has come up.
    virtual void pageShown(int page);

    /// Files that the job will write, for the question before they are overwritten. By default
    /// what stands in "le_outfile".
    [[nodiscard]] virtual QStringList outputFiles() const;

    /// The job has ended and its report stands on the status page.
    virtual void jobEnded(JobOutcome outcome);

    /// Writes and reads the tool's own settings; the group is open, the window place is done.
    virtual void writeFields(QSettings &settings) const;
    virtual void readFields(const QSettings &settings);

    void showPage(int page);
    void updateButtons();
    [[nodiscard]] int currentPage() const;
    [[nodiscard]] int outputPage() const;
    [[nodiscard]] int statusPage() const;

    /// File name, comment and copyright of the output page.
    [[nodiscard]] OutputOptions outputOptions() const;

    /// Tells above the buttons why the wizard doesn't go on, until it does; empty takes it away.
    void showProblem(const QString &text);

    /// Runs a job that belongs to a page, such as a preview; its report is dropped, the reason of a
    /// failure is shown.
    [[nodiscard]] JobOutcome runInPlace(ToolJob &job);

private:
    void goOn();
    void goBack();
    void run();
    void limitTagTexts();
    void addPresetMenu();
    void addResultButtons();
    void addProblemLine();
    [[nodiscard]] QPushButton *addResultButton(const char *name, const QString &text,
                                               const QString &tip);
    void askAndLoad();
    void askAndSave();
    void takeTypedValues() const;

    Frame m_frame;
    QStackedWidget *m_pages = nullptr;
    QPushButton *m_next = nullptr;
    QPushButton *m_previous = nullptr;
    QPushButton *m_close = nullptr;
    QPushButton *m_preset = nullptr; ///< null in a tool with buttons of its own
    QPushButton *m_view = nullptr;   ///< shown beside the report of a job that has ended well
    QPushButton *m_send = nullptr;
    QLabel *m_problem = nullptr; ///< why the wizard didn't go on
    QString m_result;            ///< what that job has written
    QTextEdit *m_report = nullptr;
    bool m_isRunning = false;
};
