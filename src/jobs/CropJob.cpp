// SPDX-License-Identifier: Apache-2.0
#include "CropJob.h"

#include "samplepass.h"

#include "log/Tracer.h"
#include "streams/levels.h"

#include <utility>

CropJob::CropJob(CropRequest request, QObject *parent)
    : EditJob(request.range.fileName, request.output, Reading::Quiet, parent)
    , m_request(std::move(request))
{
    setEnding({"Piece saved", "Saving the piece failed"});
}

bool CropJob::edit()
{
    const qint64 samples = source().info().samples;
    if (const QString problem = rangeProblem(m_request.range, samples); !problem.isEmpty()) {
        return refuse(problem);
    }
    const std::optional<double> clock = clockOr(std::nullopt);
    if (!clock) {
        return false;
    }
    const qint64 begin = m_request.range.from.value_or(0);
    const qint64 count = m_request.range.count.value_or(samples - begin);
    if (!copy(begin, count)) {
        return false;
    }
    output().setLength(*clock, count);
    output().setLevels(m_levels.peakLevel(), m_levels.rmsLevel(count));
    emit report(ReportLine::heading("Saving"));
    output().reportWaveform();
    return output().save({m_data.stream(), &m_markers, source().tags()}, "Saving...");
}

bool CropJob::copy(qint64 begin, qint64 count)
{
    if (!m_data.openFor(count) || !m_data->writeHeader(BufferedIO::DataHeader)) {
        return Tracer::fail("Cannot create temporary data buffer.");
    }
    if (!m_markers.initBuf(&m_markerBytes, BufferedIO::ReadWrite)) {
        return Tracer::fail("Cannot create temporary marker buffer.");
    }
    emit stepStarted("Copying Samples...");
    return passSamples(
        *this, source(), begin, count,
        [this](std::span<const float> values, std::span<const char> markers, qint64) {
            addLevels(values, m_levels);
            return (m_data->writeBytes(static_cast<int>(values.size_bytes()), values.data()) &&
                    m_markers.writeBytes(static_cast<int>(markers.size()), markers.data())) ||
                   Tracer::fail("Cannot write to temporary data buffer.");
        });
}
