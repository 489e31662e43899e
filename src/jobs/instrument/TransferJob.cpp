// SPDX-License-Identifier: Apache-2.0
#include "TransferJob.h"

#include "CopyJob.h"

#include "instrument/VisaDevice.h"
#include "instrument/remotepaths.h"
#include "log/Tracer.h"

#include <QDir>
#include <QFileInfo>

#include <utility>

TransferJob::TransferJob(InstrumentRef instrument, Direction direction, QString local,
                         QString remote, QObject *parent)
    : InstrumentJob(std::move(instrument),
                    direction == Direction::Get ? "Reading file..." : "Sending file...", parent)
    , m_direction(direction)
    , m_local(std::move(local))
    , m_remote(std::move(remote))
{
}

bool TransferJob::talk(VisaDevice &device)
{
    const QFileInfo local(m_local);
    const QString localFolder = local.absolutePath() + (local.dir().isRoot() ? "" : "/");
    const QString remote = slashPath(m_remote, device.pathSeparator());
    CopyRequest request;
    if (m_direction == Direction::Get) {
        if (!QFileInfo(localFolder).isDir()) {
            return Tracer::fail(QString("The folder '%1' does not exist.").arg(localFolder));
        }
        request = {.sourceDevice = &device,
                   .source = remote,
                   .targetFolder = localFolder,
                   .targetName = local.fileName()};
    } else {
        request = {.source = localFolder + local.fileName(),
                   .targetDevice = &device,
                   .targetFolder = folderOf(remote),
                   .targetName = remote.mid(folderOf(remote).size())};
    }
    CopyJob copy(request);
    connect(&copy, &ToolJob::stepStarted, this, &ToolJob::stepStarted);
    connect(this, &ToolJob::cancelRequested, &copy, &ToolJob::cancel);
    const bool done = copy.run() == JobOutcome::Finished;
    noteReported(copy.reported());
    return done;
}
