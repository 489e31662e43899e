// SPDX-License-Identifier: Apache-2.0
#include "runjob.h"

#include "QtProgressDialog.h"
#include "base/vectorstate.h"

#include <QScrollBar>
#include <QTextEdit>

namespace {

/// The line as HTML in which blanks and tabs stay what they are.
QString dressed(const ReportLine &line)
{
    QString text = line.text.toHtmlEscaped();
    const auto colored = [&text](const char *color) {
        return QString("<font color=\"%1\"><b>%2</b></font>").arg(color, text);
    };
    switch (line.kind) {
    case ReportLine::Kind::Heading:
        return "<b>" + text + "</b>";
    case ReportLine::Kind::Row:
        return ' ' + text + '\t' + line.value.toHtmlEscaped();
    case ReportLine::Kind::Warning:
        return colored("#C08000");
    case ReportLine::Kind::Success:
        return colored("#00C000");
    case ReportLine::Kind::Failure:
        return colored("#C00000");
    case ReportLine::Kind::Text:
        break;
    }
    return text;
}

/// Whether an empty line stands before a line of this kind.
bool standsOff(ReportLine::Kind kind)
{
    return kind == ReportLine::Kind::Heading || kind == ReportLine::Kind::Success ||
           kind == ReportLine::Kind::Failure;
}

} // namespace

JobOutcome runJob(ToolJob &job, QWidget *parent, QTextEdit *report)
{
    QtProgressDialog progress({}, parent);
    QObject::connect(&job, &ToolJob::stepStarted, &progress, &QtProgressDialog::startStep);
    QObject::connect(&job, &ToolJob::ProgressUpdate, &progress, &QtProgressDialog::setValue);
    QObject::connect(&job, &ToolJob::bytesMoved, &progress, &QtProgressDialog::setBytes);
    QObject::connect(&progress, &QtProgressDialog::canceled, &job, &ToolJob::cancel);
    if (report) {
        QObject::connect(&job, &ToolJob::report, report,
                         [report](const ReportLine &line) { appendReport(*report, line); });
    }
    clearVectorState();
    const JobOutcome outcome = job.run();
    if (report) {
        QObject::disconnect(&job, &ToolJob::report, report, nullptr);
    }
    return outcome;
}

void appendReport(QTextEdit &report, const ReportLine &line)
{
    if (standsOff(line.kind) && !report.document()->isEmpty()) {
        report.append({});
    }
    report.append("<span style=\"white-space:pre-wrap\">" + dressed(line) + "</span>");
    report.verticalScrollBar()->setValue(report.verticalScrollBar()->maximum());
}
