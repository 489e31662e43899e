// SPDX-License-Identifier: Apache-2.0
#pragma once

#include "SourceWaveform.h"
#include "ToolJob.h"

#include "streams/levels.h"

/// Measures the levels of a range of a waveform that a tool has read already.
class RangeJob : public ToolJob
{
    Q_OBJECT

public:
    /// `first` and `last`, samples counted from 0 and both included, lie in the waveform, which
    /// outlives the job.
    RangeJob(SourceWaveform &source, qint64 first, qint64 last, QObject *parent = nullptr);

    /// After run() has finished: the linear levels of the range.
    [[nodiscard]] double peakLevel() const { return m_levels.peakLevel(); }
    [[nodiscard]] double rmsLevel() const { return m_levels.rmsLevel(m_last - m_first + 1); }

private:
    [[nodiscard]] bool work() override;

    SourceWaveform &m_source;
    qint64 m_first;
    qint64 m_last;
    LevelSums m_levels;
};
