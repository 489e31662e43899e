// SPDX-License-Identifier: Apache-2.0
#include "TransferJob.h"

#include "CopyJob.h"

#include "instrument/VisaDevice.h"
#include "instrument/remotepaths.h"
#include "log/Tracer.h"

#include <QDir>
#include <QFileInfo>

#include <algorithm>
#include <utility>

TransferJob::TransferJob(InstrumentRef instrument, Request request, QObject *parent)
    : InstrumentJob(std::move(instrument),
                    request.direction == Direction::Get ? "Reading file..." : "Sending file...",
                    parent)
    , m_request(std::move(request))
{
}

bool TransferJob::talk(VisaDevice &device)
{
    if (m_request.direction == Direction::Put && !areFit(device)) {
        return false;
    }
    return std::all_of(m_request.locals.cbegin(), m_request.locals.cend(),
                       [&](const QString &local) { return !isCancelled() && copy(device, local); });
}

/// Before anything is sent, so that a script knows where it stands after a refusal.
bool TransferJob::areFit(const VisaDevice &device)
{
    if (m_request.check == WaveformCheck::None) {
        return true;
    }
    const InstrumentSummary instrument = summaryOf(device);
    return std::all_of(
        m_request.locals.cbegin(), m_request.locals.cend(), [&](const QString &local) {
            const bool isStrict = m_request.check == WaveformCheck::Strict;
            if (!isWaveformFile(local)) {
                return !isStrict || !local.endsWith(".wv", Qt::CaseInsensitive) ||
                       Tracer::fail(QString("The file '%1' is no waveform.").arg(local));
            }
            if (isStrict && !needsOf(local)) {
                return false;
            }
            return mayPlay(problemsOfFile(local, instrument, m_request.locals.size() > 1),
                           m_request.check);
        });
}

bool TransferJob::copy(VisaDevice &device, const QString &localName)
{
    const QFileInfo local(localName);
    const QString localFolder = local.absolutePath() + (local.dir().isRoot() ? "" : "/");
    const QString remote = slashPath(m_request.remote, device.pathSeparator());
    CopyRequest request;
    if (m_request.direction == Direction::Get) {
        if (!QFileInfo(localFolder).isDir()) {
            return Tracer::fail(QString("The folder '%1' does not exist.").arg(localFolder));
        }
        request = {.sourceDevice = &device,
                   .source = remote,
                   .targetFolder = localFolder,
                   .targetName = local.fileName(),
                   .existing = m_request.existing};
    } else {
        const QString name = remote.mid(folderOf(remote).size());
        request = {.source = localFolder + local.fileName(),
                   .targetDevice = &device,
                   .targetFolder = folderOf(remote),
                   .targetName = name.isEmpty() ? local.fileName() : name};
    }
    CopyJob copy(request);
    connect(&copy, &ToolJob::stepStarted, this, &ToolJob::stepStarted);
    connect(this, &ToolJob::cancelRequested, &copy, &ToolJob::cancel);
    const bool done = copy.run() == JobOutcome::Finished;
    noteReported(copy.reported());
    return done;
}
