// SPDX-License-Identifier: Apache-2.0
#include "runjob.h"

#include "QtProgressDialog.h"
#include "base/vectorstate.h"
#include "jobs/ToolJob.h"

#include <QScrollBar>
#include <QTextEdit>

JobOutcome runJob(ToolJob &job, QWidget *parent, QTextEdit *report)
{
    QtProgressDialog progress({}, parent);
    QObject::connect(&job, &ToolJob::stepStarted, &progress, &QtProgressDialog::startStep);
    QObject::connect(&job, &ToolJob::ProgressUpdate, &progress, &QtProgressDialog::setValue);
    QObject::connect(&progress, &QtProgressDialog::canceled, &job, &ToolJob::cancel);
    if (report) {
        QObject::connect(&job, &ToolJob::report, report,
                         [report](const QString &html) { appendReport(*report, html); });
    }
    clearVectorState();
    const bool done = job.run();
    if (report) {
        QObject::disconnect(&job, &ToolJob::report, report, nullptr);
    }
    if (done) {
        return JobOutcome::Finished;
    }
    return job.isCancelled() ? JobOutcome::Cancelled : JobOutcome::Failed;
}

void appendReport(QTextEdit &report, const QString &html)
{
    QString line = html;
    if (line.startsWith('\n')) {
        line.remove(0, 1);
        if (!report.document()->isEmpty()) {
            report.append({});
        }
    }
    report.append("<span style=\"white-space:pre-wrap\">" + line + "</span>");
    report.verticalScrollBar()->setValue(report.verticalScrollBar()->maximum());
}
