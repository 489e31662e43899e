// SPDX-License-Identifier: Apache-2.0
#include "MarkerJob.h"

#include "base/ProgressClock.h"
#include "log/Tracer.h"

#include <algorithm>
#include <utility>
#include <vector>

QString orderAndCheck(MarkerEdit &edit, qint64 samples)
{
    if (edit.first > edit.last) {
        std::swap(edit.first, edit.last);
    }
    if (edit.action == MarkerAction::Pattern && edit.pattern.isEmpty()) {
        return "No pattern set.";
    }
    if (edit.first < 0 || edit.last >= samples) {
        return QString("The marker range from %1 to %2 leads outside the waveform; permitted: 1 to "
                       "%3.")
            .arg(edit.first + 1)
            .arg(edit.last + 1)
            .arg(samples);
    }
    return {};
}

MarkerJob::MarkerJob(MarkerRequest request, QObject *parent)
    : EditJob(request.inputFile, request.output, Reading::Quiet, parent)
    , m_request(std::move(request))
{
}

bool MarkerJob::edit()
{
    const int samples = source().info().samples;
    for (MarkerEdit &edit : m_request.edits) {
        if (const QString problem = orderAndCheck(edit, samples); !problem.isEmpty()) {
            return Tracer::fail(problem);
        }
        Tracer::Trace(Tracer::Information, QString("Changing Marker from pos. %1 to pos %2.")
                                               .arg(edit.first + 1)
                                               .arg(edit.last + 1));
    }
    const std::optional<double> clock = clockOr(m_request.clockHz);
    if (!clock) {
        return false;
    }
    output().setLength(*clock, samples);
    if (!m_markers.initBuf(&m_markerBytes, BufferedIO::ReadWrite)) {
        return Tracer::fail("Cannot create temporary marker buffer.");
    }
    {
        MarkerEditor editor;
        const JobStep step(*this, "Changing Markers...", editor);
        if (!editor.run(*source().markers(), m_markers, samples, m_request.edits) ||
            !mayProceed()) {
            return false;
        }
    }
    Tracer::Trace(Tracer::Information, "Creating modified waveform...");
    output().record().markerLists = true;
    const WvStreams streams{source().data(), &m_markers, source().tags()};
    if (!output().save(streams, "Saving Waveform...")) {
        return false;
    }
    output().reportFile();
    output().reportLevels();
    return true;
}

MarkerPreviewJob::MarkerPreviewJob(SourceWaveform &source, BufferedIO &target,
                                   QList<MarkerEdit> edits, QObject *parent)
    : ToolJob(parent)
    , m_source(source)
    , m_target(target)
    , m_edits(std::move(edits))
{
}

bool MarkerPreviewJob::work()
{
    MarkerEditor editor;
    const JobStep step(*this, "Changing Markers...", editor);
    return editor.run(*m_source.markers(), m_target, m_source.info().samples, m_edits);
}

bool MarkerEditor::run(BufferedIO &source, BufferedIO &target, qint64 samples,
                       const QList<MarkerEdit> &edits)
{
    m_cancelled = false;
    if (!source.restartAtBegining() || !target.restartAtBegining()) {
        return Tracer::fail("*** Cannot set marker stream start position.");
    }
    constexpr qint64 BlockBytes = 256LL * 1024;
    ProgressClock progress([this](int percent) { emit ProgressUpdate(percent); }, m_cancelled);
    std::vector<quint8> block(static_cast<std::size_t>(std::min(samples, BlockBytes)));
    for (qint64 done = 0; done < samples;) {
        if (progress.shouldStop(done, samples)) {
            return Tracer::fail("Action aborted by user.");
        }
        const auto count = static_cast<int>(std::min(samples - done, BlockBytes));
        if (source.readBlock(count, block.data()) != count) {
            return Tracer::fail("*** Cannot read marker data.");
        }
        for (const MarkerEdit &edit : edits) {
            applyMarkerEdit(edit, done, std::span(block).first(static_cast<std::size_t>(count)));
        }
        if (!target.writeBytes(count, block.data())) {
            return Tracer::fail("*** Cannot write marker data.");
        }
        done += count;
    }
    return target.restartAtBegining() || Tracer::fail("*** Cannot write marker data.");
}
