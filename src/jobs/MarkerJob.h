// SPDX-License-Identifier: Apache-2.0
#pragma once

#include "EditJob.h"

#include "dsp/markeredit.h"

#include <QList>

#include <optional>

struct MarkerRequest
{
    QString inputFile;
    OutputOptions output;
    QList<MarkerEdit> edits;            ///< applied in this order; their ranges may run either way
    std::optional<double> clockHz = {}; ///< clock of the result; nothing: that of the source
};

/// Puts the range of an edit in order. Why it can't be applied to a waveform of so many samples;
/// empty if it can.
[[nodiscard]] QString orderAndCheck(MarkerEdit &edit, qint64 samples);

/// Changes marker traces of a waveform; samples, levels and unknown tags stay as they are.
class MarkerJob : public EditJob
{
    Q_OBJECT

public:
    explicit MarkerJob(MarkerRequest request, QObject *parent = nullptr);

private:
    [[nodiscard]] bool edit() override;

    MarkerRequest m_request;
    RunLengthDevice m_markerBytes;
    BufferedIO m_markers{1024 * 1024}; // destroyed before its device
};

/// Shows what edits make of the markers of a waveform that a tool has read: they go to a stream of
/// their own.
class MarkerPreviewJob : public ToolJob
{
    Q_OBJECT

public:
    /// Waveform and target outlive the job; the ranges are in order and lie in the waveform.
    MarkerPreviewJob(SourceWaveform &source, BufferedIO &target, QList<MarkerEdit> edits,
                     QObject *parent = nullptr);

private:
    [[nodiscard]] bool work() override;

    SourceWaveform &m_source;
    BufferedIO &m_target;
    QList<MarkerEdit> m_edits;
};

/// Copies the marker bytes of `samples` samples from one stream to another and applies edits, whose
/// ranges are in order and lie in the waveform, on the way. The target holds them from its start.
class MarkerEditor : public QObject
{
    Q_OBJECT

public:
    using QObject::QObject;

    /// False, with the reason logged, if a stream fails or the work was cancelled.
    [[nodiscard]] bool run(BufferedIO &source, BufferedIO &target, qint64 samples,
                           const QList<MarkerEdit> &edits);

public slots:
    void cancel() { m_cancelled = true; }

signals:
    void ProgressUpdate(int iPercentage);

private:
    std::atomic<bool> m_cancelled{false};
};
