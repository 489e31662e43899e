// SPDX-License-Identifier: Apache-2.0
#include "DlgInfo.h"

#include "jobs/InfoReport.h"
#include "ui_DlgInfo.h"
#include "wvfile/HvFileIO.h"

#include <QFileInfo>
#include <QPalette>
#include <QPushButton>

namespace {

/// The colours of the striped table. All colours of the report pass here.
InfoColors stripeColors(const QPalette &palette)
{
    const auto name = [&](QPalette::ColorRole role) { return palette.color(role).name(); };
    // The toolkit's alternate base is too faint for a table without lines.
    const QColor base = palette.color(QPalette::Base);
    const QColor stripe = base.lightness() > 127 ? base.darker(108) : base.lighter(130);
    return {name(QPalette::Text), base.name(), name(QPalette::Text), stripe.name()};
}

} // namespace

DlgInfo::DlgInfo(QWidget *parent)
    : DlgBase(parent)
    , m_ui(std::make_unique<Ui::DlgInfo>())
{
    m_ui->setupUi(this);
    m_ui->te_Info->document()->setDocumentMargin(12);
    m_ui->te_Info->document()->setDefaultStyleSheet("td { padding: 3px 6px; }");
    connect(m_ui->cb_close, &QPushButton::clicked, this, &DlgInfo::reject);
    connect(this, &DlgInfo::rejected, this, &DlgInfo::slot_dialog_rejected);
}

DlgInfo::~DlgInfo() = default;

bool DlgInfo::startModule(const QString &path)
{
    HvFileIO file;
    WvFileSummary summary;
    if (!file.readWaveformInfo(path, &summary)) {
        return false;
    }
    m_ui->te_Info->setHtml(
        infoHtml(summary, QFileInfo(path).absolutePath(), stripeColors(m_ui->te_Info->palette())));
    return true;
}

void DlgInfo::slot_dialog_rejected()
{
    // A report of many segments is large, and nobody sees it any more.
    m_ui->te_Info->clear();
}
