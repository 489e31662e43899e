// SPDX-License-Identifier: Apache-2.0
#include "DlgExport.h"

#include "saveselection.h"

#include "appearance/lineicon.h"
#include "display/QtNumericEdit.h"
#include "jobs/InfoReport.h"
#include "log/Tracer.h"
#include "toolframe/questions.h"
#include "toolframe/runjob.h"
#include "toolframe/toolpages.h"
#include "toolframe/windowplace.h"

#include <QComboBox>
#include <QFileDialog>
#include <QFileInfo>
#include <QFormLayout>
#include <QHBoxLayout>
#include <QLabel>
#include <QLineEdit>
#include <QPushButton>
#include <QSettings>
#include <QTextEdit>

#include <algorithm>

DlgExport::DlgExport(QWidget *parent)
    : DlgBase(parent)
    , m_source(new QLineEdit)
    , m_target(new QLineEdit)
    , m_type(new QComboBox)
    , m_from(sampleField("le_from", "First sample, counted from 0"))
    , m_count(sampleField("le_count", "Number of samples"))
    , m_report(new QTextEdit)
    , m_run(new QPushButton("&Export"))
{
    setWindowTitle("Export Waveform");
    m_source->setObjectName("le_infile");
    m_source->setReadOnly(true);
    m_target->setObjectName("le_outfile");
    m_target->setToolTip("The suffix tells the format: " + exportSuffixes().join(", "));
    m_type->setObjectName("cb_type");
    m_type->setToolTip("How a value is stored, where the format leaves a choice");
    m_report->setObjectName("te_result");
    m_report->setAccessibleName("Report");
    m_report->setReadOnly(true);
    m_run->setObjectName("pb_run");
    m_run->setDefault(true);
    auto *browse = new QPushButton("&Browse...");
    browse->setObjectName("pb_outfile");
    browse->setAutoDefault(false);
    auto *target = new QHBoxLayout;
    target->addWidget(m_target, 1);
    target->addWidget(browse);
    auto *form = new QFormLayout;
    form->addRow("&Source", m_source);
    auto *targetLabel = new QLabel("E&xport To");
    targetLabel->setBuddy(m_target);
    form->addRow(targetLabel, target);
    form->addRow("&Values", m_type);
    form->addRow("&First Sample", m_from);
    form->addRow("&Number of Samples", m_count);
    auto *close = new QPushButton("Close");
    close->setObjectName("cb_close");
    close->setIcon(lineIcon("close"));
    m_run->setIcon(lineIcon("export"));
    close->setAutoDefault(false);
    auto *buttons = new QHBoxLayout;
    buttons->addStretch(1);
    buttons->addWidget(m_run);
    buttons->addWidget(close);
    auto *column = new QVBoxLayout(this);
    column->addLayout(form);
    column->addWidget(m_report, 1);
    column->addLayout(buttons);
    connect(browse, &QPushButton::clicked, this, &DlgExport::chooseTarget);
    connect(m_target, &QLineEdit::textChanged, this, &DlgExport::showTypes);
    connect(m_run, &QPushButton::clicked, this, &DlgExport::run);
    connect(close, &QPushButton::clicked, this, &DlgExport::reject);
}

QtNumericEdit *DlgExport::sampleField(const char *name, const QString &title)
{
    auto *field = new QtNumericEdit;
    field->setObjectName(name);
    field->setName(title);
    roundInput(*field);
    return field;
}

bool DlgExport::startModule(const QString &path)
{
    WvFileSummary summary;
    if (!scanWaveform(path, summary)) {
        return false;
    }
    if (summary.samples < 1) {
        return Tracer::fail("The file holds no samples that could be exported.");
    }
    const auto samples = static_cast<double>(summary.samples);
    m_samples = summary.samples;
    m_source->setText(path);
    m_from->setMax(samples - 1);
    m_from->setMin(0);
    m_from->setVal(0.0);
    m_count->setMax(samples);
    m_count->setMin(1);
    m_count->setVal(samples);
    const QFileInfo file(path);
    m_target->setText(file.path() + '/' + file.completeBaseName() + ".wav");
    m_report->clear();
    return true;
}

void DlgExport::writeSettings(QSettings &settings)
{
    settings.beginGroup("Export");
    writeWindowPlace(settings, *this);
    settings.endGroup();
}

void DlgExport::readSettings(QSettings &settings)
{
    settings.beginGroup("Export");
    readWindowPlace(settings, *this, {200, 140}, {620, 420});
    settings.endGroup();
}

ExportRequest DlgExport::options() const
{
    ExportRequest request;
    request.range.fileName = m_source->text();
    request.range.from = m_from->getValInt();
    const qint64 rest = m_samples - m_from->getValInt();
    request.range.count = std::min<qint64>(m_count->getValInt(), rest);
    request.outputFile = m_target->text();
    if (m_type->currentIndex() >= 0) {
        request.type = static_cast<ExportType>(m_type->currentData().toInt());
    }
    request.overwrite = QFileInfo::exists(request.outputFile);
    return request;
}

void DlgExport::chooseTarget()
{
    const QString name = askExportName(this, m_target->text());
    if (!name.isEmpty()) {
        m_target->setText(name);
    }
}

/// Offers the types that the format of the name has.
void DlgExport::showTypes()
{
    static const QStringList names{"32-bit float", "16 bit", "24 bit"};
    const QVariant before = m_type->currentData();
    m_type->clear();
    for (const ExportType type : exportTypes(m_target->text())) {
        m_type->addItem(names.at(static_cast<int>(type)), static_cast<int>(type));
    }
    const int kept = m_type->findData(before);
    const int plain = m_type->findData(static_cast<int>(ExportType::Int16));
    m_type->setCurrentIndex(std::max(kept >= 0 ? kept : plain, m_type->count() > 0 ? 0 : -1));
    m_type->setEnabled(m_type->count() > 1);
}

void DlgExport::run()
{
    m_report->clear();
    const ExportRequest request = options();
    if (const QString problem = exportProblem(request); !problem.isEmpty()) {
        appendReport(*m_report, ReportLine::failure(problem));
        return;
    }
    for (const QString &file : exportedFiles(request.outputFile)) {
        if (!confirmOverwrite(this, file)) {
            appendReport(*m_report, ReportLine::failure("Export aborted"));
            return;
        }
    }
    ExportJob job(request);
    m_run->setEnabled(false);
    static_cast<void>(runJob(job, this, m_report));
    m_run->setEnabled(true);
}
