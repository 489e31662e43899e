// SPDX-License-Identifier: Apache-2.0
#include "deviceactions.h"

#include "instrument/VisaDevice.h"
#include "instrument/remotepaths.h"
#include "jobs/instrument/CopyJob.h"
#include "jobs/instrument/StartJob.h"
#include "log/Tracer.h"
#include "toolframe/QtProgressDialog.h"
#include "toolframe/questions.h"
#include "toolframe/runjob.h"

#include <algorithm>

namespace {

/// Lets one window at a time ask for the user: the question, then the progress again.
template <typename Question>
bool askBetween(const Question &question)
{
    QtProgressDialog *progress = QtProgressDialog::running();
    progress->suspend();
    const bool answer = question();
    progress->resume();
    return answer;
}

QString proceedText(qsizetype files, qint64 bytes)
{
    constexpr double Megabyte = 1024.0 * 1024.0;
    const QString size = QString("%1 MB").arg(static_cast<double>(bytes) / Megabyte, 0, 'f', 2);
    return QString("%1 files found.\nThe total file size is %2.\nDo you really want to proceed?")
        .arg(files)
        .arg(size);
}

QString wayText(const CopyRequest &request)
{
    const auto place = [](const VisaDevice *device, const QString &path) {
        return device != nullptr
                   ? QString("%1 on %2, %3").arg(path, device->model(), device->serial())
                   : path;
    };
    return QString("From: %1\nTo: %2")
        .arg(place(request.sourceDevice, request.source),
             place(request.targetDevice, request.targetFolder));
}

QString replaceText(const QStringList &paths)
{
    return paths.size() == 1
               ? QString("The file '%1' already exists.\nDo you want to overwrite this file?")
                     .arg(paths.first())
               : QString("%1 of the target files already exist.\n"
                         "Do you want to overwrite these files?")
                     .arg(paths.size());
}

bool askMisfits(QWidget *parent, const QString &title, const QStringList &problems)
{
    constexpr qsizetype MostShown = 10;
    const bool isCut = problems.size() > MostShown;
    return askYesNo(parent, title,
                    problems.first(std::min(problems.size(), MostShown)).join('\n') +
                        (isCut ? "\n..." : "") + "\nDo you want to proceed all the same?");
}

QString outcomeText(const CopyJob &job, bool done, const QString &reason)
{
    if (job.isCancelled()) {
        return job.fileCount() <= 1 ? QString("The copy was cancelled.")
                                    : QString("The copy was cancelled after %1 of %2 files.")
                                          .arg(job.copiedCount())
                                          .arg(job.fileCount());
    }
    if (!done && job.fileCount() <= 1) {
        return QString("Nothing was copied: %1").arg(reason);
    }
    if (!done) {
        return QString("%1 of %2 files copied: %3")
            .arg(job.copiedCount())
            .arg(job.fileCount())
            .arg(reason);
    }
    return job.fileCount() == 1 ? QString("1 file copied.")
                                : QString("%1 files copied.").arg(job.fileCount());
}

} // namespace

CopyOutcome copyEntry(QWidget *parent, const CopyRequest &request)
{
    const CopyQuestions questions{
        .proceed =
            [&](qsizetype files, qint64 bytes) {
                return askBetween([&] {
                    return askYesNo(parent, "Copy Folder", proceedText(files, bytes),
                                    wayText(request));
                });
            },
        .replace =
            [&](const QStringList &paths) {
                return askBetween([&] {
                    return askYesNo(parent, "Overwrite File", replaceText(paths),
                                    fileDetails(paths));
                });
            },
        .sendMisfits =
            [&](const QStringList &problems) {
                return askBetween([&] { return askMisfits(parent, "Send Waveform", problems); });
            },
        .goOn =
            [&] {
                return askBetween([&] {
                    return askYesNo(parent, "Copy Folder",
                                    "An error occured during copying. Do you want to proceed with "
                                    "the next file?");
                });
            }};
    const Tracer::ErrorWatch watch;
    CopyJob job(request, questions);
    const bool isComplete = runJob(job, parent, nullptr) == JobOutcome::Finished;
    return {job.copiedCount(), isComplete, outcomeText(job, isComplete, watch.text())};
}

bool isRunnable(const QString &path, const VisaDevice *device)
{
    return device != nullptr && path.endsWith(".WV", Qt::CaseInsensitive);
}

QString runWaveform(QWidget *parent, VisaDevice &device, const QString &path)
{
    StartJob job({.device = &device}, path);
    job.setCheck(WaveformCheck::Warned);
    job.setQuestion([&](const QStringList &problems) {
        return askBetween([&] { return askMisfits(parent, "Run!", problems); });
    });
    const Tracer::ErrorWatch watch;
    const bool started = runJob(job, parent, nullptr) == JobOutcome::Finished;
    if (!started) {
        return QString("'%1' was not started on %2, %3: %4")
            .arg(entryName(path), device.model(), device.serial(), watch.text());
    }
    const char *words =
        job.isOutputOff() ? "'%1' plays on %2, %3; its RF output is off." : "'%1' plays on %2, %3.";
    return QString(words).arg(entryName(path), device.model(), device.serial());
}
