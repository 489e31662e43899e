// SPDX-License-Identifier: Apache-2.0
#include "DlgProgress.h"

#include "appearance/lineicon.h"
#include "base/ProgressClock.h"
#include "toolframe/runjob.h"

#include <QDialogButtonBox>
#include <QFormLayout>
#include <QProgressBar>
#include <QPushButton>
#include <QTextEdit>
#include <QVBoxLayout>

DlgProgress::DlgProgress(QWidget *parent)
    : QDialog(parent)
    , p_overall(new QProgressBar(this))
    , p_task(new QProgressBar(this))
    , te_messages(new QTextEdit(this))
{
    setWindowTitle(QStringLiteral("Waveform Composer Status"));
    setModal(true);
    p_overall->setObjectName(QStringLiteral("p_overall"));
    p_task->setObjectName(QStringLiteral("p_task"));
    te_messages->setObjectName(QStringLiteral("te_messages"));
    te_messages->setReadOnly(true);
    te_messages->setAccessibleName(QStringLiteral("Messages"));
    auto *bars = new QFormLayout;
    bars->addRow(QStringLiteral("Overall"), p_overall);
    bars->addRow(QStringLiteral("Current Task"), p_task);
    auto *buttons = new QDialogButtonBox(this);
    pb_cancel = buttons->addButton(QStringLiteral("Cancel"), QDialogButtonBox::ActionRole);
    pb_close = buttons->addButton(QStringLiteral("Close"), QDialogButtonBox::RejectRole);
    pb_cancel->setObjectName(QStringLiteral("pb_cancel"));
    pb_close->setObjectName(QStringLiteral("pb_close"));
    pb_cancel->setIcon(lineIcon(QStringLiteral("cancel")));
    pb_close->setIcon(lineIcon(QStringLiteral("close")));
    auto *layout = new QVBoxLayout(this);
    layout->addLayout(bars);
    layout->addWidget(te_messages, 1);
    layout->addWidget(buttons);
    connect(pb_cancel, &QPushButton::clicked, this, &DlgProgress::canceled);
    connect(pb_close, &QPushButton::clicked, this, &DlgProgress::reject);
    resize(640, 480);
    setRunning(false);
}

void DlgProgress::addMessage(const ReportLine &line)
{
    appendReport(*te_messages, line);
}

void DlgProgress::setRunning(bool running)
{
    pb_cancel->setEnabled(running);
    pb_close->setEnabled(!running);
}

void DlgProgress::setOverallProgress(int percent)
{
    p_overall->setValue(percent);
    ProgressClock::runEvents();
}

void DlgProgress::setTaskProgress(int percent)
{
    p_task->setValue(percent);
    ProgressClock::runEvents();
}

void DlgProgress::reject()
{
    // Escape and the window's own button end a run first.
    if (pb_close->isEnabled()) {
        QDialog::reject();
    } else {
        emit canceled();
    }
}
