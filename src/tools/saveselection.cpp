// SPDX-License-Identifier: Apache-2.0
#include "saveselection.h"

#include "base/OutputFile.h"
#include "jobs/CropJob.h"
#include "jobs/ExportJob.h"
#include "jobs/ReportText.h"
#include "toolframe/questions.h"
#include "toolframe/runjob.h"
#include "toolframe/toolpages.h"

#include <QFileDialog>
#include <QFileInfo>
#include <QMessageBox>
#include <QRegularExpression>

#include <algorithm>
#include <memory>

namespace {

QString title()
{
    return "Save Selection";
}

QStringList exportFileTypes()
{
    return {"WAV (*.wav)",   "Raw 32-bit floats (*.cf32)", "Raw 16-bit words (*.cs16)",
            "Table (*.csv)", "MATLAB 5 (*.mat)",           "SigMF (*.sigmf-meta)"};
}

/// The name that was chosen; one without a suffix gets that of the chosen type.
QString askName(QWidget *parent, const QString &title, const QString &initial,
                const QStringList &types)
{
    QString type;
    QString name = QFileDialog::getSaveFileName(parent, title, initial, types.join(";;"), &type,
                                                QFileDialog::DontConfirmOverwrite);
    if (!name.isEmpty() && QFileInfo(name).suffix().isEmpty()) {
        static const QRegularExpression suffix("\\*(\\.[^)]+)\\)");
        name += suffix.match(type.isEmpty() ? types.first() : type).captured(1);
    }
    return name;
}

std::unique_ptr<ToolJob> makeJob(const SampleRange &piece, const QString &name)
{
    // The user was asked about what stands there, not about what appears later.
    const bool overwrite = QFileInfo::exists(name);
    if (exportFormat(name)) {
        return std::make_unique<ExportJob>(
            ExportRequest{.range = piece, .outputFile = name, .type = {}, .overwrite = overwrite});
    }
    OutputOptions output;
    output.fileName = name;
    output.overwrite = overwrite;
    return std::make_unique<CropJob>(CropRequest{.range = piece, .output = output});
}

} // namespace

QString askExportName(QWidget *parent, const QString &initial)
{
    return askName(parent, "Export Waveform", initial, exportFileTypes());
}

void saveSelection(QWidget *parent, const SampleRange &piece)
{
    const QString name = askName(parent, title(), fileNameWithSuffix(piece.fileName, "_piece"),
                                 QStringList("Waveform (*.wv)") + exportFileTypes());
    if (name.isEmpty()) {
        return;
    }
    const QStringList files = exportFormat(name) ? exportedFiles(name) : QStringList{name};
    const bool isSource = std::any_of(files.begin(), files.end(), [&](const QString &file) {
        return isSameFile(file, piece.fileName);
    });
    if (isSource) {
        QMessageBox::warning(parent, title(), "The piece can't take the place of its source.");
        return;
    }
    for (const QString &file : files) {
        if (!confirmOverwrite(parent, file)) {
            return;
        }
    }
    const std::unique_ptr<ToolJob> job = makeJob(piece, name);
    QStringList report;
    QObject::connect(job.get(), &ToolJob::report, parent,
                     [&report](const ReportLine &line) { report << plainLine(line); });
    const JobOutcome outcome = runJob(*job, parent, nullptr);
    if (outcome == JobOutcome::Failed) {
        QMessageBox::warning(parent, title(),
                             "The selection wasn't saved. The log of the main window tells why.");
    } else if (outcome == JobOutcome::Finished) {
        QMessageBox::information(parent, title(),
                                 report.join('\n').toHtmlEscaped().replace('\n', "<br>"));
    }
}
