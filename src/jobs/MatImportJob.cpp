// SPDX-License-Identifier: Apache-2.0
#include "MatImportJob.h"

#include "import/MatFileAccess.h"
#include "log/Tracer.h"
#include "streams/TempStream.h"

#include <algorithm>
#include <utility>

namespace {

/// Why a variable that is there can't be had, in words that say what to do.
QString obstacleOf(const MatFileAccess &file, const QString &name)
{
    const QList<MatEntry> &entries = file.directory();
    const auto entry = std::find_if(entries.begin(), entries.end(), [&name](const MatEntry &one) {
        return one.isShown() && one.name == name;
    });
    return entry != entries.end() ? entry->obstacle() : QString();
}

} // namespace

MatImportJob::MatImportJob(MatImportRequest request, QObject *parent)
    : ImportJob(request.target, parent)
    , m_request(std::move(request))
{
}

std::optional<qint64> MatImportJob::readInput(TempStream &data, qint64 limit)
{
    emit report(ReportLine::heading("Reading .MAT file directory"));
    MatFileAccess file;
    if (!file.open(m_request.inputFile)) {
        Tracer::Trace(Tracer::Error, "Cannot open file.");
        return std::nullopt;
    }
    const JobStep step(*this, "Reading MATLAB File...", file);
    if (!file.readDirectory()) {
        emit report(ReportLine::plain("Cannot read content."));
        return std::nullopt;
    }
    emit report(ReportLine::heading("Reading variable data"));
    if (!file.readVariable(m_request.variable, data.stream(), &limit)) {
        const QString obstacle = obstacleOf(file, m_request.variable);
        if (!obstacle.isEmpty()) {
            emit report(
                ReportLine::plain(QString("Variable '%1': %2").arg(m_request.variable, obstacle)));
        }
        Tracer::Trace(Tracer::Error, "Cannot read variable content.");
        return std::nullopt;
    }
    return limit;
}
