// SPDX-License-Identifier: Apache-2.0
#include "DlgInfo.h"

#include "appearance/lineicon.h"
#include "jobs/CheckJob.h"
#include "jobs/InfoReport.h"
#include "ui_DlgInfo.h"

#include <QFileInfo>
#include <QPalette>
#include <QPointer>
#include <QPushButton>
#include <QTimer>

namespace {

/// The colours of the striped table. All colours of the report pass here.
QString stripeStyle(const QPalette &palette)
{
    const QString text = palette.color(QPalette::Text).name();
    // The toolkit's alternate base is too faint for a table without lines.
    const QColor base = palette.color(QPalette::Base);
    const QColor stripe = base.lightness() > 127 ? base.darker(108) : base.lighter(130);
    const QString rule = "tr.d%1 td {; color: " + text + ";  background-color: %2}";
    return "<style type=\"text/css\">" + rule.arg(QString::number(0), base.name()) +
           rule.arg(QString::number(1), stripe.name()) + "</style>";
}

QString tableRow(const InfoRow &row, bool odd)
{
    QString label = row.label;
    if (row.kind == InfoRow::Kind::Segment) {
        label = "<b>" + label + "</b>";
    } else if (row.kind == InfoRow::Kind::Detail) {
        label.prepend("&nbsp;&nbsp; ");
    }
    return QString("<tr class=\"d%1\"><td width=\"30%\">%2</td><td width=\"70%\">%3</td></tr>")
        .arg(QString::number(odd ? 1 : 0), label, row.value.toHtmlEscaped());
}

QString table(const QList<InfoRow> &rows)
{
    QString html = "<p><table border=\"0\" width=\"100%\">";
    bool odd = false;
    for (const InfoRow &row : rows) {
        html += tableRow(row, odd);
        odd = !odd;
    }
    return html + "</table> </p> ";
}

/// The report, with `folder` above the file name. Texts from the file are escaped.
QString reportHtml(const WvFileSummary &summary, const SampleCheck *check, const QString &folder,
                   const QPalette &palette)
{
    QString html = stripeStyle(palette) + "<h2>" + folder.toHtmlEscaped() + "</h2>";
    html += "<h2>&nbsp;&nbsp;" + summary.fileName.toHtmlEscaped() + "</h2>";
    html += table(fileRows(summary) + (check != nullptr ? checkRows(*check) : QList<InfoRow>()));
    if (summary.segmentCount > 0) {
        html += "<h3> Multi Segment Waveform </h3>" + table(segmentRows(summary));
    }
    return html;
}

} // namespace

DlgInfo::DlgInfo(QWidget *parent)
    : DlgBase(parent)
    , m_ui(std::make_unique<Ui::DlgInfo>())
{
    m_ui->setupUi(this);
    m_ui->te_Info->setAccessibleName("Information");
    m_ui->cb_close->setIcon(lineIcon("close"));
    m_ui->te_Info->document()->setDocumentMargin(12);
    m_ui->te_Info->document()->setDefaultStyleSheet("td { padding: 3px 6px; }");
    connect(m_ui->cb_close, &QPushButton::clicked, this, &DlgInfo::reject);
    connect(this, &DlgInfo::rejected, this, &DlgInfo::slot_dialog_rejected);
}

DlgInfo::~DlgInfo()
{
    cancelCheck();
}

void DlgInfo::cancelCheck()
{
    if (m_check) {
        m_check->cancel();
    }
}

bool DlgInfo::startModule(const QString &path)
{
    WvFileSummary summary;
    if (!scanWaveform(path, summary)) {
        return false;
    }
    m_path = path;
    m_summary = summary;
    m_result.reset();
    showReport(nullptr);
    // The tags stand there at once; the samples of a long file take a while.
    QTimer::singleShot(0, this, &DlgInfo::checkSamples);
    return true;
}

void DlgInfo::showReport(const SampleCheck *check)
{
    m_ui->te_Info->setHtml(
        reportHtml(m_summary, check, QFileInfo(m_path).absolutePath(), m_ui->te_Info->palette()));
}

void DlgInfo::changeEvent(QEvent *event)
{
    // The stripes have colours of their own.
    if (event->type() == QEvent::StyleChange && !m_path.isEmpty()) {
        showReport(m_result.get());
    }
    DlgBase::changeEvent(event);
}

void DlgInfo::checkSamples()
{
    // The report of a multi-segment waveform is of its tags alone.
    if (m_path.isEmpty() || m_summary.samples < 1) {
        return;
    }
    cancelCheck();
    // The job lets the event loop run, in which another file may be asked for, or this be deleted.
    const QString path = m_path;
    const auto job = std::make_shared<CheckJob>(path);
    const QPointer<DlgInfo> self(this);
    m_check = job;
    const bool isDone = job->run() == JobOutcome::Finished;
    if (self.isNull() || self->m_check != job) {
        return;
    }
    self->m_check.reset();
    if (isDone && self->m_path == path) {
        const SampleCheck check = job->result();
        self->m_result = std::make_shared<const SampleCheck>(check);
        self->showReport(&check);
    }
}

void DlgInfo::slot_dialog_rejected()
{
    // A report of many segments is large, and nobody sees it any more.
    m_ui->te_Info->clear();
    m_path.clear();
    m_result.reset();
    cancelCheck();
}
