// SPDX-License-Identifier: Apache-2.0
#pragma once

#include "SourceWaveform.h"
#include "ToolJob.h"

#include "base/ProgressClock.h"
#include "view/SampleSource.h"

#include <atomic>

/// Samples of a waveform that a job has read, for work that takes a SampleSource, with the progress
/// and the cancel of the job. Job and waveform outlive it.
class JobSource : public StreamSource
{
public:
    /// `passes` is how often the samples will be read, for the progress over all.
    JobSource(ToolJob &job, SourceWaveform &source, qint64 first, qint64 count, int passes = 1);

    [[nodiscard]] bool restart() override;
    [[nodiscard]] bool next(std::span<IqSample> samples, std::span<quint8> markers) override;

private:
    ToolJob &m_job;
    const std::atomic<bool> m_never{false};
    ProgressClock m_progress;
    int m_passes;
    int m_pass = -1;
    qint64 m_done = 0;
};
