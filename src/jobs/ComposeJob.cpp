// SPDX-License-Identifier: Apache-2.0
#include "ComposeJob.h"

#include "WaveformOutput.h"

#include <QFileInfo>

#include <utility>

ComposeJob::ComposeJob(ComposeRequest request, QObject *parent)
    : ToolJob(parent)
    , m_request(std::move(request))
    , m_engine(m_request.composition)
{
    if (!m_request.multiProcess) {
        m_engine.setMaxThreads(1);
    }
    m_engine.setOverwrites(m_request.overwrite);
    connect(this, &ToolJob::cancelRequested, &m_engine, &ComposerEngine::slot_cancel);
    connect(&m_engine, &ComposerEngine::overallProgress, this, &ToolJob::ProgressUpdate);
    const auto send = [this](auto signal, ReportLine (*line)(QString)) {
        connect(&m_engine, signal, this,
                [this, line](const QString &text) { emit report(line(text)); });
    };
    send(&ComposerEngine::headline, &ReportLine::success);
    send(&ComposerEngine::message, &ReportLine::plain);
    send(&ComposerEngine::warningMessage, &ReportLine::warning);
    send(&ComposerEngine::errorMessage, &ReportLine::failure);
}

QString ComposeJob::problem() const
{
    const Composition &document = m_request.composition;
    const ComposerTarget &target = document.target;
    if (target.sName.isEmpty()) {
        return emptyFileNameText();
    }
    const QFileInfo output(target.sName);
    const QFileInfo folder(output.absolutePath());
    if (output.isDir() || !folder.isDir() || !(output.exists() || folder.isWritable())) {
        return QStringLiteral("The target file '%1' can't be written: %2")
            .arg(target.sName, output.isDir()    ? QStringLiteral("it is a folder.")
                               : !folder.isDir() ? QStringLiteral("its folder doesn't exist.")
                                                 : QStringLiteral("its folder is read-only."));
    }
    bool hasSamples = false;
    for (int track = 0; track < document.trackCount(); ++track) {
        if (!document.tracks()[static_cast<std::size_t>(track)].bEnable) {
            continue;
        }
        for (int i = 0; i < document.segmentCount(track); ++i) {
            const ComposerSegment &segment = *document.segment(track, i);
            hasSamples = hasSamples || segment.lSamples > 0;
            const QFileInfo source(segment.sName);
            if (!source.isFile()) {
                return QStringLiteral("The source file '%1' of track %2, segment %3 is missing.")
                    .arg(segment.sName)
                    .arg(track + 1)
                    .arg(i + 1);
            }
            // Rendered once more, the result would be another one.
            if (output.exists() && output.canonicalFilePath() == source.canonicalFilePath()) {
                return QStringLiteral("The target file '%1' is also the source of track %2, "
                                      "segment %3. Choose another name.")
                    .arg(target.sName)
                    .arg(track + 1)
                    .arg(i + 1);
            }
        }
    }
    if (!hasSamples) {
        return QStringLiteral("There is nothing to render: no enabled track has a segment.");
    }
    return target.lSamples > 0
               ? QString()
               : QStringLiteral(
                     "There is nothing to render: the target has a length of %1 samples.")
                     .arg(target.lSamples);
}

bool ComposeJob::work()
{
    m_refusal = problem();
    if (!m_refusal.isEmpty()) {
        return refuse(m_refusal);
    }
    emit stepStarted(QStringLiteral("Composing"));
    return m_engine.runComposer();
}
